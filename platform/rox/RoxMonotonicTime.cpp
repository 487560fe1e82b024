#include "rox/RoxMonotonicTime.h"

#include <ctime>

#include "rox/RoxAssert.h"

// A tock is a nanosecond: what the system's clock counts.
const RoxMonotonicTime RoxMonotonicTime::cpuG;
const uint64_t RoxMonotonicTime::tocksPerSecond = 1000000000;
const uint32_t RoxMonotonicTime::nanosecondsPer2N20Tock = 1u << 20;

int64_t RoxMonotonicTime::Read() const {
    timespec now{};
    RoxAssert(clock_gettime(CLOCK_MONOTONIC, &now) == 0, "RoxMonotonicTime: no monotonic clock");
    return int64_t{now.tv_sec} * 1000000000 + now.tv_nsec;
}

int64_t RoxMonotonicTime::ToNanoseconds(int64_t tocks) {
    const uint64_t magnitude = tocks < 0 ? -static_cast<uint64_t>(tocks) : static_cast<uint64_t>(tocks);
    // The upper part is a multiple of 2 to the 20th, so that it shifts out whole and can be taken apart.
    const uint64_t upper = (magnitude >> 20) * nanosecondsPer2N20Tock;
    const uint64_t lower = ((magnitude & 0xFFFFF) * nanosecondsPer2N20Tock + 0x80000) >> 20;
    const uint64_t nanoseconds = upper + lower;
    return static_cast<int64_t>(tocks < 0 ? -nanoseconds : nanoseconds);
}
