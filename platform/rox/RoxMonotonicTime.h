#pragma once

#include <cstdint>

/// The clock of the machine that never goes back and that nobody sets. It counts tocks from a moment in the
/// past. Any thread.
class RoxMonotonicTime {
 public:
    /// The clock.
    static const RoxMonotonicTime cpuG;
    /// Its rate, in the two forms in which it is needed.
    static const uint64_t tocksPerSecond;
    static const uint32_t nanosecondsPer2N20Tock;

    /// Tocks until now.
    int64_t Read() const;
    /// The same of cpuG.
    static int64_t Now() { return cpuG.Read(); }

    /// The nanoseconds in so many tocks: tocks times nanosecondsPer2N20Tock over 2 to the 20th, rounded to
    /// the nearest; of a negative number, those of its magnitude with the sign put back. It does not overflow
    /// for results that fit.
    static int64_t ToNanoseconds(int64_t tocks);
};
