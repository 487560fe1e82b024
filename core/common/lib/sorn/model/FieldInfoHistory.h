#pragma once

#include <cstdint>

#include "sorn/model/FieldInfo.h"

namespace sorn {

/// How a field looked in the schema versions before its current record took effect. Each variant has a member
/// of its own in the class, so that data of an old version never lands in the member of the current form. A
/// variant shares the field's number and name.
struct FieldInfoHistory {
    uint16_t nVariants;          ///< number of older variants, 0 for nearly all fields
    const FieldInfo* vVariants;  ///< the older variants, or null
};

}  // namespace sorn
