#include "rox/RoxAssert.h"
#include "sorn/convert/DictionarySornObject.h"
#include "sorn/dict/Dict.h"
#include "sorn/dict/MempoolNew.h"
#include "sorn/model/InternedString.h"
#include "sorn/model/Schema.h"
#include "sorn/model/SornObject.h"

namespace sorn {

ref<Dictionary> SornObject::ToDictionary(OrvoVersion version) const {
    return DictionarySornObject(GetMempool(), Schema::vStructDefG, Schema::nStructDefG)
        .SornObjectToDictionary(this, version);
}

ref<Dict> SornObject::ToDict(OrvoVersion version) const {
    return MempoolNew<Dict>(GetMempool(), ToDictionary(version));
}

RoxString SornObject::ToString(bool pretty, OrvoVersion version) const {
    return ToDictionary(version)->ToJson(pretty);
}

ref<SornObject> SornObject::Clone(unsigned structIdHint) const {
    const StructInfo* hint = Schema::FindStruct(structIdHint);
    RoxAssert(hint != nullptr, "SornObject::Clone: the id names a struct");
    ref<Dictionary> dictionary = ToDictionary(0);
    // A second value of "type", which nobody reads: the first one stays in front, so the struct is this
    // object's.
    dictionary->Add(*InternedString(nullptr, "type"), *InternedString(nullptr, hint->name));
    ref<SornObject> clone;
    RoxString error;  // goes nowhere
    DictionarySornObject context(GetMempool(), Schema::vStructDefG, Schema::nStructDefG);
    if (!context.DictionaryToSornObject(dictionary, 0, clone, error)) return nullptr;
    return clone;
}

}  // namespace sorn
