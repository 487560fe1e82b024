#include "sorn/typedjson/StructNames.h"

#include <algorithm>
#include <atomic>
#include <new>

#include "rox/RoxMempool.h"
#include "sorn/model/Schema.h"
#include "sorn/model/StructInfoMap.h"

namespace sorn {

namespace {

constinit std::atomic<NameIndex*> pNamesG = nullptr;  // the numbers are struct ids

/// Ends the table with the process.
class StructNamesDestructor {
 public:
    ~StructNamesDestructor() { StructNames::Destroy(); }
};

const StructNamesDestructor destructorG;

void Delete(NameIndex* names) {
    if (names != nullptr) names->~NameIndex();
    RoxMempool::FreeIn(nullptr, names);
}

/// Two threads may make the table at once: one of them puts it in its place, the other drops its own.
__attribute__((noinline)) const NameIndex* Make() {
    const auto nStructs = std::count_if(Schema::vStructDefG, Schema::vStructDefG + Schema::nStructDefG,
                                        [](const StructInfo* info) { return info != nullptr; });
    void* const memory = RoxMempool::MallocIn(nullptr, sizeof(NameIndex));
    auto* const names = new (memory) NameIndex(static_cast<uint32_t>(nStructs));
    for (uint32_t id = 0; id < Schema::nStructDefG; ++id) {
        const StructInfo* const info = Schema::vStructDefG[id];
        if (info != nullptr && StructInfoMap::LookupStructByName(info->name) == info)
            names->Add(info->name, id);
    }
    NameIndex* found = nullptr;
    if (pNamesG.compare_exchange_strong(found, names, std::memory_order_acq_rel, std::memory_order_acquire)) {
        return names;
    }
    Delete(names);
    return found;
}

}  // namespace

const StructInfo* StructNames::Find(const NameKey& name) {
    const NameIndex* names = pNamesG.load(std::memory_order_acquire);
    if (names == nullptr) [[unlikely]]
        names = Make();
    const uint32_t id = names->Find(name);
    return id != NameIndex::noneG ? Schema::vStructDefG[id] : nullptr;
}

void StructNames::Destroy() {
    Delete(pNamesG.exchange(nullptr, std::memory_order_acq_rel));
}

}  // namespace sorn
