#include "sorn/dict/NullValue.h"

namespace sorn {

const char NullValue::classTagG = 0;

void* NullValue::VkCastHelper(const void* classTag) {
    return classTag == &classTagG ? this : DictValue::VkCastHelper(classTag);
}

// No value carries this tag, so that nulls are never equal.
bool NullValue::Equals(const ref<DictValue>& other) const {
    return other != nullptr && other->GetTag() == dictvalue::NONE;
}

}  // namespace sorn
