#pragma once

#include <cstddef>
#include <cstdint>

#include "sorn/model/EnumDef.h"

namespace sorn {

/// Finds enumeration values by name at a cost that does not grow with the enumeration, whatever names a
/// sender picks: a hash table, keyed with the seed of the process. One for each enumeration that is asked
/// for, made by the first question and never changed afterwards. It lies on the general heap, shared by the
/// whole process. Names are bytes without a NUL among them.
class EnumNameIndex {
 public:
    /// Enumerations up to this length are walked from the start instead, which is as fast and needs no
    /// memory.
    static constexpr uint32_t longestWalkG = 32;

    /// The value of a NUL-terminated name of nName bytes: the lowest one when several have it. False, and
    /// `value` untouched, when none has. `def` must stay where it is until DestroyAll. Any thread, no lock.
    static bool Find(const EnumDef& def, const char* name, size_t nName, uint32_t& value);
    /// The same by a walk over the names, without an index.
    static bool FindByWalk(const EnumDef& def, const char* name, uint32_t& value);

    /// Deletes all indexes. Not while a conversion is going on. At the end of the process it happens by
    /// itself.
    static void DestroyAll();

 private:
    EnumNameIndex(const EnumDef& def, uint32_t nNames);
    ~EnumNameIndex();
    static EnumNameIndex* New(const EnumDef& def);
    static void Delete(EnumNameIndex* index);
    static const EnumNameIndex& Of(const EnumDef& def);
    static const EnumNameIndex* FindIndex(const EnumNameIndex* first, const EnumDef& def);

    /// The slot that holds a name's value, or the empty one where it belongs.
    uint32_t& SlotOf(const char* name, size_t nName) const;

    const EnumDef& defM;
    EnumNameIndex* pNextM = nullptr;
    uint32_t maskM;     ///< number of slots - 1; the number is a power of two, and half of them are empty
    uint32_t* vSlotsM;  ///< value + 1, or 0
};

}  // namespace sorn
