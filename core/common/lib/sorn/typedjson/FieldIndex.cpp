#include "sorn/typedjson/FieldIndex.h"

#include <algorithm>
#include <atomic>
#include <bit>
#include <new>

#include "rox/RoxMempool.h"
#include "sorn/model/StructInfoMap.h"

namespace sorn {

namespace {

/// Room for all structs of the schema; an index lies at the place of its struct's address or soon behind it.
constexpr size_t nPlacesG = 1024;
constexpr unsigned nProbesG = 16;
constinit std::atomic<FieldIndex*> vIndexG[nPlacesG] = {};

/// Ends the indexes with the process.
class FieldIndexDestructor {
 public:
    ~FieldIndexDestructor() { FieldIndex::DestroyAll(); }
};

const FieldIndexDestructor destructorG;

}  // namespace

FieldIndex::FieldIndex(const StructInfo& info, uint32_t nEntries) : infoM(info), maskM(nEntries - 1) {
    vEntriesM = static_cast<Entry*>(RoxMempool::CallocIn(nullptr, nEntries * sizeof(Entry)));
    for (int32_t slot = 0; slot < info.nFields; ++slot) {
        const FieldInfo& field = info.vFieldInfo[slot];
        if (field.FHole()) continue;
        const std::string_view name = info.FieldName(field);
        if (Find(name) != nullptr) continue;
        uint32_t i = Hash(name) & maskM;
        while (vEntriesM[i].pName != nullptr) i = (i + 1) & maskM;
        vEntriesM[i] = {name.data(), static_cast<uint32_t>(name.size()), slot};
    }
}

FieldIndex::~FieldIndex() {
    RoxMempool::FreeIn(nullptr, vEntriesM);
}

FieldIndex* FieldIndex::New(const StructInfo& info) {
    const uint32_t nEntries = std::bit_ceil(2 * static_cast<uint32_t>(std::max(info.nFields, 1)));
    return new (RoxMempool::MallocIn(nullptr, sizeof(FieldIndex))) FieldIndex(info, nEntries);
}

void FieldIndex::Delete(FieldIndex* index) {
    index->~FieldIndex();
    RoxMempool::FreeIn(nullptr, index);
}

// Two threads may make the same index at once: one of them puts it in its place, the other drops its own.
const FieldIndex* FieldIndex::Of(const StructInfo& info) {
    const uint64_t address = reinterpret_cast<uintptr_t>(&info) / alignof(StructInfo);
    size_t place = static_cast<size_t>(address * 0x9E3779B97F4A7C15 >> 54);
    static_assert(nPlacesG == size_t{1} << (64 - 54));
    for (unsigned i = 0; i < nProbesG; ++i, place = (place + 1) % nPlacesG) {
        FieldIndex* found = vIndexG[place].load(std::memory_order_acquire);
        if (found == nullptr) {
            if (StructInfoMap::LookupStructByName(info.name) != &info) return nullptr;
            FieldIndex* const index = New(info);
            if (vIndexG[place].compare_exchange_strong(found, index, std::memory_order_acq_rel,
                                                       std::memory_order_acquire)) {
                return index;
            }
            Delete(index);
        }
        if (&found->infoM == &info) return found;
    }
    return nullptr;
}

const FieldInfo* FieldIndex::FindByWalk(const StructInfo& info, std::string_view name) {
    for (int32_t slot = 0; slot < info.nFields; ++slot) {
        const FieldInfo& field = info.vFieldInfo[slot];
        if (!field.FHole() && info.FieldName(field) == name) return &field;
    }
    return nullptr;
}

void FieldIndex::DestroyAll() {
    for (std::atomic<FieldIndex*>& place : vIndexG) {
        FieldIndex* const index = place.exchange(nullptr, std::memory_order_acq_rel);
        if (index != nullptr) Delete(index);
    }
}

}  // namespace sorn
