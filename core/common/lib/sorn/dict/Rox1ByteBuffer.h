#pragma once

#include <cstdint>
#include <cstring>

#include "rox/RoxByteString.h"
#include "rox/ref.h"

class RoxMempool;

namespace sorn {

/// The storage of a growing byte array: at most 4,294,967,295 bytes, RoxAssertFail beyond. It grows by at
/// least 256 bytes, by a fifth when it is large, and the capacity stays a byte ahead of the data. One thread
/// at a time.
class Rox1ByteBuffer {
 public:
    /// Empty; the storage lies in the pool, null for the general heap.
    explicit Rox1ByteBuffer(RoxMempool* pool) : storageM(new (pool) RoxByteString) {}
    Rox1ByteBuffer(const Rox1ByteBuffer&) = delete;
    Rox1ByteBuffer& operator=(const Rox1ByteBuffer&) = delete;

    void AppendByte(unsigned char b) {
        if (lengthM >= RoomEnd()) [[unlikely]]
            Grow(1);
        storageM->MutableBytes()[lengthM++] = b;
    }
    /// n bytes, which do not lie in this buffer.
    void AppendBytes(const void* bytes, unsigned n) {
        if (n == 0) return;
        std::memcpy(Reserve(n), bytes, n);
        lengthM += n;
    }
    /// Makes room for n more bytes, growing as AppendBytes does, and gives the place behind the last byte; it
    /// holds until the next operation that is not const. The bytes become part of the buffer by Commit of at
    /// most n.
    unsigned char* Reserve(unsigned n) {
        const uint32_t roomEnd = RoomEnd();
        if (lengthM >= roomEnd || n > roomEnd - lengthM) [[unlikely]]
            Grow(n);
        return storageM->MutableBytes() + lengthM;
    }
    void Commit(unsigned n) { lengthM += n; }
    /// Replaces n bytes from `offset` on, which must be there.
    void Overwrite(unsigned offset, const void* bytes, unsigned n) { storageM->SetBytes(offset, n, bytes); }
    /// Drops all bytes from `length` on; it must not be above the length. The capacity stays.
    void Truncate(unsigned length) { lengthM = length; }

    const unsigned char* GetData() const { return storageM->GetBytes(); }
    unsigned GetLength() const { return lengthM; }
    unsigned GetCapacity() const { return storageM->GetLength(); }
    RoxMempool* GetMempool() const { return storageM->GetMempool(); }

 private:
    /// Bytes that the buffer may hold without growing.
    uint32_t RoomEnd() const {
        const uint32_t capacity = storageM->GetLength();
        return capacity == 0 ? 0 : capacity - 1;
    }
    void Grow(unsigned n);

    ref<RoxByteString> storageM;
    uint32_t lengthM = 0;
};

}  // namespace sorn
