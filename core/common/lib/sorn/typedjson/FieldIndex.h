#pragma once

#include <cstdint>
#include <string_view>

#include "sorn/model/StructInfo.h"
#include "sorn/typedjson/FieldKey.h"
#include "sorn/typedjson/NameIndex.h"

namespace sorn {

/// What the reader asks of a struct of the schema: its fields by name, at a cost that does not grow with the
/// struct. One for each struct that is asked for, made by the first question, never changed, and shared by
/// the whole process on the general heap.
class FieldIndex {
 public:
    /// The index of a struct; null for one that is not of the schema, and when there are too many. Any
    /// thread, no lock.
    static const FieldIndex* Of(const StructInfo& info);
    /// The same as Find by a walk over the slots.
    static const FieldInfo* FindByWalk(const StructInfo& info, std::string_view name);
    /// Deletes all indexes. Not while a conversion is going on. At the end of the process it happens by
    /// itself.
    static void DestroyAll();

    static constexpr uint32_t noneG = NameIndex::noneG;

    /// The slot of a name, or noneG. Slot 0, which has no field, is that of "type", which tells the struct.
    uint32_t FindSlot(const NameKey& name) const { return namesM.Find(name); }
    /// The field of a name, or null.
    const FieldInfo* Find(const NameKey& name) const {
        const uint32_t slot = namesM.Find(name);
        return slot != noneG ? vKeysM[slot].Field() : nullptr;
    }
    /// The key of a slot; for a slot that is none, of some other.
    const FieldKey& KeyAt(uint32_t slot) const { return vKeysM[slot < nKeysM ? slot : 0]; }
    /// Where KeyHints have what comes behind a slot.
    uint32_t HintPlace(uint32_t slot) const { return firstPlaceM + slot; }
    /// ObjectBudget::SizeOf.
    uint32_t ObjectBytes() const { return nObjectBytesM; }

    // For the cache.

    static FieldIndex* New(const StructInfo& info);
    static void Delete(FieldIndex* index);
    const StructInfo& GetSource() const { return infoM; }

 private:
    explicit FieldIndex(const StructInfo& info);
    ~FieldIndex();

    const StructInfo& infoM;
    NameIndex namesM;
    uint32_t nObjectBytesM;
    uint32_t nKeysM;       ///< slots, and at least 1
    uint32_t firstPlaceM;  ///< HintPlace of slot 0
    FieldKey* vKeysM;
};

}  // namespace sorn
