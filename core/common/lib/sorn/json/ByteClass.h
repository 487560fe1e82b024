#pragma once

#include <array>
#include <cstdint>

/// Classes of bytes in the JSON dialect, as tables: the letters and digits are those of ASCII, whatever
/// locale the process has set, and no byte from 0x80 up is among them.
namespace sorn::byteclass {

enum Mark : uint8_t {
    WHITE = 1,         ///< tab, line feed, carriage return, blank
    ALNUM = 2,         ///< ASCII letter or digit
    TOKEN = 4,         ///< may stand in a token without quotes
    BARE = 8,          ///< printed without quotes where quotes are only written if needed
    STARTS_KEY = 16,   ///< letter, digit or double quote
    NEEDS_ESCAPE = 32  ///< not copied as it stands inside quotes
};

constexpr std::array<uint8_t, 256> MakeTable() {
    std::array<uint8_t, 256> table{};
    for (unsigned c = 0; c < 0x20; ++c) table[c] = NEEDS_ESCAPE;
    // These two control bytes are printed raw; that is required.
    table[0x03] = 0;
    table[0x1A] = 0;
    table['"'] = NEEDS_ESCAPE | STARTS_KEY;
    table['\\'] = NEEDS_ESCAPE;
    constexpr uint8_t alnum = ALNUM | TOKEN | BARE | STARTS_KEY;
    for (unsigned c = '0'; c <= '9'; ++c) table[c] = alnum;
    for (unsigned c = 'A'; c <= 'Z'; ++c) table[c] = alnum;
    for (unsigned c = 'a'; c <= 'z'; ++c) table[c] = alnum;
    table['-'] = TOKEN | BARE;
    table['.'] = TOKEN;
    table['+'] = TOKEN;
    table['\t'] |= WHITE;
    table['\n'] |= WHITE;
    table['\r'] |= WHITE;
    table[' '] |= WHITE;
    return table;
}

inline constexpr std::array<uint8_t, 256> tableG = MakeTable();

inline bool FIs(unsigned char byte, Mark mark) {
    return (tableG[byte] & mark) != 0;
}

}  // namespace sorn::byteclass
