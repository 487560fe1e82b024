#include "sorn/binary/StructPlan.h"

#include <algorithm>
#include <new>

#include "rox/RoxGenericIntArray.h"
#include "rox/RoxMempool.h"
#include "sorn/binary/Varint.h"
#include "sorn/binary/WireFormat.h"
#include "sorn/convert/FieldAccess.h"
#include "sorn/convert/ObjectBudget.h"
#include "sorn/model/StructInfoMap.h"

namespace sorn {

namespace {

/// Ends the plans with the process.
class PlansDestructor {
 public:
    ~PlansDestructor() { StructPlans::DestroyAll(); }
};

const PlansDestructor destructorG;

template <class T>
T* NewArray(uint32_t n) {
    return static_cast<T*>(RoxMempool::CallocIn(nullptr, std::max<size_t>(n, 1) * sizeof(T)));
}

}  // namespace

constinit std::atomic<StructPlan*> StructPlans::vPlanG[nPlacesG] = {};

PlannedField::PlannedField(const FieldInfo& field, uint32_t tag) : PlannedField(field) {
    nTagBytes = static_cast<uint8_t>(varint::Size(tag));
    varint::Write(tag, tagBytes + sizeof tagBytes - nTagBytes);
}

StructPlan::Test StructPlan::TestOf(const FieldInfo& field) {
    static_assert(__BYTE_ORDER__ == __ORDER_LITTLE_ENDIAN__, "bytes are picked out of words");
    const auto part = [](size_t offset, size_t mask) {
        const size_t inWord = offset % sizeof(size_t);
        return Test{mask << 8 * inWord, offset - inWord};
    };
    constexpr Test alwaysSet{SIZE_MAX, 0};  // the pointer to the object's virtual table
    if (field.presenceOffset != 0) return part(field.presenceOffset, UINT8_MAX);
    const FieldStorage storage = StorageOf(field.Type());
    if (storage == FieldStorage::PLAIN) {
        if (field.arity != SORN_ARITY_MULTI) return alwaysSet;
        return part(field.storageOffset + RoxGenericIntArray::CountOffset(), UINT16_MAX);
    }
    if (storage == FieldStorage::TEXT && field.arity == SORN_ARITY_REQUIRED) return alwaysSet;
    // References are written only when they are not null. Containers with values have storage, which their
    // first word leads to.
    return {SIZE_MAX, field.storageOffset};
}

StructPlan::StructPlan(const StructInfo& info)
    : infoM(info),
      nObjectBytesM(ObjectBudget::SizeOf(info)),
      nSlotsM(static_cast<uint32_t>(std::max(info.nFields, 0))),
      vSlotM(NewArray<PlannedField>(nSlotsM)),
      vFieldM(NewArray<PlannedField>(nSlotsM)),
      vTestM(NewArray<Test>(nSlotsM)) {
    for (uint32_t slot = 0; slot < nSlotsM; ++slot) {
        const FieldInfo& field = info.vFieldInfo[slot];
        vSlotM[slot] = PlannedField();
        if (field.FHole()) continue;
        const uint32_t tag = wireformat::TagOf(slot, wireformat::WireTypeOf(field.dataType));
        vSlotM[slot] = vFieldM[nFieldsM] = PlannedField(field, tag);
        vTestM[nFieldsM++] = TestOf(field);
    }
}

StructPlan::~StructPlan() {
    RoxMempool::FreeIn(nullptr, vSlotM);
    RoxMempool::FreeIn(nullptr, vFieldM);
    RoxMempool::FreeIn(nullptr, vTestM);
}

StructPlan* StructPlan::New(const StructInfo& info) {
    return new (RoxMempool::MallocIn(nullptr, sizeof(StructPlan))) StructPlan(info);
}

void StructPlan::Delete(StructPlan* plan) {
    plan->~StructPlan();
    RoxMempool::FreeIn(nullptr, plan);
}

// Two threads may make the same plan at once: one of them puts it in its place, the other drops its own.
const StructPlan& StructPlans::Find(const StructInfo& info) {
    if (StructInfoMap::LookupStructByName(info.name) != &info) return FindOwn(info);
    size_t place = PlaceOf(info);
    for (unsigned i = 0; i < nProbesG; ++i, place = (place + 1) % nPlacesG) {
        StructPlan* found = vPlanG[place].load(std::memory_order_acquire);
        if (found == nullptr) {
            StructPlan* const plan = StructPlan::New(info);
            if (vPlanG[place].compare_exchange_strong(found, plan, std::memory_order_acq_rel,
                                                      std::memory_order_acquire)) {
                return *plan;
            }
            StructPlan::Delete(plan);
        }
        if (&found->infoM == &info) return *found;
    }
    return FindOwn(info);
}

const StructPlan& StructPlans::FindOwn(const StructInfo& info) {
    for (const StructPlan* plan = ownM; plan != nullptr; plan = plan->pNextM) {
        if (&plan->infoM == &info) return *plan;
    }
    StructPlan* const plan = StructPlan::New(info);
    plan->pNextM = ownM;
    return *(ownM = plan);
}

void StructPlans::DeleteOwn() {
    while (ownM != nullptr) {
        StructPlan* const next = ownM->pNextM;
        StructPlan::Delete(ownM);
        ownM = next;
    }
}

void StructPlans::DestroyAll() {
    for (std::atomic<StructPlan*>& place : vPlanG) {
        StructPlan* const plan = place.exchange(nullptr, std::memory_order_acq_rel);
        if (plan != nullptr) StructPlan::Delete(plan);
    }
}

}  // namespace sorn
