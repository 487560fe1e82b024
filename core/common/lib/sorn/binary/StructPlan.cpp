#include "sorn/binary/StructPlan.h"

#include <algorithm>
#include <new>

#include "rox/RoxGenericIntArray.h"
#include "rox/RoxMempool.h"
#include "sorn/binary/Varint.h"
#include "sorn/binary/WireFormat.h"
#include "sorn/convert/FieldAccess.h"
#include "sorn/convert/ObjectBudget.h"
#include "sorn/model/Schema.h"

namespace sorn {

namespace {

/// Ends the plans with the process.
class PlansDestructor {
 public:
    ~PlansDestructor() { StructPlans::DestroyAll(); }
};

const PlansDestructor destructorG;

/// Where the count of an object ends, behind its tables and its pool. Other threads may change it.
constexpr size_t countEndG = 2 * sizeof(void*) + sizeof(uint32_t);

uint32_t WordOf(const FieldInfo& field) {
    return field.presenceOffset / uint32_t{sizeof(size_t)};
}

/// Words with presence bytes, those of several groups counted for each.
uint32_t CountPresenceWords(const StructInfo& info, uint32_t nSlots) {
    uint32_t n = 0;
    for (uint32_t slot = 0; slot < nSlots; ++slot) {
        const FieldInfo* const field = info.vFieldInfo + slot;
        const FieldInfo* const group = field - slot % StructPlan::nGroupG;
        const auto isSame = [field](const FieldInfo& other) {
            return FHasPresenceByte(other) && WordOf(other) == WordOf(*field);
        };
        if (FHasPresenceByte(*field) && std::none_of(group, field, isSame)) ++n;
    }
    return n;
}

}  // namespace

constinit std::atomic<StructPlan*> StructPlans::vPlanG[nPlacesG] = {};

PlannedField::PlannedField(const FieldInfo& field, uint32_t tag) : PlannedField(field) {
    nTagBytes = static_cast<uint8_t>(varint::Size(tag));
    varint::Write(tag, tagBytes + sizeof tagBytes - nTagBytes);
}

StructPlan* StructPlan::New(const StructInfo& info) {
    const auto nSlots = static_cast<uint32_t>(std::max(info.nFields, 0));
    const uint32_t nGroups = (nSlots + nGroupG - 1) / nGroupG;
    const uint32_t nPresence = CountPresenceWords(info, nSlots);
    static_assert(sizeof(StructPlan) % alignof(Group) == 0 && sizeof(Group) % alignof(WrittenField) == 0 &&
                  sizeof(WrittenField) % alignof(PresenceWord) == 0 &&
                  sizeof(PresenceWord) % alignof(MemberTest) == 0);
    const size_t nBytes = sizeof(StructPlan) + nGroups * sizeof(Group) + nPresence * sizeof(PresenceWord) +
                          nSlots * (sizeof(MemberTest) + sizeof(WrittenField) + sizeof(PlannedField));
    return new (RoxMempool::CallocIn(nullptr, nBytes)) StructPlan(info, nPresence);
}

StructPlan::StructPlan(const StructInfo& info, uint32_t nPresence)
    : infoM(info),
      nObjectBytesM(ObjectBudget::SizeOf(info)),
      nSlotsM(static_cast<uint32_t>(std::max(info.nFields, 0))),
      nGroupsM((nSlotsM + nGroupG - 1) / nGroupG) {
    auto* written = reinterpret_cast<WrittenField*>(Groups() + nGroupsM);
    auto* presence = reinterpret_cast<PresenceWord*>(written + nSlotsM);
    auto* members = reinterpret_cast<MemberTest*>(presence + nPresence);
    vSlotM = reinterpret_cast<PlannedField*>(members + nSlotsM);
    for (uint32_t slot = 0; slot < nSlotsM; ++slot) {
        Group& group = Groups()[slot / nGroupG];
        if (slot % nGroupG == 0) group = {0, 0, written + slot, presence, presence, members, members};
        const FieldInfo& field = info.vFieldInfo[slot];
        vSlotM[slot] = PlannedField();
        if (field.FHole()) continue;
        vSlotM[slot] = PlannedField(field, wireformat::TagOf(slot, wireformat::WireTypeOf(field.dataType)));
        group.pWritten[BitOf(slot)] = WrittenFieldOf(slot);
        AddToGroup(field, slot);
        presence = group.pPresenceEnd;
        members = group.pMembersEnd;
    }
}

void StructPlan::AddToGroup(const FieldInfo& field, uint32_t slot) {
    static_assert(__BYTE_ORDER__ == __ORDER_LITTLE_ENDIAN__, "bytes are picked out of words");
    Group& group = Groups()[slot / nGroupG];
    const uint32_t bit = BitOf(slot);
    const FieldStorage storage = StorageOf(field.Type());
    const bool isMulti = field.arity == SORN_ARITY_MULTI;
    const bool isRequired = field.arity == SORN_ARITY_REQUIRED;
    if (storage != FieldStorage::PLAIN) group.leadsAway |= uint64_t{1} << bit;
    if (FHasPresenceByte(field)) {
        AddPresence(group, field.presenceOffset, bit);
    } else if (storage == FieldStorage::PLAIN && isMulti) {
        const size_t count = field.storageOffset + RoxGenericIntArray::CountOffset();
        *group.pMembersEnd++ = TestOf(count, UINT16_MAX, bit);
    } else if (isRequired && storage != FieldStorage::REFERENCE) {
        group.alwaysSet |= uint64_t{1} << bit;
    } else if (storage == FieldStorage::PLAIN) {
        const uint32_t mask = field.Type() == SORN_DATA_TYPE_BOOL ? UINT8_MAX : UINT32_MAX;
        *group.pMembersEnd++ = TestOf(field.storageOffset, mask, bit);
    } else {
        // References are written only when they are not null, and so are optional texts here. Containers with
        // values have storage, which their first word leads to.
        *group.pMembersEnd++ = {SIZE_MAX, field.storageOffset, static_cast<uint16_t>(bit)};
    }
}

WrittenField StructPlan::WrittenFieldOf(uint32_t slot) const {
    const PlannedField& field = vSlotM[slot];
    const DataType type = field.Type();
    const auto form = field.FMulti() ? WrittenField::OTHER : WrittenField::FormOf(type);
    WrittenField written{{}, field.storageOffset, static_cast<uint16_t>(slot), form, 0, field.nTagBytes};
    std::memcpy(written.tagBytes, field.tagBytes, sizeof written.tagBytes);
    if (written.FNumber()) {
        const unsigned nBefore = static_cast<unsigned>(sizeof(uint64_t)) - WrittenField::WidthOf(type);
        if (field.storageOffset < countEndG + nBefore) {
            written.form = WrittenField::OTHER;
            return written;
        }
        written.offset = static_cast<uint16_t>(field.storageOffset - nBefore);
        written.shift = static_cast<uint8_t>(8 * nBefore);
    }
    return written;
}

/// A test of the bytes at an offset that the mask covers, which all lie in one aligned word: so no word that
/// is looked at leaves the object.
StructPlan::MemberTest StructPlan::TestOf(size_t offset, uint32_t mask, uint32_t bit) {
    const size_t inWord = offset % sizeof(size_t);
    return {size_t{mask} << 8 * inWord, static_cast<uint16_t>(offset - inWord), static_cast<uint16_t>(bit)};
}

void StructPlan::AddPresence(Group& group, uint32_t offset, uint32_t bit) {
    const uint32_t inWord = offset % sizeof(size_t);
    const uint32_t begin = offset - inWord;
    PresenceWord* const word =
        std::find_if(group.pPresence, group.pPresenceEnd,
                     [begin](const PresenceWord& each) { return each.offset == begin; });
    if (word == group.pPresenceEnd) *group.pPresenceEnd++ = PresenceWord{{}, begin};
    for (uint32_t nibble = 0; nibble < 16; ++nibble) {
        if ((nibble >> inWord % 4 & 1) != 0) word->vSet[inWord / 4][nibble] |= uint64_t{1} << bit;
    }
}

void StructPlan::Delete(StructPlan* plan) {
    plan->~StructPlan();
    RoxMempool::FreeIn(nullptr, plan);
}

StructPlans::StructPlans(StructTable table) : tableM(table), nSharedM(0) {
    const bool isSchema = table.vStructDef == Schema::vStructDefG && table.nStructDef == Schema::nStructDefG;
    if (isSchema) nSharedM = std::min(table.nStructDef, nPlacesG);
}

// Two threads may make the same plan at once: one of them puts it in its place, the other drops its own.
const StructPlan* StructPlans::FindSlowly(uint32_t structId) {
    const StructInfo* const info = tableM.Find(structId);
    if (info == nullptr) return nullptr;
    if (structId >= nSharedM) return &Of(*info);
    StructPlan* found = nullptr;
    StructPlan* const plan = StructPlan::New(*info);
    if (vPlanG[structId].compare_exchange_strong(found, plan, std::memory_order_acq_rel,
                                                 std::memory_order_acquire)) {
        return plan;
    }
    StructPlan::Delete(plan);
    return found;
}

const StructPlan& StructPlans::Of(const StructInfo& info) {
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
