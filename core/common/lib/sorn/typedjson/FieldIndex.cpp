#include "sorn/typedjson/FieldIndex.h"

#include <algorithm>
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

}  // namespace

FieldIndex::FieldIndex(const StructInfo& info)
    : infoM(info),
      namesM(static_cast<uint32_t>(std::max(info.nFields, 0))),
      nObjectBytesM(ObjectBudget::SizeOf(info)) {
    for (int32_t slot = 0; slot < info.nFields; ++slot) {
        const FieldInfo& field = info.vFieldInfo[slot];
        if (!field.FHole()) namesM.Add(info.FieldName(field), static_cast<uint32_t>(slot));
    }
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
