#pragma once

#include <cstdint>

namespace sorn {

/// What a field holds. The numbers stand in FieldInfo::dataType and are stable.
enum DataType : uint8_t {
    SORN_DATA_TYPE_BOOL = 0,         ///< one byte, 0 or 1
    SORN_DATA_TYPE_BYTESTRING = 1,   ///< ref<rox::ByteBuffer>
    SORN_DATA_TYPE_CHANNEL = 2,      ///< ChannelNumber
    SORN_DATA_TYPE_CURRENCY = 3,     ///< Currency
    SORN_DATA_TYPE_DATE = 4,         ///< Date, days since 1970-01-01
    SORN_DATA_TYPE_DATETIME = 5,     ///< DateTime, milliseconds since 1970-01-01 UTC
    SORN_DATA_TYPE_ANY_DICT = 6,     ///< ref<Dict> of any shape
    SORN_DATA_TYPE_ENUM = 7,         ///< 32-bit value; typeRef is the enumeration's id
    SORN_DATA_TYPE_FLOAT = 8,        ///< IEEE double
    SORN_DATA_TYPE_INT_ID = 9,       ///< unsigned 32 bits; typeRef is the struct whose idPrefix is used
    SORN_DATA_TYPE_LONG_ID = 10,     ///< unsigned 64 bits; typeRef as for int ids
    SORN_DATA_TYPE_STRING_ID = 11,   ///< RoxString; typeRef as for int ids
    SORN_DATA_TYPE_KNOWN_DICT = 12,  ///< ref<SornObject> of any struct
    SORN_DATA_TYPE_KNOWN_DICT_AS_LAZY = 13,  ///< ref<LazyDict>, a struct left undecoded
    SORN_DATA_TYPE_OBJECT = 14,              ///< ref<SornObject>; typeRef is the struct's id
    SORN_DATA_TYPE_S64 = 15,                 ///< signed 64 bits
    SORN_DATA_TYPE_S32 = 16,                 ///< signed 32 bits
    SORN_DATA_TYPE_STRING = 17,              ///< RoxString
    SORN_DATA_TYPE_TIME = 18,                ///< Time, milliseconds since midnight
    SORN_DATA_TYPE_U32 = 19,                 ///< unsigned 32 bits
    SORN_DATA_TYPE_U64 = 20,                 ///< unsigned 64 bits
    SORN_DATA_TYPE_NONE = 21,                ///< a slot without a field
};

}  // namespace sorn
