#pragma once

#include <cstdint>

#include "rox/RoxCore.h"
#include "rox/RoxString.h"
#include "rox/ref.h"

namespace rox {

/// The growing storage of counted arrays: elements of a fixed size in a pool. One thread at a time.
template <unsigned elementSize, class Pool>
class SizedObjectArray;

template <>
class SizedObjectArray<1, RoxMempool> {
 public:
    static constexpr uint32_t minCapacityG = 8;

    explicit SizedObjectArray(RoxMempool* pool) : poolM(pool) {}
    SizedObjectArray(const SizedObjectArray&) = delete;
    SizedObjectArray& operator=(const SizedObjectArray&) = delete;
    ~SizedObjectArray() { FreeStorage(); }

    /// Moves the elements to new, cleared storage of exactly n elements, 8 at least. n must not be below the
    /// length.
    void Realloc(uint32_t n);
    /// New storage of exactly n elements, 8 at least, all of them to be written by the caller; the old ones
    /// are gone.
    void Allot(uint32_t n);
    /// n elements that lie somewhere else, for as long as this array refers to them. They are not its own:
    /// the capacity is 0.
    void Borrow(unsigned char* data, uint32_t n);

    unsigned char* GetData() const { return dataM; }  ///< null without storage
    uint32_t GetCapacity() const { return capacityM; }
    uint32_t GetLength() const { return lengthM; }
    /// n must not be above the capacity.
    void SetLength(uint32_t n) { lengthM = n; }

 private:
    void FreeStorage() {
        if (capacityM != 0) RoxMempool::FreeIn(poolM, dataM);
    }

    RoxMempool* poolM;
    unsigned char* dataM = nullptr;
    uint32_t capacityM = 0;
    uint32_t lengthM = 0;
};

/// A reference-counted array of bytes, the form in which byte payloads travel. At most 4,294,967,295 bytes.
/// Shared ones do not change; only the count is atomic.
class ByteBuffer : public RoxCore {
 public:
    static const char classTagG;

    /// Empty, with no storage, in the object's pool.
    ByteBuffer() : bytesM(GetMempool()) {}
    /// With the pool that it is allocated in at hand.
    explicit ByteBuffer(RoxMempool* pool) : RoxCore(pool), bytesM(pool) {}
    ~ByteBuffer() override;

    /// A new one in the pool with a copy of n bytes, in one allocation of that size, 8 at least; without
    /// bytes it has no storage.
    static ref<ByteBuffer> New(RoxMempool* pool, const void* bytes, uint32_t n);
    /// All bytes of a text.
    static ref<ByteBuffer> New(RoxMempool* pool, const RoxString& text);
    /// A new one of n bytes, cleared, for the caller to fill.
    static ref<ByteBuffer> NewOfLength(RoxMempool* pool, uint32_t n);
    /// The same, not cleared: the caller writes all n bytes before anybody reads them.
    static ref<ByteBuffer> NewToFill(RoxMempool* pool, uint32_t n);
    /// A new one in the pool of n bytes of another buffer from `offset` on, without a copy: it holds a
    /// reference on the buffer that owns the bytes, never on another slice, and has no capacity. The range
    /// must lie in the owner, which must not change any more, and whose pool must outlive the slice. A slice
    /// of no bytes holds nothing.
    static ref<ByteBuffer> NewSlice(RoxMempool* pool, const ref<ByteBuffer>& owner, uint32_t offset,
                                    uint32_t n);

    /// A new one in the pool of n bytes of a text from `offset` on, without a copy: it holds the text, whose
    /// pool must outlive it, and has no capacity. The range must lie in the text.
    static ref<ByteBuffer> NewOfText(RoxMempool* pool, const RoxString& text, uint32_t offset, uint32_t n);
    /// A new one in the pool of n bytes that lie where `keeper` keeps them unchanged as long as it lives. It
    /// holds a reference on the keeper and has no capacity.
    static ref<ByteBuffer> NewKept(RoxMempool* pool, const ref<RoxCore>& keeper, const void* bytes,
                                   uint32_t n);

    const unsigned char* GetData() const { return bytesM.GetData(); }  ///< null without storage
    /// For whoever made the buffer, before it is shared; not for bytes that lie somewhere else.
    unsigned char* MutableData() { return bytesM.GetData(); }
    uint32_t GetLength() const { return bytesM.GetLength(); }
    uint32_t GetCapacity() const { return bytesM.GetCapacity(); }
    bool FEmpty() const { return bytesM.GetLength() == 0; }
    /// The buffer that owns the bytes of a slice, else null.
    const ref<ByteBuffer>& GetOwner() const { return ownerM; }

    void* VkCastHelper(const void* classTag) override;

 protected:
    SizedObjectArray<1, RoxMempool> bytesM;

 private:
    ref<ByteBuffer> ownerM;
};

}  // namespace rox
