#pragma once

#include <bit>
#include <cstddef>
#include <cstdint>
#include <cstring>

/// Decimal digits, two at a time.
namespace sorn::decimaldigits {

/// The two digits of each number below 100.
inline constexpr struct Pairs {
    char digits[200];
    constexpr Pairs() : digits() {
        for (unsigned i = 0; i < 100; ++i) {
            digits[2 * i] = static_cast<char>('0' + i / 10);
            digits[2 * i + 1] = static_cast<char>('0' + i % 10);
        }
    }
} pairsG;

/// Writes a number below 100 with two digits.
inline char* WriteTwo(uint32_t value, char* out) {
    std::memcpy(out, pairsG.digits + 2 * size_t{value}, 2);
    return out + 2;
}

/// Writes a number below 10,000 with four digits.
inline char* WriteFour(uint32_t value, char* out) {
    return WriteTwo(value % 100, WriteTwo(value / 100, out));
}

/// Writes a number below 100,000,000 with eight digits.
inline char* WriteEight(uint32_t value, char* out) {
    return WriteFour(value % 10000, WriteFour(value / 10000, out));
}

/// The digits that a number has; 1 for 0.
inline unsigned Count(uint32_t value) {
    constexpr uint32_t powers[] = {0, 10, 100, 1000, 10000, 100000, 1000000, 10000000, 100000000, 1000000000};
    // log10(2) is 1233 / 4096, nearly.
    const unsigned guess = static_cast<unsigned>(std::bit_width(value | 1)) * 1233 >> 12;
    return guess + (value >= powers[guess] ? 1 : 0);
}

/// Writes a number without leading zeros; gives the position behind it.
inline char* Write(uint32_t value, char* out) {
    char* const end = out + Count(value);
    char* p = end;
    while (value >= 100) {
        p -= 2;
        WriteTwo(value % 100, p);
        value /= 100;
    }
    if (value >= 10) {
        WriteTwo(value, out);
    } else {
        *out = static_cast<char>('0' + value);
    }
    return end;
}

}  // namespace sorn::decimaldigits
