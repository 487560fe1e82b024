#include "sorn/convert/ObjectBuilder.h"

#include "sorn/convert/SchemaText.h"
#include "sorn/dict/ArrayValue.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/model/InternedString.h"
#include "sorn/model/Schema.h"
#include "sorn/model/StructInfoMap.h"

namespace sorn {

namespace {

constexpr const char* innerSingleWordsG = ". Can't unmarshal inner Dictionary";
constexpr const char* innerMultiWordsG = " Can't convert inner Dictionary to SornObject";

}  // namespace

ObjectBuilder::ObjectBuilder(RoxMempool* pool, StructTable table, OrvoVersion version, RoxString& error)
    : pMempoolM(pool),
      versionM(version),
      wordsM(pool, error),
      readerM(pool, table, version, wordsM),
      stackM(pool) {}

ObjectBuilder::~ObjectBuilder() {
    while (!stackM.FEmpty()) PopFrame();
}

ref<SornObject> ObjectBuilder::Build(Dictionary* dictionary) {
    if (OpenObject(dictionary) && Run()) return std::move(resultM);
    wordsM.Commit();
    return nullptr;
}

bool ObjectBuilder::StoreValue(const FieldInfo* field, bool isMulti, DictValue* value, SornObject* object) {
    object->UpRef();
    stackM.Push({nullptr, nullptr, object, field, nullptr, 0, 0, isMulti});
    if (ConvertValue(value)) {
        if (Run()) return true;
    } else {
        PopFrame();
    }
    wordsM.Commit();
    return false;
}

bool ObjectBuilder::Run() {
    while (!stackM.FEmpty()) {
        if (Step()) continue;
        Unwind();
        return false;
    }
    return true;
}

bool ObjectBuilder::Step() {
    Frame& frame = stackM.Top();
    if (frame.pArray != nullptr && frame.nextElement < frame.pArray->CountValues()) {
        DictValue* element = frame.pArray->At(frame.nextElement++);
        if (ConvertValue(element)) return true;
        AddFieldWords(stackM.Top());
        return false;
    }
    return NextField();
}

bool ObjectBuilder::NextField() {
    Frame& frame = stackM.Top();
    if (frame.pInfo == nullptr) return CloseObject();
    while (++frame.slot < frame.pInfo->nFields) {
        const FieldInfo* field = frame.pInfo->SelectFieldVariant(frame.slot, versionM);
        if (field == nullptr) continue;
        const char* name = frame.pInfo->FieldName(*field);
        DictValue* value = frame.pDictionary->Find(name);
        if (value == nullptr) {
            if (field->arity != SORN_ARITY_REQUIRED || versionM.FAbsent()) continue;
            return Fail("Required field not set: ", name);
        }
        frame.pField = field;
        frame.isMulti = field->arity == SORN_ARITY_MULTI;
        return frame.isMulti ? StartMulti(value) : StartSingle(value);
    }
    return CloseObject();
}

bool ObjectBuilder::StartSingle(DictValue* value) {
    Frame& frame = stackM.Top();
    const FieldInfo& field = *frame.pField;
    if (field.arity == SORN_ARITY_OPTIONAL) frame.pObject->SetPresent(field);
    frame.pArray = nullptr;
    if (value->GetTag() == dictvalue::ARRAY) {
        const ArrayValue& array = static_cast<const ArrayValue&>(*value);
        if (array.CountValues() != 1) {
            return Fail("Cannot convert array to single field: ", frame.pInfo->FieldName(field));
        }
        value = array.At(0);
    }
    if (ConvertValue(value)) return true;
    AddFieldWords(stackM.Top());
    return false;
}

// Only the first of several values of a name is looked at, here as in single fields.
bool ObjectBuilder::StartMulti(DictValue* value) {
    Frame& frame = stackM.Top();
    frame.pArray = value->GetTag() == dictvalue::ARRAY ? static_cast<ArrayValue*>(value) : nullptr;
    frame.nextElement = 0;
    if (frame.pArray != nullptr || ConvertValue(value)) return true;
    AddFieldWords(stackM.Top());
    return false;
}

bool ObjectBuilder::ConvertValue(DictValue* value) {
    const Frame& frame = stackM.Top();
    const FieldInfo& field = *frame.pField;
    if (!FHoldsObjects(field.Type())) {
        return readerM.Read(field, value, FieldTarget(frame.pObject->MemberAt(field), frame.isMulti));
    }
    if (value == nullptr || value->GetTag() != dictvalue::DICTIONARY) {
        wordsM.Append("Field must be a Dictionary");
        return false;
    }
    // The struct is the one that the inner dictionary names, whatever the field's typeRef says.
    if (OpenObject(static_cast<Dictionary*>(value))) return true;
    wordsM.Append(frame.isMulti ? innerMultiWordsG : innerSingleWordsG);
    return false;
}

bool ObjectBuilder::OpenObject(Dictionary* dictionary) {
    if (!versionM.FAbsent() &&
        (versionM.Number() < Schema::firstSchemaVersionG || versionM.Number() > Schema::lastSchemaVersionG)) {
        wordsM.Append(
            "Unmarshaling to SornObject: given orvo version is out of range used in code generation: ");
        // One raw byte and no number: readers of the message count on it.
        wordsM.AppendRaw(static_cast<unsigned char>(versionM.Number() & 0xFF));
        return false;
    }
    RoxString type;
    if (dictionary != nullptr) type = dictionary->GetString(*InternedString(nullptr, "type"));
    if (type.FEmpty()) return Fail("Dictionary has no 'type' field.", "");
    const StructInfo* info =
        schematext::FHasNul(type) ? nullptr : StructInfoMap::LookupStructByName(type.Utf8());
    if (info == nullptr) return Fail("no such structure type: ", type.Utf8());

    ref<SornObject> object = info->Factory(pMempoolM);
    object->SetDebugLockOwner(0);
    object->UpRef();  // the stack's
    stackM.Push({info, dictionary, object.get(), nullptr, nullptr, 0, 0, false});
    return true;
}

bool ObjectBuilder::CloseObject() {
    bool isWhole = stackM.Top().pInfo != nullptr;
    ref<SornObject> object(stackM.Top().pObject);
    PopFrame();
    if (!isWhole) return true;
    if (stackM.FEmpty()) {
        resultM = std::move(object);
        return true;
    }
    const Frame& outer = stackM.Top();
    const FieldInfo& field = *outer.pField;
    if (FieldTarget(outer.pObject->MemberAt(field), outer.isMulti).StoreReference(object)) return true;
    wordsM.Append(ValueReader::tooManyG);
    AddFieldWords(outer);
    return false;
}

bool ObjectBuilder::Fail(const char* words, const char* name) {
    wordsM.Append(words);
    wordsM.Append(name);
    return false;
}

void ObjectBuilder::AddFieldWords(const Frame& frame) {
    if (frame.pInfo == nullptr) return;
    wordsM.Append(frame.isMulti ? ". Bad multi field: " : ". Bad single field: ");
    wordsM.Append(frame.pInfo->FieldName(*frame.pField));
}

/// Drops the objects under construction, innermost first; each level that holds one of them adds its words.
void ObjectBuilder::Unwind() {
    for (PopFrame(); !stackM.FEmpty(); PopFrame()) {
        wordsM.Append(stackM.Top().isMulti ? innerMultiWordsG : innerSingleWordsG);
        AddFieldWords(stackM.Top());
    }
}

void ObjectBuilder::PopFrame() {
    SornObject* object = stackM.Top().pObject;
    stackM.Pop();
    RoxCore::DownRef(object);
}

}  // namespace sorn
