#include "sorn/binary/ReverseBuffer.h"

#include <algorithm>
#include <new>

#include "rox/RoxMempool.h"
#include "sorn/binary/ProtoBufByteOutputStream.h"

namespace sorn {

ReverseBuffer::~ReverseBuffer() {
    while (currentM != nullptr && currentM != &inPlaceHeadM) {
        Block* const block = currentM;
        currentM = olderM;
        olderM = olderM != nullptr ? olderM->pOlder : nullptr;
        RoxMempool::FreeIn(nullptr, block->pMemory);
    }
}

/// Closes the block and takes a new one with room for n bytes at least.
unsigned char* ReverseBuffer::NextBlock(unsigned char* p, size_t n) {
    currentM->pOlder = olderM;
    currentM->pFirst = p;
    currentM->pEnd = blockEndM;
    olderM = currentM;
    nClosedM += static_cast<size_t>(blockEndM - p);

    const size_t nLast = static_cast<size_t>(blockEndM - blockBeginM);
    const size_t nBytes = std::max(n, std::min(nLast * 2, maxBlockG));
    void* const memory = RoxMempool::MallocIn(nullptr, sizeof(Block) + nBytes);
    currentM = new (memory) Block{};
    currentM->pMemory = memory;
    blockBeginM = reinterpret_cast<unsigned char*>(currentM + 1);
    blockEndM = blockBeginM + nBytes;
    return blockEndM;
}

unsigned char* ReverseBuffer::BytesAcrossBlocks(unsigned char* p, const unsigned char* bytes, size_t n) {
    const auto room = static_cast<size_t>(p - blockBeginM);
    p -= room;
    n -= room;
    std::memcpy(p, bytes + n, room);
    p = NextBlock(p, n) - n;
    std::memcpy(p, bytes, n);
    return p;
}

template <class Take>
void ReverseBuffer::ForEachRun(Take take) const {
    take(firstM, static_cast<size_t>(blockEndM - firstM));
    for (const Block* block = olderM; block != nullptr; block = block->pOlder) {
        take(block->pFirst, static_cast<size_t>(block->pEnd - block->pFirst));
    }
}

void ReverseBuffer::CopyTo(unsigned char* out) const {
    ForEachRun([&out](const unsigned char* bytes, size_t n) {
        std::memcpy(out, bytes, n);
        out += n;
    });
}

void ReverseBuffer::WriteTo(ProtoBufByteOutputStream& stream) const {
    ForEachRun([&stream](const unsigned char* bytes, size_t n) {
        // A block is no larger than a string, whose length has 32 bits, or the block size.
        stream.WriteBytes(bytes, static_cast<unsigned>(n));
    });
}

}  // namespace sorn
