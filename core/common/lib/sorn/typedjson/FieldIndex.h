#pragma once

#include <cstdint>
#include <string_view>

#include "sorn/model/StructInfo.h"
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

    /// The field of a name, or null.
    const FieldInfo* Find(const NameKey& name) const {
        const uint32_t slot = namesM.Find(name);
        return slot != NameIndex::noneG ? &infoM.vFieldInfo[slot] : nullptr;
    }
    /// ObjectBudget::SizeOf.
    uint32_t ObjectBytes() const { return nObjectBytesM; }

    // For the cache.

    static FieldIndex* New(const StructInfo& info);
    static void Delete(FieldIndex* index);
    const StructInfo& GetSource() const { return infoM; }

 private:
    explicit FieldIndex(const StructInfo& info);
    ~FieldIndex() = default;

    const StructInfo& infoM;
    NameIndex namesM;
    uint32_t nObjectBytesM;
};

}  // namespace sorn
