#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <string_view>

namespace sorn {

/// A name to look for, in words: two names of at most 24 bytes are equal when their words and lengths are.
class NameKey {
 public:
    explicit NameKey(std::string_view name) : pNameM(name.data()), nNameM(name.size()) {
        if (nNameM >= wordBytesG) {
            Load();
        } else if (nNameM != 0) {
            memcpy(&firstM, pNameM, nNameM);
            middleM = lastM = firstM;
        }
    }
    /// The same without a branch, for a name with wordBytesG readable bytes from its start on.
    static NameKey OfRoomy(std::string_view name) { return NameKey(name.data(), name.size()); }

 private:
    friend class NameIndex;

    static constexpr size_t wordBytesG = 8;

    NameKey(const char* name, size_t n) : pNameM(name), nNameM(n) {
        Load();
        const uint64_t mask = n == 0 ? 0 : ~uint64_t{0} >> (64 - 8 * std::min(n, wordBytesG));
        firstM &= mask;
        middleM &= mask;
        lastM &= mask;
    }
    void Load() {
        memcpy(&firstM, pNameM, sizeof firstM);
        memcpy(&middleM, pNameM + (nNameM > 2 * wordBytesG ? wordBytesG : 0), sizeof middleM);
        memcpy(&lastM, pNameM + (nNameM > wordBytesG ? nNameM - wordBytesG : 0), sizeof lastM);
    }
    uint32_t Hash() const {
        return static_cast<uint32_t>(((firstM + 31 * lastM + nNameM) * 0x9E3779B97F4A7C15) >> 32);
    }

    const char* pNameM;
    size_t nNameM;
    uint64_t firstM = 0;
    uint64_t middleM = 0;
    uint64_t lastM = 0;
};

/// Numbers by name, at a cost that does not grow with how many there are: a hash table on the general heap.
/// The names are the schema's, so its hash needs no key: what is in it is not a sender's choice, and a search
/// for any other name ends at the first gap. Once made it is only read, by any thread.
class NameIndex {
 public:
    static constexpr uint32_t noneG = UINT32_MAX;

    /// With room for so many names.
    explicit NameIndex(uint32_t nNames);
    ~NameIndex();
    NameIndex(const NameIndex&) = delete;
    NameIndex& operator=(const NameIndex&) = delete;

    /// The name stays where it is. The first of equal names stands.
    void Add(std::string_view name, uint32_t number);
    /// The number of a name, or noneG.
    uint32_t Find(const NameKey& key) const {
        for (uint32_t i = key.Hash() & maskM;; i = (i + 1) & maskM) {
            const Entry& entry = vEntriesM[i];
            const uint64_t difference = (entry.first ^ key.firstM) | (entry.middle ^ key.middleM) |
                                        (entry.last ^ key.lastM) | (entry.nName ^ key.nNameM);
            if (difference == 0 && FEqualRest(entry.pName, key)) return entry.number;
            if (entry.pName == nullptr) return noneG;
        }
    }

 private:
    struct Entry {
        uint64_t first;
        uint64_t middle;
        uint64_t last;
        const char* pName;  ///< null for an empty entry
        uint32_t nName;     ///< of an empty entry more than any name has
        uint32_t number;
    };

    static bool FEqualRest(const char* name, const NameKey& key) {
        constexpr size_t n = 3 * NameKey::wordBytesG;
        return key.nNameM <= n || memcmp(name, key.pNameM, key.nNameM) == 0;
    }

    uint32_t maskM;  ///< number of entries - 1; the number is a power of two, and half of them are empty
    Entry* vEntriesM;
};

}  // namespace sorn
