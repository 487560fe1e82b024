#include "rox/RoxHashBytes.h"

#include <sys/random.h>
#include <time.h>

#include "rox/RoxSipHash.h"

namespace {

struct Seed {
    uint64_t k0;
    uint64_t k1;
};

Seed MakeSeed() {
    Seed seed{};
    if (getrandom(&seed, sizeof(seed), GRND_NONBLOCK) != static_cast<ssize_t>(sizeof(seed))) {
        // Early in the start of a machine: the clock and where things lie must do.
        timespec now{};
        clock_gettime(CLOCK_MONOTONIC, &now);
        seed.k0 = static_cast<uint64_t>(now.tv_nsec) * 0x9E3779B97F4A7C15 ^ reinterpret_cast<uintptr_t>(&now);
        seed.k1 =
            static_cast<uint64_t>(now.tv_sec) * 0xC2B2AE3D27D4EB4F ^ reinterpret_cast<uintptr_t>(&MakeSeed);
    }
    return seed;
}

}  // namespace

uint32_t RoxHashBytes(const void* bytes, size_t n) {
    static const Seed seed = MakeSeed();
    uint32_t hash;
    if constexpr (sizeof(void*) == 8) {
        uint64_t wide = RoxSipHash<1, 3>::Hash64(seed.k0, seed.k1, bytes, n);
        hash = static_cast<uint32_t>(wide ^ wide >> 32);
    } else {
        hash = RoxSipHash<1, 3>::Hash32(static_cast<uint32_t>(seed.k0), static_cast<uint32_t>(seed.k1), bytes,
                                        n);
    }
    return hash != 0 ? hash : 1;
}
