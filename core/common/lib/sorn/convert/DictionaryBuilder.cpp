#include "sorn/convert/DictionaryBuilder.h"

#include "rox/RoxAssert.h"
#include "sorn/dict/ArrayValue.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/model/InternedString.h"

namespace sorn {

ref<Dictionary> DictionaryBuilder::Build(const SornObject& object) {
    ref<Dictionary> dictionary = NewDictionary(object);
    PushObject(object, dictionary.get());
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
        ref<DictValue> value = MakeValue(field, source, i);
        if (value != nullptr && !Place(frame, value)) frame.nextElement = frame.nElements;
        return;
    }
    const SornObject* inner = source.ReferenceAt<SornObject>(i);
    if (inner == nullptr) return;
    ref<Dictionary> dictionary = NewDictionary(*inner);
    if (Place(frame, dictionary)) {
        PushObject(*inner, dictionary.get());  // `frame` may move
    } else {
        frame.nextElement = frame.nElements;
    }
}

ref<Dictionary> DictionaryBuilder::NewDictionary(const SornObject& object) const {
    return Dictionary::New(pMempoolM, *InternedString(nullptr, StructOf(object).name));
}

void DictionaryBuilder::PushObject(const SornObject& object, Dictionary* out) {
    Frame frame{};
    frame.pInfo = &StructOf(object);
    frame.pObject = &object;
    frame.pDictionary = out;
    stackM.Push(frame);
}

/// False when the name is full: then nothing holds the value, and the field has no more to add.
bool DictionaryBuilder::Place(Frame& frame, const ref<DictValue>& value) const {
    // Lazy elements are values of the name one by one, and not an array. Of such values the way back takes
    // the first.
    if (!frame.isMulti || frame.pField->Type() == SORN_DATA_TYPE_KNOWN_DICT_AS_LAZY) {
        return frame.pDictionary->Add(*frame.pName, value);
    }
    if (frame.pArray == nullptr) {
        ref<ArrayValue> array(new (pMempoolM) ArrayValue(pMempoolM));
        if (!frame.pDictionary->Add(*frame.pName, array)) return false;
        frame.pArray = array.get();
    }
    return frame.pArray->Add(value);
}

const StructInfo& DictionaryBuilder::StructOf(const SornObject& object) const {
    const StructInfo* info = tableM.Find(object.structId);
    RoxAssert(info != nullptr, "the object is of a struct of the schema");
    return *info;
}

}  // namespace sorn
