#pragma once

#include <cstdint>

#include "rox/RoxString.h"

namespace sorn {

/// A day, counted from 1970-01-01 in UTC. Plain value.
class Date {
 public:
    static const Date ZERO;

    int32_t days = 0;

    constexpr Date() = default;
    constexpr explicit Date(int32_t count) : days(count) {}

    friend constexpr bool operator==(const Date& a, const Date& b) { return a.days == b.days; }
    friend constexpr bool operator!=(const Date& a, const Date& b) { return !(a == b); }

    /// Reads a text such as 2037-12-31, as strptime does with "%F", used up whole; anything else gives ZERO.
    static Date Parse(const RoxString& text);
    /// The same for nByte bytes with a NUL behind them.
    static Date Parse(const char* text, unsigned nByte);

    /// Such as 2037-12-31, in the pool (null: the general heap).
    RoxString ToString(RoxMempool* pool = nullptr) const;
    /// The same text into a buffer of scalartext::maxMomentBytesG bytes, without a NUL; gives its length.
    unsigned FormatTo(char* out) const;
};

}  // namespace sorn
