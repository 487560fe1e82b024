#include "sorn/json/StringWriter.h"

#include <algorithm>

#include "sorn/json/TextScan.h"

namespace sorn::stringwriter {

namespace {

constexpr size_t pieceG = maxShortG;  // bytes that are escaped at once
static_assert(pieceG * maxEscapedG + 2 <= JsonOutput::maxRoomG);

using Bytes = const unsigned char*;

unsigned char* WriteControl(unsigned char byte, unsigned char* out) {
    static constexpr char digits[] = "0123456789ABCDEF";
    static constexpr char letters[33] = "uuuuuuuubtnufruuuuuuuuuuuuuuuuuu";  // by control byte
    const char letter = letters[byte];
    *out++ = '\\';
    *out++ = static_cast<unsigned char>(letter);
    if (letter != 'u') return out;
    *out++ = '0';
    *out++ = '0';
    *out++ = static_cast<unsigned char>(digits[byte >> 4]);
    *out++ = static_cast<unsigned char>(digits[byte & 15]);
    return out;
}

/// Writes the byte at p, which needs an escape; `end` is the end of the whole text.
unsigned char* WriteEscaped(Bytes p, Bytes end, unsigned char* out) {
    const unsigned char byte = *p;
    if (byte < 0x20) return WriteControl(byte, out);
    *out++ = '\\';
    // A backslash before a 'u' is not doubled: so an escape that the readers kept goes out as it came in.
    if (byte == '"' || end - p < 2 || p[1] != 'u') *out++ = byte;
    return out;
}

/// Steps p over the bytes that go out as they are, copying them in blocks: up to a byte that needs an escape,
/// or to where fewer bytes are left than a block has. There is room for whole blocks.
unsigned char* CopyBlocks(Bytes& p, Bytes pieceEnd, unsigned char* out) {
    using textscan::Word;
#if defined(__SSE2__)
    for (; pieceEnd - p >= 16; p += 16, out += 16) {
        const __m128i bytes = _mm_loadu_si128(reinterpret_cast<const __m128i*>(p));
        const __m128i stops = _mm_or_si128(_mm_or_si128(_mm_cmpeq_epi8(bytes, _mm_set1_epi8('"')),
                                                        _mm_cmpeq_epi8(bytes, _mm_set1_epi8('\\'))),
                                           _mm_cmpeq_epi8(_mm_min_epu8(bytes, _mm_set1_epi8(0x1F)), bytes));
        _mm_storeu_si128(reinterpret_cast<__m128i*>(out), bytes);
        const int mask = _mm_movemask_epi8(stops);
        if (mask != 0) {
            const int n = __builtin_ctz(static_cast<unsigned>(mask));
            p += n;
            return out + n;
        }
    }
#endif
    for (; pieceEnd - p >= 8; p += 8, out += 8) {
        const uint64_t word = Word::Load(p);
        const uint64_t stops = Word::Below(word, 0x20) | Word::Equal(word, '"') | Word::Equal(word, '\\');
        std::memcpy(out, p, 8);
        if (stops != 0) {
            const unsigned n = Word::FirstByte(stops);
            p += n;
            return out + n;
        }
    }
    return out;
}

/// Copies n bytes at p that go out as they are, in blocks that overlap; false if one of them, or of the bytes
/// that make up the blocks, needs an escape. No read or write leaves the piece from `begin` on.
bool CopyTail(Bytes begin, Bytes p, size_t n, unsigned char* out) {
    using textscan::Word;
    const Bytes end = p + n;
    if (end - begin >= 8) {
        const uint64_t word = Word::Load(end - 8);
        if (textscan::FControlOrQuoteIn(word)) return false;
        std::memcpy(out + n - 8, &word, 8);
        return true;
    }
    if (n < 4) return false;
    uint32_t first;
    uint32_t last;
    std::memcpy(&first, p, 4);
    std::memcpy(&last, end - 4, 4);
    if (textscan::FControlOrQuoteIn(uint64_t{first} << 32 | last)) return false;
    std::memcpy(out, &first, 4);
    std::memcpy(out + n - 4, &last, 4);
    return true;
}

/// Writes the bytes from `begin` to pieceEnd, of a text that ends at `end`. There is room for maxEscapedG
/// times as many.
unsigned char* WritePiece(Bytes begin, Bytes pieceEnd, Bytes end, unsigned char* out) {
    Bytes p = begin;
    while (p < pieceEnd) {
        out = CopyBlocks(p, pieceEnd, out);
        const size_t nLeft = static_cast<size_t>(pieceEnd - p);
        if (nLeft < 8 && CopyTail(begin, p, nLeft, out)) return out + nLeft;
        while (p < pieceEnd) {
            if (byteclass::FIs(*p, byteclass::NEEDS_ESCAPE)) {
                out = WriteEscaped(p++, end, out);
                break;
            }
            *out++ = *p++;
        }
    }
    return out;
}

/// Copies n bytes; most numbers and words are too short for a call.
unsigned char* CopyShort(Bytes p, size_t n, unsigned char* out) {
    if (n > 8) {
        std::memcpy(out, p, n);
    } else {
        for (size_t i = 0; i < n; ++i) out[i] = p[i];
    }
    return out + n;
}

void WriteAll(Bytes p, Bytes end, JsonOutput& out) {
    while (p < end) {
        const size_t n = std::min(static_cast<size_t>(end - p), pieceG);
        unsigned char* to = out.Room(static_cast<unsigned>(n * maxEscapedG));
        out.Written(WritePiece(p, p + n, end, to));
        p += n;
    }
}

}  // namespace

unsigned char* PutWithEscapes(const char* bytes, size_t n, unsigned char* out) {
    const Bytes p = reinterpret_cast<Bytes>(bytes);
    return WritePiece(p, p + n, p + n, out);
}

void WriteQuoted(const char* bytes, size_t n, JsonOutput& out) {
    if (n <= pieceG) [[likely]] {
        unsigned char* to = out.Room(static_cast<unsigned>(n * maxEscapedG + 2));
        *to++ = '"';
        to = PutEscaped(bytes, n, to);
        *to++ = '"';
        out.Written(to);
        return;
    }
    const Bytes p = reinterpret_cast<Bytes>(bytes);
    out.Byte('"');
    WriteAll(p, p + n, out);
    out.Byte('"');
}

void WriteText(const RoxString& text, bool fQuote, JsonOutput& out) {
    const size_t n = text.NByte();
    if (fQuote) {
        WriteQuoted(text.Utf8(), n, out);
        return;
    }
    const Bytes begin = reinterpret_cast<Bytes>(text.Utf8());
    const size_t nBare = static_cast<size_t>(textscan::FindBareEnd(begin, begin + n) - begin);
    if (nBare == n) {
        if (n > JsonOutput::maxRoomG) {
            out.Bytes(begin, n);
        } else {
            unsigned char* const to = out.Room(static_cast<unsigned>(n));
            out.Written(CopyShort(begin, n, to));
        }
    } else if (begin[nBare] == 0) {
        // The decision takes the text as NUL-terminated, the writing does not.
        WriteAll(begin, begin + n, out);
    } else {
        WriteQuoted(text.Utf8(), n, out);
    }
}

}  // namespace sorn::stringwriter
