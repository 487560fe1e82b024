#pragma once

#include <cstdint>
#include <string>

namespace sorn::tools {

/// All metadata as one JSON object: the constants, "structs", "enums" and "structNameHashTable". Holes are
/// left out; dataType and arity are the numbers.
std::string JsonOfSchema();
/// The object of one record or enumeration, as it stands in JsonOfSchema.
std::string JsonOfType(uint32_t id);

}  // namespace sorn::tools
