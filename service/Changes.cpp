#include "service/Changes.h"

#include <cstring>

#include "rox/RoxStringArray.h"
#include "service/Query.h"
#include "sorn/dict/ArrayValue.h"
#include "sorn/model/Schema.h"

namespace sorn::service {

namespace {

constexpr char typeG[] = "type";

/// The fields that a body has.
class FieldsOf final : public Conditions::Fields {
 public:
    explicit FieldsOf(const Dictionary& body) : bodyM(body) {}
    bool FWanted(const char* name) const override {
        return std::strcmp(name, typeG) != 0 && bodyM.Find(name) != nullptr;
    }

 private:
    const Dictionary& bodyM;
};

/// False for what is no dictionary of a record of that type.
bool AddRecordText(DictValue* value, const StructInfo& record, std::vector<std::string>& vTexts) {
    if (value == nullptr || value->GetTag() != dictvalue::DICTIONARY) return false;
    const auto& dictionary = static_cast<const Dictionary&>(*value);
    if (!(dictionary.GetString(typeG) == record.name)) return false;
    vTexts.emplace_back(dictionary.ToJson(false).View());
    return true;
}

/// Adds the texts of the records in a field: a single one, or those of an array. False when others are among
/// them.
bool AddRecordTexts(DictValue* value, const StructInfo& record, std::vector<std::string>& vTexts) {
    if (value == nullptr) return true;
    if (value->GetTag() != dictvalue::ARRAY) return AddRecordText(value, record, vTexts);
    const auto& elements = static_cast<const ArrayValue&>(*value);
    for (unsigned i = 0; i < elements.CountValues(); ++i) {
        if (!AddRecordText(elements.At(i), record, vTexts)) return false;
    }
    return true;
}

/// A record of the fields that it shares with the request.
std::string SharedText(RoxMempool& pool, const RequestBody& body, const StructInfo& record) {
    const ref<Dictionary> shared = Dictionary::New(&pool, record.name);
    for (int32_t slot = 0; slot < body.pType->nFields; ++slot) {
        const FieldInfo* const field = body.pType->SelectFieldVariant(slot, body.version);
        if (field == nullptr) continue;
        const char* const name = body.pType->FieldName(*field);
        const FieldInfo* const own = FindField(record, name, body.version);
        DictValue* const value = body.dictionary->Find(name);
        if (own != nullptr && FSameValues(*own, *field) && value != nullptr) {
            shared->Add(name, ref<DictValue>(value));
        }
    }
    return std::string(shared->ToJson(false).View());
}

}  // namespace

bool Changes::Put(std::string_view text, OrvoVersion version, Failure& failure) {
    if (text.size() > limitsM.maxRecordBytes) {
        return failure.Set(ErrorCode::resourceUnavailableG, "the record is too large");
    }
    const ref<SornObject> record = recordsM.ReadRecord(text, version, failure);
    return record != nullptr && recordsM.Put(record, version, text, failure);
}

bool Changes::PutAll(const std::vector<std::string>& vTexts, OrvoVersion version, Failure& failure) {
    if (vTexts.size() == 1) return Put(vTexts[0], version, failure);
    if (!recordsM.BeginBatch(failure)) return false;
    for (const std::string& text : vTexts) {
        if (Put(text, version, failure)) continue;
        recordsM.DropBatch();
        return false;
    }
    return recordsM.EndBatch(failure);
}

bool Changes::RemoveWhere(const StructInfo& type, const Conditions& conditions, Failure& failure) {
    if (conditions.FEmpty()) {
        return failure.Set(ErrorCode::badArgumentG, "the request does not say which records to remove");
    }
    return FWithinLimits(conditions, limitsM, failure) && recordsM.Remove(type, conditions, failure);
}

bool Changes::Remove(const RequestBody& body, Failure& failure) {
    // A name that is no field's is a slip of the pen, and without it more would go than was meant.
    RoxStringArray names;
    body.dictionary->GetSortedNames(names);
    for (unsigned i = 0; i < names.GetCount(); ++i) {
        if (names[i] == typeG || FindField(*body.pType, names[i].View(), OrvoVersion()) != nullptr) continue;
        return failure.Set(ErrorCode::badArgumentG,
                           std::string(body.pType->name) + " has no field '" + names[i].Utf8() + "'");
    }
    const ref<SornObject> object = body.ToPartialObject(&poolM, failure);
    if (object == nullptr) return false;
    Conditions conditions;
    conditions.Add(*object, OrvoVersion(), *body.pType, FieldsOf(*body.dictionary));
    return RemoveWhere(*body.pType, conditions, failure);
}

bool Changes::Store(const RequestPlan& plan, const RequestBody& body, Failure& failure) {
    const ref<SornObject> object = body.ToObject(&poolM, failure);
    if (object == nullptr) return false;
    const StructInfo& record = *plan.pRecord;
    std::vector<std::string> vTexts;
    for (int32_t slot = 0; slot < body.pType->nFields; ++slot) {
        const FieldInfo* const field = body.pType->SelectFieldVariant(slot, body.version);
        const bool isObject = field != nullptr && field->Type() == SORN_DATA_TYPE_OBJECT;
        const StructInfo* const type = isObject ? Schema::FindStruct(field->typeRef) : nullptr;
        if (type != nullptr && type == &record) {
            const char* const name = body.pType->FieldName(*field);
            if (AddRecordTexts(body.dictionary->Find(name), record, vTexts)) continue;
            return failure.Set(ErrorCode::badArgumentG, std::string(name) + " has more than such records");
        }
    }
    if (vTexts.empty()) vTexts.push_back(SharedText(poolM, body, record));
    return PutAll(vTexts, body.version, failure);
}

bool Changes::RemoveBy(const RequestPlan& plan, const RequestBody& body, Failure& failure) {
    const ref<SornObject> object = body.ToObject(&poolM, failure);
    if (object == nullptr) return false;
    Conditions conditions;
    conditions.Add(*object, body.version, *plan.pRecord, FieldsOf(*body.dictionary));
    return RemoveWhere(*plan.pRecord, conditions, failure);
}

}  // namespace sorn::service
