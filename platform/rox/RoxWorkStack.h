#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <type_traits>

#include "rox/RoxAssert.h"
#include "rox/RoxMempool.h"

/// Explicit stack for walks over nested data: the first nInline frames lie in the object, more in the pool
/// (null: general heap), doubling. Frames move when it grows, so references to them hold only until the next
/// Push.
template <class T, unsigned nInline>
class RoxWorkStack {
    static_assert(std::is_trivially_copyable_v<T> && nInline > 0);

 public:
    explicit RoxWorkStack(RoxMempool* pool) : pMempoolM(pool) {}
    RoxWorkStack(const RoxWorkStack&) = delete;
    RoxWorkStack& operator=(const RoxWorkStack&) = delete;
    ~RoxWorkStack() {
        if (pFramesM != InlineFrames()) {
            RoxMempool::FreeIn(pMempoolM, pFramesM);
        }
    }

    void Push(const T& frame) {
        if (sizeM == capacityM) [[unlikely]] {
            PushGrowing(frame);
            return;
        }
        new (&pFramesM[sizeM]) T(frame);
        ++sizeM;
    }
    /// Pushes a frame made of these, in its place.
    template <class... Arguments>
    void Emplace(Arguments... arguments) {
        if (sizeM == capacityM) [[unlikely]] {
            PushGrowing(T{arguments...});
            return;
        }
        new (&pFramesM[sizeM]) T{arguments...};
        ++sizeM;
    }
    /// The stack must not be empty for Pop and Top; i < Size() counts from the bottom.
    void Pop() { --sizeM; }
    T& Top() { return pFramesM[sizeM - 1]; }
    const T& Top() const { return pFramesM[sizeM - 1]; }
    bool FEmpty() const { return sizeM == 0; }
    size_t Size() const { return sizeM; }
    T& operator[](size_t i) { return pFramesM[i]; }
    const T& operator[](size_t i) const { return pFramesM[i]; }

 private:
    T* InlineFrames() { return reinterpret_cast<T*>(inlineM); }

    // The frame may lie in this very stack.
    __attribute__((noinline)) void PushGrowing(const T& frame) {
        T kept = frame;
        RoxAssert(capacityM <= SIZE_MAX / 4 / sizeof(T), "RoxWorkStack: too many frames");
        size_t capacity = capacityM * 2;
        if (pFramesM == InlineFrames()) {
            void* block = RoxMempool::MallocIn(pMempoolM, capacity * sizeof(T));
            memcpy(block, inlineM, sizeM * sizeof(T));
            pFramesM = static_cast<T*>(block);
        } else {
            pFramesM = static_cast<T*>(RoxMempool::ReallocIn(pMempoolM, pFramesM, capacity * sizeof(T)));
        }
        capacityM = capacity;
        new (&pFramesM[sizeM]) T(kept);
        ++sizeM;
    }

    RoxMempool* pMempoolM;
    size_t sizeM = 0;
    size_t capacityM = nInline;
    alignas(T) unsigned char inlineM[nInline * sizeof(T)];
    T* pFramesM = InlineFrames();
};
