#include "sorn/convert/DictionarySornObject.h"
#include "sorn/dict/ByteBuffer.h"
#include "sorn/dict/Dict.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/dict/MempoolNew.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/json/JsonFormat.h"
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
            if (bytesM == nullptr) return nullptr;
            return Dictionary::FromJsonBytestring(bytesM, error, GetMempool());
        case REP_OBJECT:
            if (objectM == nullptr) return nullptr;
            return DictionarySornObject(GetMempool(), Schema::vStructDefG, Schema::nStructDefG)
                .SornObjectToDictionary(objectM.get(), versionM);
        case REP_DICTIONARY:
            return dictionaryM;
        case REP_PROTOBUF:
            error = "protobuf did not unmarshal";
            return nullptr;
        case REP_BYTESOURCE:
            error = "byte source was not read";
            return nullptr;
    }
    error = "LazyDict to Dictionary: unknown representation in LazyDict";
    return nullptr;
}

ref<Dict> LazyDict::ToDict() const {
    if (repM == REP_DICT && dictM != nullptr) return dictM;
    RoxString error;
    ref<Dictionary> dictionary;
    if (repM > REP_BYTESOURCE) {
        dictionary = NewErrorDictionary("internalError", "bad rep in LazyDict");
    } else {
        dictionary = ToDictionary(error);
        if (dictionary == nullptr) dictionary = NewErrorDictionary("badArgument", error);
    }
    return MempoolNew<Dict>(GetMempool(), dictionary);
}

ref<SornObject> LazyDict::ToSornObjectOrErrorString(RoxString& error) const {
    if (repM == REP_OBJECT) return objectM;
    ref<SornObject> object;
    const ref<Dictionary> dictionary = ToDictionary(error);
    if (dictionary == nullptr) return nullptr;
    DictionarySornObject(GetMempool(), Schema::vStructDefG, Schema::nStructDefG)
        .DictionaryToSornObject(dictionary, versionM, object, error);
    return object;
}

ref<SornObject> LazyDict::ToSornObjectOrError() const {
    RoxString error;
    ref<SornObject> object = ToSornObjectOrErrorString(error);
    return object != nullptr ? object : NewErrorObject(error);
}

LazyBodyContent LazyDict::ToWrite(bool pretty) const {
    LazyBodyContent content;
    if (repM == REP_JSON && !pretty) {
        content.text = bytesM;
    } else {
        RoxString error;  // goes nowhere
        content.dictionary = ToDictionary(error);
    }
    return content;
}

void LazyDict::ToJsonByteBuffer(ByteBuffer& out, bool pretty) const {
    const LazyBodyContent content = ToWrite(pretty);
    if (content.dictionary != nullptr) {
        content.dictionary->ToJson(out, JsonFormat(pretty));
    } else if (content.text != nullptr) {
        out.AppendBytes(content.text->GetData(), content.text->GetLength());
    }
}

bool LazyDict::operator==(const LazyDict& other) const {
    return *ToDict() == *other.ToDict();
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
