#pragma once

#include <cstdint>
#include <cstring>
#include <string_view>

#include "sorn/model/StructInfo.h"

namespace sorn {

/// Finds the fields of a struct of the schema by name, at a cost that does not grow with the struct. One for
/// each struct that is asked for, made by the first question, never changed, and shared by the whole process
/// on the general heap. Its hash needs no key: what is in an index is the schema's choice, not a sender's.
class FieldIndex {
 public:
    /// The index of a struct; null for one that is not of the schema, and when there are too many. Any
    /// thread, no lock.
    static const FieldIndex* Of(const StructInfo& info);
    /// The same as FindField by a walk over the slots.
    static const FieldInfo* FindByWalk(const StructInfo& info, std::string_view name);
    /// Deletes all indexes. Not while a conversion is going on. At the end of the process it happens by
    /// itself.
    static void DestroyAll();

    /// The field of a name, or null.
    const FieldInfo* Find(std::string_view name) const {
        for (uint32_t i = Hash(name) & maskM;; i = (i + 1) & maskM) {
            const Entry& entry = vEntriesM[i];
            if (entry.pName == nullptr) return nullptr;
            if (entry.nName == name.size() && FEqual(entry.pName, name)) return &infoM.vFieldInfo[entry.slot];
        }
    }

 private:
    struct Entry {
        const char* pName;  ///< null for an empty entry
        uint32_t nName;
        int32_t slot;
    };

    FieldIndex(const StructInfo& info, uint32_t nEntries);
    ~FieldIndex();
    static FieldIndex* New(const StructInfo& info);
    static void Delete(FieldIndex* index);

    static uint64_t Load8(const char* p) {
        uint64_t word;
        memcpy(&word, p, sizeof word);
        return word;
    }
    static uint32_t Load4(const char* p) {
        uint32_t word;
        memcpy(&word, p, sizeof word);
        return word;
    }
    static uint32_t Hash(std::string_view name) {
        const char* const p = name.data();
        const size_t n = name.size();
        uint64_t word = n;
        if (n >= 8) {
            word += Load8(p) + 31 * Load8(p + n - 8);
        } else if (n >= 4) {
            word += Load4(p) + (uint64_t{Load4(p + n - 4)} << 32);
        } else {
            for (size_t i = 0; i < n; ++i) word = word << 8 | static_cast<unsigned char>(p[i]);
        }
        return static_cast<uint32_t>((word * 0x9E3779B97F4A7C15) >> 32);
    }
    /// Of names of one length.
    static bool FEqual(const char* field, std::string_view name) {
        const char* const p = name.data();
        const size_t n = name.size();
        if (n < 8 || n > 16) return memcmp(field, p, n) == 0;
        return Load8(field) == Load8(p) && Load8(field + n - 8) == Load8(p + n - 8);
    }

    const StructInfo& infoM;
    uint32_t maskM;  ///< number of entries - 1; the number is a power of two, and half of them are empty
    Entry* vEntriesM;
};

}  // namespace sorn
