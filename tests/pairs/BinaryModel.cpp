// The binary form: a plain recursive writer, and what its bytes read as.

#include <cinttypes>
#include <cstring>

#include "pairs/BodyModel.h"
#include "pairs/ScalarText.h"
#include "sorn/model/Schema.h"

namespace sorntest {

using sorn::FieldInfo;
using sorn::Schema;

namespace {

std::string Varint(uint64_t number) {
    std::string out;
    for (; number >= 0x80; number >>= 7) out += static_cast<char>((number & 0x7F) | 0x80);
    return out + static_cast<char>(number);
}

std::string Zigzag(int64_t number) {
    uint64_t bits = static_cast<uint64_t>(number);
    return Varint(number < 0 ? ~(bits << 1) : bits << 1);
}

std::string WithLength(const std::string& bytes) {
    return Varint(bytes.size()) + bytes;
}

std::string Item(char tag, const std::string& bytes) {
    return tag + WithLength(bytes);
}

/// The values that a name has for a handle on a dictionary: its first one, or the elements of that when it is
/// an array.
std::vector<const Tree*> ValuesOf(const std::vector<const Tree*>& all) {
    if (all[0]->kind != Tree::isArray) return {all[0]};
    std::vector<const Tree*> values;
    for (const Tree& item : all[0]->items) values.push_back(&item);
    return values;
}

/// A body inside an any-dict counts as its dictionary.
Tree Resolved(const Tree& tree) {
    if (tree.kind != Tree::isBody) return tree;
    std::string words;
    std::optional<Tree> resolved = BodyTree(*tree.body, words);
    return resolved ? *resolved : ErrorTree(words);
}

std::string AnyDict(const Tree& tree) {
    std::string out;
    for (const auto& [name, all] : tree.Sorted()) {
        std::string entry = Item(0x32, name);
        for (const Tree* each : ValuesOf(all)) {
            const Tree value = Resolved(*each);
            std::string bytes;
            if (value.kind == Tree::isText) bytes = Item(0x12, value.text);
            if (value.kind == Tree::isDict) bytes = AnyDict(value);
            entry += Item(0x42, bytes);
        }
        out += Item(0x22, entry);
    }
    return out;
}

Tree AnyDictAfterBinary(const Tree& tree) {
    Tree out;
    for (const auto& [name, all] : tree.Sorted()) {
        Tree array = Tree::Array();
        for (const Tree* each : ValuesOf(all)) {
            const Tree value = Resolved(*each);
            array.items.push_back(value.kind == Tree::isText   ? Tree::Text(value.text)
                                  : value.kind == Tree::isDict ? AnyDictAfterBinary(value)
                                                               : Tree::Dict());
        }
        if (array.items.size() == 1) out.Add(name, array.items[0]);
        if (array.items.size() > 1) out.Add(name, array);
    }
    return out;
}

class BinaryWriter {
 public:
    explicit BinaryWriter(bool isTypedRoad) : isTypedRoadM(isTypedRoad) {}

    std::string Known(const Record& record) {
        uint32_t id = 0;
        while (Schema::FindStruct(id) != record.info) ++id;
        return Varint(id * 8 + 2) + WithLength(Fields(record));
    }

 private:
    std::string Fields(const Record& record) {
        std::string out;
        for (const auto& [key, values] : record.fields) {
            const FieldInfo& field = record.FieldOf(key);
            if (key.second != currentForm) continue;
            for (const Value& value : values) {
                if (!FNullReference(field, value)) {
                    out +=
                        Varint(static_cast<uint64_t>(key.first * 8 + WireType(field))) + Bytes(field, value);
                }
            }
        }
        return out;
    }

    static int WireType(const FieldInfo& field) {
        switch (field.dataType) {
            case 8:
                return 1;
            case 1:
            case 2:
            case 3:
            case 6:
            case 11:
            case 12:
            case 13:
            case 14:
            case 17:
                return 2;
            default:
                return 0;
        }
    }

    std::string Bytes(const FieldInfo& field, const Value& value) {
        switch (field.dataType) {
            case 1:
            case 11:
            case 17:
                return WithLength(value.text);
            case 2:
            case 3:
                return WithLength(ScalarText(field, value));
            case 4:
            case 5:
            case 15:
            case 16:
                return Zigzag(value.number);
            case 6:
                return WithLength(AnyDict(*value.tree));
            case 8:
                return Double(value.real);
            case 12:
                return WithLength(Known(*value.record));
            case 13:
                return WithLength(Known(OfBody(*value.body)));
            case 14:
                return WithLength(Fields(*value.record));
            default:
                return Varint(static_cast<uint64_t>(value.number));
        }
    }

    Record OfBody(const Body& body) {
        std::string words;
        std::optional<Record> record = BodyRecord(body, isTypedRoadM, words);
        return record ? *record : ErrorRecord(words);
    }

    static std::string Double(double value) {
        uint64_t bits;
        memcpy(&bits, &value, 8);
        std::string out;
        for (int i = 0; i < 8; ++i) out += static_cast<char>(bits >> 8 * i & 0xFF);
        return out;
    }

    bool isTypedRoadM;
};

Value ValueAfterBinary(const FieldInfo& field, const Value& value, bool isTypedRoad) {
    Value out = value;
    if (field.dataType == 6) out.tree = std::make_shared<Tree>(AnyDictAfterBinary(*value.tree));
    if (field.dataType == 12 || field.dataType == 14) {
        out.record = std::make_shared<Record>(AfterBinary(*value.record, isTypedRoad));
    }
    if (field.dataType != 13) return out;
    std::string words;
    std::optional<Record> record = BodyRecord(*value.body, isTypedRoad, words);
    if (!record) record = ErrorRecord(words);
    Body body;
    body.rep = Body::ofBinary;
    body.bytes = Binary(*record, isTypedRoad);
    body.record = std::make_shared<Record>(AfterBinary(*record, isTypedRoad));
    out.body = std::make_shared<Body>(body);
    return out;
}

}  // namespace

std::string Binary(const Record& record, bool isTypedRoad) {
    return BinaryWriter(isTypedRoad).Known(record);
}

Record AfterBinary(const Record& record, bool isTypedRoad) {
    Record out(*record.info);
    for (const auto& [key, values] : record.fields) {
        const FieldInfo& field = record.FieldOf(key);
        if (key.second != currentForm) continue;
        std::vector<Value> kept;
        for (const Value& value : values) {
            if (!FNullReference(field, value)) kept.push_back(ValueAfterBinary(field, value, isTypedRoad));
        }
        if (!kept.empty()) out.fields[key] = kept;
    }
    return out;
}

}  // namespace sorntest
