#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>

/// The variable-length integers in memory: what GoogleInt, the encoder and the decoder share.
namespace sorn::varint {

/// Bytes of the longest forms that are written and read.
constexpr unsigned maxBytes32G = 5;
constexpr unsigned maxBytes64G = 10;

constexpr uint32_t Zigzag(int32_t value) {
    return (static_cast<uint32_t>(value) << 1) ^ (value < 0 ? UINT32_MAX : 0);
}
constexpr uint64_t Zigzag(int64_t value) {
    return (static_cast<uint64_t>(value) << 1) ^ (value < 0 ? UINT64_MAX : 0);
}
constexpr int32_t Unzigzag(uint32_t value) {
    return static_cast<int32_t>((value >> 1) ^ (~(value & 1) + 1));
}
constexpr int64_t Unzigzag(uint64_t value) {
    return static_cast<int64_t>((value >> 1) ^ (~(value & 1) + 1));
}

/// The number of bytes of the shortest form.
inline unsigned Size(uint64_t value) {
    const unsigned nBits = 64 - static_cast<unsigned>(__builtin_clzll(value | 1));
    return (nBits * 9 + 64) / 64;
}

/// Writes the shortest form forwards; gives the place behind it.
template <class Unsigned>
inline unsigned char* Write(Unsigned value, unsigned char* p) {
    for (; value >= 0x80; value >>= 7) *p++ = static_cast<unsigned char>(value | 0x80);
    *p++ = static_cast<unsigned char>(value);
    return p;
}

/// Writes the shortest form so that it ends before `end`; gives its first byte.
template <class Unsigned>
inline unsigned char* WriteBefore(Unsigned value, unsigned char* end) {
    if (value < 0x80) {
        *--end = static_cast<unsigned char>(value);
        return end;
    }
    if (value < 0x4000) {
        *--end = static_cast<unsigned char>(value >> 7);
        *--end = static_cast<unsigned char>(value | 0x80);
        return end;
    }
    unsigned char* const begin = end - Size(value);
    Write(value, begin);
    return begin;
}

/// The groups of seven bits, eight of them at most, each in a byte of its own.
inline uint64_t SpreadGroups(uint64_t value) {
    value = (value & 0x000000000FFFFFFF) | (value & 0x00FFFFFFF0000000) << 4;
    value = (value & 0x00003FFF00003FFF) | (value & 0x0FFFC0000FFFC000) << 2;
    return (value & 0x007F007F007F007F) | (value & 0x3F803F803F803F80) << 1;
}
/// The other way round.
inline uint64_t JoinGroups(uint64_t bytes) {
    bytes = (bytes & 0x007F007F007F007F) | (bytes & 0x7F007F007F007F00) >> 1;
    bytes = (bytes & 0x00003FFF00003FFF) | (bytes & 0x3FFF00003FFF0000) >> 2;
    return (bytes & 0x000000000FFFFFFF) | (bytes & 0x0FFFFFFF00000000) >> 4;
}
constexpr uint64_t topBitsG = 0x8080808080808080;

/// The rest of WriteInRoom, for numbers of three bytes and more.
__attribute__((noinline)) inline unsigned char* WriteLongInRoom(uint64_t value, unsigned char* end) {
    static_assert(__BYTE_ORDER__ == __ORDER_LITTLE_ENDIAN__);
    if (value >> 28 == 0) {
        const unsigned n = 3 + (value >> 21 != 0);
        const auto bits = static_cast<uint32_t>(value);
        uint32_t word = (bits & 0x7F) | (bits & 0x3F80) << 1 | (bits & 0x1FC000) << 2 | (bits >> 21 << 24);
        word = (word | (n == 4 ? 0x808080 : 0x8080)) << 8 * (4 - n);
        std::memcpy(end - sizeof word, &word, sizeof word);
        return end - n;
    }
    if (value >> 56 != 0) [[unlikely]]
        return WriteBefore(value, end);
    const unsigned n = Size(value);
    const uint64_t bytes = SpreadGroups(value) | (topBitsG & ((uint64_t{1} << 8 * (n - 1)) - 1));
    const uint64_t word = bytes << (64 - 8 * n);
    std::memcpy(end - sizeof word, &word, sizeof word);
    return end - n;
}

/// Writes the shortest form so that it ends before `end`; gives its first byte. Without a branch for each
/// byte: maxBytes64G bytes before `end` are overwritten.
inline unsigned char* WriteInRoom(uint64_t value, unsigned char* end) {
    if (value < 0x80) {
        *--end = static_cast<unsigned char>(value);
        return end;
    }
    if (value < 0x4000) {
        *--end = static_cast<unsigned char>(value >> 7);
        *--end = static_cast<unsigned char>(value | 0x80);
        return end;
    }
    return WriteLongInRoom(value, end);
}

/// Reads a number of at most nMax bytes that lies before `end`; gives the place behind it, or null.
template <class Unsigned, unsigned nMax>
inline const unsigned char* ReadLong(const unsigned char* p, const unsigned char* end, Unsigned& value) {
    const size_t room = static_cast<size_t>(end - p);
    const unsigned n = room < nMax ? static_cast<unsigned>(room) : nMax;
    Unsigned result = 0;
    for (unsigned i = 0; i < n; ++i) {
        result |= static_cast<Unsigned>(p[i] & 0x7F) << (7 * i);
        if (p[i] < 0x80) {
            value = result;
            return p + i + 1;
        }
    }
    return nullptr;
}

const unsigned char* ReadLong32(const unsigned char* p, const unsigned char* end, uint32_t& value);
const unsigned char* ReadLong64(const unsigned char* p, const unsigned char* end, uint64_t& value);

/// Reads a number that lies before `end`; gives the place behind it, or null and leaves the result alone. p
/// may lie behind `end`: then there is none.
inline const unsigned char* Read(const unsigned char* p, const unsigned char* end, uint32_t& value) {
    if (p < end && *p < 0x80) [[likely]] {
        value = *p;
        return p + 1;
    }
    return ReadLong32(p, end, value);
}
inline const unsigned char* Read(const unsigned char* p, const unsigned char* end, uint64_t& value) {
    if (p < end && *p < 0x80) [[likely]] {
        value = *p;
        return p + 1;
    }
    return ReadLong64(p, end, value);
}

/// The same for p before `end`, and faster for numbers of several bytes where more may be looked at than what
/// lies before `end`: all before `readable`, which does not lie before `end`.
template <class Unsigned>
inline const unsigned char* ReadWithin(const unsigned char* p, const unsigned char* end,
                                       const unsigned char* readable, Unsigned& value) {
    constexpr unsigned nMax = sizeof(Unsigned) == sizeof(uint32_t) ? maxBytes32G : maxBytes64G;
    uint64_t bytes = 0;
    if (static_cast<size_t>(readable - p) < sizeof bytes) return Read(p, end, value);
    std::memcpy(&bytes, p, sizeof bytes);
    const uint64_t stops = ~bytes & topBitsG;
    if (stops == 0) return Read(p, end, value);
    const unsigned n = (static_cast<unsigned>(__builtin_ctzll(stops)) + 1) / 8;
    if (n > nMax || n > static_cast<size_t>(end - p)) return nullptr;
    value = static_cast<Unsigned>(JoinGroups(bytes & (stops ^ (stops - 1))));
    return p + n;
}

}  // namespace sorn::varint
