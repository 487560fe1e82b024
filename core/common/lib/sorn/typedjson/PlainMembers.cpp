#include "sorn/typedjson/PlainMembers.h"

#include <algorithm>
#include <cstring>

namespace sorn {

namespace {

using Byte = PlainMembers::Byte;

#if defined(__SSE2__)

/// How many bytes are looked at in one go.
constexpr unsigned nStrideG = 64;

constexpr unsigned nUnrolledG = 4;

uint32_t CountBits(uint64_t bits) {
    bits -= bits >> 1 & 0x5555555555555555;
    bits = (bits & 0x3333333333333333) + (bits >> 2 & 0x3333333333333333);
    return static_cast<uint32_t>(((bits + (bits >> 4)) & 0x0F0F0F0F0F0F0F0F) * 0x0101010101010101 >> 56);
}

/// Writes the places of the stops in nStrideG bytes, and perhaps some words more; gives the end of the list.
uint16_t* ListStops(const Byte* p, unsigned offset, uint16_t* out) {
    uint64_t stops = 0;
    for (unsigned i = 0; i < nStrideG; i += 16) stops |= uint64_t{textscan::StringStops(p + i)} << i;
    // By fours, since the usual numbers are no use to a branch predictor.
    uint16_t* const behind = out + CountBits(stops);
    while (stops != 0) {
        for (unsigned i = 0; i < nUnrolledG; ++i, stops &= stops - 1) {
            *out++ =
                static_cast<uint16_t>(offset + static_cast<unsigned>(__builtin_ctzll(stops | 1ull << 63)));
        }
    }
    return behind;
}

#else

constexpr unsigned nStrideG = 8;

uint16_t* ListStops(const Byte* p, unsigned offset, uint16_t* out) {
    using textscan::Word;
    const uint64_t word = Word::Load(p);
    uint64_t stops = Word::Within(word, '"', '"') | Word::Within(word, '\\', '\\') | Word::Within(word, 0, 0);
    for (; stops != 0; stops &= stops - 1) {
        *out++ = static_cast<uint16_t>(offset + Word::FirstByte(stops));
    }
    return out;
}

#endif

}  // namespace

/// Makes the piece that begins at p.
void PlainMembers::FindStops(const Byte* p) {
    const unsigned n =
        static_cast<unsigned>(std::clamp<ptrdiff_t>(pEndM - p - plaintext::nBehindG, 0, nPieceG));
    pBeginM = p;
    pPieceEndM = p + n;
    uint16_t* out = vStopsM;
    unsigned i = 0;
    for (; n - i >= nStrideG; i += nStrideG) out = ListStops(p + i, i, out);
    if (i != n) {
        Byte rest[nStrideG];
        memset(rest, ' ', sizeof rest);
        memcpy(rest, p + i, n - i);
        out = ListStops(rest, i, out);
    }
    std::fill_n(out, nAheadG, noneG);
    pNextM = vStopsM;
}

}  // namespace sorn
