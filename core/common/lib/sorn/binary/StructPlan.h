#pragma once

#include <atomic>
#include <cstddef>
#include <cstdint>
#include <cstring>

#include "sorn/model/StructInfo.h"

namespace sorn {

/// A field as the codec wants it: what FieldInfo says, and its tag.
struct PlannedField {
    /// What a field's values are: the data type of a single field, and that with multiG of a repeated one.
    static constexpr uint8_t multiG = 32;
    /// Neither: a slot without a field.
    static constexpr uint8_t holeG = 2 * multiG;

    /// A word, so that it is copied at once.
    static constexpr size_t maxTagBytesG = 8;

    PlannedField() = default;
    /// Without a tag.
    explicit PlannedField(const FieldInfo& field)
        : storageOffset(field.storageOffset),
          presenceOffset(field.presenceOffset),
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

/// A struct's metadata in the form in which the codec walks it: worked out once for a struct, never changed,
/// and shared by the whole process on the general heap.
class StructPlan {
 public:
    StructPlan(const StructPlan&) = delete;
    StructPlan& operator=(const StructPlan&) = delete;

    const StructInfo& Info() const { return infoM; }
    /// What ObjectBudget counts for an object.
    uint32_t ObjectBytes() const { return nObjectBytesM; }

    uint32_t NSlots() const { return nSlotsM; }
    const PlannedField& Slot(uint32_t slot) const { return vSlotM[slot]; }

    // The fields without the holes, in the order of their slots.

    uint32_t NFields() const { return nFieldsM; }
    const PlannedField& Field(uint32_t i) const { return vFieldM[i]; }
    /// Of the n fields from `first` on, 64 at most: a bit for each that has a value in the object. A bit may
    /// stand for a repeated field without values, too. Without a branch for each field, since which fields
    /// are set cannot be foretold.
    uint64_t FindSet(const void* object, uint32_t first, uint32_t n) const {
        uint64_t isSet = 0;
        for (const Test* test = vTestM + first + n; test-- != vTestM + first;) {
            size_t word;
            std::memcpy(&word, static_cast<const char*>(object) + test->offset, sizeof word);
            isSet = isSet * 2 + ((word & test->mask) != 0);
        }
        return isSet;
    }

 private:
    friend class StructPlans;
    /// A field has a value when a bit of the mask is set in the word at the offset in its object.
    struct Test {
        size_t mask;
        size_t offset;
    };

    explicit StructPlan(const StructInfo& info);
    ~StructPlan();
    static StructPlan* New(const StructInfo& info);
    static void Delete(StructPlan* plan);
    static Test TestOf(const FieldInfo& field);

    const StructInfo& infoM;
    uint32_t nObjectBytesM;
    uint32_t nSlotsM;
    uint32_t nFieldsM = 0;
    PlannedField* vSlotM;
    PlannedField* vFieldM;
    Test* vTestM;
    StructPlan* pNextM = nullptr;  // in the list of one StructPlans
};

/// Where a walk gets its plans from. Those of the schema's structs are made by the first question and kept
/// for the process, without a lock. Those of other structs, whose metadata may end before the process does,
/// live as long as this. One thread at a time.
class StructPlans {
 public:
    StructPlans() = default;
    StructPlans(const StructPlans&) = delete;
    StructPlans& operator=(const StructPlans&) = delete;
    ~StructPlans() {
        if (ownM != nullptr) [[unlikely]]
            DeleteOwn();
    }

    const StructPlan& Of(const StructInfo& info) {
        const StructPlan* const plan = vPlanG[PlaceOf(info)].load(std::memory_order_acquire);
        if (plan != nullptr && &plan->infoM == &info) [[likely]]
            return *plan;
        return Find(info);
    }

    /// Deletes the plans of the schema's structs. Not while anybody uses one. At the end of the process it
    /// happens by itself.
    static void DestroyAll();

 private:
    static constexpr unsigned nPlaceBitsG = 10;  // room for all structs of the schema
    static constexpr size_t nPlacesG = size_t{1} << nPlaceBitsG;
    static constexpr unsigned nProbesG = 16;

    /// Structs lie one behind another: multiplication spreads what the low bits have.
    static size_t PlaceOf(const StructInfo& info) {
        const uint64_t address = reinterpret_cast<uintptr_t>(&info) / alignof(StructInfo);
        return static_cast<size_t>(address * 0x9E3779B97F4A7C15 >> (64 - nPlaceBitsG));
    }
    const StructPlan& Find(const StructInfo& info);
    const StructPlan& FindOwn(const StructInfo& info);
    void DeleteOwn();

    static std::atomic<StructPlan*> vPlanG[nPlacesG];

    StructPlan* ownM = nullptr;
};

}  // namespace sorn
