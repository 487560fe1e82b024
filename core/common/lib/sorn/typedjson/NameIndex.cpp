#include "sorn/typedjson/NameIndex.h"

#include <algorithm>
#include <bit>

#include "rox/RoxMempool.h"

namespace sorn {

NameIndex::NameIndex(uint32_t nNames) : maskM(std::bit_ceil(2 * std::max(nNames, 1u)) - 1) {
    const size_t nEntries = size_t{maskM} + 1;
    vEntriesM = static_cast<Entry*>(RoxMempool::MallocIn(nullptr, nEntries * sizeof(Entry)));
    std::fill_n(vEntriesM, nEntries, Entry{0, 0, 0, nullptr, UINT32_MAX, noneG});
}

NameIndex::~NameIndex() {
    RoxMempool::FreeIn(nullptr, vEntriesM);
}

void NameIndex::Add(std::string_view name, uint32_t number) {
    const NameKey key(name);
    if (Find(key) != noneG) return;
    uint32_t i = key.Hash() & maskM;
    while (vEntriesM[i].pName != nullptr) i = (i + 1) & maskM;
    vEntriesM[i] = {key.firstM, key.middleM, key.lastM, name.data(), static_cast<uint32_t>(name.size()),
                    number};
}

}  // namespace sorn
