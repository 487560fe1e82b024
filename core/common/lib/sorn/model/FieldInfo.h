#pragma once

#include <cstdint>

#include "sorn/model/Arity.h"
#include "sorn/model/DataType.h"
#include "sorn/model/OrvoVersion.h"

namespace sorn {

/// One slot of a struct, or one older variant of a slot's field. Ten bytes of constant data; the slot's index
/// in StructInfo::vFieldInfo is the field number.
struct FieldInfo {
    uint8_t firstVersion;   ///< first schema version in which this record holds
    uint8_t lastVersion;    ///< last schema version in which this record holds, inclusive
    uint16_t dataType : 5;  ///< a DataType
    uint16_t arity : 2;     ///< an Arity
    uint16_t
        presenceOffset : 9;  ///< bytes from the object's start to the presence byte; 0 when there is none
    uint16_t storageOffset;  ///< bytes from the object's start to the member
    uint16_t typeRef;        ///< struct id or enum id, as the data type says; else 0
    uint16_t nameOffset;     ///< bytes from StructInfo::pFieldNames to the name; meaningless in a hole

    DataType Type() const { return static_cast<DataType>(dataType); }

    /// A hole is a slot without a field: number 0, or a retired number. Every walk skips it.
    bool FHole() const { return arity == SORN_ARITY_NONE; }

    /// Whether this record holds in a version. Without a version every record does.
    bool FHoldsIn(OrvoVersion version) const {
        return version.FAbsent() || (version.Number() >= firstVersion && version.Number() <= lastVersion);
    }
};

static_assert(sizeof(FieldInfo) == 10);

}  // namespace sorn
