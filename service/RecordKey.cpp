#include "service/RecordKey.h"

#include <cinttypes>
#include <cstdio>

#include "rox/RoxSipHash.h"
#include "service/RequestPlans.h"
#include "sorn/dict/ByteBuffer.h"
#include "sorn/model/Schema.h"
#include "sorn/model/StructInfoMap.h"
#include "sorn/typedjson/JsonSornObject.h"

namespace sorn::service {

namespace {

bool FId(const FieldInfo& field) {
    const DataType type = field.Type();
    return type == SORN_DATA_TYPE_INT_ID || type == SORN_DATA_TYPE_LONG_ID ||
           type == SORN_DATA_TYPE_STRING_ID;
}

/// The field for the record's own id, or null. Records also name others of their kind (a category its
/// parent): the one called after the struct goes before a required one, and that before any other.
const FieldInfo* FindOwnId(const StructInfo& info, OrvoVersion version) {
    const FieldInfo* best = nullptr;
    for (int32_t slot = 0; slot < info.nFields; ++slot) {
        const FieldInfo* const field = info.SelectFieldVariant(slot, version);
        if (field == nullptr || field->arity == SORN_ARITY_MULTI || !FId(*field) ||
            Schema::FindStruct(field->typeRef) != &info) {
            continue;
        }
        if (info.FieldName(*field) == std::string(info.name) + "Id") return field;
        const bool isBetter =
            best == nullptr || (best->arity != SORN_ARITY_REQUIRED && field->arity == SORN_ARITY_REQUIRED);
        if (isBetter) best = field;
    }
    return best;
}

class KeyWriter {
 public:
    KeyWriter(const SornObject& record, OrvoVersion version) : recordM(record), versionM(version) {}

    void Add(const StructInfo& info, const FieldInfo& field) {
        JsonSornObject json(nullptr);
        const char* const name = info.FieldName(field);
        if (field.arity == SORN_ARITY_MULTI) {
            json.MultiFieldToJson(name, &field, &recordM, textM, isFirstM, versionM);
        } else if (field.arity == SORN_ARITY_REQUIRED || recordM.FPresent(field)) {
            json.SingleFieldToJson(name, &field, &recordM, textM, isFirstM, versionM);
        }
    }
    std::string Text() const {
        return std::string(reinterpret_cast<const char*>(textM.GetData()), textM.GetLength());
    }

 private:
    const SornObject& recordM;
    OrvoVersion versionM;
    ByteBuffer textM{nullptr};
    bool isFirstM = true;
};

/// Adds the fields that the struct shares with its remove request.
void AddNamedByRemove(const StructInfo& info, OrvoVersion version, KeyWriter& key) {
    const StructInfo* const remove =
        StructInfoMap::LookupStructByName((std::string(info.name) + "Remove").c_str());
    for (int32_t slot = 0; remove != nullptr && slot < remove->nFields; ++slot) {
        const FieldInfo* const named = remove->SelectFieldVariant(slot, version);
        if (named == nullptr) continue;
        const FieldInfo* const own = FindField(info, remove->FieldName(*named), version);
        if (own != nullptr && FSameValues(*own, *named)) key.Add(info, *own);
    }
}

/// Stands in the store: the same for the same text at all times.
std::string TextKey(std::string_view text) {
    using Hash = RoxSipHash<2, 4>;
    char key[40];
    std::snprintf(key, sizeof key, "#%016" PRIx64 "%016" PRIx64, Hash::Hash64(1, 2, text.data(), text.size()),
                  Hash::Hash64(3, 4, text.data(), text.size()));
    return key;
}

}  // namespace

std::string RecordKey(const SornObject& record, OrvoVersion version, std::string_view text) {
    const StructInfo& info = *Schema::vStructDefG[record.structId];
    KeyWriter key(record, version);
    const FieldInfo* const id = FindOwnId(info, version);
    if (id != nullptr) {
        key.Add(info, *id);
    } else {
        AddNamedByRemove(info, version, key);
    }
    std::string words = key.Text();
    return words.empty() ? TextKey(text) : words;
}

}  // namespace sorn::service
