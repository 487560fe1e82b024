#include "sorn/typedjson/WriterPlans.h"

#include <atomic>
#include <new>

#include "rox/RoxMempool.h"
#include "sorn/model/Schema.h"
#include "sorn/typedjson/EnumTexts.h"

namespace sorn {

namespace {

using PlanPlace = std::atomic<WriterPlan*>;

/// By struct id; made with the first plan, of the size of the schema's table.
constinit std::atomic<PlanPlace*> vPlansG = nullptr;

/// Ends the plans with the process.
class WriterPlansDestructor {
 public:
    ~WriterPlansDestructor() { WriterPlans::DestroyAll(); }
};

const WriterPlansDestructor destructorG;

PlanPlace* MakePlaces() {
    PlanPlace* places = nullptr;
    void* const made = RoxMempool::CallocIn(nullptr, Schema::nStructDefG * sizeof(PlanPlace));
    if (vPlansG.compare_exchange_strong(places, static_cast<PlanPlace*>(made), std::memory_order_acq_rel,
                                        std::memory_order_acquire)) {
        return static_cast<PlanPlace*>(made);
    }
    RoxMempool::FreeIn(nullptr, made);
    return places;
}

// Two threads may make the same plan at once: one of them puts it in its place, the other drops its own.
const WriterPlan* MakePlan(uint32_t structId, PlanPlace& place) {
    const StructInfo* const info = Schema::vStructDefG[structId];
    if (info == nullptr) return nullptr;
    WriterPlan* const plan = WriterPlan::New(*info, {Schema::vStructDefG, Schema::nStructDefG});
    WriterPlan* found = nullptr;
    if (place.compare_exchange_strong(found, plan, std::memory_order_acq_rel, std::memory_order_acquire)) {
        return plan;
    }
    WriterPlan::Delete(plan);
    return found;
}

}  // namespace

WriterPlans::WriterPlans(StructTable table)
    : tableM(table),
      isSharedM(table.vStructDef == Schema::vStructDefG && table.nStructDef == Schema::nStructDefG) {}

const WriterPlan* WriterPlans::OfSchema(uint32_t structId) {
    if (structId >= Schema::nStructDefG) return nullptr;
    PlanPlace* places = vPlansG.load(std::memory_order_acquire);
    if (places == nullptr) places = MakePlaces();
    const WriterPlan* const found = places[structId].load(std::memory_order_acquire);
    return found != nullptr ? found : MakePlan(structId, places[structId]);
}

const WriterPlan* WriterPlans::OfTable(uint32_t structId) {
    const StructInfo* const info = tableM.Find(structId);
    if (info == nullptr) return nullptr;
    for (const Own* own = pFirstM; own != nullptr; own = own->pNext) {
        if (&own->pPlan->Info() == info) return own->pPlan;
    }
    void* const memory = RoxMempool::MallocIn(nullptr, sizeof(Own));
    pFirstM = new (memory) Own{WriterPlan::New(*info, tableM), pFirstM};
    return pFirstM->pPlan;
}

void WriterPlans::DeleteOwn() {
    while (pFirstM != nullptr) {
        Own* const next = pFirstM->pNext;
        WriterPlan::Delete(pFirstM->pPlan);
        RoxMempool::FreeIn(nullptr, pFirstM);
        pFirstM = next;
    }
}

void WriterPlans::DestroyAll() {
    PlanPlace* const places = vPlansG.exchange(nullptr, std::memory_order_acq_rel);
    for (uint32_t i = 0; places != nullptr && i < Schema::nStructDefG; ++i) {
        WriterPlan* const plan = places[i].load(std::memory_order_acquire);
        if (plan != nullptr) WriterPlan::Delete(plan);
    }
    RoxMempool::FreeIn(nullptr, places);
    EnumTexts::DestroyAll();
}

}  // namespace sorn
