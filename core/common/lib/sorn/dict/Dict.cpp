#include "sorn/dict/Dict.h"

#include <cstdio>

#include "rox/RoxAssert.h"
#include "sorn/dict/ArrayValue.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/dict/LazyDictValue.h"
#include "sorn/dict/NamedValue.h"
#include "sorn/dict/StringValue.h"
#include "sorn/dict/ValueComparison.h"

namespace sorn {

const char Dict::classTagG = 0;

namespace {

/// Adds a value (text, lazy body or dictionary) under a name; a second one makes an array of the first and
/// the second.
template <class T>
bool AddToDictOrArray(Dictionary& dictionary, RoxMempool* pool, const RoxString& name, const T& value) {
    const ref<DictValue> old = dictionary.Get(name);
    if (old == nullptr) return dictionary.Add(name, value);
    if (old->GetTag() == dictvalue::ARRAY) return static_cast<ArrayValue*>(old.get())->Add(value);
    // The name and the value may lie in what is removed: under a name of several values all go.
    // NOLINTBEGIN(performance-unnecessary-copy-initialization)
    const RoxString heldName = name;
    const T heldValue = value;
    // NOLINTEND(performance-unnecessary-copy-initialization)
    const ref<ArrayValue> array(new (pool) ArrayValue(pool));
    dictionary.Remove(heldName);
    return dictionary.Add(heldName, array) && array->Add(old) && array->Add(heldValue);
}

RoxString TextOf(DictValue* value, RoxMempool* pool) {
    if (value == nullptr || value->GetTag() != dictvalue::STRING) return StringValue::EmptyValue(pool);
    return static_cast<StringValue*>(value)->GetValue();
}

ref<Dict> DictOf(DictValue* value, RoxMempool* pool) {
    if (value != nullptr && value->GetTag() == dictvalue::DICTIONARY) {
        return new (pool) Dict(ref<Dictionary>(static_cast<Dictionary*>(value)));
    }
    if (value != nullptr && value->GetTag() == dictvalue::LAZY_DICT) {
        return DictOfLazyBody(pool, LazyDictValue::BodyOf(*value));
    }
    return MakeDict(pool);
}

ref<LazyDict> LazyBodyOf(DictValue* value, RoxMempool* pool, const char* name, unsigned index) {
    if (value == nullptr) {
        std::fprintf(stderr, "Dict::GetValueFromWrapper: field %s[%d] not found", name,
                     static_cast<int>(index));
        return LazyDictValue::EmptyValue(pool);
    }
    if (value->GetTag() == dictvalue::LAZY_DICT) return LazyDictValue::BodyOf(*value);
    if (value->GetTag() == dictvalue::DICTIONARY) {
        return NewLazyBody(pool, ref<Dictionary>(static_cast<Dictionary*>(value)), OrvoVersion());
    }
    std::fprintf(stderr, "%s[%d] is neither a LazyDict nor a Dict", name, static_cast<int>(index));
    return LazyDictValue::EmptyValue(pool);
}

}  // namespace

Dict::Dict() : dictionaryM(new (GetMempool()) Dictionary(GetMempool())) {}

Dict::Dict(const ref<Dictionary>& dictionary) : dictionaryM(dictionary) {
    RoxAssert(dictionary != nullptr, "Dict: no dictionary to wrap");
}

Dict::~Dict() = default;

ref<Dict> MakeDict(RoxMempool* pool) {
    return new (pool) Dict;
}

ref<Dict> Dict::New(RoxMempool* pool, const RoxString& typeName) {
    ref<Dict> dict = MakeDict(pool);
    if (!typeName.FEmpty()) dict->InsertTypeZero(typeName);
    return dict;
}

void Dict::InsertTypeZero(const RoxString& typeName) {
    AddString(RoxString(GetMempool(), "type"), typeName);
}

unsigned Dict::CountNames() const {
    return dictionaryM->CountNames();
}

unsigned Dict::CountValues(const RoxString& name) const {
    return namedvalue::Count(dictionaryM->Find(name));
}

unsigned Dict::CountValues(const char* name) const {
    return namedvalue::Count(dictionaryM->Find(name));
}

void Dict::GetSortedNames(RoxStringArray& names) const {
    dictionaryM->GetSortedNames(names);
}

ref<DictValue> Dict::FindValue(const RoxString& name, unsigned index) const {
    return namedvalue::At(dictionaryM->Find(name), index);
}

ref<DictValue> Dict::FindValue(const char* name, unsigned index) const {
    return namedvalue::At(dictionaryM->Find(name), index);
}

RoxString Dict::GetString(const RoxString& name, unsigned index) const {
    return TextOf(namedvalue::At(dictionaryM->Find(name), index), GetMempool());
}

RoxString Dict::GetString(const char* name, unsigned index) const {
    return TextOf(namedvalue::At(dictionaryM->Find(name), index), GetMempool());
}

ref<Dict> Dict::GetDict(const RoxString& name, unsigned index) const {
    return DictOf(namedvalue::At(dictionaryM->Find(name), index), GetMempool());
}

ref<Dict> Dict::GetDict(const char* name, unsigned index) const {
    return DictOf(namedvalue::At(dictionaryM->Find(name), index), GetMempool());
}

ref<LazyDict> Dict::GetLazyDict(const RoxString& name, unsigned index) const {
    return LazyBodyOf(namedvalue::At(dictionaryM->Find(name), index), GetMempool(), name.Utf8(), index);
}

ref<LazyDict> Dict::GetLazyDict(const char* name, unsigned index) const {
    return LazyBodyOf(namedvalue::At(dictionaryM->Find(name), index), GetMempool(),
                      name != nullptr ? name : "", index);
}

int Dict::GetType(const RoxString& name, unsigned index, bool& isLazy) const {
    return namedvalue::KindOf(namedvalue::At(dictionaryM->Find(name), index), isLazy);
}

int Dict::GetType(const char* name, unsigned index, bool& isLazy) const {
    return namedvalue::KindOf(namedvalue::At(dictionaryM->Find(name), index), isLazy);
}

int Dict::GetType(const RoxString& name, unsigned index) const {
    bool isLazy = false;
    return GetType(name, index, isLazy);
}

int Dict::GetType(const char* name, unsigned index) const {
    bool isLazy = false;
    return GetType(name, index, isLazy);
}

RoxString Dict::ToString(bool pretty) const {
    return dictionaryM->ToJson(pretty);
}

ref<rox::ByteBuffer> Dict::ToBytestring(bool pretty) const {
    return dictionaryM->ToBytestring(pretty);
}

bool Dict::AddString(const RoxString& name, const RoxString& text) {
    return AddToDictOrArray(*dictionaryM, GetMempool(), name, text);
}

bool Dict::AddString(const char* name, const char* text) {
    return AddString(RoxString(GetMempool(), name), RoxString(GetMempool(), text));
}

bool Dict::AddDict(const RoxString& name, const ref<Dict>& value) {
    return value != nullptr && AddToDictOrArray(*dictionaryM, GetMempool(), name, value->dictionaryM);
}

bool Dict::AddDict(const char* name, const ref<Dict>& value) {
    return AddDict(RoxString(GetMempool(), name), value);
}

bool Dict::AddLazyDict(const RoxString& name, const ref<LazyDict>& value) {
    return value != nullptr && AddToDictOrArray(*dictionaryM, GetMempool(), name, value);
}

bool Dict::AddLazyDict(const char* name, const ref<LazyDict>& value) {
    return AddLazyDict(RoxString(GetMempool(), name), value);
}

void Dict::Remove(const RoxString& name) {
    dictionaryM->Remove(name);
}

void Dict::Remove(const char* name) {
    dictionaryM->Remove(RoxString(GetMempool(), name));
}

void Dict::Remove(const RoxString& name, unsigned index) {
    const ref<DictValue> value = dictionaryM->Get(name);
    if (value != nullptr && value->GetTag() == dictvalue::ARRAY) {
        auto* const array = static_cast<ArrayValue*>(value.get());
        // It may be the text of the element. NOLINTNEXTLINE(performance-unnecessary-copy-initialization)
        const RoxString heldName = name;
        array->Remove(index);
        if (array->CountValues() == 0) dictionaryM->Remove(heldName);
        return;
    }
    dictionaryM->Remove(name);
}

void Dict::Remove(const char* name, unsigned index) {
    Remove(RoxString(GetMempool(), name), index);
}

void Dict::SetDebugLockOwner(RoxLockId id) {
    dictionaryM->SetDebugLockOwner(id);
}

bool Dict::Equals(const Dict* other) const {
    return other != nullptr && dictionaryM->Equals(other->dictionaryM);
}

bool Dict::Equals(const ref<Dict>& other) const {
    return other != nullptr && FEqualStructures(*dictionaryM, *other->dictionaryM, GetMempool());
}

bool Dict::operator==(const Dict& other) const {
    return ToString(false) == other.ToString(false);
}

void* Dict::VkCastHelper(const void* classTag) {
    return classTag == &classTagG ? this : RoxCore::VkCastHelper(classTag);
}

}  // namespace sorn
