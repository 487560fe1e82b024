#include "sorn/convert/EnumNameIndex.h"

#include <algorithm>
#include <atomic>
#include <bit>
#include <cstring>
#include <new>

#include "rox/RoxHashBytes.h"
#include "rox/RoxMempool.h"

namespace sorn {

namespace {

// All indexes, the newest first. Only long enumerations of the schema are in it, about a dozen.
constinit std::atomic<EnumNameIndex*> pFirstG = nullptr;

/// Ends the indexes with the process.
class EnumNameIndexDestructor {
 public:
    ~EnumNameIndexDestructor() { EnumNameIndex::DestroyAll(); }
};

const EnumNameIndexDestructor destructorG;

uint32_t CountNames(const EnumDef& def) {
    return static_cast<uint32_t>(
        std::count_if(def.names, def.names + def.count, [](const char* name) { return name != nullptr; }));
}

}  // namespace

EnumNameIndex::EnumNameIndex(const EnumDef& def, uint32_t nNames)
    : defM(def), maskM(std::bit_ceil(std::max(2 * nNames, 1u)) - 1) {
    vSlotsM = static_cast<uint32_t*>(RoxMempool::CallocIn(nullptr, (size_t{maskM} + 1) * sizeof(uint32_t)));
    for (uint32_t value = 0; value < def.count; ++value) {
        const char* name = def.names[value];
        if (name == nullptr) continue;
        uint32_t& slot = SlotOf(name, strlen(name));
        if (slot == 0) slot = value + 1;
    }
}

EnumNameIndex::~EnumNameIndex() {
    RoxMempool::FreeIn(nullptr, vSlotsM);
}

EnumNameIndex* EnumNameIndex::New(const EnumDef& def) {
    return new (RoxMempool::MallocIn(nullptr, sizeof(EnumNameIndex))) EnumNameIndex(def, CountNames(def));
}

void EnumNameIndex::Delete(EnumNameIndex* index) {
    index->~EnumNameIndex();
    RoxMempool::FreeIn(nullptr, index);
}

uint32_t& EnumNameIndex::SlotOf(const char* name, size_t nName) const {
    for (uint32_t i = RoxHashBytes(name, nName) & maskM;; i = (i + 1) & maskM) {
        uint32_t& slot = vSlotsM[i];
        if (slot == 0 || strcmp(defM.names[slot - 1], name) == 0) return slot;
    }
}

const EnumNameIndex* EnumNameIndex::FindIndex(const EnumNameIndex* first, const EnumDef& def) {
    while (first != nullptr && &first->defM != &def) first = first->pNextM;
    return first;
}

// Two threads may make the same index at once: one of them puts it in front, the other drops its own.
const EnumNameIndex& EnumNameIndex::Of(const EnumDef& def) {
    EnumNameIndex* first = pFirstG.load(std::memory_order_acquire);
    const EnumNameIndex* found = FindIndex(first, def);
    if (found != nullptr) return *found;
    EnumNameIndex* index = New(def);
    do {
        found = FindIndex(first, def);
        if (found != nullptr) {
            Delete(index);
            return *found;
        }
        index->pNextM = first;
    } while (
        !pFirstG.compare_exchange_weak(first, index, std::memory_order_acq_rel, std::memory_order_acquire));
    return *index;
}

bool EnumNameIndex::Find(const EnumDef& def, const char* name, size_t nName, uint32_t& value) {
    if (def.count <= longestWalkG) return FindByWalk(def, name, value);
    uint32_t slot = Of(def).SlotOf(name, nName);
    if (slot == 0) return false;
    value = slot - 1;
    return true;
}

bool EnumNameIndex::FindByWalk(const EnumDef& def, const char* name, uint32_t& value) {
    for (uint32_t i = 0; i < def.count; ++i) {
        const char* candidate = def.names[i];
        if (candidate == nullptr || candidate[0] != name[0] || strcmp(candidate, name) != 0) continue;
        value = i;
        return true;
    }
    return false;
}

void EnumNameIndex::DestroyAll() {
    EnumNameIndex* index = pFirstG.exchange(nullptr, std::memory_order_acq_rel);
    while (index != nullptr) {
        EnumNameIndex* next = index->pNextM;
        Delete(index);
        index = next;
    }
}

}  // namespace sorn
