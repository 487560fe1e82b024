#pragma once

#include <cstddef>
#include <cstdint>

#include "rox/RoxMempoolClasses.h"

class RoxMempoolArena;
class RoxMempoolState;

/// A run of pages in a chunk that holds blocks of one class. Blocks are carved from its memory bit by bit, so
/// that pages never touched stay unused by the process.
struct RoxMempoolPage {
    void* pFree;            // freed and freshly carved blocks, linked through their first word
    RoxMempoolPage* pNext;  // in the arena's list of the class
    RoxMempoolPage* pPrev;
    uint32_t blockBytes;
    uint16_t nUsed;
    uint16_t nCarved;
    uint16_t nBlocks;
    uint8_t sizeClass;
    uint8_t nPages;
    bool fFull;  // no block left: in no list
};

/// The head of a mapping, at an address that is a multiple of chunkBytes: either 16 pages of small blocks, or
/// one large block.
struct RoxMempoolChunk {
    RoxMempoolArena* pArena;  // null for a large block
    RoxMempoolState* pState;  // the pool's
    RoxMempoolChunk* pNext;   // in one list of the arena or the pool
    RoxMempoolChunk* pPrev;
    size_t mappedBytes;
    size_t largeBytes;                              // of the large block
    uint32_t freePages;                             // a bit per page
    uint8_t vFirstPage[roxmempool::nPagesInChunk];  // by page: the first page of its run
    RoxMempoolPage vPage[roxmempool::nPagesInChunk];

    static RoxMempoolChunk* Of(const void* block) {
        return reinterpret_cast<RoxMempoolChunk*>(reinterpret_cast<uintptr_t>(block) &
                                                  ~(roxmempool::chunkBytes - 1));
    }
    RoxMempoolPage* PageOf(const void* block) {
        uintptr_t offset = reinterpret_cast<uintptr_t>(block) & (roxmempool::chunkBytes - 1);
        return &vPage[vFirstPage[offset / roxmempool::pageBytes]];
    }
    char* At(size_t offset) { return reinterpret_cast<char*>(this) + offset; }

    static constexpr uint32_t allPages = (uint32_t{1} << roxmempool::nPagesInChunk) - 1;
};

static_assert(sizeof(RoxMempoolChunk) <= roxmempool::chunkHeaderBytes);

/// A doubly linked list of chunks.
class RoxMempoolChunkList {
 public:
    RoxMempoolChunk* First() const { return pFirstM; }
    RoxMempoolChunk* Last() const { return pLastM; }
    void Push(RoxMempoolChunk* chunk) {
        chunk->pPrev = nullptr;
        chunk->pNext = pFirstM;
        (pFirstM != nullptr ? pFirstM->pPrev : pLastM) = chunk;
        pFirstM = chunk;
    }
    void Remove(RoxMempoolChunk* chunk) {
        (chunk->pPrev != nullptr ? chunk->pPrev->pNext : pFirstM) = chunk->pNext;
        (chunk->pNext != nullptr ? chunk->pNext->pPrev : pLastM) = chunk->pPrev;
    }

 private:
    RoxMempoolChunk* pFirstM = nullptr;
    RoxMempoolChunk* pLastM = nullptr;
};
