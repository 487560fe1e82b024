#pragma once

#include <cstdint>

#include "rox/RoxString.h"

namespace sorn {

/// A moment, in milliseconds since 1970-01-01 00:00:00 UTC. Plain value.
class DateTime {
 public:
    static const DateTime ZERO;

    int64_t milliseconds = 0;

    constexpr DateTime() = default;
    constexpr explicit DateTime(int64_t count) : milliseconds(count) {}

    friend constexpr bool operator==(const DateTime& a, const DateTime& b) {
        return a.milliseconds == b.milliseconds;
    }
    friend constexpr bool operator!=(const DateTime& a, const DateTime& b) { return !(a == b); }

    /// 2038-01-01 00:00:00. The text of any later moment gives this one, on purpose.
    static constexpr int64_t clampMillisecondsG = 2145916800000;

    /// Reads a text such as 2037-12-31 23:59:59, with a blank or a T between, as strptime does with "%F %T"
    /// or
    /// "%FT%T", used up whole; anything else gives ZERO. Years from 2038 on give clampMillisecondsG.
    static DateTime Parse(const RoxString& text);
    /// The same for nByte bytes with a NUL behind them.
    static DateTime Parse(const char* text, unsigned nByte);
    /// The present moment by the system's clock.
    static DateTime Now();

    /// Such as 2037-12-31 23:59:59, milliseconds dropped, in the pool (null: the general heap).
    RoxString ToString(RoxMempool* pool = nullptr) const;
    /// The same text into a buffer of scalartext::maxMomentBytesG bytes, without a NUL; gives its length.
    unsigned FormatTo(char* out) const;
};

}  // namespace sorn
