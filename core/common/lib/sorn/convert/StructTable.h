#pragma once

#include <cstdint>

#include "sorn/model/StructInfo.h"

namespace sorn {

/// The structs that a conversion knows, by id: Schema::vStructDefG, or a table of the caller's. Owns nothing.
struct StructTable {
    const StructInfo* const* vStructDef;  ///< index = struct id; null where the id names no struct
    uint32_t nStructDef;                  ///< entries of vStructDef

    /// The struct of an id that may come from outside, or null.
    const StructInfo* Find(uint32_t id) const { return id < nStructDef ? vStructDef[id] : nullptr; }
};

}  // namespace sorn
