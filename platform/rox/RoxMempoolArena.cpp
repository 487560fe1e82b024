#include "rox/RoxMempoolArena.h"

#include <algorithm>

#include "rox/RoxMempoolState.h"
#include "rox/RoxMempoolSystem.h"

using namespace roxmempool;

namespace {

// Chunks without blocks that a pool keeps: enough for the objects of a large body to come and go without
// system calls.
constexpr size_t maxEmptyChunks = (sizeof(void*) == 8 ? 64 : 8) * 1024 * 1024 / chunkBytes;
// From this many chunks on a new chunk will be filled, and faulting its pages in at once is cheaper.
constexpr size_t nChunksBeforePopulating = 4;
// Bytes carved at a time.
constexpr size_t carveBytes = 1024;
// Chunks that are looked at for a run of several pages before a new chunk is taken.
constexpr unsigned maxChunksSearched = 8;

RoxMempoolChunk* ChunkOf(const RoxMempoolPage* page) {
    return RoxMempoolChunk::Of(page);
}

unsigned PageIndex(const RoxMempoolPage* page) {
    return static_cast<unsigned>(page - ChunkOf(page)->vPage);
}

char* PageBegin(RoxMempoolPage* page) {
    unsigned index = PageIndex(page);
    return ChunkOf(page)->At(index == 0 ? chunkHeaderBytes : index * pageBytes);
}

size_t PageSpace(unsigned index, unsigned nPages) {
    return nPages * pageBytes - (index == 0 ? chunkHeaderBytes : 0);
}

}  // namespace

constinit RoxMempoolPage RoxMempoolArena::noPageG{};

RoxMempoolArena::RoxMempoolArena(RoxMempoolState* state) : pStateM(state) {
    std::fill(std::begin(vAvailableM), std::end(vAvailableM), &noPageG);
}

RoxMempoolArena::~RoxMempoolArena() {
    for (RoxMempoolChunkList* list : {&partialM, &fullM, &emptyM}) {
        while (RoxMempoolChunk* chunk = list->First()) {
            list->Remove(chunk);
            pStateM->UnmapChunk(chunk);
        }
    }
}

void* RoxMempoolArena::Alloc(unsigned sizeClass) {
    RoxMempoolPage* page = FindUsablePage(sizeClass);
    if (page == nullptr && pRemoteM.load(std::memory_order_relaxed) != nullptr) {
        CollectRemote();
        page = FindUsablePage(sizeClass);
    }
    if (page == nullptr) {
        page = NewPage(sizeClass);
        if (page == nullptr) {
            return nullptr;
        }
    }
    return TryAlloc(sizeClass);
}

/// The first page of the class with a free block; full pages leave the list on the way.
RoxMempoolPage* RoxMempoolArena::FindUsablePage(unsigned sizeClass) {
    for (;;) {
        RoxMempoolPage* page = vAvailableM[sizeClass];
        if (page == &noPageG) {
            return nullptr;
        }
        if (page->pFree != nullptr) {
            return page;
        }
        if (page->nCarved < page->nBlocks) {
            Carve(page);
            return page;
        }
        RemovePage(page);
        page->fFull = true;
    }
}

void RoxMempoolArena::Carve(RoxMempoolPage* page) {
    size_t wanted = std::max<size_t>(carveBytes / page->blockBytes, 1);
    size_t n = std::min<size_t>(wanted, static_cast<size_t>(page->nBlocks - page->nCarved));
    char* begin = PageBegin(page) + size_t{page->nCarved} * page->blockBytes;
    void* next = page->pFree;
    for (size_t i = n; i-- > 0;) {
        char* block = begin + i * page->blockBytes;
        SetLink(block, next);
        next = block;
    }
    page->pFree = next;
    page->nCarved = static_cast<uint16_t>(page->nCarved + n);
}

void RoxMempoolArena::FreeSlow(RoxMempoolPage* page) {
    if (page->fFull) {
        page->fFull = false;
        PushPage(page);
    }
    // The last page of a class stays, so that one block that comes and goes does not cost a page each time.
    bool fOnly = page->pPrev == nullptr && page->pNext == &noPageG;
    if (page->nUsed == 0 && !fOnly) {
        RemovePage(page);
        ReleasePage(page);
    }
}

void RoxMempoolArena::FreeRemote(void* block) {
    void* first = pRemoteM.load(std::memory_order_relaxed);
    do {
        SetLink(block, first);
    } while (
        !pRemoteM.compare_exchange_weak(first, block, std::memory_order_release, std::memory_order_relaxed));
}

void RoxMempoolArena::CollectRemote() {
    void* block = pRemoteM.exchange(nullptr, std::memory_order_acquire);
    while (block != nullptr) {
        void* next = GetLink(block);
        Free(RoxMempoolChunk::Of(block)->PageOf(block), block);
        block = next;
    }
}

RoxMempoolPage* RoxMempoolArena::NewPage(unsigned sizeClass) {
    unsigned nPages = classPagesG[sizeClass];
    RoxMempoolPage* page = nullptr;
    unsigned nSearched = 0;
    for (RoxMempoolChunk* chunk = partialM.First(); chunk != nullptr && nSearched < maxChunksSearched;
         chunk = chunk->pNext, ++nSearched) {
        page = TakeRun(chunk, sizeClass, nPages);
        if (page != nullptr) {
            break;
        }
    }
    if (page == nullptr) {
        RoxMempoolChunk* chunk = NewChunk();
        if (chunk == nullptr) {
            return nullptr;
        }
        page = TakeRun(chunk, sizeClass, nPages);
    }
    PushPage(page);
    Carve(page);
    return page;
}

/// Takes a run of free pages from the chunk, or gives null when it has none that long.
RoxMempoolPage* RoxMempoolArena::TakeRun(RoxMempoolChunk* chunk, unsigned sizeClass, unsigned nPages) {
    uint32_t starts = chunk->freePages;
    for (unsigned i = 1; i < nPages; ++i) {
        starts &= chunk->freePages >> i;
    }
    uint32_t blockBytes = classBytesG[sizeClass];
    if (nPages > 1 || blockBytes > carveBytes / 4) {
        starts &= ~uint32_t{1};  // the header's page is short and serves small blocks only
    }
    if (starts == 0) {
        return nullptr;
    }
    unsigned index = static_cast<unsigned>(__builtin_ctz(starts));
    chunk->freePages &= ~(((uint32_t{1} << nPages) - 1) << index);
    for (unsigned i = 0; i < nPages; ++i) {
        chunk->vFirstPage[index + i] = static_cast<uint8_t>(index);
    }
    if (chunk->freePages == 0) {
        partialM.Remove(chunk);
        fullM.Push(chunk);
    }
    RoxMempoolPage* page = &chunk->vPage[index];
    *page = RoxMempoolPage{};
    page->blockBytes = blockBytes;
    page->nBlocks = static_cast<uint16_t>(PageSpace(index, nPages) / blockBytes);
    page->sizeClass = static_cast<uint8_t>(sizeClass);
    page->nPages = static_cast<uint8_t>(nPages);
    return page;
}

/// A chunk whose pages are all free, in the partial list.
RoxMempoolChunk* RoxMempoolArena::NewChunk() {
    RoxMempoolChunk* chunk = emptyM.First();
    if (chunk != nullptr) {
        emptyM.Remove(chunk);
        --nEmptyM;
    } else {
        chunk = pStateM->MapChunk(chunkBytes, nChunksM >= nChunksBeforePopulating);
        if (chunk == nullptr) {
            return nullptr;
        }
        chunk->pArena = this;
        chunk->freePages = RoxMempoolChunk::allPages;
        Poison(chunk->At(chunkHeaderBytes), chunkBytes - chunkHeaderBytes);
        ++nChunksM;
    }
    partialM.Push(chunk);
    return chunk;
}

void RoxMempoolArena::ReleasePage(RoxMempoolPage* page) {
    RoxMempoolChunk* chunk = ChunkOf(page);
    if (chunk->freePages == 0) {
        fullM.Remove(chunk);
        partialM.Push(chunk);
    }
    chunk->freePages |= ((uint32_t{1} << page->nPages) - 1) << PageIndex(page);
    if (chunk->freePages == RoxMempoolChunk::allPages) {
        partialM.Remove(chunk);
        ReleaseChunk(chunk);
    }
}

void RoxMempoolArena::ReleaseChunk(RoxMempoolChunk* chunk) {
    if (nEmptyM < maxEmptyChunks) {
        emptyM.Push(chunk);
        ++nEmptyM;
        return;
    }
    --nChunksM;
    pStateM->UnmapChunk(chunk);
}

void RoxMempoolArena::PushPage(RoxMempoolPage* page) {
    RoxMempoolPage* first = vAvailableM[page->sizeClass];
    page->pPrev = nullptr;
    page->pNext = first;
    if (first != &noPageG) {
        first->pPrev = page;
    }
    vAvailableM[page->sizeClass] = page;
}

void RoxMempoolArena::RemovePage(RoxMempoolPage* page) {
    (page->pPrev != nullptr ? page->pPrev->pNext : vAvailableM[page->sizeClass]) = page->pNext;
    if (page->pNext != &noPageG) {
        page->pNext->pPrev = page->pPrev;
    }
}

size_t RoxMempoolArena::CountBlocks() {
    CollectRemote();
    size_t n = 0;
    for (RoxMempoolChunkList* list : {&partialM, &fullM}) {
        for (RoxMempoolChunk* chunk = list->First(); chunk != nullptr; chunk = chunk->pNext) {
            for (unsigned i = 0; i < nPagesInChunk;) {
                bool fFree = (chunk->freePages >> i & 1) != 0;
                n += fFree ? 0 : chunk->vPage[i].nUsed;
                i += fFree ? 1 : chunk->vPage[i].nPages;
            }
        }
    }
    return n;
}
