#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>

#include "sorn/binary/Varint.h"
#include "sorn/model/DataType.h"

namespace sorn {

/// A field as it is written: what the encoder's inner loop wants to know, and nothing else. All numbers look
/// alike there, since which of their types comes next cannot be foretold.
struct alignas(uint64_t) WrittenField {
    enum Form : uint8_t {
        UNSIGNED,  ///< a number as it is
        SIGNED,    ///< a number in zigzag order
        TEXT,      ///< a single RoxString
        OTHER,     ///< anything else; repeated fields, and numbers beside the object's count
    };
    /// A word, so that it is copied at once.
    static constexpr size_t maxTagBytesG = 8;

    static constexpr Form FormOf(DataType type) {
        switch (type) {
            case SORN_DATA_TYPE_BOOL:
            case SORN_DATA_TYPE_ENUM:
            case SORN_DATA_TYPE_INT_ID:
            case SORN_DATA_TYPE_LONG_ID:
            case SORN_DATA_TYPE_TIME:
            case SORN_DATA_TYPE_U32:
            case SORN_DATA_TYPE_U64:
                return UNSIGNED;
            case SORN_DATA_TYPE_DATE:
            case SORN_DATA_TYPE_DATETIME:
            case SORN_DATA_TYPE_S32:
            case SORN_DATA_TYPE_S64:
                return SIGNED;
            case SORN_DATA_TYPE_STRING:
            case SORN_DATA_TYPE_STRING_ID:
                return TEXT;
            default:
                return OTHER;
        }
    }
    /// The bytes of a number's member.
    static constexpr unsigned WidthOf(DataType type) {
        switch (type) {
            case SORN_DATA_TYPE_BOOL:
                return 1;
            case SORN_DATA_TYPE_DATETIME:
            case SORN_DATA_TYPE_LONG_ID:
            case SORN_DATA_TYPE_S64:
            case SORN_DATA_TYPE_U64:
                return 8;
            default:
                return 4;
        }
    }

    bool FNumber() const { return form <= SIGNED; }
    /// A number's value as the varint that is written.
    uint64_t Number(const unsigned char* object) const {
        static_assert(__BYTE_ORDER__ == __ORDER_LITTLE_ENDIAN__);
        uint64_t word;
        std::memcpy(&word, object + offset, sizeof word);
        const uint64_t plain = word >> shift;
        const uint64_t zigzag = varint::Zigzag(static_cast<int64_t>(word) >> shift);
        return form == SIGNED ? zigzag : plain;
    }
    /// Writes the tag so that it ends before p; gives its first byte. maxTagBytesG bytes before p are
    /// overwritten.
    unsigned char* WriteTag(unsigned char* p) const {
        std::memcpy(p - sizeof tagBytes, tagBytes, sizeof tagBytes);
        return p - nTagBytes;
    }

    unsigned char tagBytes[maxTagBytesG];  ///< the last nTagBytes of them
    uint16_t offset;  ///< of the member; for a number, of the eight bytes that end with its member's
    uint16_t slot;
    Form form;
    uint8_t shift;  ///< bits of those bytes that lie before the member
    uint8_t nTagBytes;
};

}  // namespace sorn
