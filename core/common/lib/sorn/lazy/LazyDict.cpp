#include "sorn/lazy/LazyDict.h"

#include "kelbaselib/Bytesource.h"
#include "sorn/dict/Dict.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/model/SornObject.h"

namespace sorn {

const char LazyDict::classTagG = 0;

void* LazyDict::VkCastHelper(const void* classTag) {
    return classTag == &classTagG ? this : RoxCore::VkCastHelper(classTag);
}

LazyDict::~LazyDict() {
    if (bytesourceM != nullptr) bytesourceM->Release();
}

ref<LazyDict> LazyDict::New(RoxMempool* pool, Rep rep, const ref<Dict>& dict,
                            const ref<rox::ByteBuffer>& bytes, const ref<SornObject>& object,
                            kelbaselib::Bytesource* bytesource, OrvoVersion version) {
    ref<LazyDict> lazy(new (pool) LazyDict(pool, rep, version));
    lazy->dictM = dict;
    lazy->bytesM = bytes;
    lazy->objectM = object;
    lazy->bytesourceM = bytesource;
    return lazy;
}

ref<LazyDict> LazyDict::FromDict(RoxMempool* pool, const ref<Dict>& dict, unsigned short version) {
    return New(pool, REP_DICT, dict, nullptr, nullptr, nullptr, version);
}

ref<LazyDict> LazyDict::FromBytestring(RoxMempool* pool, const ref<rox::ByteBuffer>& bytes,
                                       OrvoVersion version) {
    if (bytes == nullptr || bytes->GetLength() == 0) return nullptr;
    unsigned char first = bytes->GetData()[0];
    if (first == 0) return nullptr;
    Rep rep = first == ' ' || first == '{' ? REP_JSON : REP_PROTOBUF;
    return New(pool, rep, nullptr, bytes, nullptr, nullptr, version);
}

ref<LazyDict> LazyDict::FromJsonString(RoxMempool* pool, const RoxString& text, OrvoVersion version) {
    return FromBytestring(pool, rox::ByteBuffer::New(pool, text), version);
}

ref<LazyDict> LazyDict::FromSornObject(RoxMempool* pool, const ref<SornObject>& object, OrvoVersion version) {
    return New(pool, REP_OBJECT, nullptr, nullptr, object, nullptr, version);
}

ref<LazyDict> LazyDict::FromBytesource(RoxMempool* pool, kelbaselib::Bytesource* bytesource,
                                       OrvoVersion version) {
    return New(pool, REP_BYTESOURCE, nullptr, nullptr, nullptr, bytesource, version);
}

ref<LazyDict> LazyDict::FromDictionary(RoxMempool* pool, const ref<Dictionary>& dictionary,
                                       OrvoVersion version) {
    ref<LazyDict> lazy = New(pool, REP_DICTIONARY, nullptr, nullptr, nullptr, nullptr, version);
    lazy->SetDictionary(dictionary);
    return lazy;
}

void LazyDict::SetDictionary(const ref<Dictionary>& dictionary) {
    dictionaryM = dictionary;
}

}  // namespace sorn
