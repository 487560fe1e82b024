#include "sorn/convert/ObjectBudget.h"

#include <algorithm>
#include <atomic>

#include "rox/RoxGenericArray.h"
#include "rox/RoxGenericIntArray.h"
#include "rox/RoxStringArray.h"
#include "sorn/model/SornObject.h"

namespace sorn {

namespace {

constexpr uint32_t maxMemberG =
    std::max({sizeof(RoxGenericIntArray), sizeof(RoxGenericArray), sizeof(RoxStringArray)});

/// Sizes by the address of the metadata, each in one word with it, so that threads need no lock: the address
/// above, the size below. Without room for a struct its size is worked out anew each time.
constexpr unsigned nSizeBitsG = 17;
constexpr size_t nPlacesG = 1024;
constexpr unsigned nProbesG = 8;
std::atomic<uint64_t> vSizeG[nPlacesG];

uint32_t ComputeSize(const StructInfo& info) {
    uint32_t behindLast = sizeof(SornObject);
    for (int slot = 0; slot < info.nFields; ++slot) {
        const FieldInfo& field = info.vFieldInfo[slot];
        if (!field.FHole()) behindLast = std::max(behindLast, field.storageOffset + maxMemberG);
        const FieldInfoHistory& history = info.vFieldInfoHistory[slot];
        for (unsigned i = 0; i < history.nVariants; ++i) {
            behindLast = std::max(behindLast, history.vVariants[i].storageOffset + maxMemberG);
        }
    }
    return behindLast;
}

}  // namespace

static_assert(UINT16_MAX + maxMemberG < 1u << nSizeBitsG);

uint32_t ObjectBudget::SizeOf(const StructInfo& info) {
    static_assert(alignof(StructInfo) >= 4);
    const uint64_t address = reinterpret_cast<uintptr_t>(&info) >> 2;
    const uint64_t key = address << nSizeBitsG;
    if (key >> nSizeBitsG != address) return ComputeSize(info);
    // Structs lie one behind another: multiplication spreads what the low bits have.
    size_t place = static_cast<size_t>(address * 0x9E3779B97F4A7C15 >> 54);
    static_assert(nPlacesG == size_t{1} << (64 - 54));
    for (unsigned i = 0; i < nProbesG; ++i, place = (place + 1) % nPlacesG) {
        const uint64_t entry = vSizeG[place].load(std::memory_order_relaxed);
        if (entry >> nSizeBitsG == address) return static_cast<uint32_t>(entry & ((1u << nSizeBitsG) - 1));
        if (entry != 0) continue;
        const uint32_t size = ComputeSize(info);
        vSizeG[place].store(key | size, std::memory_order_relaxed);
        return size;
    }
    return ComputeSize(info);
}

}  // namespace sorn
