#include "sorn/dict/TextUtilities.h"

#include <cstring>

#include "rox/RoxAssert.h"
#include "rox/RoxUtf8.h"
#include "sorn/dict/ByteBuffer.h"
#include "sorn/dict/NewText.h"

namespace sorn {

namespace {

bool FSpace(unsigned char c) {
    return c == ' ' || (c >= '\t' && c <= '\r');
}

/// The value of a hexadecimal digit, 16 for any other byte.
unsigned HexDigit(unsigned char c) {
    if (c >= '0' && c <= '9') return c - unsigned{'0'};
    c |= 0x20;
    return c >= 'a' && c <= 'f' ? c - unsigned{'a'} + 10 : 16;
}

/// The low byte of what a 64-bit strtol reads in base 16. The token has no white space.
unsigned char LowByteOfToken(const char* p, const char* end) {
    const auto digitAt = [end](const char* at) {
        return at < end ? HexDigit(static_cast<unsigned char>(*at)) : 16;
    };
    const bool fNegative = *p == '-';
    if (*p == '-' || *p == '+') ++p;
    if (digitAt(p) == 0 && p + 1 < end && (p[1] | 0x20) == 'x' && digitAt(p + 2) < 16) p += 2;
    constexpr uint64_t highest = INT64_MAX;
    uint64_t magnitude = 0;
    for (unsigned digit; (digit = digitAt(p)) < 16; ++p) {
        if (magnitude > (highest >> 4)) {  // out of range: LONG_MAX or LONG_MIN
            return fNegative ? 0x00 : 0xFF;
        }
        magnitude = magnitude << 4 | digit;
    }
    return static_cast<unsigned char>(fNegative ? 0 - magnitude : magnitude);
}

/// Appends the bytes of a text in hexadecimal digits.
void ParseRange(const char* p, const char* end, ByteBuffer& out) {
    while (p != end && *p != '\0') {
        if (FSpace(static_cast<unsigned char>(*p))) {
            ++p;
            continue;
        }
        const char* const token = p;
        while (p != end && *p != '\0' && !FSpace(static_cast<unsigned char>(*p))) ++p;
        out.AppendByte(LowByteOfToken(token, p));
    }
}

RoxString FormatRange(RoxMempool* pool, const unsigned char* bytes, uint32_t n) {
    static constexpr char digits[] = "0123456789ABCDEF";
    RoxAssert(n <= UINT32_MAX / 3, "FormatBytes: too many bytes");
    return NewText(pool, n * 3, [bytes, n](char* out) {
        for (uint32_t i = 0; i < n; ++i) {
            *out++ = digits[bytes[i] >> 4];
            *out++ = digits[bytes[i] & 15];
            *out++ = ' ';
        }
    });
}

}  // namespace

RoxString ParseBytes(RoxMempool* pool, const RoxString& text) {
    ByteBuffer bytes(pool);
    ParseRange(text.Utf8(), text.Utf8() + text.NByte(), bytes);
    return bytes.ToRoxString(pool);
}

ref<rox::ByteBuffer> ParseBytesToBytestring(RoxMempool* pool, const RoxString& text) {
    ByteBuffer bytes(pool);
    ParseRange(text.Utf8(), text.Utf8() + text.NByte(), bytes);
    return rox::ByteBuffer::New(pool, bytes.GetData(), bytes.GetLength());
}

RoxString FormatBytes(RoxMempool* pool, const RoxString& bytes) {
    return FormatRange(pool, reinterpret_cast<const unsigned char*>(bytes.Utf8()), bytes.NByte());
}

RoxString FormatBytesFromBytestring(RoxMempool* pool, const ref<rox::ByteBuffer>& bytes) {
    return bytes == nullptr ? RoxString() : FormatRange(pool, bytes->GetData(), bytes->GetLength());
}

RoxString ReplaceCharsWithString(RoxMempool* pool, const RoxString& text, const char* chars,
                                 const RoxString& replacement) {
    bool fReplaced[256] = {};
    for (const char* c = chars; *c != '\0'; ++c) fReplaced[static_cast<unsigned char>(*c)] = true;
    ByteBuffer out(pool);
    for (const char* p = text.Utf8(); *p != '\0'; ++p) {
        if (fReplaced[static_cast<unsigned char>(*p)]) {
            out.AppendText(replacement);
        } else {
            out.AppendChar(*p);
        }
    }
    return out.ToRoxString(pool);
}

// NOLINTNEXTLINE(performance-unnecessary-value-param): callers know that the text is a copy
void SplitString(RoxString text, const RoxString& delimiter, RoxStringArray& pieces) {
    const uint32_t nDelimiter = delimiter.NByte();
    if (nDelimiter == 0) return;
    const char* const begin = text.Utf8();
    const size_t n = text.NByte();
    size_t place = 0;
    bool fAny = false;
    while (const void* const found = memmem(begin + place, n - place, delimiter.Utf8(), nDelimiter)) {
        fAny = true;
        size_t next = static_cast<size_t>(static_cast<const char*>(found) - begin);
        if (!pieces.Add(text.FromUtf8Bytes(static_cast<unsigned>(next - place), begin + place))) return;
        // As many characters as the delimiter has bytes: that is the rule.
        for (uint32_t i = 0; i < nDelimiter && next < n; ++i) {
            next += RoxUtf8CharacterLength(reinterpret_cast<const unsigned char*>(begin) + next, n - next);
        }
        place = next;
    }
    if (fAny) pieces.Add(text.FromUtf8Bytes(static_cast<unsigned>(n - place), begin + place));
}

}  // namespace sorn
