#pragma once

#include <cstdint>

namespace sorn {

struct StructInfo;

/// Finds structs by name in Schema::structNameHashTableG, an open-addressed table which is computed when the
/// schema is generated: a name's home entry is h modulo the size, with h = h * 31 + byte over its bytes in 32
/// bits; a taken entry sends the search to the next one, with wrap-around. Constant data: no lock.
class StructInfoMap {
 public:
    /// The struct of a NUL-terminated name, or null.
    static const StructInfo* LookupStructByName(const char* name);
    /// The same in any table of `size` entries that is built by the rule above and has a null entry.
    static const StructInfo* LookupInTable(const StructInfo* const* table, uint32_t size, const char* name);
};

}  // namespace sorn
