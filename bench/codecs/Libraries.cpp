#include "codecs/Libraries.h"

#include <benchmark/benchmark.h>
#include <google/protobuf/util/json_util.h>
#include <rapidjson/stringbuffer.h>
#include <rapidjson/writer.h>
#include <sornpeer.pb.h>
#include <sornpeer_oneof.pb.h>

#include "sorn/binary/ProtoBuf.h"
#include "sorn/model/Schema.h"
#include "sorn/typedjson/JsonSornObject.h"

namespace bench {

namespace {

// Records of the newest version, at which no field is written that only older ones require.
const sorn::OrvoVersion versionG(sorn::Schema::lastSchemaVersionG);

sorn::ProtoBuf Codec(RoxMempool& pool) {
    return sorn::ProtoBuf(&pool, sorn::Schema::vStructDefG, sorn::Schema::nStructDefG);
}

}  // namespace

Sorn::Tree Sorn::FromBinary(const Record& record) {
    Tree tree;
    Codec(poolM).UnmarshalKnownDict(record.binary, &tree);
    return tree;
}

Sorn::Tree Sorn::FromText(const Record& record) {
    Tree tree;
    RoxString error;
    sorn::JsonSornObject(&poolM).JsonToSornObject(reinterpret_cast<const unsigned char*>(record.text.data()),
                                                  static_cast<int>(record.text.size()), versionG, &tree,
                                                  error);
    return tree;
}

ref<rox::ByteBuffer> Sorn::ToBinary(const Tree& tree) {
    return Codec(poolM).MarshalKnownDict(tree.get());
}

std::string Sorn::ToText(const Tree& tree) {
    const RoxString text = sorn::JsonSornObject(&poolM).SornObjectToJson(tree.get(), versionG);
    return std::string(text.Utf8(), text.NByte());
}

size_t Sorn::WriteText(const Tree& tree) {
    const RoxString text = sorn::JsonSornObject(&poolM).SornObjectToJson(tree.get(), versionG);
    benchmark::DoNotOptimize(text.Utf8());
    return text.NByte();
}

Peer::Peer(Form form, size_t nBlock)
    : blockM(nBlock, '\0'), arenaM(Options(blockM)), prototypeM(Prototype(form, factoryM)) {}

const google::protobuf::Message& Peer::Prototype(Form form,
                                                 google::protobuf::DynamicMessageFactory& factory) {
    if (form == Form::DYNAMIC) return *factory.GetPrototype(sornpeer::KnownDict::descriptor());
    if (form == Form::ONEOF) return sornpeer_oneof::KnownDict::default_instance();
    return sornpeer::KnownDict::default_instance();
}

google::protobuf::ArenaOptions Peer::Options(std::string& block) {
    google::protobuf::ArenaOptions options;
    options.initial_block = block.data();
    options.initial_block_size = block.size();
    return options;
}

Peer::Tree Peer::FromBinary(const Record& record) {
    Tree tree = prototypeM.New(&arenaM);
    const bool isGood =
        tree->ParseFromArray(record.binary->GetData(), static_cast<int>(record.binary->GetLength()));
    return isGood ? tree : nullptr;
}

Peer::Tree Peer::FromText(const Record& record) {
    Tree tree = prototypeM.New(&arenaM);
    return google::protobuf::util::JsonStringToMessage(record.peerText, tree).ok() ? tree : nullptr;
}

size_t Peer::WriteText(const google::protobuf::Message& tree) {
    std::string text;
    if (!google::protobuf::util::MessageToJsonString(tree, &text).ok()) return 0;
    benchmark::DoNotOptimize(text.data());
    return text.size();
}

RapidJson::Tree RapidJson::FromText(const Record& record) {
    rapidjson::Document document;
    document.Parse(record.text.data(), record.text.size());
    return document;
}

size_t RapidJson::WriteText(const Tree& tree) {
    rapidjson::StringBuffer text;
    rapidjson::Writer<rapidjson::StringBuffer> writer(text);
    tree.Accept(writer);
    benchmark::DoNotOptimize(text.GetString());
    return text.GetSize();
}

}  // namespace bench
