#include "rox/RoxMempoolState.h"

#include <algorithm>
#include <cstdlib>
#include <cstring>

#include "rox/RoxAssert.h"
#include "rox/RoxMempoolSystem.h"
#include "rox/RoxSpinLockHold.h"

using namespace roxmempool;

namespace {

// In front of a large block; keeps it on a cache line of its own.
constexpr size_t largeOffset = 64;
static_assert(offsetof(RoxMempoolChunk, freePages) <= largeOffset);

// Freed large blocks stay mapped up to this many bytes and blocks in all, for the text buffers of the next
// body.
constexpr size_t maxKeptBytes = (sizeof(void*) == 8 ? 32 : 12) * 1024 * 1024;
constexpr size_t maxKeptBlocks = 32;

/// What to map for a block that grows: twice the need, for the address space beyond costs nothing until it is
/// used.
size_t WithHeadroom(size_t mappedBytes) {
    return mappedBytes < SIZE_MAX / 4 ? RoxMempoolSystem::RoundUp(2 * mappedBytes) : mappedBytes;
}

}  // namespace

RoxMempoolState::RoxMempoolState(const char* name) : nameM(strdup(name)) {
    if (nameM == nullptr) {
        RoxAssertFail("out of memory: the name of pool %s", name);
    }
}

RoxMempoolState::~RoxMempoolState() {
    for (RoxMempoolChunkList* list : {&largeM, &keptM}) {
        while (RoxMempoolChunk* chunk = list->First()) {
            list->Remove(chunk);
            UnmapChunk(chunk);
        }
    }
    pOwnerM.load(std::memory_order_relaxed)->DownRef();
    free(nameM);
}

size_t RoxMempoolState::LargeBytes(size_t n) {
    return RoxMempoolSystem::RoundUp(largeOffset + n) - largeOffset;
}

void* RoxMempoolState::Alloc(size_t n, bool fGrows, bool& fCleared) {
    bool fOwner = FOwner() || BecomeOwner();
    if (n > largestSmallBytes) {
        void* block = AllocLarge(n, fGrows, fCleared);
        if (block != nullptr) {
            Count(fOwner, static_cast<intptr_t>(LargeBytes(n)));
        }
        return block;
    }
    unsigned sizeClass = ClassOf(n);
    if (fOwner) {
        CountOwner(static_cast<intptr_t>(classBytesG[sizeClass]));
        return ownerArenaM.Alloc(sizeClass);
    }
    void* block = nullptr;
    {
        RoxSpinLockHold hold(lockM);
        block = sharedArenaM.Alloc(sizeClass);
    }
    Count(false, static_cast<intptr_t>(classBytesG[sizeClass]));
    return block;
}

/// Makes the calling thread the owner if there is none or it has ended.
bool RoxMempoolState::BecomeOwner() {
    RoxThreadRecord* current = RoxThreadRecord::Current();
    if (!current->FAlive()) {
        return false;
    }
    // Under the lock, for the owner's record may go away with the change of owner.
    RoxSpinLockHold hold(lockM);
    RoxThreadRecord* owner = pOwnerM.load(std::memory_order_relaxed);
    if (owner->FAlive()) {
        return owner == current;
    }
    current->UpRef();
    pOwnerM.store(current, std::memory_order_relaxed);
    owner->DownRef();
    return true;
}

void RoxMempoolState::Free(void* block) {
    RoxMempoolChunk* chunk = RoxMempoolChunk::Of(block);
    if (chunk->pState != this) {
        RoxAssertFail("pool %s: a block that is freed belongs to another pool", nameM);
    }
    bool fOwner = FOwner();
    if (chunk->pArena == nullptr) {
        Count(fOwner, -static_cast<intptr_t>(chunk->largeBytes));
        FreeLarge(chunk);
        return;
    }
    RoxMempoolPage* page = chunk->PageOf(block);
    intptr_t bytes = static_cast<intptr_t>(page->blockBytes);
    Poison(block, page->blockBytes);
    if (chunk->pArena == &sharedArenaM) {
        RoxSpinLockHold hold(lockM);
        sharedArenaM.Free(page, block);
    } else if (fOwner) {
        ownerArenaM.Free(page, block);
    } else {
        ownerArenaM.FreeRemote(block);
    }
    Count(fOwner, -bytes);
}

void* RoxMempoolState::AllocLarge(size_t n, bool fGrows, bool& fCleared) {
    size_t mappedBytes = LargeBytes(n) + largeOffset;
    RoxMempoolChunk* chunk = TakeKept(mappedBytes, fGrows);
    fCleared = chunk == nullptr;
    if (chunk == nullptr && fGrows) {
        chunk = MapChunk(WithHeadroom(mappedBytes), false);
    }
    if (chunk == nullptr) {
        chunk = MapChunk(mappedBytes, false);
    }
    if (chunk == nullptr) {
        return nullptr;
    }
    chunk->pArena = nullptr;
    chunk->largeBytes = mappedBytes - largeOffset;
    Poison(chunk->At(largeOffset), chunk->mappedBytes - largeOffset);
    RoxSpinLockHold hold(lockM);
    largeM.Push(chunk);
    return chunk->At(largeOffset);
}

/// A kept mapping of at least that size, or null: for a block that grows the largest, else the smallest, if
/// it does not waste more than half as much again.
RoxMempoolChunk* RoxMempoolState::TakeKept(size_t mappedBytes, bool fGrows) {
    RoxSpinLockHold hold(lockM);
    RoxMempoolChunk* best = nullptr;
    for (RoxMempoolChunk* chunk = keptM.First(); chunk != nullptr; chunk = chunk->pNext) {
        if (chunk->mappedBytes < mappedBytes ||
            (!fGrows && chunk->mappedBytes - mappedBytes > mappedBytes / 2)) {
            continue;
        }
        if (best == nullptr || (chunk->mappedBytes > best->mappedBytes) == fGrows) {
            best = chunk;
        }
    }
    if (best != nullptr) {
        keptM.Remove(best);
        keptBytesM -= best->mappedBytes;
        --nKeptM;
    }
    return best;
}

void RoxMempoolState::FreeLarge(RoxMempoolChunk* chunk) {
    RoxMempoolChunkList dropped;
    Poison(chunk->At(largeOffset), chunk->mappedBytes - largeOffset);
    {
        RoxSpinLockHold hold(lockM);
        largeM.Remove(chunk);
        if (chunk->mappedBytes > maxKeptBytes) {
            dropped.Push(chunk);
        } else {
            keptM.Push(chunk);
            keptBytesM += chunk->mappedBytes;
            ++nKeptM;
        }
        while (keptBytesM > maxKeptBytes || nKeptM > maxKeptBlocks) {
            RoxMempoolChunk* oldest = keptM.Last();
            keptM.Remove(oldest);
            keptBytesM -= oldest->mappedBytes;
            --nKeptM;
            dropped.Push(oldest);
        }
    }
    while (RoxMempoolChunk* oldest = dropped.First()) {
        dropped.Remove(oldest);
        UnmapChunk(oldest);
    }
}

void* RoxMempoolState::ResizeLarge(void* block, size_t n) {
    RoxMempoolChunk* chunk = RoxMempoolChunk::Of(block);
    size_t newBytes = LargeBytes(n);
    size_t needed = newBytes + largeOffset;
    if (needed > chunk->mappedBytes) {
        chunk = RemapLarge(chunk, WithHeadroom(needed));
    } else if (newBytes < chunk->largeBytes && needed < chunk->mappedBytes / 4) {
        chunk = RemapLarge(chunk, needed);
    }
    if (chunk == nullptr) {
        return nullptr;
    }
    intptr_t change = static_cast<intptr_t>(newBytes) - static_cast<intptr_t>(chunk->largeBytes);
    chunk->largeBytes = newBytes;
    Count(FOwner() || BecomeOwner(), change);
    return chunk->At(largeOffset);
}

/// Gives the mapping of a large block another size; null, with nothing changed, if that cannot be.
RoxMempoolChunk* RoxMempoolState::RemapLarge(RoxMempoolChunk* chunk, size_t mappedBytes) {
    {
        RoxSpinLockHold hold(lockM);
        largeM.Remove(chunk);
    }
    RoxMempoolChunk* moved =
        static_cast<RoxMempoolChunk*>(RoxMempoolSystem::Remap(chunk, chunk->mappedBytes, mappedBytes));
    if (moved != nullptr) {
        mappedBytesM.fetch_add(mappedBytes - moved->mappedBytes,
                               std::memory_order_relaxed);  // wraps when it shrinks
        moved->mappedBytes = mappedBytes;
    }
    RoxSpinLockHold hold(lockM);
    largeM.Push(moved != nullptr ? moved : chunk);
    return moved;
}

RoxMempoolChunk* RoxMempoolState::MapChunk(size_t bytes, bool fWillBeUsed) {
    void* p = RoxMempoolSystem::Map(bytes, fWillBeUsed);
    if (p == nullptr) {
        return nullptr;
    }
    mappedBytesM.fetch_add(bytes, std::memory_order_relaxed);
    RoxMempoolChunk* chunk = static_cast<RoxMempoolChunk*>(p);
    chunk->pState = this;
    chunk->mappedBytes = bytes;
    return chunk;
}

void RoxMempoolState::UnmapChunk(RoxMempoolChunk* chunk) {
    mappedBytesM.fetch_sub(chunk->mappedBytes, std::memory_order_relaxed);
    RoxMempoolSystem::Unmap(chunk, chunk->mappedBytes);
}

void RoxMempoolState::Count(bool fOwner, intptr_t bytes) {
    if (fOwner) {
        CountOwner(bytes);
        return;
    }
    intptr_t net = othersNetM.fetch_add(bytes, std::memory_order_relaxed) + bytes;
    intptr_t total = net + ownerNetM.load(std::memory_order_relaxed);
    intptr_t high = othersHighM.load(std::memory_order_relaxed);
    while (total > high && !othersHighM.compare_exchange_weak(high, total, std::memory_order_relaxed)) {
    }
}

size_t RoxMempoolState::GetUsedBytes() const {
    intptr_t used = ownerNetM.load(std::memory_order_relaxed) + othersNetM.load(std::memory_order_relaxed);
    return static_cast<size_t>(std::max<intptr_t>(used, 0));
}

size_t RoxMempoolState::GetHighWater() const {
    return static_cast<size_t>(
        std::max(ownerHighM.load(std::memory_order_relaxed), othersHighM.load(std::memory_order_relaxed)));
}

size_t RoxMempoolState::CountBlocks() {
    size_t n = ownerArenaM.CountBlocks() + sharedArenaM.CountBlocks();
    for (RoxMempoolChunk* chunk = largeM.First(); chunk != nullptr; chunk = chunk->pNext) {
        ++n;
    }
    return n;
}
