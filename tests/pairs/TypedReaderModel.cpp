// The typed reader, over the dictionary of its text: the first walk notes the struct of each object, the
// second one makes the objects and finds their structs by counting.

#include "pairs/BodyModel.h"
#include "pairs/ScalarText.h"
#include "sorn/model/Schema.h"

namespace sorntest {

using sorn::FieldInfo;
using sorn::Schema;
using sorn::StructInfo;

namespace {

const StructInfo* StructNamed(const std::string& name) {
    for (uint32_t id = 0; id < Schema::nStructDefG; ++id) {
        const StructInfo* info = Schema::FindStruct(id);
        if (info != nullptr && name == info->name) return info;
    }
    return nullptr;
}

const std::string badSingle = " failed to UnmarshalOneSingleValue in ReadFieldValue";
const std::string keyWords = " Failed to parse value for key ";
const std::string badElement = " failed to UnmarshalOneMultiValue in AVReadFieldValue";

class TypedReader {
 public:
    explicit TypedReader(std::string& words) : wordsM(words) {}

    std::optional<Record> Read(const Tree& tree) {
        if (!Note(tree) || structsM[0] == nullptr) return std::nullopt;
        std::shared_ptr<const Record> record;
        if (!ReadObject(tree, structsM[0], record)) return std::nullopt;
        return *record;
    }

 private:
    /// The first walk. A "type" that is no scalar leaves an object where a comma or the end belongs.
    bool Note(const Tree& tree) {
        for (size_t i = 0; i < tree.items.size(); ++i) {
            const Tree& item = tree.items[i];
            if (!Note(item)) return Fail((item.kind == Tree::isArray ? "" : badElement) + Element(i));
        }
        if (tree.kind != Tree::isDict) return true;
        size_t index = structsM.size();
        structsM.push_back(nullptr);
        for (const auto& [name, value] : tree.entries) {
            if (name == "type" && value.kind != Tree::isText) {
                wordsM = "JSON object does not end with '}'.";
                return false;
            }
            if (name == "type") {
                structsM[index] = StructNamed(value.text);
            } else if (!Note(value)) {
                return Fail((value.kind == Tree::isArray ? "" : badSingle) + keyWords + name);
            }
        }
        return true;
    }

    static std::string Element(size_t i) {
        return i == 0 ? " Failed to parse an array element." : " Failed to parse an array member.";
    }

    bool Fail(const std::string& words) {
        wordsM += words;
        return false;
    }

    static size_t CountDicts(const Tree& tree) {
        size_t count = tree.kind == Tree::isDict ? 1 : 0;
        for (const Tree& item : tree.items) count += CountDicts(item);
        for (const auto& entry : tree.entries) count += CountDicts(entry.value);
        return count;
    }

    /// Without a struct the object is only counted, and is null.
    bool ReadObject(const Tree& tree, const StructInfo* info, std::shared_ptr<const Record>& out) {
        if (tree.kind != Tree::isDict) return false;
        if (info == nullptr) {
            indexM += CountDicts(tree);
            return true;
        }
        ++indexM;
        auto record = std::make_shared<Record>(*info);
        for (const auto& [name, value] : tree.entries) {
            int slot = SlotNamed(*info, name);
            if (slot == 0) {
                indexM += CountDicts(value);
            } else if (!ReadField(value, {slot, currentForm}, *record)) {
                return Fail(keyWords + name);
            }
        }
        out = record;
        return true;
    }

    static int SlotNamed(const StructInfo& info, const std::string& name) {
        for (int slot = 1; slot < info.nFields; ++slot) {
            const FieldInfo& field = info.vFieldInfo[slot];
            if (field.arity != 3 && name == info.pFieldNames + field.nameOffset) return slot;
        }
        return 0;
    }

    bool ReadField(const Tree& tree, const FieldKey& key, Record& record) {
        const FieldInfo& field = record.FieldOf(key);
        Value value;
        if (field.arity == 2) {
            std::vector<Value>& values = record.fields[key];
            bool isGood = tree.kind == Tree::isArray ? AppendAll(tree, field, values)
                                                     : Append(tree, field, values) || Fail(Element(0));
            if (values.empty()) record.fields.erase(key);
            return isGood;
        }
        // A list at a single field has no words of its own.
        if (tree.kind == Tree::isArray) return Fail(someWords);
        if (!ReadOne(tree, field, value)) return Fail(badSingle);
        bool isAbsent = field.arity == 0 && FReference(field) && FNullReference(field, value);
        if (!isAbsent) record.fields[key] = {value};
        return true;
    }

    bool AppendAll(const Tree& tree, const FieldInfo& field, std::vector<Value>& values) {
        for (size_t i = 0; i < tree.items.size(); ++i) {
            if (!Append(tree.items[i], field, values)) return Fail(Element(i));
        }
        return true;
    }

    bool Append(const Tree& tree, const FieldInfo& field, std::vector<Value>& values) {
        if (tree.kind == Tree::isArray) return AppendAll(tree, field, values);
        values.emplace_back();
        if (ReadOne(tree, field, values.back())) return true;
        if (field.dataType == 12) wordsM += " failed to Unmarshal KNOWN_DICT in Multi";
        if (field.dataType == 14) wordsM += " failed to Unmarshal TYPE_OBJECT in Multi";
        return Fail(badElement);
    }

    /// What goes wrong inside an object has no words outside.
    bool ReadInner(const Tree& tree, const StructInfo* info, std::shared_ptr<const Record>& out) {
        const std::string before = wordsM;
        bool isGood = ReadObject(tree, info, out);
        wordsM = before;
        return isGood;
    }

    bool ReadOne(const Tree& tree, const FieldInfo& field, Value& out) {
        switch (field.dataType) {
            case 6: {
                ++indexM;
                Tree any;
                bool isGood = tree.kind == Tree::isDict && ReadAny(tree, any);
                out.tree = std::make_shared<Tree>(any);
                return isGood;
            }
            case 12:
                return ReadInner(tree, indexM < structsM.size() ? structsM[indexM] : nullptr, out.record);
            case 13: {
                if (tree.kind != Tree::isDict) return false;
                indexM += CountDicts(tree);
                Body body;
                body.rep = Body::ofStream;
                body.bytes = tree.raw;
                out.body = std::make_shared<Body>(body);
                return true;
            }
            case 14:
                return ReadInner(tree, Schema::FindStruct(field.typeRef), out.record);
            default: {
                std::string words;
                return tree.kind == Tree::isText &&
                       ParseScalar(field, tree.text, Strictness::typed, out, words);
            }
        }
    }

    /// A map has at least one name, all scalars are strings, brackets leave no trace but for an empty array,
    /// which is an empty text, and an array in an array has no end.
    static bool ReadAny(const Tree& tree, Tree& out) {
        if (tree.entries.empty()) return false;
        std::vector<std::string> order;
        std::map<std::string, std::vector<Tree>> all;
        for (const auto& [name, value] : tree.entries) {
            std::vector<Tree> items = value.kind == Tree::isArray ? value.items : std::vector<Tree>{value};
            if (items.empty()) items.push_back(Tree::Text(""));
            for (const Tree& item : items) {
                Tree one = Tree::Text(item.text);
                if (item.kind == Tree::isArray) return false;
                if (item.kind == Tree::isDict) {
                    one = Tree::Dict();
                    if (!ReadAny(item, one)) return false;
                }
                all[name].push_back(one);
            }
        }
        for (const auto& [name, values] : all) {
            Tree array = Tree::Array();
            array.items = values;
            out.Add(name, values.size() == 1 ? values[0] : array);
        }
        return true;
    }

    std::string& wordsM;
    std::vector<const StructInfo*> structsM;
    size_t indexM = 0;
};

}  // namespace

std::optional<Record> RecordOfTypedText(const std::string& text, std::string& words) {
    std::optional<Tree> tree = ParseText(text, Dialect::typed, words);
    if (!tree) return std::nullopt;
    return TypedReader(words).Read(*tree);
}

}  // namespace sorntest
