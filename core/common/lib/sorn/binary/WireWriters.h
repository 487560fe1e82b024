#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>

#include "rox/RoxString.h"
#include "sorn/binary/ReverseBuffer.h"
#include "sorn/binary/StructPlan.h"
#include "sorn/binary/Varint.h"
#include "sorn/model/ChannelNumber.h"
#include "sorn/model/CopyShort.h"
#include "sorn/model/Currency.h"

/// Writers of values that are no references, which write so that the value ends before p and give its first
/// byte. They want room for maxPlainG bytes before p, and leave room for a tag.
namespace sorn::wirewriters {

static_assert(__BYTE_ORDER__ == __ORDER_LITTLE_ENDIAN__, "doubles are copied as they lie in memory");

/// A length and a tag.
constexpr size_t maxHeadG = varint::maxBytes64G + PlannedField::maxTagBytesG;
/// A text of so many bytes, the length of which is one byte, is written in one piece with what is around.
constexpr uint32_t maxShortG = 64;
/// A short text, a text of a scalar with its length, or a number, and a tag.
constexpr size_t maxPlainG = maxShortG + maxHeadG;
static_assert(ChannelNumber::maxTextBytesG <= maxShortG && Currency::maxTextBytesG <= maxShortG);
static_assert(maxShortG < 0x80);

template <class T>
T Load(const void* member) {
    T value;
    std::memcpy(&value, member, sizeof value);
    return value;
}

template <class Scalar>
__attribute__((noinline)) unsigned char* WriteScalarText(const void* member, unsigned char* p) {
    char text[Scalar::maxTextBytesG];
    const unsigned n = static_cast<const Scalar*>(member)->FormatTo(text);
    p -= n;
    std::memcpy(p, text, n);
    return varint::WriteInRoom(n, p);
}

__attribute__((always_inline)) inline unsigned char* WritePlain(DataType type, const void* member,
                                                                unsigned char* p) {
    switch (type) {
        case SORN_DATA_TYPE_BOOL:
            return varint::WriteInRoom(Load<uint8_t>(member), p);
        case SORN_DATA_TYPE_CHANNEL:
            return WriteScalarText<ChannelNumber>(member, p);
        case SORN_DATA_TYPE_CURRENCY:
            return WriteScalarText<Currency>(member, p);
        case SORN_DATA_TYPE_DATE:
        case SORN_DATA_TYPE_S32:
            return varint::WriteInRoom(varint::Zigzag(Load<int32_t>(member)), p);
        case SORN_DATA_TYPE_DATETIME:
        case SORN_DATA_TYPE_S64:
            return varint::WriteInRoom(varint::Zigzag(Load<int64_t>(member)), p);
        case SORN_DATA_TYPE_FLOAT:
            p -= sizeof(double);
            std::memcpy(p, member, sizeof(double));
            return p;
        case SORN_DATA_TYPE_LONG_ID:
        case SORN_DATA_TYPE_U64:
            return varint::WriteInRoom(Load<uint64_t>(member), p);
        default:  // ENUM, INT_ID, TIME, U32
            return varint::WriteInRoom(Load<uint32_t>(member), p);
    }
}

/// The rest of WriteText, for texts of more than maxShortG bytes.
__attribute__((noinline)) inline unsigned char* WriteLongText(ReverseBuffer& out, const RoxString& text,
                                                              unsigned char* p, size_t nRoom) {
    p = out.Room(out.Bytes(p, text.Utf8(), text.NByte()), nRoom);
    return varint::WriteInRoom(text.NByte(), p);
}

/// Makes the room that it needs and nRoom bytes more, which are maxHeadG at least.
__attribute__((always_inline)) inline unsigned char* WriteText(ReverseBuffer& out, const RoxString& text,
                                                               unsigned char* p, size_t nRoom) {
    const uint32_t n = text.NByte();
    if (n > maxShortG) return WriteLongText(out, text, p, nRoom);
    p = out.Room(p, maxShortG + nRoom) - n;
    if (n > 32) {
        CopyEnds<16>(text.Utf8(), 32, p);
        CopyEnds<16>(text.Utf8() + n - 32, 32, p + n - 32);
    } else {
        CopyShort(text.Utf8(), n, p);
    }
    *--p = static_cast<unsigned char>(n);
    return p;
}

}  // namespace sorn::wirewriters
