#include "service/RequestBody.h"

#include "sorn/convert/DictionarySornObject.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/lazy/LazyDict.h"
#include "sorn/model/Schema.h"
#include "sorn/model/StructInfoMap.h"
#include "sorn/typedjson/JsonSornObject.h"

namespace sorn::service {

namespace {

constexpr std::string_view whiteSpaceG = " \t\r\n";

std::string_view Trimmed(std::string_view text) {
    const size_t begin = text.find_first_not_of(whiteSpaceG);
    if (begin == std::string_view::npos) return {};
    return text.substr(begin, text.find_last_not_of(whiteSpaceG) - begin + 1);
}

bool FKnown(OrvoVersion version) {
    return version.FAbsent() || (version.Number() >= Schema::firstSchemaVersionG &&
                                 version.Number() <= Schema::lastSchemaVersionG);
}

const unsigned char* Bytes(std::string_view text) {
    return reinterpret_cast<const unsigned char*>(text.data());
}

std::string Words(const RoxString& words, const char* otherwise) {
    return words.FEmpty() ? otherwise : std::string(words.View());
}

}  // namespace

bool RequestBody::Read(RoxMempool* pool, const RequestWrapper& request, Failure& failure) {
    const ref<LazyDict>& body = request.GetBody();
    if (body == nullptr || body->GetRep() != LazyDict::REP_JSON) {
        return failure.Set(ErrorCode::badArgumentG, "the body is no JSON object");
    }
    const ref<rox::ByteBuffer>& bytes = body->GetStoredBytes();
    text = Trimmed({reinterpret_cast<const char*>(bytes->GetData()), bytes->GetLength()});
    version = request.GetOrvoVersion();
    if (!FKnown(version)) {
        return failure.Set(ErrorCode::schemaExceptionG,
                           "schema version " + std::to_string(version.Number()) + " is not known");
    }
    const RoxString& type = request.GetRequestType();
    pType = StructInfoMap::LookupStructByName(type.Utf8());
    if (pType == nullptr) {
        return failure.Set(ErrorCode::badArgumentG, "unknown type '" + std::string(type.View()) + "'");
    }
    RoxString words;
    dictionary = Dictionary::FromJson(Bytes(text), static_cast<unsigned>(text.size()), words, pool);
    if (dictionary == nullptr) {
        return failure.Set(ErrorCode::badArgumentG, Words(words, "the body is no JSON object"));
    }
    if (!(dictionary->GetString("type") == type)) {
        return failure.Set(ErrorCode::badArgumentG, "the body is not of the type that the request names");
    }
    return true;
}

ref<SornObject> RequestBody::ToObject(RoxMempool* pool, Failure& failure) const {
    ref<SornObject> object;
    RoxString words;
    DictionarySornObject(pool, Schema::vStructDefG, Schema::nStructDefG)
        .DictionaryToSornObject(dictionary, version, object, words);
    if (object == nullptr) failure.Set(ErrorCode::badArgumentG, Words(words, "the body does not convert"));
    return object;
}

ref<SornObject> RequestBody::ToPartialObject(RoxMempool* pool, Failure& failure) const {
    ref<SornObject> object;
    RoxString words;
    JsonSornObject(pool).JsonToSornObject(Bytes(text), static_cast<int>(text.size()), version, &object,
                                          words);
    if (object == nullptr) failure.Set(ErrorCode::badArgumentG, Words(words, "the body does not convert"));
    return object;
}

}  // namespace sorn::service
