#pragma once

#include <cstddef>
#include <cstdint>

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
    return (nBits + 6) / 7;
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

}  // namespace sorn::varint
