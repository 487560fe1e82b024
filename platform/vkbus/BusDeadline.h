#pragma once

#include <climits>
#include <cstdint>

#include "rox/RoxMonotonicTime.h"

/// A moment some nanoseconds from its making.
class BusDeadline {
 public:
    explicit BusDeadline(int64_t limit) : startM(RoxMonotonicTime::Now()), limitM(limit > 0 ? limit : 0) {}

    /// Nanoseconds until then; 0 when it has passed.
    int64_t Remaining() const {
        const int64_t elapsed = RoxMonotonicTime::ToNanoseconds(RoxMonotonicTime::Now() - startM);
        return elapsed < limitM ? limitM - elapsed : 0;
    }
    bool FPassed() const { return Remaining() == 0; }
    /// The same in whole milliseconds that do not end before it, as system calls want them.
    int Milliseconds() const {
        const int64_t remaining = Remaining();
        const int64_t left = remaining / 1'000'000 + (remaining % 1'000'000 != 0);
        return left < INT_MAX ? static_cast<int>(left) : INT_MAX;
    }

 private:
    int64_t startM;
    int64_t limitM;
};
