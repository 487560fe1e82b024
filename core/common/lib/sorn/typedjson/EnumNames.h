#pragma once

#include <cstdint>

#include "sorn/model/EnumDef.h"
#include "sorn/typedjson/NameIndex.h"

namespace sorn {

/// The values of an enumeration of the schema by name. One for each enumeration that is asked for, made by
/// the first question, never changed, and shared by the whole process on the general heap.
class EnumNames {
 public:
    /// The value of a name without a NUL: the lowest one when several have it. False, and `value` untouched,
    /// when none has. Any thread, no lock.
    static bool Find(const EnumDef& def, const NameKey& name, uint32_t& value);
    /// Deletes all indexes. Not while a conversion is going on. At the end of the process it happens by
    /// itself.
    static void DestroyAll();

    // For the cache.

    static EnumNames* New(const EnumDef& def);
    static void Delete(EnumNames* names);
    const EnumDef& GetSource() const { return defM; }

 private:
    EnumNames(const EnumDef& def, uint32_t nNames);
    static bool FindAlone(const EnumDef& def, const NameKey& name, uint32_t& value);
    ~EnumNames() = default;

    const EnumDef& defM;
    NameIndex namesM;
};

}  // namespace sorn
