#include <algorithm>

#include "sorn/convert/SchemaText.h"
#include "sorn/dict/Dict.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/lazy/LazyDict.h"
#include "sorn/model/InternedString.h"
#include "sorn/model/Schema.h"
#include "sorn/model/SornObject.h"
#include "sorn/model/StructInfoMap.h"

namespace sorn {

namespace {

/// The id of the struct that a dictionary's "type" names.
bool FindType(const Dictionary& dictionary, unsigned* structId) {
    const RoxString type = dictionary.GetString(*InternedString(nullptr, "type"));
    if (schematext::FHasNul(type)) return false;
    const StructInfo* const info = StructInfoMap::LookupStructByName(type.Utf8());
    if (info == nullptr) return false;
    const auto* const end = Schema::vStructDefG + Schema::nStructDefG;
    *structId = static_cast<unsigned>(std::find(Schema::vStructDefG, end, info) - Schema::vStructDefG);
    return true;
}

}  // namespace

bool LazyDict::GetType(unsigned* structId) {
    if (repM == REP_BYTESOURCE) BuildDictionaryFromBytesource();
    const ref<SornObject> object = ObjectToName();
    if (object != nullptr) {
        *structId = object->structId;
        return true;
    }
    const ref<Dictionary> dictionary = DictionaryToName();
    return dictionary != nullptr && FindType(*dictionary, structId);
}

bool LazyDict::GetTypeName(RoxString* name) {
    if (repM == REP_BYTESOURCE) BuildDictionaryFromBytesource();
    const ref<SornObject> object = ObjectToName();
    if (object != nullptr) {
        *name = object->GetTypeName();
        return true;
    }
    const ref<Dictionary> dictionary = DictionaryToName();
    if (dictionary == nullptr || dictionary->CountValues(*InternedString(nullptr, "type")) == 0) return false;
    *name = dictionary->GetString(*InternedString(nullptr, "type"));
    return true;
}

/// The object of a body that is one or unmarshals to one, else null.
ref<SornObject> LazyDict::ObjectToName() const {
    if (repM == REP_OBJECT) return objectM;
    return repM == REP_PROTOBUF ? Decode() : nullptr;
}

/// The dictionary of any other body, or null.
ref<Dictionary> LazyDict::DictionaryToName() const {
    if (repM == REP_BYTESOURCE) return dictionaryM;
    RoxString error;  // goes nowhere
    return repM == REP_OBJECT || repM == REP_PROTOBUF ? nullptr : ToDictionary(error);
}

}  // namespace sorn
