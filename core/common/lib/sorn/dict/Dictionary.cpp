#include "sorn/dict/Dictionary.h"

#include "sorn/dict/ArrayCore.h"
#include "sorn/dict/ArrayValue.h"
#include "sorn/dict/DictionaryEntries.h"
#include "sorn/dict/LazyDictValue.h"
#include "sorn/dict/NullValue.h"
#include "sorn/dict/StringValue.h"
#include "sorn/dict/ValueComparison.h"

namespace sorn {

const char Dictionary::classTagG = 0;

namespace {

constexpr unsigned initialTableSizeG = 5;

/// What the table has under a name, holder or value; null for an unknown name.
DictValue* StoredValue(RoxCore* core) {
    return static_cast<DictValue*>(core);
}

DictValue* FirstOf(DictValue* stored) {
    const ArrayCore* const several = ArrayCore::From(stored);
    return several == nullptr ? stored : several->At(0);
}

/// The value when it has the tag, else null.
DictValue* IfTagged(DictValue* value, dictvalue::Type tag) {
    return value != nullptr && value->GetTag() == tag ? value : nullptr;
}

}  // namespace

Dictionary::Dictionary()
    : DictValue(dictvalue::DICTIONARY), tableM(GetMempool(), initialTableSizeG, roxMempoolUserSorn) {}

Dictionary::Dictionary(RoxMempool* pool)
    : DictValue(pool, dictvalue::DICTIONARY), tableM(pool, initialTableSizeG, roxMempoolUserSorn) {}

Dictionary::~Dictionary() = default;

ref<Dictionary> Dictionary::New(RoxMempool* pool, const RoxString& typeName) {
    ref<Dictionary> dictionary(new (pool) Dictionary(pool));
    if (!typeName.FEmpty()) dictionary->Add(RoxString(pool, "type"), typeName);
    return dictionary;
}

bool Dictionary::Add(const RoxString& name, const ref<DictValue>& value) {
    _RoxHashTable::Entry* const entry = tableM._Lookup(name.GetRepN());
    if (entry == nullptr) {
        tableM.Add(name, value.get());
        ++nValuesM;
        return true;
    }
    DictValue* const stored = StoredValue(static_cast<RoxCore*>(entry->pData));
    ArrayCore* several = ArrayCore::From(stored);
    if (several == nullptr) {
        several = new (GetMempool()) ArrayCore(GetMempool());
        several->UpRef();  // the table's
        several->Add(stored);
        entry->pData = static_cast<RoxCore*>(several);
        RoxCore::DownRef(stored);
    }
    if (!several->Add(value.get())) return false;
    ++nValuesM;
    return true;
}

bool Dictionary::Add(const RoxString& name, const ref<ArrayValue>& value) {
    return Add(name, ref<DictValue>(value));
}

bool Dictionary::Add(const RoxString& name, const ref<NullValue>& value) {
    return Add(name, ref<DictValue>(value));
}

bool Dictionary::Add(const RoxString& name, const ref<StringValue>& value) {
    return Add(name, ref<DictValue>(value));
}

bool Dictionary::Add(const RoxString& name, const ref<Dictionary>& value) {
    return Add(name, ref<DictValue>(value));
}

bool Dictionary::Add(const RoxString& name, const RoxString& text) {
    return Add(name, ref<DictValue>(new (GetMempool()) StringValue(GetMempool(), text, true)));
}

bool Dictionary::Add(const RoxString& name, const ref<LazyDict>& body) {
    return Add(name, ref<DictValue>(new (GetMempool()) LazyDictValue(body)));
}

bool Dictionary::AddBytestring(const RoxString& name, const ref<rox::ByteBuffer>& bytes) {
    return Add(name, StringValue::Make(bytes, GetMempool()));
}

DictValue* Dictionary::Find(const RoxString& name) const {
    return FirstOf(StoredValue(tableM.Find(name)));
}

DictValue* Dictionary::Find(const char* name) const {
    return FirstOf(StoredValue(tableM.Find(name != nullptr ? name : "")));
}

ref<DictValue> Dictionary::Get(const RoxString& name) const {
    return Find(name);
}

bool Dictionary::GetRange(const RoxString& name, RoxArray<DictValue>& values) const {
    DictionaryEntries::Name found;
    if (!DictionaryEntries::Find(*this, {name.GetRepN(), nullptr}, found)) return true;
    const unsigned nValues = found.CountValues();
    for (unsigned i = 0; i < nValues; ++i) {
        if (!values.Add(found.At(i))) return false;
    }
    return true;
}

RoxString Dictionary::GetString(const RoxString& name) const {
    DictValue* const value = IfTagged(Find(name), dictvalue::STRING);
    return value == nullptr ? StringValue::EmptyValue(GetMempool())
                            : static_cast<StringValue*>(value)->GetValue();
}

bool Dictionary::GetStringRange(const RoxString& name, RoxStringArray& texts) const {
    DictionaryEntries::Name found;
    if (!DictionaryEntries::Find(*this, {name.GetRepN(), nullptr}, found)) return true;
    const unsigned nValues = found.CountValues();
    for (unsigned i = 0; i < nValues; ++i) {
        DictValue* const value = IfTagged(found.At(i), dictvalue::STRING);
        if (value != nullptr && !texts.Add(static_cast<StringValue*>(value)->GetValue())) return false;
    }
    return true;
}

ref<ArrayValue> Dictionary::GetArray(const RoxString& name) const {
    return static_cast<ArrayValue*>(IfTagged(Find(name), dictvalue::ARRAY));
}

ref<Dictionary> Dictionary::GetDictionary(const RoxString& name) const {
    return static_cast<Dictionary*>(IfTagged(Find(name), dictvalue::DICTIONARY));
}

unsigned Dictionary::CountValues(const RoxString& name) const {
    DictionaryEntries::Name found;
    return DictionaryEntries::Find(*this, {name.GetRepN(), nullptr}, found) ? found.CountValues() : 0;
}

void Dictionary::GetSortedNames(RoxStringArray& names) const {
    names.Destroy();
    RoxWorkStack<DictionaryEntries::Name, 32> sorted(GetMempool());
    DictionaryEntries::PushSorted(*this, sorted);
    for (size_t i = 0; i < sorted.Size(); ++i) {
        if (!names.Add(sorted[i].ToRoxString())) return;
    }
}

void Dictionary::Remove(const RoxString& name) {
    nValuesM -= CountValues(name);
    tableM.Remove(name);
}

void* Dictionary::VkCastHelper(const void* classTag) {
    return classTag == &classTagG ? this : DictValue::VkCastHelper(classTag);
}

bool Dictionary::Equals(const ref<DictValue>& other) const {
    return FEqualValues(this, other.get());
}

bool Dictionary::Equals(const ref<Dictionary>& other) const {
    return FEqualValues(this, other.get());
}

}  // namespace sorn
