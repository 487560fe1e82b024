#include "sorn/dict/LazyDictValue.h"

#include "rox/VkCast.h"

namespace sorn {

const char LazyDictValue::classTagG = 0;

ref<LazyDict> LazyDictValue::BodyOf(const DictValue& value) {
    const auto* const lazy = VkCast<LazyDictValue>(const_cast<DictValue*>(&value));
    return lazy == nullptr ? ref<LazyDict>() : lazy->bodyM;
}

ref<LazyDict> LazyDictValue::EmptyValue(RoxMempool* pool) {
    return NewEmptyLazyBody(pool);
}

void* LazyDictValue::VkCastHelper(const void* classTag) {
    return classTag == &classTagG ? this : DictValue::VkCastHelper(classTag);
}

bool LazyDictValue::Equals(const ref<DictValue>& other) const {
    return other != nullptr && other->GetTag() == dictvalue::LAZY_DICT &&
           FEqualLazyBodies(bodyM, BodyOf(*other));
}

}  // namespace sorn
