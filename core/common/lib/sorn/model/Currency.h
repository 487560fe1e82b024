#pragma once

#include <cstdint>

#include "rox/RoxString.h"

namespace sorn {

/// An amount of money in a currency's smallest unit, with a code of three bytes. An empty code marks an
/// invalid currency. Plain value.
class Currency {
 public:
    static constexpr unsigned codeBytesG = 3;
    static constexpr unsigned maxTextBytesG = 16;  ///< code, point and a signed 32-bit number
    static const Currency INVALID;                 ///< all eight bytes zero

    int32_t amount = 0;
    char code[4] = {0, 0, 0, 0};

    constexpr Currency() = default;
    Currency(int amountOfMoney, const char* threeLetters);

    /// Stores both when the code has exactly three bytes; otherwise (null included) all eight bytes become 0.
    void Init(int amountOfMoney, const char* threeLetters);

    /// All eight bytes.
    friend bool operator==(const Currency& a, const Currency& b) {
        return a.amount == b.amount && a.code[0] == b.code[0] && a.code[1] == b.code[1] &&
               a.code[2] == b.code[2] && a.code[3] == b.code[3];
    }
    friend bool operator!=(const Currency& a, const Currency& b) { return !(a == b); }

    /// Reads "USD.100": three bytes, a point and a number without sign; anything else gives INVALID, so that
    /// a negative amount prints but does not parse back. A number above 2147483647 reads as 2147483647.
    static Currency Parse(const RoxString& text);

    /// "USD.100" or "invalid", in the pool (null: the general heap).
    RoxString ToString(RoxMempool* pool = nullptr) const;
    /// The same text into a buffer of maxTextBytesG bytes, without a NUL; gives its length.
    unsigned FormatTo(char* out) const;
};

}  // namespace sorn
