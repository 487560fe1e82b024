#include "rox/RoxMempool.h"

#include <algorithm>
#include <atomic>
#include <cstdlib>
#include <cstring>
#include <new>

#include "rox/RoxAssert.h"
#include "rox/RoxCore.h"
#include "rox/RoxMempoolState.h"
#include "rox/RoxMempoolSystem.h"

using namespace roxmempool;

namespace {

std::atomic<RoxMempool::LeakReporter> leakReporterG{nullptr};

// Above it no size can be served, and sums with the overheads would wrap.
constexpr size_t maxBytes = SIZE_MAX / 2 - 2 * chunkBytes;

[[noreturn]] __attribute__((cold, noinline)) void FailExhausted(const char* poolName, size_t n) {
    RoxAssertFail("out of memory: pool %s, %zu bytes", poolName, n);
}

void* AllocOrFail(RoxMempoolState& state, size_t n, bool fGrows, bool& fCleared) {
    void* block = n > maxBytes ? nullptr : state.Alloc(n + redzoneBytes, fGrows, fCleared);
    if (block == nullptr) {
        FailExhausted(state.GetName(), n);
    }
    Unpoison(block, std::max<size_t>(n, 1));
    return block;
}

__attribute__((noinline)) void* MallocSlow(RoxMempoolState& state, size_t n) {
    bool fCleared = false;
    return AllocOrFail(state, n, false, fCleared);
}

/// Bytes that the block can hold, the redzone left out.
size_t CapacityOf(const void* p) {
    RoxMempoolChunk* chunk = RoxMempoolChunk::Of(p);
    size_t bytes = chunk->pArena == nullptr ? chunk->largeBytes : chunk->PageOf(p)->blockBytes;
    return bytes - redzoneBytes;
}

size_t ClassCapacity(size_t n) {
    size_t bytes = n + redzoneBytes;
    return (bytes > largestSmallBytes ? RoxMempoolState::LargeBytes(bytes) : classBytesG[ClassOf(bytes)]) -
           redzoneBytes;
}

void* CheckHeap(void* p, size_t n) {
    if (p == nullptr) [[unlikely]] {
        FailExhausted("(general heap)", n);
    }
    return p;
}

}  // namespace

RoxMempool::RoxMempool(const char* name) {
    void* memory = malloc(sizeof(RoxMempoolState));
    if (memory == nullptr) {
        FailExhausted(name, sizeof(RoxMempoolState));
    }
    pStateM = new (memory) RoxMempoolState(name);
}

RoxMempool::~RoxMempool() {
    RoxCore::DestroyDeferred(*this);
    LeakReporter reporter = leakReporterG.load(std::memory_order_acquire);
    if (reporter != nullptr) {
        size_t nBlocks = pStateM->CountBlocks();
        if (nBlocks != 0) {
            reporter(GetName(), nBlocks, GetUsedBytes());
        }
    }
    pStateM->~RoxMempoolState();
    free(pStateM);
}

void* RoxMempool::Malloc(size_t n) {
    RoxMempoolState& state = *pStateM;
    if (n <= largestSmallBytes - redzoneBytes && state.FOwner()) [[likely]] {
        unsigned sizeClass = ClassOf(n + redzoneBytes);
        void* block = state.OwnerArena().TryAlloc(sizeClass);
        if (block != nullptr) [[likely]] {
            state.CountOwner(static_cast<intptr_t>(classBytesG[sizeClass]));
            Unpoison(block, std::max<size_t>(n, 1));
            return block;
        }
    }
    return MallocSlow(state, n);
}

void* RoxMempool::Calloc(size_t n) {
    if (n <= largestSmallBytes) {
        return memset(Malloc(n), 0, n);
    }
    bool fCleared = false;
    void* p = AllocOrFail(*pStateM, n, false, fCleared);
    return fCleared ? p : memset(p, 0, n);
}

void* RoxMempool::Realloc(void* p, size_t n) {
    if (p == nullptr) {
        return Malloc(n);
    }
    if (n > maxBytes) {
        FailExhausted(GetName(), n);
    }
    if (RoxMempoolChunk::Of(p)->pState != pStateM) {
        RoxAssertFail("pool %s: a block that is resized belongs to another pool", GetName());
    }
    size_t capacity = CapacityOf(p);
    size_t kept = std::min(AccessibleBytes(p, capacity), n);
    if (ClassCapacity(n) == capacity) {
        Poison(p, capacity);
        Unpoison(p, std::max<size_t>(n, 1));
        return p;
    }
    if (!fPoisoning && RoxMempoolChunk::Of(p)->pArena == nullptr && n > largestSmallBytes) {
        void* resized = pStateM->ResizeLarge(p, n);
        if (resized != nullptr) {
            return resized;
        }
    }
    bool fCleared = false;
    void* moved = n <= largestSmallBytes ? Malloc(n) : AllocOrFail(*pStateM, n, n > capacity, fCleared);
    memcpy(moved, p, std::min(kept, capacity));
    Free(p);
    return moved;
}

void RoxMempool::Free(void* p) {
    if (p == nullptr) {
        return;
    }
    RoxMempoolState& state = *pStateM;
    RoxMempoolChunk* chunk = RoxMempoolChunk::Of(p);
    if (FPoisoned(p)) {
        RoxAssertFail("pool %s: a block is freed twice", GetName());
    }
    if (chunk->pArena == &state.OwnerArena() && state.FOwner()) [[likely]] {
        RoxMempoolPage* page = chunk->PageOf(p);
        intptr_t bytes = static_cast<intptr_t>(page->blockBytes);
        Poison(p, page->blockBytes);
        state.OwnerArena().Free(page, p);
        state.CountOwner(-bytes);
        return;
    }
    state.Free(p);
}

size_t RoxMempool::GetUsedBytes() const {
    return pStateM->GetUsedBytes();
}

size_t RoxMempool::GetUnusedBytes() const {
    size_t mapped = pStateM->GetMappedBytes();
    return mapped - std::min(mapped, GetUsedBytes());
}

size_t RoxMempool::GetUsedBytesHighWater() const {
    return pStateM->GetHighWater();
}
size_t RoxMempool::GetHighWaterUsedBytes() const {
    return pStateM->GetHighWater();
}
const char* RoxMempool::GetName() const {
    return pStateM->GetName();
}

void* RoxMempool::HeapMalloc(size_t n) {
    return CheckHeap(malloc(std::max<size_t>(n, 1)), n);
}

void RoxMempool::HeapFree(void* p) {
    free(p);
}

void* RoxMempool::CallocIn(RoxMempool* poolOrNull, size_t n) {
    return poolOrNull != nullptr ? poolOrNull->Calloc(n) : CheckHeap(calloc(std::max<size_t>(n, 1), 1), n);
}

void* RoxMempool::ReallocIn(RoxMempool* poolOrNull, void* p, size_t n) {
    return poolOrNull != nullptr ? poolOrNull->Realloc(p, n)
                                 : CheckHeap(realloc(p, std::max<size_t>(n, 1)), n);
}

void RoxMempool::SetLeakReporter(LeakReporter reporter) {
    leakReporterG.store(reporter, std::memory_order_release);
}

size_t RoxMempool::GetSystemBytes() {
    return RoxMempoolSystem::GetMappedBytes();
}
