#include "rox/RoxMempoolSystem.h"

#include <sys/mman.h>
#include <unistd.h>

#include <algorithm>
#include <atomic>
#include <cstdint>

#include "rox/RoxMempoolClasses.h"
#include "rox/RoxMempoolPoison.h"

namespace {

std::atomic<size_t> mappedBytesG{0};

void* MapAnywhere(size_t n, int flags) {
    void* p = mmap(nullptr, n, PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS | flags, -1, 0);
    return p == MAP_FAILED ? nullptr : p;
}

bool FAligned(const void* p) {
    return reinterpret_cast<uintptr_t>(p) % roxmempool::chunkBytes == 0;
}

/// Maps more than needed and gives back what lies before and behind the aligned part.
void* MapAndTrim(size_t n, int flags) {
    size_t slack = roxmempool::chunkBytes - RoxMempoolSystem::RoundUp(1);
    if (n > SIZE_MAX - slack) {
        return nullptr;
    }
    char* p = static_cast<char*>(MapAnywhere(n + slack, flags));
    if (p == nullptr) {
        return nullptr;
    }
    size_t lead = -reinterpret_cast<uintptr_t>(p) % roxmempool::chunkBytes;
    if (lead != 0) {
        munmap(p, lead);
    }
    if (lead != slack) {
        munmap(p + lead + n, slack - lead);
    }
    return p + lead;
}

void* MapAligned(size_t n, int flags) {
    // The kernel tends to put a mapping right beside the last one, which is aligned already.
    void* p = MapAnywhere(n, flags);
    if (p != nullptr && !FAligned(p)) {
        munmap(p, n);
        p = MapAndTrim(n, flags);
    }
    return p;
}

}  // namespace

size_t RoxMempoolSystem::RoundUp(size_t n) {
    static const size_t granule = std::max(roxmempool::pageBytes, static_cast<size_t>(sysconf(_SC_PAGESIZE)));
    return (n + granule - 1) / granule * granule;
}

void* RoxMempoolSystem::Map(size_t n, bool fWillBeUsed) {
    void* p = MapAligned(n, fWillBeUsed ? MAP_POPULATE : 0);
    if (p != nullptr) {
        mappedBytesG.fetch_add(n, std::memory_order_relaxed);
        roxmempool::NoteMapped(p, n);
    }
    return p;
}

void RoxMempoolSystem::Unmap(void* p, size_t n) {
    roxmempool::NoteUnmapping(p, n);
    munmap(p, n);
    mappedBytesG.fetch_sub(n, std::memory_order_relaxed);
}

void* RoxMempoolSystem::Remap(void* p, size_t oldBytes, size_t newBytes) {
    if (roxmempool::fPoisoning) {
        return nullptr;  // the sanitizer's marks do not move along
    }
    if (newBytes <= oldBytes) {
        if (newBytes < oldBytes) {
            munmap(static_cast<char*>(p) + newBytes, oldBytes - newBytes);
        }
        mappedBytesG.fetch_sub(oldBytes - newBytes, std::memory_order_relaxed);
        return p;
    }
    void* moved = mremap(p, oldBytes, newBytes, 0);
    if (moved == MAP_FAILED) {
        void* target = MapAligned(newBytes, 0);
        if (target == nullptr) {
            return nullptr;
        }
        moved = mremap(p, oldBytes, newBytes, MREMAP_MAYMOVE | MREMAP_FIXED, target);
        if (moved == MAP_FAILED) {
            munmap(target, newBytes);
            return nullptr;
        }
    }
    mappedBytesG.fetch_add(newBytes - oldBytes, std::memory_order_relaxed);
    return moved;
}

size_t RoxMempoolSystem::GetMappedBytes() {
    return mappedBytesG.load(std::memory_order_relaxed);
}
