#pragma once

#include <cstdint>

#include "rox/RoxString.h"

/// An interval of time in nanoseconds.
class RoxTime {
 public:
    constexpr RoxTime() = default;
    constexpr explicit RoxTime(int64_t nanoseconds) : nanosecondsM(nanoseconds) {}

    constexpr int64_t GetNanoseconds() const { return nanosecondsM; }
    friend constexpr bool operator==(const RoxTime&, const RoxTime&) = default;

    /// The interval for a log line, in the largest unit that leaves a whole part, exact to the nanosecond:
    /// "999 ns", "1.000 us", "12.345678 ms", "5.000000000 s"; with a minus sign when negative.
    RoxString DebugStringAsInterval() const;

 private:
    int64_t nanosecondsM = 0;
};
