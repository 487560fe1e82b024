#include "kelbaselib/Bytesource.h"
#include "rox/RoxAssert.h"
#include "sorn/binary/ProtoBuf.h"
#include "sorn/convert/DictionarySornObject.h"
#include "sorn/dict/ByteBuffer.h"
#include "sorn/dict/Dict.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/dict/MempoolNew.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/lazy/LazyDict.h"
#include "sorn/model/InternedString.h"
#include "sorn/model/Schema.h"

namespace sorn {

// A body whose member was never given is answered as an unreadable one without words.
ref<Dictionary> LazyDict::ToDictionary(RoxString& error) const {
    error = RoxString();
    switch (repM) {
        case REP_DICT:
            return dictM != nullptr ? dictM->GetDictionary() : nullptr;
        case REP_JSON:
            return bytesM != nullptr ? Dictionary::FromJsonBytestring(bytesM, error, GetMempool()) : nullptr;
        case REP_PROTOBUF:
        case REP_OBJECT: {
            const ref<SornObject> object = repM == REP_OBJECT ? objectM : Decode();
            if (object == nullptr) return nullptr;
            return DictionarySornObject(GetMempool(), Schema::vStructDefG, Schema::nStructDefG)
                .SornObjectToDictionary(object.get(), versionM);
        }
        case REP_DICTIONARY:
            return dictionaryM;
        case REP_BYTESOURCE: {
            RoxString lost;  // an unreadable stream gives no words here
            return ReadBytesource(lost);
        }
    }
    error = "LazyDict to Dictionary: unknown representation in LazyDict";
    return nullptr;
}

ref<Dict> LazyDict::ToDict() const {
    if (repM == REP_DICT && dictM != nullptr) return dictM;
    return MempoolNew<Dict>(GetMempool(), ToDictionaryOrError());
}

ref<rox::ByteBuffer> LazyDict::ToProtobuf() const {
    if (repM > REP_BYTESOURCE) return rox::ByteBuffer::NewOfLength(GetMempool(), 0);
    if (repM == REP_PROTOBUF && bytesM != nullptr) return bytesM;
    ref<SornObject> object = objectM;
    if (repM != REP_OBJECT || object == nullptr) {
        RoxString error;
        object = ObjectOfDictionary(ToDictionaryOrError(), error);
        if (object == nullptr) {
            ByteBuffer words(GetMempool());
            words.AppendText(error);  // may have a NUL inside
            words.AppendLiteral("Dict did not unmarshal");
            object = NewErrorObject(words.ToRoxString(GetMempool()));
        }
    }
    return ProtoBuf(GetMempool(), Schema::vStructDefG, Schema::nStructDefG).MarshalKnownDict(object.get());
}

bool LazyDict::GetDictionaryFromBytesource(ref<Dictionary>& out) const {
    RoxString error;
    if (repM != REP_BYTESOURCE || bytesourceM == nullptr) RoxAssertFail("%s: no byte source", __func__);
    kelbaselib::Bytesource* const source = bytesourceM->NewSource();
    out = nullptr;
    if (source == nullptr) return false;
    out = Dictionary::FromJsonBytesource(source, error, GetMempool());
    return out != nullptr && error.FEmpty();
}

void LazyDict::BuildDictionaryFromBytesource() {
    // The part of a body that cannot be read is not kept: a later query would take it for the body.
    ref<Dictionary> dictionary;
    if (dictionaryM != nullptr || bytesourceM == nullptr || !GetDictionaryFromBytesource(dictionary)) return;
    dictionaryM = dictionary;
    repM = REP_DICTIONARY;
    bytesourceM->Release();
    bytesourceM = nullptr;
}

bool LazyDict::operator==(const LazyDict& other) const {
    return *ToDict() == *other.ToDict();
}

/// The object of a REP_PROTOBUF body; an error object when it does not unmarshal, null without bytes.
ref<SornObject> LazyDict::Decode() const {
    if (bytesM == nullptr) return nullptr;
    ref<SornObject> object;
    ProtoBuf codec(GetMempool(), Schema::vStructDefG, Schema::nStructDefG);
    return codec.UnmarshalKnownDict(bytesM, &object) ? object : NewErrorObject("protobuf did not unmarshal");
}

/// The dictionary of a stream, or null and the parser's words.
ref<Dictionary> LazyDict::ReadBytesource(RoxString& error) const {
    kelbaselib::Bytesource* const source = bytesourceM != nullptr ? bytesourceM->NewSource() : nullptr;
    if (source == nullptr) return nullptr;
    RoxString words;
    const ref<Dictionary> dictionary = Dictionary::FromJsonBytesource(source, words, GetMempool());
    if (words.FEmpty()) return dictionary;
    error = words;
    return nullptr;
}

ref<Dictionary> LazyDict::ToDictionaryOrError() const {
    if (repM > REP_BYTESOURCE) return NewErrorDictionary("internalError", "bad rep in LazyDict");
    RoxString error;
    ref<Dictionary> dictionary = repM == REP_BYTESOURCE ? ReadBytesource(error) : ToDictionary(error);
    return dictionary != nullptr ? dictionary : NewErrorDictionary("badArgument", error);
}

ref<SornObject> LazyDict::ObjectOfDictionary(const ref<Dictionary>& dictionary, RoxString& error) const {
    ref<SornObject> object;
    DictionarySornObject(GetMempool(), Schema::vStructDefG, Schema::nStructDefG)
        .DictionaryToSornObject(dictionary, versionM, object, error);
    return object;
}

ref<Dictionary> LazyDict::NewErrorDictionary(const char* code, const RoxString& text) const {
    ref<Dictionary> dictionary = Dictionary::New(GetMempool(), *InternedString(nullptr, "error"));
    dictionary->Add(*InternedString(nullptr, "code"), RoxString(GetMempool(), code));
    dictionary->Add(*InternedString(nullptr, "text"), text);
    return dictionary;
}

ref<SornObject> LazyDict::NewErrorObject(const RoxString& text) const {
    ref<SornObject> object;
    RoxString none;  // the error dictionary fits its struct
    DictionarySornObject(GetMempool(), Schema::vStructDefG, Schema::nStructDefG)
        .DictionaryToSornObject(NewErrorDictionary("badArgument", text), 0, object, none);
    return object;
}

}  // namespace sorn
