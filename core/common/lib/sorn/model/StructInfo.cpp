#include "sorn/model/StructInfo.h"

namespace sorn {

const FieldInfo* StructInfo::SelectFieldVariant(int slot, OrvoVersion version) const {
    const FieldInfo* field = &vFieldInfo[slot];
    if (field->FHole()) return nullptr;
    if (version.FAbsent()) return field;
    const FieldInfoHistory& history = vFieldInfoHistory[slot];
    for (uint16_t i = 0; i < history.nVariants; ++i) {
        if (history.vVariants[i].FHoldsIn(version)) {
            field = &history.vVariants[i];
            break;
        }
    }
    return field->FHoldsIn(version) ? field : nullptr;
}

}  // namespace sorn
