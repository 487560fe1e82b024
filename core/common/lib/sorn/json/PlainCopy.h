#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>

#include "sorn/json/TextScan.h"

/// Copies of texts that most often need no escape: looked through while they are copied.
namespace sorn::plaincopy {

#if defined(__SSE2__)

/// The bytes that may need an escape.
inline __m128i Stops(__m128i bytes) {
    return _mm_or_si128(
        _mm_or_si128(_mm_cmpeq_epi8(bytes, _mm_set1_epi8('"')), _mm_cmpeq_epi8(bytes, _mm_set1_epi8('\\'))),
        _mm_cmpeq_epi8(_mm_min_epu8(bytes, _mm_set1_epi8(0x1F)), bytes));
}

/// From 16 bytes on; the last block overlaps the one in front of it.
inline bool CopyBlocks(const unsigned char* p, size_t n, unsigned char* out) {
    __m128i stops = _mm_setzero_si128();
    for (size_t i = 0; i < n - 16; i += 16) {
        const __m128i bytes = _mm_loadu_si128(reinterpret_cast<const __m128i*>(p + i));
        _mm_storeu_si128(reinterpret_cast<__m128i*>(out + i), bytes);
        stops = _mm_or_si128(stops, Stops(bytes));
    }
    const __m128i last = _mm_loadu_si128(reinterpret_cast<const __m128i*>(p + n - 16));
    _mm_storeu_si128(reinterpret_cast<__m128i*>(out + n - 16), last);
    return _mm_movemask_epi8(_mm_or_si128(stops, Stops(last))) == 0;
}

/// From 8 to 16 bytes.
inline bool CopyHalves(const unsigned char* p, size_t n, unsigned char* out) {
    const __m128i first = _mm_loadl_epi64(reinterpret_cast<const __m128i*>(p));
    const __m128i last = _mm_loadl_epi64(reinterpret_cast<const __m128i*>(p + n - 8));
    _mm_storel_epi64(reinterpret_cast<__m128i*>(out), first);
    _mm_storel_epi64(reinterpret_cast<__m128i*>(out + n - 8), last);
    return _mm_movemask_epi8(Stops(_mm_unpacklo_epi64(first, last))) == 0;
}

constexpr size_t blockG = 16;

#else

inline bool CopyBlocks(const unsigned char* p, size_t n, unsigned char* out) {
    using textscan::Word;
    uint64_t stops = 0;
    const auto copy = [&](size_t i) {
        const uint64_t word = Word::Load(p + i);
        std::memcpy(out + i, &word, 8);
        stops |= Word::Below(word, 0x20) | Word::Equal(word, '"') | Word::Equal(word, '\\');
    };
    for (size_t i = 0; i < n - 8; i += 8) copy(i);
    copy(n - 8);
    return stops == 0;
}

inline bool CopyHalves(const unsigned char* p, size_t n, unsigned char* out) {
    return CopyBlocks(p, n, out);
}

constexpr size_t blockG = 8;

#endif

/// Copies n bytes; false if one of them may need an escape: then `out` holds nothing of use. Nothing else is
/// read or written.
inline bool Copy(const char* text, size_t n, unsigned char* out) {
    const auto* const p = reinterpret_cast<const unsigned char*>(text);
    if (n >= blockG) return CopyBlocks(p, n, out);
    if (n >= 8) return CopyHalves(p, n, out);
    if (n >= 4) {
        uint32_t first;
        uint32_t last;
        std::memcpy(&first, p, 4);
        std::memcpy(&last, p + n - 4, 4);
        std::memcpy(out, &first, 4);
        std::memcpy(out + n - 4, &last, 4);
        return !textscan::FControlOrQuoteIn(uint64_t{first} << 32 | last);
    }
    bool needsEscape = false;
    for (size_t i = 0; i < n; ++i) {
        out[i] = p[i];
        needsEscape |= byteclass::FIs(p[i], byteclass::NEEDS_ESCAPE);
    }
    return !needsEscape;
}

}  // namespace sorn::plaincopy
