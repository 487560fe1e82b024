#include "pairs/BodyModel.h"

#include <cstdlib>

#include "sorn/model/Schema.h"

namespace sorntest {

namespace {

constexpr uint32_t badArgument = 3;  // of the enumeration of error codes

const sorn::StructInfo& ErrorStruct() {
    for (uint32_t id = 0; id < sorn::Schema::nStructDefG; ++id) {
        const sorn::StructInfo* info = sorn::Schema::FindStruct(id);
        if (info != nullptr && info->name == std::string("error")) return *info;
    }
    abort();
}

}  // namespace

Record ErrorRecord(const std::string& words) {
    Record record(ErrorStruct());
    for (const FieldKey& key : Record::KeysOf(*record.info)) {
        const std::string name = record.info->pFieldNames + record.FieldOf(key).nameOffset;
        Value value;
        value.number = badArgument;
        value.text = words;
        if (name == "code" || name == "text") record.fields[key] = {value};
    }
    return record;
}

Tree ErrorTree(const std::string& words) {
    Tree tree;
    tree.Add("type", Tree::Text("error"));
    tree.Add("code", Tree::Text("badArgument"));
    tree.Add("text", Tree::Text(words));
    return tree;
}

std::optional<Tree> BodyTree(const Body& body, std::string& words) {
    words.clear();
    switch (body.rep) {
        case Body::ofJson:
            return ParseText(body.bytes, Dialect::hand, words);
        case Body::ofStream:
            return ParseText(body.bytes, Dialect::stream, words);
        case Body::ofDict:
        case Body::ofDictionary:
            return *body.tree;
        default:
            return TreeOfRecord(*body.record, body.version);
    }
}

std::optional<Record> BodyRecord(const Body& body, bool isTypedRoad, std::string& words) {
    words.clear();
    if (body.rep == Body::ofObject || body.rep == Body::ofBinary) return *body.record;
    bool isText = body.rep == Body::ofJson || body.rep == Body::ofStream;
    if (isText && isTypedRoad) return RecordOfTypedText(body.bytes, words);
    std::optional<Tree> tree = BodyTree(body, words);
    if (!tree) return std::nullopt;
    return RecordOfTree(*tree, body.version, words);
}

std::string BodyBinary(const Body& body, bool isTypedRoad) {
    if (body.rep == Body::ofBinary) return body.bytes;
    if (body.rep == Body::ofObject) return Binary(*body.record, isTypedRoad);
    std::string words;
    std::optional<Tree> tree = BodyTree(body, words);
    if (!tree) return Binary(ErrorRecord(words), isTypedRoad);
    std::optional<Record> record = RecordOfTree(*tree, body.version, words);
    return Binary(record ? *record : ErrorRecord(words + "Dict did not unmarshal"), isTypedRoad);
}

std::string BodyText(const Body& body, bool pretty, Destination destination) {
    bool isObject = body.rep == Body::ofObject || body.rep == Body::ofBinary;
    if (body.rep == Body::ofJson && !pretty) return body.bytes;
    if (isObject && !pretty && destination != Destination::sink) return TypedText(*body.record, body.version);
    std::string words;
    std::optional<Tree> tree = BodyTree(body, words);
    return tree ? TreeText(*tree, pretty, destination) : "";
}

}  // namespace sorntest
