#pragma once

#include <cstdint>

namespace sorn {

/// The names of one enumeration. The name of the enumeration itself is the row at its id in `orvoObjectType`.
struct EnumDef {
    uint32_t count;            ///< number of entries of `names`: highest value + 1
    const char* const* names;  ///< index = enum value; null where no such value exists

    /// The name of a value, or null when the value has none or lies outside the table.
    const char* NameOf(uint32_t value) const { return value < count ? names[value] : nullptr; }
};

}  // namespace sorn
