#include "codecs/Records.h"

#include <google/protobuf/util/json_util.h>
#include <rapidjson/document.h>
#include <sornpeer.pb.h>
#include <sornpeer_oneof.pb.h>

#include <cstdio>
#include <cstdlib>
#include <utility>

#include "codecs/Libraries.h"
#include "sorn/convert/DictionarySornObject.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/model/Schema.h"

namespace bench {

namespace {

void Check(bool isRight, const char* what, const std::string& body) {
    if (isRight) return;
    std::fprintf(stderr, "%s: %.200s\n", what, body.c_str());
    std::exit(1);
}

/// By the dictionary road, which is not what is measured.
ref<sorn::SornObject> ObjectOf(const std::string& body, RoxMempool& pool) {
    RoxString error;
    const ref<sorn::Dictionary> dictionary =
        sorn::Dictionary::FromJson(reinterpret_cast<const unsigned char*>(body.data()),
                                   static_cast<unsigned>(body.size()), error, &pool);
    ref<sorn::SornObject> object;
    sorn::DictionarySornObject converter(&pool, sorn::Schema::vStructDefG, sorn::Schema::nStructDefG);
    const bool isGood =
        dictionary != nullptr &&
        converter.DictionaryToSornObject(dictionary, sorn::Schema::lastSchemaVersionG, object, error);
    Check(isGood, error.Utf8(), body);
    return object;
}

std::string BytesOf(const ref<rox::ByteBuffer>& bytes) {
    return std::string(reinterpret_cast<const char*>(bytes->GetData()), bytes->GetLength());
}

void CheckObject(Sorn& ours, const Sorn::Tree& tree, const std::string& bytes, const std::string& form,
                 const std::string& body) {
    Check(tree != nullptr, (form + " is refused").c_str(), body);
    Check(BytesOf(ours.ToBinary(tree)) == bytes, (form + " does not come back").c_str(), body);
}

}  // namespace

Records::Records(std::string name, const Bodies& bodies) : nameM(std::move(name)) {
    for (const std::string& body : bodies) {
        recordsM.push_back(MakeRecord(body));
        const Record& record = recordsM.back();
        nBinaryM += record.binary->GetLength();
        nTextM += record.text.size();
        nPeerTextM += record.peerText.size();
    }
}

Record Records::MakeRecord(const std::string& body) {
    Record record;
    Sorn ours(poolM);
    const ref<sorn::SornObject> object = ObjectOf(body, poolM);
    record.binary = ours.ToBinary(object);
    record.text = ours.ToText(object);
    record.object = Sorn(treesM).FromBinary(record);
    const std::string bytes = BytesOf(record.binary);

    CheckObject(ours, record.object, bytes, "the record", body);
    CheckObject(ours, ours.FromBinary(record), bytes, "binary", body);
    CheckObject(ours, ours.FromText(record), bytes, "text", body);
    rapidjson::Document document;
    document.Parse(record.text.data(), record.text.size());
    Check(!document.HasParseError(), "RapidJSON refuses the text", body);

    sornpeer_oneof::KnownDict inOneof;
    Check(inOneof.ParseFromString(bytes) && inOneof.SerializeAsString() == bytes,
          "libprotobuf's oneof differs", body);
    sornpeer::KnownDict message;
    Check(message.ParseFromString(bytes), "libprotobuf refuses the bytes", body);
    Check(message.SerializeAsString() == bytes, "libprotobuf writes other bytes", body);
    Check(google::protobuf::util::MessageToJsonString(message, &record.peerText).ok(),
          "libprotobuf writes no JSON", body);
    sornpeer::KnownDict again;
    Check(google::protobuf::util::JsonStringToMessage(record.peerText, &again).ok(),
          "libprotobuf refuses its own JSON", body);
    Check(again.SerializeAsString() == bytes, "libprotobuf's JSON does not come back", body);
    return record;
}

}  // namespace bench
