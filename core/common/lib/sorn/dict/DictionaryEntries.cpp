#include "sorn/dict/DictionaryEntries.h"

#include <algorithm>
#include <cstring>
#include <utility>

#include "rox/RoxMempool.h"
#include "rox/RoxWorkStack.h"

namespace sorn {

namespace {

using Name = DictionaryEntries::Name;

constexpr size_t maxInsertionSortG = 32;
/// From here on names are sorted by distribution, whose cost grows with their bytes and not faster.
constexpr size_t minDistributionSortG = 1024;

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

/// The eight bytes from `depth` on as a number that orders as they do, zeros behind a shorter name.
uint64_t PrefixOf(const Name& name, uint32_t depth = 0) {
    const char* const p = name.Utf8() + depth;
    const uint32_t n = name.NByte() - depth;
    if (n >= 8) return Read64(p);
    if (n >= 4) {  // two words that overlap
        return uint64_t{Read32(p)} << 32 | uint64_t{Read32(p + n - 4)} << (8 - n) * 8;
    }
    uint64_t prefix = 0;
    for (uint32_t i = 0; i < n; ++i) prefix |= uint64_t{static_cast<unsigned char>(p[i])} << (56 - 8 * i);
    return prefix;
}

/// Compares two names that are one up to `depth`.
bool FBelow(const Name& a, const Name& b, uint32_t depth = 0) {
    const uint32_t nA = a.NByte();
    const uint32_t nB = b.NByte();
    const int order = std::memcmp(a.Utf8() + depth, b.Utf8() + depth, std::min(nA, nB) - depth);
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

/// Sorts many names eight bytes at a time: least significant byte first, then each group that has the same
/// eight bytes by the next ones.
class DistributionSort {
 public:
    DistributionSort(Name* names, size_t n) : namesM(names), groupsM(nullptr) {
        for (Keyed*& keys : vKeysM)
            keys = static_cast<Keyed*>(RoxMempool::MallocIn(nullptr, n * sizeof(Keyed)));
        groupsM.Push({0, n, 0});
    }
    ~DistributionSort() {
        for (Keyed* keys : vKeysM) RoxMempool::FreeIn(nullptr, keys);
    }
    DistributionSort(const DistributionSort&) = delete;
    DistributionSort& operator=(const DistributionSort&) = delete;

    void Run() {
        while (!groupsM.FEmpty()) {
            const Group group = groupsM.Top();
            groupsM.Pop();
            const auto fBelow = [&group](const Name& a, const Name& b) { return FBelow(a, b, group.depth); };
            if (group.end - group.begin < minDistributionSortG) {
                std::sort(namesM + group.begin, namesM + group.end, fBelow);
            } else {
                SortGroup(group);
            }
        }
    }

 private:
    struct Keyed {
        uint64_t prefix;
        Name name;
    };
    /// Names from `begin` to `end` that are one up to `depth`.
    struct Group {
        size_t begin;
        size_t end;
        uint32_t depth;
    };

    void SortGroup(const Group& group) {
        const size_t n = group.end - group.begin;
        uint32_t counts[8][256] = {};
        for (size_t i = 0; i < n; ++i) {
            const Name& name = namesM[group.begin + i];
            const uint64_t prefix = PrefixOf(name, group.depth);
            vKeysM[0][i] = {prefix, name};
            for (unsigned byte = 0; byte < 8; ++byte) ++counts[byte][prefix >> 8 * byte & 0xFF];
        }
        for (unsigned byte = 0; byte < 8; ++byte) Distribute(byte, counts[byte], n);
        for (size_t i = 0; i < n; ++i) namesM[group.begin + i] = vKeysM[0][i].name;
        PushEqualOnes(group);
    }

    /// One stable pass over all keys by one byte, unless they all have the same one.
    void Distribute(unsigned byte, uint32_t* counts, size_t n) {
        const auto byteOf = [byte](const Keyed& key) { return key.prefix >> 8 * byte & 0xFF; };
        if (counts[byteOf(vKeysM[0][0])] == n) return;
        uint32_t place = 0;
        for (unsigned value = 0; value < 256; ++value) place += std::exchange(counts[value], place);
        for (size_t i = 0; i < n; ++i) vKeysM[1][counts[byteOf(vKeysM[0][i])]++] = vKeysM[0][i];
        std::swap(vKeysM[0], vKeysM[1]);
    }

    /// Names with the same eight bytes are left, ordered by what follows; those that end here by their
    /// lengths, since zeros may be bytes of theirs.
    void PushEqualOnes(const Group& group) {
        const size_t n = group.end - group.begin;
        for (size_t i = 0; i < n;) {
            size_t next = i + 1;
            while (next < n && vKeysM[0][next].prefix == vKeysM[0][i].prefix) ++next;
            if (next - i > 1) PushEqualOnes(group.begin + i, group.begin + next, group.depth + 8);
            i = next;
        }
    }
    void PushEqualOnes(size_t begin, size_t end, uint32_t depth) {
        Name* const behindShort = std::partition(namesM + begin, namesM + end,
                                                 [depth](const Name& name) { return name.NByte() <= depth; });
        std::sort(namesM + begin, behindShort,
                  [](const Name& a, const Name& b) { return a.NByte() < b.NByte(); });
        const size_t beginLong = static_cast<size_t>(behindShort - namesM);
        if (end - beginLong > 1) groupsM.Push({beginLong, end, depth});
    }

    Name* namesM;
    Keyed* vKeysM[2];
    RoxWorkStack<Group, 16> groupsM;
};

}  // namespace

void DictionaryEntries::Sort(Name* names, size_t n) {
    if (n <= 1) return;
    const auto fBelow = [](const Name& a, const Name& b) { return FBelow(a, b); };
    if (n <= maxInsertionSortG) {
        InsertionSort(names, n);
    } else if (std::is_sorted(names, names + n, fBelow)) {
        return;
    } else if (n < minDistributionSortG) {
        std::sort(names, names + n, fBelow);
    } else {
        DistributionSort(names, n).Run();
    }
}

}  // namespace sorn
