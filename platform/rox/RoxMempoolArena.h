#pragma once

#include <atomic>
#include <cstddef>

#include "rox/RoxMempoolChunk.h"
#include "rox/RoxMempoolPoison.h"

/// Small blocks in chunks of pages. One thread at a time works in an arena (its owner, or the holder of the
/// pool's lock); FreeRemote alone may be called by any other.
class RoxMempoolArena {
 public:
    explicit RoxMempoolArena(RoxMempoolState* state);
    RoxMempoolArena(const RoxMempoolArena&) = delete;
    RoxMempoolArena& operator=(const RoxMempoolArena&) = delete;
    /// Unmaps all chunks.
    ~RoxMempoolArena();

    /// A block of the class, poisoned, if one lies ready; else null.
    void* TryAlloc(unsigned sizeClass) {
        RoxMempoolPage* page = vAvailableM[sizeClass];
        void* block = page->pFree;
        if (block != nullptr) [[likely]] {
            page->pFree = roxmempool::GetLink(block);
            ++page->nUsed;
        }
        return block;
    }
    /// A block of the class, poisoned; null when memory is exhausted.
    void* Alloc(unsigned sizeClass);
    /// Takes back a block, poisoned, of `page` in this arena.
    void Free(RoxMempoolPage* page, void* block) {
        roxmempool::SetLink(block, page->pFree);
        page->pFree = block;
        if (--page->nUsed == 0 || page->fFull) [[unlikely]] {
            FreeSlow(page);
        }
    }
    /// Takes back a block from a thread that does not work in the arena.
    void FreeRemote(void* block);
    /// Blocks in use. Walks all chunks.
    size_t CountBlocks();

 private:
    void FreeSlow(RoxMempoolPage* page);
    RoxMempoolPage* FindUsablePage(unsigned sizeClass);
    void Carve(RoxMempoolPage* page);
    void CollectRemote();
    RoxMempoolPage* NewPage(unsigned sizeClass);
    RoxMempoolPage* TakeRun(RoxMempoolChunk* chunk, unsigned sizeClass, unsigned nPages);
    RoxMempoolChunk* NewChunk();
    void ReleasePage(RoxMempoolPage* page);
    void ReleaseChunk(RoxMempoolChunk* chunk);
    void PushPage(RoxMempoolPage* page);
    void RemovePage(RoxMempoolPage* page);

    /// Stands for "no page" at the end of every list, so that the fast path needs no test of its own.
    static RoxMempoolPage noPageG;

    RoxMempoolPage* vAvailableM[roxmempool::nClasses];  // pages that may have a free block
    std::atomic<void*> pRemoteM{nullptr};               // blocks freed by other threads
    RoxMempoolState* pStateM;
    RoxMempoolChunkList partialM;  // chunks with free pages and used ones
    RoxMempoolChunkList fullM;
    RoxMempoolChunkList emptyM;  // kept for the next need
    size_t nEmptyM = 0;
    size_t nChunksM = 0;
};
