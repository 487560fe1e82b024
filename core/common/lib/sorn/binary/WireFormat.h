#pragma once

#include <cstdint>

#include "sorn/model/DataType.h"

/// The numbers of the binary form.
namespace sorn::wireformat {

enum WireType : uint32_t {
    VARINT = 0,
    FIXED64 = 1,
    BYTES = 2,  ///< a length and as many bytes
};

constexpr unsigned wireTypeBitsG = 3;

/// The bits of the data types 1 to 17 whose values have a length in front.
constexpr uint32_t bytesMaskG = 0x13C27;

constexpr WireType WireTypeOf(uint32_t dataType) {
    if (dataType >= 1 && dataType <= 17 && (bytesMaskG >> (dataType - 1) & 1) != 0) return BYTES;
    return dataType == SORN_DATA_TYPE_FLOAT ? FIXED64 : VARINT;
}

constexpr uint32_t TagOf(uint32_t number, WireType wireType) {
    return number << wireTypeBitsG | wireType;
}

// The tags inside dictionaries without a schema: those of fields 4, 6, 8 and 2, each always a single byte.
constexpr unsigned char entryTagG = 0x22;  ///< an entry: a name and its values
constexpr unsigned char nameTagG = 0x32;
constexpr unsigned char valueTagG = 0x42;
constexpr unsigned char textTagG = 0x12;

}  // namespace sorn::wireformat
