#include <climits>

#include "kelbaselib/Bytesource.h"
#include "rox/RoxFeatures.h"
#include "sorn/binary/ProtoBuf.h"
#include "sorn/dict/Dict.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/lazy/ConversionMeasurement.h"
#include "sorn/lazy/LazyDict.h"
#include "sorn/model/Schema.h"
#include "sorn/typedjson/JsonSornObject.h"

namespace sorn {

ref<SornObject> LazyDict::ToSornObjectOrErrorString(RoxString& error) const {
    switch (repM) {
        case REP_DICT:
        case REP_DICTIONARY: {
            const ref<Dictionary> dictionary = ToDictionary(error);
            return dictionary != nullptr ? ObjectOfDictionary(dictionary, error) : nullptr;
        }
        case REP_OBJECT:
            return objectM;
        case REP_PROTOBUF: {
            ref<SornObject> object;
            ProtoBuf codec(GetMempool(), Schema::vStructDefG, Schema::nStructDefG);
            if (bytesM != nullptr && codec.UnmarshalKnownDict(bytesM, &object)) return object;
            error = "Protobuf did not unmarshal to SornObject";
            return nullptr;
        }
        case REP_JSON:
            return bytesM != nullptr ? ObjectOfText(error) : nullptr;
        case REP_BYTESOURCE:
            return bytesourceM != nullptr ? ObjectOfStream(error) : nullptr;
    }
    error = "unknown rep in LazyDict";
    return nullptr;
}

ref<SornObject> LazyDict::ToSornObjectOrError() const {
    RoxString error;
    ref<SornObject> object = ToSornObjectOrErrorString(error);
    return object != nullptr ? object : NewErrorObject(error);
}

bool LazyDict::ToSornObject(ref<SornObject>& out) const {
    RoxString error;  // goes nowhere
    out = ToSornObjectOrErrorString(error);
    return out != nullptr;
}

ref<SornObject> LazyDict::ObjectOfText(RoxString& error) const {
    const bool isTyped = RoxFeatures::FEnabled(VK_FEATURE_TYPED_JSON);
    const ConversionMeasurement measurement(isTyped ? "new REP_JSON" : "old REP_JSON", GetMempool());
    ref<SornObject> object;
    if (isTyped) {
        const uint32_t nBytes = bytesM->GetLength();
        if (nBytes > INT_MAX) {
            error = "JSON text is longer than 2 GiB";
        } else {
            JsonSornObject(GetMempool())
                .JsonToSornObject(bytesM->GetData(), static_cast<int>(nBytes), versionM, &object, error);
        }
        measurement.End(object.get(), nBytes);
        return object;
    }
    const ref<Dictionary> dictionary = Dictionary::FromJsonBytestring(bytesM, error, GetMempool());
    if (dictionary == nullptr) return nullptr;
    object = ObjectOfDictionary(dictionary, error);
    measurement.End(object.get(), 0);  // this road's lines have no size
    return object;
}

ref<SornObject> LazyDict::ObjectOfStream(RoxString& error) const {
    const bool isTyped = RoxFeatures::FEnabled(VK_FEATURE_TYPED_JSON);
    const ConversionMeasurement measurement(isTyped ? "new REP_BYTESOURCE" : "old REP_BYTESOURCE",
                                            GetMempool());
    ref<SornObject> object;
    unsigned nRead = 0;  // the other road's lines have no size
    if (isTyped) {
        JsonSornObject(GetMempool()).JsonToSornObject(bytesourceM, nRead, versionM, &object, error);
    } else {
        const ref<Dictionary> dictionary = ReadBytesource(error);
        if (dictionary == nullptr) return nullptr;
        object = ObjectOfDictionary(dictionary, error);
    }
    measurement.End(object.get(), nRead);
    return object;
}

}  // namespace sorn
