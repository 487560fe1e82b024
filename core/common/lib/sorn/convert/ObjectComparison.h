#pragma once

#include "rox/RoxWorkStack.h"
#include "sorn/convert/FieldAccess.h"
#include "sorn/model/FieldInfo.h"
#include "sorn/model/SornObject.h"
#include "sorn/model/StructInfo.h"

namespace sorn {

/// The walk that compares two objects, with a stack of its own instead of recursion. It ends at the first
/// difference.
class ObjectComparison {
 public:
    explicit ObjectComparison(RoxMempool* pool) : stackM(pool) {}

    bool FEqual(const SornObject& a, const SornObject& b);
    /// Compares two members of one field.
    bool FEqualFields(const FieldInfo& field, const FieldSource& a, const FieldSource& b);

 private:
    /// Two objects of one struct under comparison. The lowest frame of FEqualFields has no struct: it stands
    /// for one field.
    struct Frame {
        const StructInfo* pInfo;
        const SornObject* pA;
        const SornObject* pB;
        const FieldInfo* pField;  ///< the field that holds objects under way, or null
        FieldSource a;            ///< its members
        FieldSource b;
        uint32_t nextElement;
        uint32_t nElements;
        int32_t slot;
    };

    bool Run();
    bool Step();
    bool NextField();
    bool StartField(Frame& frame, const FieldInfo& field, const FieldSource& a, const FieldSource& b) const;
    bool OpenObjects(const SornObject* a, const SornObject* b);

    RoxWorkStack<Frame, 8> stackM;
};

}  // namespace sorn
