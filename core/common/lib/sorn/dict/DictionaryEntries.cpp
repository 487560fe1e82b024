#include "sorn/dict/DictionaryEntries.h"

#include <algorithm>
#include <cstring>

namespace sorn {

namespace {

using Name = DictionaryEntries::Name;

constexpr size_t maxInsertionSortG = 32;

uint64_t Read64(const char* p) {
    uint64_t value;
    std::memcpy(&value, p, sizeof value);
    return __builtin_bswap64(value);
}

uint32_t Read32(const char* p) {
    uint32_t value;
    std::memcpy(&value, p, sizeof value);
    return __builtin_bswap32(value);
}

static_assert(__BYTE_ORDER__ == __ORDER_LITTLE_ENDIAN__, "the prefixes are read as little-endian words");

/// The first eight bytes as a number that orders as they do, zeros behind a shorter name.
uint64_t PrefixOf(const Name& name) {
    const char* const p = name.Utf8();
    const uint32_t n = name.NByte();
    if (n >= 8) return Read64(p);
    if (n >= 4) {  // two words that overlap
        return uint64_t{Read32(p)} << 32 | uint64_t{Read32(p + n - 4)} << (8 - n) * 8;
    }
    uint64_t prefix = 0;
    for (uint32_t i = 0; i < n; ++i) prefix |= uint64_t{static_cast<unsigned char>(p[i])} << (56 - 8 * i);
    return prefix;
}

bool FBelow(const Name& a, const Name& b) {
    const uint32_t nA = a.NByte();
    const uint32_t nB = b.NByte();
    const int order = std::memcmp(a.Utf8(), b.Utf8(), std::min(nA, nB));
    return order != 0 ? order < 0 : nA < nB;
}

void InsertionSort(Name* names, size_t n) {
    uint64_t prefixes[maxInsertionSortG];
    prefixes[0] = PrefixOf(names[0]);
    for (size_t i = 1; i < n; ++i) {
        const Name name = names[i];
        const uint64_t prefix = PrefixOf(name);
        size_t place = i;
        while (place > 0 && (prefix < prefixes[place - 1] ||
                             (prefix == prefixes[place - 1] && FBelow(name, names[place - 1])))) {
            names[place] = names[place - 1];
            prefixes[place] = prefixes[place - 1];
            --place;
        }
        names[place] = name;
        prefixes[place] = prefix;
    }
}

}  // namespace

void DictionaryEntries::Sort(Name* names, size_t n) {
    if (n <= 1) return;
    if (n <= maxInsertionSortG) {
        InsertionSort(names, n);
    } else if (!std::is_sorted(names, names + n, FBelow)) {
        std::sort(names, names + n, FBelow);
    }
}

}  // namespace sorn
