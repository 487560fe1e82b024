#include "sorn/binary/UnknownField.h"

#include <cstddef>
#include <cstdio>

#include "sorn/binary/Varint.h"
#include "sorn/binary/WireFormat.h"
#include "sorn/model/StructInfo.h"

namespace sorn {

namespace {

const unsigned char* SkipBytes(uint32_t n, const unsigned char* p, const unsigned char* end) {
    return p != nullptr && n <= static_cast<size_t>(end - p) ? p + n : nullptr;
}

}  // namespace

const unsigned char* SkipValue(uint32_t wireType, const unsigned char* p, const unsigned char* end) {
    if (p > end) return nullptr;
    uint64_t value = 0;
    switch (wireType) {
        case wireformat::VARINT:
            return varint::Read(p, end, value);
        case wireformat::FIXED64:
            return SkipBytes(8, p, end);
        case wireformat::BYTES:
            p = varint::Read(p, end, value);
            // Of the length only the low 32 bits count; peers rely on it.
            return SkipBytes(static_cast<uint32_t>(value), p, end);
        default:
            return nullptr;
    }
}

const unsigned char* PassUnknownField(const StructInfo& info, uint32_t tag, const unsigned char* p,
                                      const unsigned char* end) {
    const uint32_t number = tag >> wireformat::wireTypeBitsG;
    const bool isHole = number < static_cast<uint32_t>(info.nFields);
    std::printf(isHole ? "field number '%u' undefined in '%s'\n" : "field number '%u' out of range in '%s'\n",
                static_cast<unsigned>(number), info.name);
    return SkipValue(tag & ((1u << wireformat::wireTypeBitsG) - 1), p, end);
}

}  // namespace sorn
