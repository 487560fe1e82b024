#pragma once

#include <cstdint>

#include "sorn/model/EnumDef.h"
#include "sorn/model/StructInfo.h"

namespace sorn {

/// The roots of the schema's metadata: constants of the generated code, read by all threads without locks.
/// Both tables are sparse and indexed directly by id; struct ids and enum ids are numbers of one common
/// space, and 0 is neither.
struct Schema {
    static const int32_t firstSchemaVersionG;    ///< oldest schema version known to the generated code
    static const int32_t lastSchemaVersionG;     ///< newest schema version known to the generated code
    static const int32_t defaultSchemaVersionG;  ///< what a client sends unless it is set to use the newest

    static const uint32_t nStructDefG;             ///< entries of vStructDefG: highest struct id + 1
    static const StructInfo* const vStructDefG[];  ///< index = struct id; null where the id names no struct
    static const uint32_t nEnumDefG;               ///< entries of vEnumDefG: highest enum id + 1
    static const EnumDef* const vEnumDefG[];  ///< index = enum id; null where the id names no enumeration

    static const uint32_t structNameHashTableSizeG;         ///< entries of structNameHashTableG
    static const StructInfo* const structNameHashTableG[];  ///< see StructInfoMap; at least one entry is null

    /// The struct of an id that may come from outside, or null.
    static const StructInfo* FindStruct(uint32_t id) { return id < nStructDefG ? vStructDefG[id] : nullptr; }
    /// The enumeration of an id that may come from outside, or null.
    static const EnumDef* FindEnum(uint32_t id) { return id < nEnumDefG ? vEnumDefG[id] : nullptr; }
};

}  // namespace sorn
