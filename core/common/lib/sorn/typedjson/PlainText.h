#pragma once

#include <cstddef>
#include <cstdint>
#include <string_view>

#include "sorn/json/TextScan.h"

/// Keys and values as programs write them: keys in quotes, no white space but one blank behind a colon and
/// any behind a comma, texts without escapes. The readers pass these with pointers in registers and leave all
/// else to their general ways, so everything here may give up; it does near the end of the block at hand.
namespace sorn::plaintext {

using Byte = unsigned char;

/// Bytes that stand behind every key and text that is found, within the block: enough for words to be read
/// from their start on (NameKey::OfRoomy).
constexpr ptrdiff_t nBehindG = 8;

inline std::string_view View(const Byte* begin, const Byte* end) {
    return {reinterpret_cast<const char*>(begin), static_cast<size_t>(end - begin)};
}

/// textscan::FindStringStop with fewer branches for the usual lengths.
inline const Byte* FindStop(const Byte* p, const Byte* end) {
#if defined(__SSE2__)
    if (end - p >= 32) [[likely]] {
        const unsigned mask = textscan::StringStops(p) | textscan::StringStops(p + 16) << 16;
        if (mask != 0) [[likely]]
            return p + __builtin_ctz(mask);
        p += 32;
    }
#endif
    return textscan::FindStringStop(p, end);
}

/// textscan::FindTokenEnd, the same.
inline const Byte* FindTokenEnd(const Byte* p, const Byte* end) {
    using textscan::Word;
    if (end - p >= 8) [[likely]] {
        const uint64_t word = Word::Load(p);
        const uint64_t token = Word::Within(word, '0', '9') | Word::Within(word, '-', '.') |
                               Word::Within(word, '+', '+') |
                               Word::Within(word | (Word::onesG * 0x20), 'a', 'z');
        if (token != Word::highG) [[likely]]
            return p + Word::FirstByte(token ^ Word::highG);
        p += 8;
    }
    return textscan::FindTokenEnd(p, end);
}

/// The closing quote of the key that stands at p, which has a colon behind it; null for anything else.
inline const Byte* FindKeyEnd(const Byte* p, const Byte* end) {
    if (end - p <= nBehindG || *p != '"') return nullptr;
    const Byte* const stop = FindStop(p + 1, end);
    if (end - stop <= nBehindG || stop[0] != '"' || stop[1] != ':') return nullptr;
    return stop;
}

/// Where the value begins that belongs to such a key.
inline const Byte* ValueOf(const Byte* keyEnd) {
    if (keyEnd[2] == ' ') [[likely]]
        return keyEnd + 3;
    return keyEnd + 2;
}

/// The text at p, in quotes or a token, and what stands behind it; null for anything else.
inline const Byte* FindText(const Byte* p, const Byte* end, std::string_view& text) {
    const bool isQuoted = *p == '"';
    const Byte* const begin = isQuoted ? p + 1 : p;
    const Byte* const stop = isQuoted ? FindStop(begin, end) : FindTokenEnd(begin, end);
    if (end - stop <= nBehindG || (isQuoted ? *stop != '"' : stop == begin)) return nullptr;
    text = View(begin, stop);
    return isQuoted ? stop + 1 : stop;
}

/// The next key or element, for a p that stands on a comma.
inline const Byte* BehindComma(const Byte* p, const Byte* end) {
    return textscan::SkipWhitespace(p + 1, end);
}

}  // namespace sorn::plaintext
