#include "pairs/Record.h"

#include <cinttypes>

#include "convert/RawText.h"

namespace sorntest {

using sorn::FieldInfo;
using sorn::StructInfo;

Tree Tree::Text(const std::string& text, bool quoted) {
    Tree tree;
    tree.kind = isText;
    tree.text = text;
    tree.quoted = quoted;
    return tree;
}

Tree Tree::Null() {
    Tree tree;
    tree.kind = isNull;
    return tree;
}

Tree Tree::Array() {
    Tree tree;
    tree.kind = isArray;
    return tree;
}

Tree Tree::Dict() {
    return Tree();
}

Tree Tree::OfBody(const std::shared_ptr<const Body>& body) {
    Tree tree;
    tree.kind = isBody;
    tree.body = body;
    return tree;
}

void Tree::Add(const std::string& name, const Tree& value) {
    entries.push_back({name, value});
}

const Tree* Tree::Find(const std::string& name) const {
    for (const auto& [each, value] : entries) {
        if (each == name) return &value;
    }
    return nullptr;
}

std::map<std::string, std::vector<const Tree*>> Tree::Sorted() const {
    std::map<std::string, std::vector<const Tree*>> sorted;
    for (const auto& [name, value] : entries) sorted[name].push_back(&value);
    return sorted;
}

bool FReference(const FieldInfo& field) {
    return field.dataType == 1 || field.dataType == 6 || (field.dataType >= 12 && field.dataType <= 14);
}

bool FNullReference(const FieldInfo& field, const Value& value) {
    switch (field.dataType) {
        case 1:
            return value.isNullBytes;
        case 6:
            return value.tree == nullptr;
        case 12:
        case 14:
            return value.record == nullptr;
        case 13:
            return value.body == nullptr;
        default:
            return false;
    }
}

const FieldInfo& Record::FieldOf(const StructInfo& info, const FieldKey& key) {
    if (key.second == currentForm) return info.vFieldInfo[key.first];
    return info.vFieldInfoHistory[key.first].vVariants[key.second];
}

std::vector<FieldKey> Record::KeysOf(const StructInfo& info) {
    std::vector<FieldKey> keys;
    for (int slot = 0; slot < info.nFields; ++slot) {
        if (info.vFieldInfo[slot].arity == 3) continue;
        for (int i = 0; i < info.vFieldInfoHistory[slot].nVariants; ++i) keys.emplace_back(slot, i);
        keys.emplace_back(slot, currentForm);
    }
    return keys;
}

Value Record::DefaultOf(const FieldInfo& field) {
    Value value;
    if (field.dataType == 2) value.number = value.sub = -2;
    value.isNullBytes = field.dataType == 1;
    return value;
}

Record::Record(const StructInfo& structInfo) : info(&structInfo) {
    for (const FieldKey& key : KeysOf(structInfo)) {
        const FieldInfo& field = FieldOf(key);
        if (field.arity == 1) fields[key].push_back(DefaultOf(field));
    }
}

const std::vector<Value>* Record::Find(const FieldKey& key) const {
    auto found = fields.find(key);
    return found == fields.end() ? nullptr : &found->second;
}

namespace {

std::string Printable(const std::string& bytes) {
    std::string text;
    for (char c : bytes) {
        bool isPlain = c >= 0x20 && c < 0x7F && c != '\\';
        text += isPlain ? std::string(1, c) : Format("\\%02X", static_cast<unsigned char>(c));
    }
    return "'" + text + "'";
}

std::string Show(const FieldInfo& field, const Value& value) {
    if (FNullReference(field, value)) return "null";
    switch (field.dataType) {
        case 1:
        case 11:
        case 17:
            return Printable(value.text);
        case 2:
            return Format("%" PRId64 "/%" PRId64, value.number, value.sub);
        case 3:
            return Printable(value.text) + Format("%" PRId64, value.number);
        case 6:
            return Show(*value.tree);
        case 8:
            return Format("%a", value.real);
        case 12:
        case 14:
            return Show(*value.record);
        case 13:
            return Show(*value.body);
        default:
            return Format("%" PRId64, value.number);
    }
}

}  // namespace

std::string Show(const Record& record) {
    std::string out = std::string(record.info->name) + "(";
    for (const auto& [key, values] : record.fields) {
        const FieldInfo& field = record.FieldOf(key);
        out += Format("%s.%d=", record.info->pFieldNames + field.nameOffset, key.second);
        for (const Value& value : values) out += Show(field, value) + ";";
        out += "\n";
    }
    return out + ")";
}

std::string Show(const Tree& tree) {
    std::string out;
    switch (tree.kind) {
        case Tree::isText:
            return (tree.quoted ? "" : "bare ") + Printable(tree.text);
        case Tree::isNull:
            return "null";
        case Tree::isBody:
            return Show(*tree.body);
        case Tree::isArray:
            for (const Tree& item : tree.items) out += Show(item) + ", ";
            return "[" + out + "]";
        default:
            for (const auto& [name, values] : tree.Sorted()) {
                for (const Tree* value : values) out += Printable(name) + ": " + Show(*value) + ", ";
            }
            return "{" + out + "}";
    }
}

std::string Show(const Body& body) {
    std::string out = Format("body %d@%d ", static_cast<int>(body.rep), body.version);
    switch (body.rep) {
        case Body::ofObject:
            return out + Show(*body.record);
        case Body::ofDict:
        case Body::ofDictionary:
            return out + Show(*body.tree);
        default:
            return out + Printable(body.bytes);
    }
}

}  // namespace sorntest
