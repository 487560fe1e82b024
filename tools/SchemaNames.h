#pragma once

#include <cstdint>

#include "sorn/model/FieldInfo.h"

namespace sorn::tools {

/// The name of the record or enumeration of an id, or null: the row of `orvoObjectType`.
const char* NameOfType(uint32_t id);
/// The id of a record or enumeration by its name or by its number in decimal; 0 when there is none.
uint32_t FindType(const char* nameOrId);
/// The catalogue's word for a data type, such as "datetime".
const char* WordOfDataType(DataType type);
/// "optional", "required" or "multi".
const char* WordOfArity(uint16_t arity);

}  // namespace sorn::tools
