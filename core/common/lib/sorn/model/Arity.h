#pragma once

#include <cstdint>

namespace sorn {

/// How many values a field holds. The numbers stand in FieldInfo::arity and are stable.
enum Arity : uint8_t {
    SORN_ARITY_OPTIONAL = 0,  ///< zero or one value
    SORN_ARITY_REQUIRED = 1,  ///< exactly one value; counts as present at all times
    SORN_ARITY_MULTI = 2,     ///< zero or more values in a container
    SORN_ARITY_NONE = 3,      ///< a slot without a field
};

}  // namespace sorn
