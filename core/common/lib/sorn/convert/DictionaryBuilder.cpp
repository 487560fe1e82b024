#include "sorn/convert/DictionaryBuilder.h"

#include "rox/RoxAssert.h"
#include "sorn/dict/ArrayValue.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/model/InternedString.h"

namespace sorn {

ref<Dictionary> DictionaryBuilder::Build(const SornObject& object) {
    ref<Dictionary> dictionary = OpenObject(object);
    Run();
    return dictionary;
}

void DictionaryBuilder::AddField(const RoxString& name, const FieldInfo* field, bool isMulti,
                                 const SornObject& object, Dictionary* out) {
    Frame frame{};
    frame.pObject = &object;
    frame.pDictionary = out;
    StartField(frame, field, &name, isMulti);
    stackM.Push(frame);
    Run();
}

void DictionaryBuilder::Run() {
    while (!stackM.FEmpty()) {
        Frame& frame = stackM.Top();
        if (frame.pField != nullptr && frame.nextElement < frame.nElements) {
            AddElement(frame);
        } else if (!NextField(frame)) {
            stackM.Pop();
        }
    }
}

bool DictionaryBuilder::NextField(Frame& frame) const {
    if (frame.pInfo == nullptr) return false;
    while (++frame.slot < frame.pInfo->nFields) {
        const FieldInfo* field = frame.pInfo->SelectFieldVariant(frame.slot, versionM);
        if (field == nullptr) continue;
        if (field->arity == SORN_ARITY_OPTIONAL && !frame.pObject->FPresent(*field)) continue;
        StartField(frame, field, nullptr, field->arity == SORN_ARITY_MULTI);
        if (frame.nElements == 0) continue;
        frame.pName = InternedString(nullptr, frame.pInfo->FieldName(*field));
        return true;
    }
    return false;
}

void DictionaryBuilder::StartField(Frame& frame, const FieldInfo* field, const RoxString* name,
                                   bool isMulti) const {
    frame.pField = field;
    frame.pName = name;
    frame.pArray = nullptr;
    frame.nextElement = 0;
    frame.nElements = FieldSource(frame.pObject->MemberAt(*field), isMulti).Count(field->Type());
    frame.isMulti = isMulti;
}

void DictionaryBuilder::AddElement(Frame& frame) {
    const FieldInfo& field = *frame.pField;
    FieldSource source(frame.pObject->MemberAt(field), frame.isMulti);
    unsigned i = frame.nextElement++;
    if (!FHoldsObjects(field.Type())) {
        Place(frame, MakeValue(field, source, i));
        return;
    }
    const SornObject* inner = source.ReferenceAt<SornObject>(i);
    if (inner == nullptr) return;
    size_t level = stackM.Size() - 1;
    ref<Dictionary> dictionary = OpenObject(*inner);
    Place(stackM[level], dictionary);  // `frame` may have moved
}

ref<Dictionary> DictionaryBuilder::OpenObject(const SornObject& object) {
    Frame frame{};
    frame.pInfo = &StructOf(object);
    frame.pObject = &object;
    ref<Dictionary> dictionary = Dictionary::New(pMempoolM, *InternedString(nullptr, frame.pInfo->name));
    frame.pDictionary = dictionary.get();
    stackM.Push(frame);
    return dictionary;
}

void DictionaryBuilder::Place(Frame& frame, const ref<DictValue>& value) const {
    if (value == nullptr) return;
    // Lazy elements are values of the name one by one, and not an array. Of such values the way back takes
    // the first.
    if (!frame.isMulti || frame.pField->Type() == SORN_DATA_TYPE_KNOWN_DICT_AS_LAZY) {
        frame.pDictionary->Add(*frame.pName, value);
        return;
    }
    if (frame.pArray == nullptr) {
        ref<ArrayValue> array(new (pMempoolM) ArrayValue(pMempoolM));
        frame.pDictionary->Add(*frame.pName, array);
        frame.pArray = array.get();
    }
    frame.pArray->Add(value);
}

const StructInfo& DictionaryBuilder::StructOf(const SornObject& object) const {
    uint32_t id = object.structId;
    RoxAssert(id < nStructDefM && vStructDefM[id] != nullptr, "the object is of a struct of the schema");
    return *vStructDefM[id];
}

}  // namespace sorn
