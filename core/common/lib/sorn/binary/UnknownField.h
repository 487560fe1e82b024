#pragma once

#include <cstdint>

namespace sorn {

struct StructInfo;

/// Steps over a value of a wire type; gives the place behind it, or null when there is none before `end`.
const unsigned char* SkipValue(uint32_t wireType, const unsigned char* p, const unsigned char* end);

/// Steps over the value of a field that the struct has not got, and says so in a line on standard output.
const unsigned char* PassUnknownField(const StructInfo& info, uint32_t tag, const unsigned char* p,
                                      const unsigned char* end);

}  // namespace sorn
