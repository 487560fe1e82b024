#include "sorn/convert/DictionarySornObject.h"

#include "sorn/convert/DictionaryBuilder.h"
#include "sorn/convert/ObjectBuilder.h"
#include "sorn/convert/SchemaText.h"

namespace sorn {

bool DictionarySornObject::DictionaryToSornObject(const ref<Dictionary>& dictionary, OrvoVersion version,
                                                  ref<SornObject>& out, RoxString& error) {
    ref<SornObject> object = ObjectBuilder(pMempoolM, tableM, version, error).Build(dictionary.get());
    if (object == nullptr) return false;
    out = std::move(object);
    return true;
}

bool DictionarySornObject::DictToSingleField(const FieldInfo* field, const ref<DictValue>& value,
                                             SornObject* object, RoxString& error, OrvoVersion version) {
    return ObjectBuilder(pMempoolM, tableM, version, error).StoreValue(field, false, value.get(), object);
}

bool DictionarySornObject::DictToMultiField(const FieldInfo* field, const ref<DictValue>& value,
                                            SornObject* object, RoxString& error, OrvoVersion version) {
    return ObjectBuilder(pMempoolM, tableM, version, error).StoreValue(field, true, value.get(), object);
}

ref<Dictionary> DictionarySornObject::SornObjectToDictionary(const SornObject* object, OrvoVersion version) {
    return DictionaryBuilder(pMempoolM, tableM, version).Build(*object);
}

void DictionarySornObject::SingleFieldToDict(const RoxString& name, const FieldInfo* field,
                                             const SornObject* object, ref<Dictionary>& out,
                                             OrvoVersion version) {
    DictionaryBuilder(pMempoolM, tableM, version).AddField(name, field, false, *object, out.get());
}

void DictionarySornObject::MultiFieldToDict(const RoxString& name, const FieldInfo* field,
                                            const SornObject* object, ref<Dictionary>& out,
                                            OrvoVersion version) {
    DictionaryBuilder(pMempoolM, tableM, version).AddField(name, field, true, *object, out.get());
}

bool DictionarySornObject::StringToIntId(RoxMempool* pool, const FieldInfo* field, const RoxString& text,
                                         RoxString& error, unsigned& out) {
    ErrorWords words(pool, error);
    const char* bare = schematext::BareId(tableM, *field, text, words);
    if (bare != nullptr) out = schematext::BareInt(pool, text, bare);
    words.Commit();
    return bare != nullptr;
}

bool DictionarySornObject::StringToLongId(RoxMempool* pool, const FieldInfo* field, const RoxString& text,
                                          RoxString& error, unsigned long long& out) {
    ErrorWords words(pool, error);
    const char* bare = schematext::BareId(tableM, *field, text, words);
    if (bare != nullptr) out = schematext::BareLong(pool, text, bare);
    words.Commit();
    return bare != nullptr;
}

bool DictionarySornObject::StringToStringId(RoxMempool* pool, const FieldInfo* field, const RoxString& text,
                                            RoxString& error, RoxString& out) {
    ErrorWords words(pool, error);
    const char* bare = schematext::BareId(tableM, *field, text, words);
    if (bare != nullptr) out = schematext::BareString(pool, text, bare);
    words.Commit();
    return bare != nullptr;
}

}  // namespace sorn
