#pragma once

#include <cstddef>
#include <cstring>

#include "sorn/binary/Varint.h"

namespace sorn {

class ProtoBufByteOutputStream;

/// Bytes written from the last one to the first, so that every length is known when its place comes. A chain
/// of blocks on the general heap, the first in place: what is written never moves. One thread at a time.
///
/// Writers hold the place of the first byte written, `p`, in a variable of their own: Begin gives it, every
/// writing operation takes it and gives the new one, and Commit hands it back.
class ReverseBuffer {
 public:
    ReverseBuffer() = default;
    ReverseBuffer(const ReverseBuffer&) = delete;
    ReverseBuffer& operator=(const ReverseBuffer&) = delete;
    ~ReverseBuffer();

    unsigned char* Begin() const { return firstM; }
    void Commit(unsigned char* p) { firstM = p; }

    /// Makes room for n more bytes in one piece, which the caller may write right before the place that this
    /// gives. For small n; larger ones go through Bytes.
    unsigned char* Room(unsigned char* p, size_t n) {
        return static_cast<size_t>(p - blockBeginM) >= n ? p : NextBlock(p, n);
    }
    /// Writes n bytes, in their order.
    unsigned char* Bytes(unsigned char* p, const void* bytes, size_t n) {
        if (static_cast<size_t>(p - blockBeginM) < n) [[unlikely]]
            return BytesAcrossBlocks(p, static_cast<const unsigned char*>(bytes), n);
        p -= n;
        std::memcpy(p, bytes, n);
        return p;
    }
    /// The number of bytes behind p.
    size_t Count(const unsigned char* p) const { return nClosedM + static_cast<size_t>(blockEndM - p); }

    size_t Count() const { return Count(firstM); }
    /// Copies all bytes, in their order, to `out`, which has room for Count() bytes.
    void CopyTo(unsigned char* out) const;
    void WriteTo(ProtoBufByteOutputStream& stream) const;

 private:
    static constexpr size_t nInPlaceG = 4096;
    static constexpr size_t maxBlockG = 64 * 1024;

    /// The head of a block that is full: its bytes begin at pFirst and end at pEnd.
    struct Block {
        Block* pOlder;
        unsigned char* pFirst;
        unsigned char* pEnd;
        void* pMemory;  ///< of the general heap, or null for the block in place
    };

    unsigned char* NextBlock(unsigned char* p, size_t n);
    unsigned char* BytesAcrossBlocks(unsigned char* p, const unsigned char* bytes, size_t n);
    template <class Take>
    void ForEachRun(Take take) const;

    Block inPlaceHeadM{};
    Block* olderM = nullptr;  // the full blocks, the latest first
    Block* currentM = &inPlaceHeadM;
    size_t nClosedM = 0;  // bytes in the full blocks
    unsigned char inPlaceM[nInPlaceG];
    unsigned char* blockBeginM = inPlaceM;
    unsigned char* blockEndM = inPlaceM + nInPlaceG;
    unsigned char* firstM = blockEndM;
};

}  // namespace sorn
