#include "sorn/typedjson/FieldIndex.h"

#include <algorithm>
#include <atomic>
#include <new>

#include "rox/RoxMempool.h"
#include "sorn/convert/ObjectBudget.h"
#include "sorn/model/StructInfoMap.h"
#include "sorn/typedjson/IndexCache.h"

namespace sorn {

namespace {

/// Room for all structs of the schema.
constinit IndexCache<StructInfo, FieldIndex, 10> cacheG;

/// Ends the indexes with the process.
class FieldIndexDestructor {
 public:
    ~FieldIndexDestructor() { FieldIndex::DestroyAll(); }
};

const FieldIndexDestructor destructorG;

constinit std::atomic<uint32_t> nextPlaceG = 0;  // of the slots of the next index, for KeyHints

}  // namespace

FieldIndex::FieldIndex(const StructInfo& info)
    : infoM(info),
      namesM(static_cast<uint32_t>(std::max(info.nFields, 0)) + 1),
      nObjectBytesM(ObjectBudget::SizeOf(info)),
      nKeysM(static_cast<uint32_t>(std::max(info.nFields, 1))),
      firstPlaceM(nextPlaceG.fetch_add(nKeysM, std::memory_order_relaxed)),
      vKeysM(static_cast<FieldKey*>(RoxMempool::MallocIn(nullptr, nKeysM * sizeof(FieldKey)))) {
    new (vKeysM) FieldKey(nullptr);
    for (uint32_t slot = 0; slot < static_cast<uint32_t>(std::max(info.nFields, 0)); ++slot) {
        const FieldInfo& field = info.vFieldInfo[slot];
        if (field.FHole()) {
            new (&vKeysM[slot]) FieldKey(nullptr);
        } else {
            new (&vKeysM[slot]) FieldKey(info.FieldName(field), &field);
            namesM.Add(info.FieldName(field), slot);
        }
    }
    // Every object has this key, and few structs a field of the name.
    const std::string_view type = "type";
    if (vKeysM[0].Field() == nullptr && namesM.Find(NameKey(type)) == noneG) {
        new (vKeysM) FieldKey(type, nullptr);
        namesM.Add(type, 0);
    }
}

FieldIndex::~FieldIndex() {
    RoxMempool::FreeIn(nullptr, vKeysM);
}

FieldIndex* FieldIndex::New(const StructInfo& info) {
    if (StructInfoMap::LookupStructByName(info.name) != &info) return nullptr;
    return new (RoxMempool::MallocIn(nullptr, sizeof(FieldIndex))) FieldIndex(info);
}

void FieldIndex::Delete(FieldIndex* index) {
    index->~FieldIndex();
    RoxMempool::FreeIn(nullptr, index);
}

const FieldIndex* FieldIndex::Of(const StructInfo& info) {
    return cacheG.Of(info);
}

const FieldInfo* FieldIndex::FindByWalk(const StructInfo& info, std::string_view name) {
    for (int32_t slot = 0; slot < info.nFields; ++slot) {
        const FieldInfo& field = info.vFieldInfo[slot];
        if (!field.FHole() && info.FieldName(field) == name) return &field;
    }
    return nullptr;
}

void FieldIndex::DestroyAll() {
    cacheG.DestroyAll();
}

}  // namespace sorn
