#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <utility>

#include "rox/RoxGenericIntArray.h"
#include "rox/RoxString.h"
#include "rox/RoxStringArray.h"
#include "sorn/binary/Varint.h"
#include "sorn/model/CopyShort.h"

/// Readers of values at p: they store the value in a single field's member or, isMulti, as one more element
/// of a repeated one, and give the place behind it. Null for bad bytes, with nothing stored, and when the
/// member is full.
namespace sorn::wirevalues {

/// Where values may lie: before `end`, that of the object. Before `readable`, the end of all bytes, more may
/// be looked at.
struct Bounds {
    const unsigned char* end;
    const unsigned char* readable;
};

template <bool isMulti, class T>
inline bool Store(void* member, const T& value) {
    if constexpr (isMulti) return static_cast<RoxGenericIntArray*>(member)->Add(&value);
    std::memcpy(member, &value, sizeof value);
    return true;
}

/// Reads a number of the wire's type.
template <class Wire>
inline const unsigned char* ReadNumber(const unsigned char* p, Bounds bounds, Wire& value) {
    if (p >= bounds.end) return nullptr;
    if (*p < 0x80) {
        value = *p;
        return p + 1;
    }
    return varint::ReadWithin(p, bounds.end, bounds.readable, value);
}

/// Reads a length; null when as many bytes do not follow before the end.
inline const unsigned char* ReadHead(const unsigned char* p, Bounds bounds, uint32_t& nBytes) {
    p = ReadNumber(p, bounds, nBytes);
    return p != nullptr && nBytes <= static_cast<size_t>(bounds.end - p) ? p : nullptr;
}

template <bool isMulti>
inline const unsigned char* ReadBool(const unsigned char* p, Bounds bounds, void* member) {
    uint32_t value = 0;
    p = ReadNumber(p, bounds, value);
    if (p == nullptr || value > 1) return nullptr;
    return Store<isMulti>(member, static_cast<uint8_t>(value)) ? p : nullptr;
}

template <bool isMulti, class Wire>
inline const unsigned char* ReadUnsigned(const unsigned char* p, Bounds bounds, void* member) {
    Wire value = 0;
    p = ReadNumber(p, bounds, value);
    return p != nullptr && Store<isMulti>(member, value) ? p : nullptr;
}

template <bool isMulti, class Wire>
inline const unsigned char* ReadSigned(const unsigned char* p, Bounds bounds, void* member) {
    Wire value = 0;
    p = ReadNumber(p, bounds, value);
    return p != nullptr && Store<isMulti>(member, varint::Unzigzag(value)) ? p : nullptr;
}

inline RoxString NewText(RoxMempool* pool, const unsigned char* bytes, uint32_t n) {
    if (n == 0) return RoxString();
    RoxStringRepN* const rep = RoxStringRepN::New(pool, n);
    CopyShort(reinterpret_cast<const char*>(bytes), n, reinterpret_cast<unsigned char*>(rep->MutableBytes()));
    return RoxString::AdoptRepN(rep);
}

template <bool isMulti>
inline const unsigned char* ReadText(const unsigned char* p, Bounds bounds, RoxMempool* pool, void* member) {
    uint32_t nBytes = 0;
    p = ReadHead(p, bounds, nBytes);
    if (p == nullptr) return nullptr;
    RoxString text = NewText(pool, p, nBytes);
    if constexpr (isMulti) {
        if (!static_cast<RoxStringArray*>(member)->Add(std::move(text))) return nullptr;
    } else {
        *static_cast<RoxString*>(member) = std::move(text);
    }
    return p + nBytes;
}

template <bool isMulti, class Scalar>
inline const unsigned char* ReadScalarText(const unsigned char* p, Bounds bounds, RoxMempool* pool,
                                           void* member) {
    uint32_t nBytes = 0;
    p = ReadHead(p, bounds, nBytes);
    if (p == nullptr) return nullptr;
    const Scalar value = Scalar::Parse(NewText(pool, p, nBytes));
    return value != Scalar::INVALID && Store<isMulti>(member, value) ? p + nBytes : nullptr;
}

template <bool isMulti>
inline const unsigned char* ReadDouble(const unsigned char* p, Bounds bounds, void* member) {
    double value = 0;
    if (static_cast<size_t>(bounds.end - p) < sizeof value) return nullptr;
    std::memcpy(&value, p, sizeof value);
    return Store<isMulti>(member, value) ? p + sizeof value : nullptr;
}

}  // namespace sorn::wirevalues
