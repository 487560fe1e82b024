#pragma once

#include <cstdint>

#include "rox/RoxString.h"

namespace sorn {

/// A time of day, in milliseconds since midnight. Plain value.
class Time {
 public:
    static const Time ZERO;

    int32_t milliseconds = 0;

    constexpr Time() = default;
    constexpr explicit Time(int32_t count) : milliseconds(count) {}

    friend constexpr bool operator==(const Time& a, const Time& b) {
        return a.milliseconds == b.milliseconds;
    }
    friend constexpr bool operator!=(const Time& a, const Time& b) { return !(a == b); }

    /// Reads a text such as 23:59:59, as strptime does with "%T", used up whole; anything else gives ZERO.
    static Time Parse(const RoxString& text);
    /// The same for nByte bytes with a NUL behind them.
    static Time Parse(const char* text, unsigned nByte);

    /// Such as 23:59:59, milliseconds dropped, in the pool (null: the general heap).
    RoxString ToString(RoxMempool* pool = nullptr) const;
    /// The same text into a buffer of scalartext::maxMomentBytesG bytes, without a NUL; gives its length.
    unsigned FormatTo(char* out) const;
};

}  // namespace sorn
