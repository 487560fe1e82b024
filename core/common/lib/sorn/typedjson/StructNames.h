#pragma once

#include "sorn/model/StructInfo.h"
#include "sorn/typedjson/NameIndex.h"

namespace sorn {

/// The structs of the schema by name, for names that are not NUL-terminated. Made by the first question,
/// never changed, and shared by the whole process on the general heap.
class StructNames {
 public:
    /// As StructInfoMap::LookupStructByName for a name without a NUL: the struct, or null. Any thread, no
    /// lock.
    static const StructInfo* Find(const NameKey& name);
    /// Deletes the table. Not while a conversion is going on. At the end of the process it happens by itself.
    static void Destroy();
};

}  // namespace sorn
