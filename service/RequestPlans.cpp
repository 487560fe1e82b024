#include "service/RequestPlans.h"

#include "sorn/model/Schema.h"
#include "sorn/model/StructInfoMap.h"

namespace sorn::service {

namespace {

const StructInfo* FindStruct(const StructInfo& record, const char* suffix) {
    return StructInfoMap::LookupStructByName((std::string(record.name) + suffix).c_str());
}

/// The field of a list that holds its records.
const FieldInfo* FindRecords(const StructInfo& list, const StructInfo& record) {
    for (int32_t slot = 0; slot < list.nFields; ++slot) {
        const FieldInfo& field = list.vFieldInfo[slot];
        if (!field.FHole() && field.arity == SORN_ARITY_MULTI && field.Type() == SORN_DATA_TYPE_OBJECT &&
            Schema::FindStruct(field.typeRef) == &record) {
            return &field;
        }
    }
    return nullptr;
}

}  // namespace

RequestPlans::RequestPlans() {
    for (uint32_t id = 0; id < Schema::nStructDefG; ++id) {
        const StructInfo* const record = Schema::vStructDefG[id];
        if (record == nullptr) continue;
        AddSearch(*record);
        Add(*record, "Store", RequestPlan::STORE);
        Add(*record, "Update", RequestPlan::STORE);
        Add(*record, "Remove", RequestPlan::REMOVE);
    }
}

void RequestPlans::AddSearch(const StructInfo& record) {
    const StructInfo* const search = FindStruct(record, "Search");
    const StructInfo* const list = FindStruct(record, "List");
    if (search == nullptr || list == nullptr) return;
    const FieldInfo* const records = FindRecords(*list, record);
    if (records != nullptr) plansM[search->name] = {RequestPlan::SEARCH, &record, list, records};
}

void RequestPlans::Add(const StructInfo& record, const char* suffix, RequestPlan::Kind kind) {
    const StructInfo* const request = FindStruct(record, suffix);
    if (request != nullptr) plansM[request->name] = {kind, &record, nullptr, nullptr};
}

const RequestPlan* RequestPlans::Find(std::string_view requestType) const {
    const auto found = plansM.find(std::string(requestType));
    return found == plansM.end() ? nullptr : &found->second;
}

const FieldInfo* FindField(const StructInfo& info, std::string_view name, OrvoVersion version) {
    for (int32_t slot = 0; slot < info.nFields; ++slot) {
        const FieldInfo* const field = info.SelectFieldVariant(slot, version);
        if (field != nullptr && name == info.FieldName(*field)) return field;
    }
    return nullptr;
}

bool FSameValues(const FieldInfo& a, const FieldInfo& b) {
    return a.dataType == b.dataType && a.typeRef == b.typeRef;
}

}  // namespace sorn::service
