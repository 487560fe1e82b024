#pragma once

#if defined(__SSE2__) && defined(__x86_64__)
#include <emmintrin.h>
#endif

#include <algorithm>
#include <atomic>
#include <cstddef>
#include <cstdint>
#include <cstring>

#include "sorn/binary/WrittenField.h"
#include "sorn/convert/StructTable.h"
#include "sorn/model/StructInfo.h"

namespace sorn {

/// Only of optional fields a presence byte is looked at, and only when metadata gives them one.
inline bool FHasPresenceByte(const FieldInfo& field) {
    return field.arity == SORN_ARITY_OPTIONAL && field.presenceOffset != 0;
}

/// A field as the codec wants it: what FieldInfo says, and its tag.
struct PlannedField {
    /// What a field's values are: the data type of a single field, and that with multiG of a repeated one.
    static constexpr uint8_t multiG = 32;
    /// Neither: a slot without a field.
    static constexpr uint8_t holeG = 2 * multiG;

    static constexpr size_t maxTagBytesG = WrittenField::maxTagBytesG;

    PlannedField() = default;
    /// Without a tag.
    explicit PlannedField(const FieldInfo& field)
        : storageOffset(field.storageOffset),
          presenceOffset(FHasPresenceByte(field) ? field.presenceOffset : uint16_t{0}),
          typeRef(field.typeRef),
          kind(static_cast<uint8_t>(field.dataType + (field.arity == SORN_ARITY_MULTI ? multiG : 0))) {}
    PlannedField(const FieldInfo& field, uint32_t tag);

    DataType Type() const { return static_cast<DataType>(kind % multiG); }
    bool FMulti() const { return (kind & multiG) != 0; }

    /// Writes the tag so that it ends before p; gives its first byte. maxTagBytesG bytes before p are
    /// overwritten.
    unsigned char* WriteTag(unsigned char* p) const {
        std::memcpy(p - sizeof tagBytes, tagBytes, sizeof tagBytes);
        return p - nTagBytes;
    }

    unsigned char tagBytes[maxTagBytesG] = {};  ///< the last nTagBytes of them
    uint16_t storageOffset = 0;
    uint16_t presenceOffset = 0;  ///< 0 when there is no presence byte
    uint16_t typeRef = 0;
    uint8_t kind = holeG;
    uint8_t nTagBytes = 0;
};

/// A struct's metadata in the form in which the codec walks it. Never changes. One block of the general heap.
class StructPlan {
 public:
    StructPlan(const StructPlan&) = delete;
    StructPlan& operator=(const StructPlan&) = delete;

    const StructInfo& Info() const { return infoM; }
    /// What ObjectBudget counts for an object.
    uint32_t ObjectBytes() const { return nObjectBytesM; }
    uint32_t NSlots() const { return nSlotsM; }
    const PlannedField& Slot(uint32_t slot) const { return vSlotM[slot]; }

    /// Slots that are looked at together.
    static constexpr uint32_t nGroupG = 64;
    uint32_t NGroups() const { return nGroupsM; }
    /// The fields of a group, the last slot first.
    const WrittenField* WrittenOf(uint32_t iGroup) const { return Groups()[iGroup].pWritten; }
    /// A bit for each slot of a group, the lowest for the last one, whose field has a value in the object: an
    /// optional one by its presence byte, or, without one, by the first 32 bits of its member, a reference by
    /// all of it; the bit may stand for a repeated field without values, too. Without a branch for each
    /// field, since which fields are set cannot be foretold.
    uint64_t FindSet(const void* object, uint32_t iGroup) const {
        const Group& group = Groups()[iGroup];
        uint64_t isSet = group.alwaysSet;
        for (const PresenceWord* word = group.pPresence; word != group.pPresenceEnd; ++word) {
            const unsigned bits = NonZeroBytes(LoadWord(object, word->offset));
            isSet |= word->vSet[0][bits % 16];
            if constexpr (nNibblesG == 2) isSet |= word->vSet[nNibblesG - 1][bits / 16];
        }
        for (const MemberTest* test = group.pMembers; test != group.pMembersEnd; ++test) {
            isSet |= uint64_t{(LoadWord(object, test->offset) & test->mask) != 0} << test->bit;
        }
        Prefetch(object, group, isSet & group.leadsAway);
        return isSet;
    }

 private:
    friend class StructPlans;
    static constexpr unsigned nNibblesG = sizeof(size_t) / 4;
    /// As many presence bytes as a word has: what the fields of four of them that are set add to the result.
    struct PresenceWord {
        uint64_t vSet[nNibblesG][16];
        size_t offset;
    };
    /// A field without presence byte has a value when a bit of the mask is set in the word at the offset.
    struct MemberTest {
        size_t mask;
        uint16_t offset;
        uint16_t bit;
    };
    struct Group {
        uint64_t alwaysSet;
        uint64_t leadsAway;  ///< the fields whose member begins with a pointer
        WrittenField* pWritten;
        PresenceWord* pPresence;
        PresenceWord* pPresenceEnd;
        MemberTest* pMembers;
        MemberTest* pMembersEnd;
    };

    /// Has what the fields' members lead to brought near, all at once: in a large tree the waiting for memory
    /// is what writing takes. Always inlined, since GCC takes a function that only prefetches for one without
    /// effect, and drops the call.
    __attribute__((always_inline)) static void Prefetch(const void* object, const Group& group,
                                                        uint64_t fields) {
        for (; fields != 0; fields &= fields - 1) {
            const void* p;
            const uint16_t offset = group.pWritten[__builtin_ctzll(fields)].offset;
            std::memcpy(&p, static_cast<const char*>(object) + offset, sizeof p);
            __builtin_prefetch(p);
        }
    }
    static size_t LoadWord(const void* object, size_t offset) {
        size_t word;
        std::memcpy(&word, static_cast<const char*>(object) + offset, sizeof word);
        return word;
    }
    /// A bit for each byte of the word, the lowest for the first one.
    static unsigned NonZeroBytes(size_t word) {
#if defined(__SSE2__) && defined(__x86_64__)
        const __m128i bytes = _mm_cvtsi64_si128(static_cast<long long>(word));
        const int isZero = _mm_movemask_epi8(_mm_cmpeq_epi8(bytes, _mm_setzero_si128()));
        return static_cast<unsigned>(isZero) ^ 0xFFFF;
#else
        constexpr uint64_t lowBits = 0x7F7F7F7F7F7F7F7F;
        const uint64_t tops = (((word & lowBits) + lowBits) | word) & ~lowBits;
        return static_cast<unsigned>((tops >> 7) * 0x0102040810204080 >> 56);
#endif
    }

    StructPlan(const StructInfo& info, uint32_t nPresence);
    ~StructPlan() = default;
    static StructPlan* New(const StructInfo& info);
    static void Delete(StructPlan* plan);
    void AddToGroup(const FieldInfo& field, uint32_t slot);
    WrittenField WrittenFieldOf(uint32_t slot) const;
    uint32_t BitOf(uint32_t slot) const {
        return std::min(nSlotsM - slot / nGroupG * nGroupG, nGroupG) - 1 - slot % nGroupG;
    }
    static MemberTest TestOf(size_t offset, uint32_t mask, uint32_t bit);
    static void AddPresence(Group& group, uint32_t offset, uint32_t bit);
    // The groups lie right behind the plan, so that no pointer leads to them; then the rest.
    Group* Groups() {
        return reinterpret_cast<Group*>(this + 1);
    }
    const Group* Groups() const {
        return reinterpret_cast<const Group*>(this + 1);
    }

    const StructInfo& infoM;
    uint32_t nObjectBytesM;
    uint32_t nSlotsM;
    uint32_t nGroupsM;
    PlannedField* vSlotM;
    StructPlan* pNextM = nullptr;  // in the list of one StructPlans
};

/// Where a walk over objects of a table's structs gets its plans from. Those of the schema's are made by the
/// first question and kept for the process, without a lock; those of other tables, whose metadata may end
/// before the process does, live as long as this. One thread at a time.
class StructPlans {
 public:
    explicit StructPlans(StructTable table);
    StructPlans(const StructPlans&) = delete;
    StructPlans& operator=(const StructPlans&) = delete;
    ~StructPlans() {
        if (ownM != nullptr) [[unlikely]]
            DeleteOwn();
    }

    /// The plan of the struct with this id; null for an id that names none.
    const StructPlan* Find(uint32_t structId) {
        if (structId < nSharedM) [[likely]] {
            const StructPlan* const plan = vPlanG[structId].load(std::memory_order_acquire);
            if (plan != nullptr) [[likely]]
                return plan;
        }
        return FindSlowly(structId);
    }
    /// The plan of any struct.
    const StructPlan& Of(const StructInfo& info);

    /// Deletes the plans of the schema's structs. Not while anybody uses one. At the end of the process it
    /// happens by itself.
    static void DestroyAll();

 private:
    /// Room for all structs of the schema, by their ids.
    static constexpr uint32_t nPlacesG = 8192;

    const StructPlan* FindSlowly(uint32_t structId);
    void DeleteOwn();

    static std::atomic<StructPlan*> vPlanG[nPlacesG];

    StructTable tableM;
    uint32_t nSharedM;  // ids below it have their plans in vPlanG
    StructPlan* ownM = nullptr;
};

}  // namespace sorn
