#include "sorn/convert/ObjectComparison.h"
#include "sorn/model/SornObject.h"

namespace sorn {

bool SornObject::operator==(const SornObject& other) const {
    return ObjectComparison(GetMempool()).FEqual(*this, other);
}

bool SornObject::SingleFieldEquals(const FieldInfo* field, void* a, void* b) {
    return ObjectComparison(nullptr).FEqualFields(*field, FieldSource(a, false), FieldSource(b, false));
}

bool SornObject::MultiFieldEquals(const FieldInfo* field, void* a, void* b) {
    return ObjectComparison(nullptr).FEqualFields(*field, FieldSource(a, true), FieldSource(b, true));
}

}  // namespace sorn
