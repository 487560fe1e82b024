// Object to dictionary and back.

#include "pairs/BodyModel.h"
#include "pairs/ScalarText.h"
#include "sorn/model/Schema.h"

namespace sorntest {

using sorn::FieldInfo;
using sorn::Schema;
using sorn::StructInfo;

namespace {

std::optional<Tree> TreeOfValue(const FieldInfo& field, const Value& value, int version) {
    if (FNullReference(field, value)) return std::nullopt;
    switch (field.dataType) {
        case 6:
            return *value.tree;
        case 12:
        case 14:
            return TreeOfRecord(*value.record, version);
        case 13:
            return Tree::OfBody(value.body);
        default: {
            bool isBare =
                field.dataType == 0 || field.dataType == 8 || field.dataType == 16 || field.dataType == 19;
            return Tree::Text(ScalarText(field, value), !isBare);
        }
    }
}

/// The form of a slot that holds in a version; false when the slot has none.
bool FormOf(const StructInfo& info, int slot, int version, FieldKey& key) {
    key = {slot, currentForm};
    if (info.vFieldInfo[slot].arity == 3) return false;
    if (version == 0) return true;
    for (int i = info.vFieldInfoHistory[slot].nVariants - 1; i >= 0; --i) {
        const FieldInfo& older = info.vFieldInfoHistory[slot].vVariants[i];
        if (older.firstVersion <= version && version <= older.lastVersion) key.second = i;
    }
    const FieldInfo& field = Record::FieldOf(info, key);
    return field.firstVersion <= version && version <= field.lastVersion;
}

const StructInfo* StructNamed(const std::string& name) {
    for (uint32_t id = 0; id < Schema::nStructDefG; ++id) {
        const StructInfo* info = Schema::FindStruct(id);
        if (info != nullptr && name == info->name) return info;
    }
    return nullptr;
}

class RecordReader {
 public:
    RecordReader(int version, std::string& words) : versionM(version), wordsM(words) {}

    std::optional<Record> Read(const Tree& tree) {
        const Tree* type = tree.Find("type");
        const StructInfo* info = type != nullptr ? StructNamed(type->text) : nullptr;
        if (info == nullptr) {
            wordsM +=
                type == nullptr ? "Dictionary has no 'type' field." : "no such structure type: " + type->text;
            return std::nullopt;
        }
        Record record(*info);
        FieldKey key;
        for (int slot = 0; slot < info->nFields; ++slot) {
            if (FormOf(*info, slot, versionM, key) && !ReadField(tree, key, record)) return std::nullopt;
        }
        return record;
    }

 private:
    bool ReadField(const Tree& tree, const FieldKey& key, Record& record) {
        const FieldInfo& field = record.FieldOf(key);
        const std::string name = record.info->pFieldNames + field.nameOffset;
        const Tree* found = tree.Find(name);
        if (found == nullptr) {
            if (field.arity != 1 || versionM == 0) return true;
            wordsM += "Required field not set: " + name;
            return false;
        }
        std::vector<Tree> items = found->kind == Tree::isArray ? found->items : std::vector<Tree>{*found};
        bool isMulti = field.arity == 2;
        if (!isMulti && items.size() != 1) {
            wordsM += "Cannot convert array to single field: " + name;
            return false;
        }
        std::vector<Value> values(items.size());
        for (size_t i = 0; i < items.size(); ++i) {
            if (ReadOne(field, items[i], isMulti, values[i])) continue;
            wordsM += (isMulti ? ". Bad multi field: " : ". Bad single field: ") + name;
            return false;
        }
        if (!values.empty()) record.fields[key] = values;
        return true;
    }

    bool ReadOne(const FieldInfo& field, const Tree& tree, bool isMulti, Value& out) {
        switch (field.dataType) {
            case 6:
                out.tree = std::make_shared<Tree>(tree);
                return tree.kind == Tree::isDict || Fail("Field must be a Dictionary");
            case 12:
            case 14:
                return ReadObject(tree, isMulti, out);
            case 13:
                return ReadBody(tree, out);
            default:
                return ReadScalar(field, tree, isMulti, out);
        }
    }

    bool ReadObject(const Tree& tree, bool isMulti, Value& out) {
        if (tree.kind != Tree::isDict) return Fail("Field must be a Dictionary");
        std::optional<Record> record = Read(tree);
        if (!record) {
            return Fail(isMulti ? " Can't convert inner Dictionary to SornObject"
                                : ". Can't unmarshal inner Dictionary");
        }
        out.record = std::make_shared<Record>(*record);
        return true;
    }

    bool ReadBody(const Tree& tree, Value& out) {
        if (tree.kind == Tree::isBody) {
            out.body = tree.body;
            return true;
        }
        if (tree.kind != Tree::isDict) return Fail("Field must be a LazyDict or a Dictionary");
        Body body;
        body.rep = Body::ofDictionary;
        body.version = versionM;
        body.tree = std::make_shared<Tree>(tree);
        out.body = std::make_shared<Body>(body);
        return true;
    }

    /// Some data types leave their words behind what is there, and some in its place.
    bool ReadScalar(const FieldInfo& field, const Tree& tree, bool isMulti, Value& out) {
        bool isNamed = field.dataType == 7 || (field.dataType >= 9 && field.dataType <= 11);
        bool isAppended = isNamed || field.dataType == 17;
        if (!isAppended) {
            const std::string before = wordsM;
            wordsM.clear();
            if (tree.kind != Tree::isText) return Fail("Dictionary field is not a single string");
            std::string none;
            if (ParseScalar(field, tree.text, Strictness::dictionary, out, none)) {
                wordsM = before;
                return true;
            }
            return Fail(
                isMulti ? "Dictionary string cannot be converted to requested data type in SornObject array"
                        : "Cannot convert field");
        }
        if (tree.kind != Tree::isText) {
            return Fail(isNamed ? "Field must be a single string"
                                : "Dictionary field is not a single string");
        }
        std::string words;
        if (ParseScalar(field, tree.text, Strictness::dictionary, out, words)) return true;
        return Fail(words + (isMulti ? "Bad value in field: " : "Cannot convert value for the field."));
    }

    bool Fail(const std::string& words) {
        wordsM += words;
        return false;
    }

    int versionM;
    std::string& wordsM;
};

}  // namespace

Tree TreeOfRecord(const Record& record, int version) {
    const StructInfo& info = *record.info;
    Tree tree;
    tree.Add("type", Tree::Text(info.name));
    FieldKey key;
    for (int slot = 0; slot < info.nFields; ++slot) {
        const std::vector<Value>* values = FormOf(info, slot, version, key) ? record.Find(key) : nullptr;
        if (values == nullptr) continue;
        const FieldInfo& field = record.FieldOf(key);
        const std::string name = info.pFieldNames + field.nameOffset;
        Tree array = Tree::Array();
        for (const Value& value : *values) {
            std::optional<Tree> one = TreeOfValue(field, value, version);
            if (!one) continue;
            if (field.arity == 2 && field.dataType != 13) {
                array.items.push_back(*one);
            } else {
                tree.Add(name, *one);
            }
        }
        if (!array.items.empty()) tree.Add(name, array);
    }
    return tree;
}

std::optional<Record> RecordOfTree(const Tree& tree, int version, std::string& words) {
    words.clear();
    return RecordReader(version, words).Read(tree);
}

}  // namespace sorntest
