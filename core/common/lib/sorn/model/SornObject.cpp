#include "sorn/model/SornObject.h"

#include "sorn/model/Schema.h"

namespace sorn {

const char SornObject::classTagG = 0;

void* SornObject::VkCastHelper(const void* classTag) {
    return classTag == &classTagG ? this : RoxCore::VkCastHelper(classTag);
}

void SornObject::SetDebugLockOwner(RoxLockId) {}

RoxString SornObject::GetTypeName() const {
    return RoxString(GetMempool(), Schema::vStructDefG[structId]->name);
}

bool SornObject::FPresent(const FieldInfo& field) const {
    if (field.presenceOffset != 0) return reinterpret_cast<const char*>(this)[field.presenceOffset] != 0;
    return static_cast<const RefBase*>(MemberAt(field))->GetCore() != nullptr;
}

}  // namespace sorn
