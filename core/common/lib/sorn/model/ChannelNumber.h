#pragma once

#include <cstdint>

#include "rox/RoxString.h"

namespace sorn {

/// A channel number with an optional sub-number: 7 or 7-2. The value -2 in a member means "none". Plain
/// value.
class ChannelNumber {
 public:
    static constexpr int32_t noneG = -2;
    static constexpr unsigned maxTextBytesG = 24;  ///< two signed 32-bit numbers and the dash
    static const ChannelNumber INVALID;            ///< (-2, -2)

    int32_t number = noneG;
    int32_t subNumber = noneG;

    constexpr ChannelNumber() = default;
    constexpr ChannelNumber(int a) : number(a) {}  // implicit, as a channel without sub-number
    constexpr ChannelNumber(int a, int b) : number(a), subNumber(b) {}

    friend constexpr bool operator==(const ChannelNumber& a, const ChannelNumber& b) {
        return a.number == b.number && a.subNumber == b.subNumber;
    }
    friend constexpr bool operator!=(const ChannelNumber& a, const ChannelNumber& b) { return !(a == b); }

    /// Reads "a" or "a-b", digits only; anything else, "invalid" and negative numbers included, gives
    /// INVALID. A number above 2147483647 reads as 2147483647.
    static ChannelNumber Parse(const RoxString& text);

    /// "a", "a-b" or "invalid", in the pool (null: the general heap).
    RoxString ToString(RoxMempool* pool = nullptr) const;
    /// The same text into a buffer of maxTextBytesG bytes, without a NUL; gives its length.
    unsigned FormatTo(char* out) const;
};

}  // namespace sorn
