#include "sorn/dict/RoxByteBuffer.h"

#include <algorithm>
#include <cstring>

#include "rox/RoxAssert.h"

namespace rox {

void SizedObjectArray<1, RoxMempool>::Realloc(uint32_t n) {
    RoxAssert(n >= lengthM, "SizedObjectArray: new storage smaller than the contents");
    const uint32_t capacity = std::max(n, minCapacityG);
    auto* const storage = static_cast<unsigned char*>(RoxMempool::CallocIn(poolM, capacity));
    if (lengthM != 0) std::memcpy(storage, dataM, lengthM);
    FreeStorage();
    dataM = storage;
    capacityM = capacity;
}

void SizedObjectArray<1, RoxMempool>::Allot(uint32_t n) {
    FreeStorage();
    capacityM = std::max(n, minCapacityG);
    dataM = static_cast<unsigned char*>(RoxMempool::MallocIn(poolM, capacityM));
    lengthM = n;
}

void SizedObjectArray<1, RoxMempool>::Borrow(unsigned char* data, uint32_t n) {
    FreeStorage();
    capacityM = 0;
    dataM = data;
    lengthM = n;
}

namespace {

/// Bytes of something that it holds.
template <class Keeper>
class KeptByteBuffer final : public ByteBuffer {
 public:
    KeptByteBuffer(RoxMempool* pool, const Keeper& keeper, const void* bytes, uint32_t n)
        : ByteBuffer(pool), keeperM(keeper) {
        // Nobody writes to storage that is borrowed.
        bytesM.Borrow(static_cast<unsigned char*>(const_cast<void*>(bytes)), n);
    }

 private:
    Keeper keeperM;
};

}  // namespace

const char ByteBuffer::classTagG = 0;

ByteBuffer::~ByteBuffer() = default;

ref<ByteBuffer> ByteBuffer::New(RoxMempool* pool, const void* bytes, uint32_t n) {
    ref<ByteBuffer> result = NewToFill(pool, n);
    if (n != 0) std::memcpy(result->MutableData(), bytes, n);
    return result;
}

ref<ByteBuffer> ByteBuffer::New(RoxMempool* pool, const RoxString& text) {
    return New(pool, text.Utf8(), text.NByte());
}

ref<ByteBuffer> ByteBuffer::NewOfLength(RoxMempool* pool, uint32_t n) {
    ref<ByteBuffer> result(new (pool) ByteBuffer(pool));
    if (n != 0) {
        result->bytesM.Realloc(n);
        result->bytesM.SetLength(n);
    }
    return result;
}

ref<ByteBuffer> ByteBuffer::NewToFill(RoxMempool* pool, uint32_t n) {
    ref<ByteBuffer> result(new (pool) ByteBuffer(pool));
    if (n != 0) result->bytesM.Allot(n);
    return result;
}

ref<ByteBuffer> ByteBuffer::NewSlice(RoxMempool* pool, const ref<ByteBuffer>& owner, uint32_t offset,
                                     uint32_t n) {
    RoxAssert(offset <= owner->GetLength() && n <= owner->GetLength() - offset,
              "ByteBuffer: slice outside its owner");
    ref<ByteBuffer> result(new (pool) ByteBuffer(pool));
    if (n == 0) return result;
    result->bytesM.Borrow(owner->bytesM.GetData() + offset, n);
    result->ownerM = owner->ownerM != nullptr ? owner->ownerM : owner;
    return result;
}

ref<ByteBuffer> ByteBuffer::NewOfText(RoxMempool* pool, const RoxString& text, uint32_t offset, uint32_t n) {
    RoxAssert(offset <= text.NByte() && n <= text.NByte() - offset, "ByteBuffer: range outside its text");
    if (n == 0) return New(pool, nullptr, 0);
    return ref<ByteBuffer>(new (pool) KeptByteBuffer<RoxString>(pool, text, text.Utf8() + offset, n));
}

ref<ByteBuffer> ByteBuffer::NewKept(RoxMempool* pool, const ref<RoxCore>& keeper, const void* bytes,
                                    uint32_t n) {
    return ref<ByteBuffer>(new (pool) KeptByteBuffer<ref<RoxCore>>(pool, keeper, bytes, n));
}

void* ByteBuffer::VkCastHelper(const void* classTag) {
    return classTag == &classTagG ? this : RoxCore::VkCastHelper(classTag);
}

}  // namespace rox
