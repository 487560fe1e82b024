#pragma once

#include <atomic>
#include <cstddef>
#include <cstdint>

#include "rox/RoxMempoolArena.h"
#include "rox/RoxSpinLock.h"
#include "rox/RoxThreadRecord.h"

/// The inside of a pool: two arenas of small blocks (the owner thread's, and one behind the lock for all
/// other threads), the large blocks, and the figures.
///
/// Bytes are counted in two halves, what the owner allocated minus what it freed, and the same of all other
/// threads: each half is right on its own no matter which thread's blocks are freed where, and the owner's
/// needs no atomic read-modify-write.
class RoxMempoolState {
 public:
    explicit RoxMempoolState(const char* name);
    ~RoxMempoolState();
    RoxMempoolState(const RoxMempoolState&) = delete;
    RoxMempoolState& operator=(const RoxMempoolState&) = delete;

    bool FOwner() const {
        return pOwnerM.load(std::memory_order_relaxed) == RoxThreadRecord::CurrentOrNull();
    }
    RoxMempoolArena& OwnerArena() { return ownerArenaM; }

    /// n includes the redzone and is any size; null when memory is exhausted. `fGrows`: the block continues
    /// one that was resized, and will likely be resized again. `fCleared`: set to true if all bytes are 0.
    void* Alloc(size_t n, bool fGrows, bool& fCleared);
    void Free(void* block);
    /// Resizes a large block without copying; null if that cannot be.
    void* ResizeLarge(void* block, size_t n);

    void CountOwner(intptr_t bytes) {
        intptr_t net = ownerNetM.load(std::memory_order_relaxed) + bytes;
        ownerNetM.store(net, std::memory_order_relaxed);
        if (bytes > 0) {
            intptr_t total = net + othersNetM.load(std::memory_order_relaxed);
            if (total > ownerHighM.load(std::memory_order_relaxed)) {
                ownerHighM.store(total, std::memory_order_relaxed);
            }
        }
    }

    size_t GetUsedBytes() const;
    size_t GetHighWater() const;
    size_t GetMappedBytes() const { return mappedBytesM.load(std::memory_order_relaxed); }
    const char* GetName() const { return nameM; }
    size_t CountBlocks();

    RoxMempoolChunk* MapChunk(size_t bytes, bool fWillBeUsed);
    void UnmapChunk(RoxMempoolChunk* chunk);

    static size_t LargeBytes(size_t n);

 private:
    bool BecomeOwner();
    void* AllocLarge(size_t n, bool fGrows, bool& fCleared);
    RoxMempoolChunk* TakeKept(size_t mappedBytes, bool fGrows);
    void FreeLarge(RoxMempoolChunk* chunk);
    RoxMempoolChunk* RemapLarge(RoxMempoolChunk* chunk, size_t mappedBytes);
    void Count(bool fOwner, intptr_t bytes);

    // What the owner's fast path touches stands together.
    std::atomic<RoxThreadRecord*> pOwnerM{RoxThreadRecord::NoThread()};
    std::atomic<intptr_t> ownerNetM{0};
    std::atomic<intptr_t> ownerHighM{0};
    std::atomic<intptr_t> othersNetM{0};
    std::atomic<intptr_t> othersHighM{0};
    std::atomic<size_t> mappedBytesM{0};
    RoxMempoolArena ownerArenaM{this};

    RoxSpinLock lockM{4};  // guards all below, and who becomes the owner
    RoxMempoolArena sharedArenaM{this};
    RoxMempoolChunkList largeM;
    RoxMempoolChunkList keptM;  // freed large blocks that were kept mapped, newest first
    size_t keptBytesM = 0;
    size_t nKeptM = 0;
    char* nameM;
};
