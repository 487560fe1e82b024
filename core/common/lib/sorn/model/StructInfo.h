#pragma once

#include <cstdint>

#include "rox/ref.h"
#include "sorn/model/FieldInfo.h"
#include "sorn/model/FieldInfoHistory.h"

class RoxMempool;

namespace sorn {

class SornObject;

/// One struct of the schema. All members are constant data but `nFields` and `pFieldNames`, which an
/// initialiser of the generated class fills when the library is loaded.
struct StructInfo {
    const char* name;             ///< lower camel case; the value of the "type" key in dictionaries and JSON
    const char* idPrefix;         ///< put in front of the ids of this struct, such as "vuka:an."; or null
    int32_t nFields;              ///< number of slots, slot 0 included
    const FieldInfo* vFieldInfo;  ///< one record per slot; slot index = field number
    const FieldInfoHistory* vFieldInfoHistory;  ///< parallel to vFieldInfo
    const char* pFieldNames;                    ///< the field names, NUL-terminated, in slot order
    ref<SornObject> (*Factory)(RoxMempool*);    ///< makes an empty object of this struct in the pool

    /// The name of a slot's field. Not to be asked of a hole.
    const char* FieldName(const FieldInfo& field) const { return pFieldNames + field.nameOffset; }

    /// The record that holds for a schema version in a slot: the first older variant whose range has the
    /// version, else the current record; null when the slot is a hole or the field does not exist in that
    /// version. Without a version, the current record untested.
    const FieldInfo* SelectFieldVariant(int slot, OrvoVersion version) const;
};

}  // namespace sorn
