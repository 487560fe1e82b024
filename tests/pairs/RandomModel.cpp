#include "pairs/RandomModel.h"

#include "convert/RawText.h"
#include "pairs/BodyModel.h"
#include "sorn/model/Schema.h"

namespace sorntest {

using sorn::EnumDef;
using sorn::FieldInfo;
using sorn::Schema;
using sorn::StructInfo;

Record RandomModel::Make(const StructInfo& info, int nLevels) {
    Record record(info);
    for (const FieldKey& key : Record::KeysOf(info)) {
        const FieldInfo& field = record.FieldOf(key);
        bool isObject = field.dataType == 12 || field.dataType == 14;
        if (isObject && nLevels <= 0 && field.arity != 1) continue;
        uint32_t n = field.arity == 1 ? 1 : field.arity == 0 ? Below(2) : Below(4);
        if (n == 0) continue;
        std::vector<Value> values;
        for (uint32_t i = 0; i < n; ++i) values.push_back(MakeValue(field, nLevels));
        record.fields[key] = values;
    }
    return record;
}

/// Numbers for which the text forms lose nothing.
int64_t RandomModel::MakeNumber(const FieldInfo& field) {
    switch (field.dataType) {
        case 0:
            return Below(2);
        case 2:
        case 3:
            return static_cast<int64_t>(Bits() & 0x7FFFFFFF);
        case 4:
            return int64_t{Below(24837)};  // before 2038
        case 5:
            return int64_t{Below(2145916800)} * 1000;
        case 7: {
            const EnumDef& def = *Schema::FindEnum(field.typeRef);
            uint32_t start = Below(def.count);
            for (uint32_t i = 0; i < def.count; ++i) {
                if (def.names[(start + i) % def.count] != nullptr) return (start + i) % def.count;
            }
            return 0;
        }
        case 10:
            return static_cast<int64_t>((uint64_t{Below(2) != 0 ? 9u : 0u} << 48) + (Bits() >> 16));
        case 15:
        case 20:
            return static_cast<int64_t>(Bits() >> Below(64));
        case 16:
            return static_cast<int32_t>(Bits());
        case 18:
            return int64_t{Below(86400)} * 1000;
        default:
            return static_cast<uint32_t>(Bits() >> Below(64));
    }
}

Value RandomModel::MakeValue(const FieldInfo& field, int nLevels) {
    Value value;
    switch (field.dataType) {
        case 1:
            for (uint32_t n = 1 + Below(8); n != 0; --n) value.text += static_cast<char>(Bits());
            break;
        case 6:
            value.tree = std::make_shared<Tree>(MakeAnyDict(2));
            break;
        case 8:
            value.real = static_cast<double>(static_cast<int32_t>(Below(2000000)) - 1000000) / 4;
            break;
        case 11:
            value.text = MakeText(6);
            break;
        case 12:
            value.record = std::make_shared<Record>(Make(AnyStruct(), nLevels - 1));
            break;
        case 13:
            value.body = MakeBody();
            break;
        case 14:
            value.record = std::make_shared<Record>(Make(*Schema::FindStruct(field.typeRef), nLevels - 1));
            break;
        case 17:
            value.text = MakeText(12);
            break;
        default:
            value.number = MakeNumber(field);
            value.sub = field.dataType == 2 ? (Below(2) != 0 ? int64_t{Below(100)} : -2) : 0;
            if (field.dataType == 3) value.text = Below(2) != 0 ? "USD" : "JPY";
    }
    return value;
}

/// Mostly what the library's own handle on dictionaries makes: strings, dictionaries, and lists of two and
/// more.
Tree RandomModel::MakeAnyValue(int nLevels) {
    uint32_t kind = Below(24);
    if (kind == 0) return Tree::Null();
    if (kind == 1) return Tree::Text(Format("%d", static_cast<int>(Below(100)) - 50), false);
    if (kind == 2) return Tree::Text("true", false);
    if (kind < 6 && nLevels > 0) return MakeAnyDict(nLevels - 1);
    if (kind < 8 && nLevels > 0) {
        Tree array = Tree::Array();
        for (uint32_t n = 2 + Below(2); n != 0; --n) array.items.push_back(MakeAnyValue(nLevels - 1));
        return array;
    }
    return Tree::Text(MakeText(5));
}

Tree RandomModel::MakeAnyDict(int nLevels) {
    Tree tree;
    for (uint32_t n = Below(8) == 0 ? 0 : 1 + Below(3); n != 0; --n) {
        const std::string name = Below(16) == 0 ? "type" : MakeText(4);
        if (tree.Find(name) == nullptr) tree.Add(name, MakeAnyValue(nLevels));
    }
    return tree;
}

std::shared_ptr<const Body> RandomModel::MakeBody() {
    auto body = std::make_shared<Body>();
    const Record record = Make(AnyStruct(), 0);
    body->rep = static_cast<Body::Rep>(Below(6));
    switch (body->rep) {
        case Body::ofObject:
            body->record = std::make_shared<Record>(record);
            break;
        case Body::ofBinary:
            body->bytes = Binary(record, false);
            body->record = std::make_shared<Record>(AfterBinary(record, false));
            break;
        case Body::ofDict:
        case Body::ofDictionary:
            body->tree = std::make_shared<Tree>(TreeOfRecord(record, 0));
            break;
        default:
            body->bytes =
                Below(2) != 0 ? TypedText(record, 0) : TreeText(TreeOfRecord(record, 0), Below(2) != 0);
    }
    return body;
}

std::string RandomModel::MakeText(unsigned maxPieces) {
    static const char* const pieces[] = {"a", "Z", "9", " ",  "\"",      "\\",   "\n", "\xC3\xA9",
                                         ".", ",", "d", "\t", "\\u00e9", "\x01", "/",  "-"};
    std::string text;
    for (uint32_t n = Below(maxPieces); n != 0; --n) text += pieces[Below(16)];
    return text;
}

/// Any struct that requires no other one and no any-dict of it is read by the name of its struct.
const StructInfo& RandomModel::AnyStruct() {
    for (;;) {
        const StructInfo* info = Schema::FindStruct(Below(Schema::nStructDefG));
        if (info == nullptr) continue;
        bool isLeaf = true;
        for (int i = 0; i < info->nFields; ++i) {
            const FieldInfo& field = info->vFieldInfo[i];
            if (field.arity != 3 && field.dataType >= 12 && field.dataType <= 14 && field.arity == 1)
                isLeaf = false;
            // Bodies in bodies have tests of their own.
            if (field.arity != 3 && field.dataType == 13) isLeaf = false;
        }
        if (isLeaf) return *info;
    }
}

}  // namespace sorntest
