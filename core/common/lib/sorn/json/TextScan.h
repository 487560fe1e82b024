#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>

#include "sorn/json/ByteClass.h"

#if defined(__SSE2__)
#include <emmintrin.h>
#endif

/// Searches over runs of bytes, many bytes at a time. No operation reads outside its run.
namespace sorn::textscan {

/// Eight bytes at once. Each test gives a word whose lowest set bit lies in the first byte that it holds for;
/// bits above that byte may be wrong.
class Word {
 public:
    static constexpr uint64_t onesG = 0x0101010101010101;
    static constexpr uint64_t highG = 0x8080808080808080;

    static uint64_t Load(const unsigned char* p) {
        uint64_t word;
        std::memcpy(&word, p, sizeof word);
        return word;
    }
    static uint64_t Below(uint64_t word, unsigned char bound) {
        return (word - onesG * bound) & ~word & highG;
    }
    static uint64_t Equal(uint64_t word, unsigned char byte) { return Below(word ^ (onesG * byte), 1); }
    /// Right for every byte: the top bit of those from `low` to `high`, both below 0x80.
    static uint64_t Within(uint64_t word, unsigned char low, unsigned char high) {
        const uint64_t ascii = word & ~highG;
        return (ascii + onesG * (0x80u - low)) & ~(ascii + onesG * (0x7Fu - high)) & ~word & highG;
    }
    /// Number of the byte of the lowest set bit, in the order of memory on a little-endian machine.
    static unsigned FirstByte(uint64_t bits) { return static_cast<unsigned>(__builtin_ctzll(bits)) / 8; }
};

static_assert(__BYTE_ORDER__ == __ORDER_LITTLE_ENDIAN__, "words are searched from their low end");

/// SkipWhitespace behind two bytes of white space, which is most often the indentation of a pretty text.
inline __attribute__((noinline)) const unsigned char* SkipWhitespaceRun(const unsigned char* p,
                                                                        const unsigned char* end) {
#if defined(__SSE2__)
    for (; end - p >= 16; p += 16) {
        const __m128i bytes = _mm_loadu_si128(reinterpret_cast<const __m128i*>(p));
        const __m128i white = _mm_or_si128(_mm_or_si128(_mm_cmpeq_epi8(bytes, _mm_set1_epi8(' ')),
                                                        _mm_cmpeq_epi8(bytes, _mm_set1_epi8('\n'))),
                                           _mm_or_si128(_mm_cmpeq_epi8(bytes, _mm_set1_epi8('\t')),
                                                        _mm_cmpeq_epi8(bytes, _mm_set1_epi8('\r'))));
        const unsigned mask = static_cast<unsigned>(_mm_movemask_epi8(white));
        if (mask != 0xFFFF) return p + __builtin_ctz(~mask);
    }
#endif
    for (; end - p >= 8; p += 8) {
        const uint64_t word = Word::Load(p);
        const uint64_t white =
            Word::Within(word, ' ', ' ') | Word::Within(word, '\t', '\n') | Word::Within(word, '\r', '\r');
        if (white != Word::highG) return p + Word::FirstByte(white ^ Word::highG);
    }
    while (p < end && byteclass::FIs(*p, byteclass::WHITE)) ++p;
    return p;
}

/// The first byte from p on that is no white space, or `end`; `end` may lie below p, then p.
inline const unsigned char* SkipWhitespace(const unsigned char* p, const unsigned char* end) {
    if (p >= end || !byteclass::FIs(*p, byteclass::WHITE)) return p;
    ++p;
    if (p >= end || !byteclass::FIs(*p, byteclass::WHITE)) [[likely]]
        return p;
    return SkipWhitespaceRun(p + 1, end);
}

/// The end of the run of token bytes that begins at p.
inline const unsigned char* FindTokenEnd(const unsigned char* p, const unsigned char* end) {
    while (p < end && byteclass::FIs(*p, byteclass::TOKEN)) ++p;
    return p;
}

/// The end of the run of bytes from p on that may be printed without quotes.
inline const unsigned char* FindBareEnd(const unsigned char* p, const unsigned char* end) {
    for (; end - p >= 8; p += 8) {
        const uint64_t word = Word::Load(p);
        const uint64_t bare = Word::Within(word, '0', '9') | Word::Within(word, '-', '-') |
                              Word::Within(word | (Word::onesG * 0x20), 'a', 'z');
        if (bare != Word::highG) return p + Word::FirstByte(bare ^ Word::highG);
    }
    while (p < end && byteclass::FIs(*p, byteclass::BARE)) ++p;
    return p;
}

#if defined(__SSE2__)
/// A bit for each of the 16 bytes at p that is a double quote, a backslash or a NUL.
inline unsigned StringStops(const unsigned char* p) {
    const __m128i bytes = _mm_loadu_si128(reinterpret_cast<const __m128i*>(p));
    const __m128i stops = _mm_or_si128(
        _mm_or_si128(_mm_cmpeq_epi8(bytes, _mm_set1_epi8('"')), _mm_cmpeq_epi8(bytes, _mm_set1_epi8('\\'))),
        _mm_cmpeq_epi8(bytes, _mm_setzero_si128()));
    return static_cast<unsigned>(_mm_movemask_epi8(stops));
}
#endif

/// The first double quote, backslash or NUL from p on, or `end`.
inline const unsigned char* FindStringStop(const unsigned char* p, const unsigned char* end) {
#if defined(__SSE2__)
    for (; end - p >= 16; p += 16) {
        const unsigned mask = StringStops(p);
        if (mask != 0) return p + __builtin_ctz(mask);
    }
#endif
    for (; end - p >= 8; p += 8) {
        const uint64_t word = Word::Load(p);
        const uint64_t stops = Word::Equal(word, '"') | Word::Equal(word, '\\') | Word::Below(word, 1);
        if (stops != 0) return p + Word::FirstByte(stops);
    }
    while (p < end && *p != '"' && *p != '\\' && *p != 0) ++p;
    return p;
}

/// Whether one of the eight bytes is below 0x20, a double quote or a backslash.
inline bool FControlOrQuoteIn(uint64_t word) {
    return (Word::Below(word, 0x20) | Word::Equal(word, '"') | Word::Equal(word, '\\')) != 0;
}

}  // namespace sorn::textscan
