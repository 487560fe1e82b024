#pragma once

#include <cstdint>
#include <map>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "sorn/model/FieldInfo.h"
#include "sorn/model/StructInfo.h"

/// A second account of records, dictionaries and bodies as plain data of the tests. What the library must
/// give is worked out from these by the writers and readers of this folder, which use none of the library's
/// code but the metadata.
namespace sorntest {

struct Record;
struct Tree;
struct TreeEntry;

/// A body that defers its form; `rep` is the number of LazyDict::Rep.
struct Body {
    enum Rep { ofDict, ofJson, ofBinary, ofObject, ofDictionary, ofStream };

    Rep rep = ofObject;
    int version = 0;
    std::shared_ptr<const Record> record;  ///< of ofObject, and what the bytes of ofBinary decode to
    std::shared_ptr<const Tree> tree;      ///< of ofDict and ofDictionary
    std::string bytes;                     ///< of ofJson, ofBinary and ofStream
};

/// A value of a dictionary, which is one itself at the top.
struct Tree {
    enum Kind { isText, isNull, isArray, isDict, isBody };

    Kind kind = isDict;
    bool quoted = true;
    std::string text;
    std::vector<Tree> items;
    std::vector<TreeEntry> entries;  ///< in the order of addition, names repeated
    std::shared_ptr<const Body> body;
    std::string raw;  ///< of a dictionary that was read: its text

    static Tree Text(const std::string& text, bool quoted = true);
    static Tree Null();
    static Tree Array();
    static Tree Dict();
    static Tree OfBody(const std::shared_ptr<const Body>& body);

    void Add(const std::string& name, const Tree& value);
    /// The first value of a name, or null.
    const Tree* Find(const std::string& name) const;
    /// Names in byte order, each with its values in the order of addition.
    std::map<std::string, std::vector<const Tree*>> Sorted() const;
};

struct TreeEntry {
    std::string name;
    Tree value;
};

/// One value of a field; which members count follows from the field's data type.
struct Value {
    int64_t number = 0;                    ///< numbers, ids, days, milliseconds, amount, channel
    int64_t sub = 0;                       ///< a channel's second number
    double real = 0;                       ///< float
    std::string text;                      ///< strings, string ids, bytes, a currency's code
    bool isNullBytes = false;              ///< bytes that are a null reference
    std::shared_ptr<const Record> record;  ///< sub-objects; null for a null reference
    std::shared_ptr<const Tree> tree;      ///< any-dict
    std::shared_ptr<const Body> body;      ///< lazy
};

/// A slot, and a place among its forms: 0 and up for the older ones, `currentForm` for the one in force.
using FieldKey = std::pair<int, int>;
constexpr int currentForm = 99;

/// A record: its fields with their values. Required fields always have one value; others are there only when
/// they have any.
struct Record {
    const sorn::StructInfo* info = nullptr;
    std::map<FieldKey, std::vector<Value>> fields;

    explicit Record(const sorn::StructInfo& structInfo);

    const sorn::FieldInfo& FieldOf(const FieldKey& key) const { return FieldOf(*info, key); }
    static const sorn::FieldInfo& FieldOf(const sorn::StructInfo& info, const FieldKey& key);
    /// All fields of a struct, older forms before the one in force, slot by slot.
    static std::vector<FieldKey> KeysOf(const sorn::StructInfo& info);
    /// What a member holds that nobody has set.
    static Value DefaultOf(const sorn::FieldInfo& field);
    const std::vector<Value>* Find(const FieldKey& key) const;
};

bool FReference(const sorn::FieldInfo& field);
bool FNullReference(const sorn::FieldInfo& field, const Value& value);

/// Everything that is in it, for comparison and for people.
std::string Show(const Record& record);
std::string Show(const Tree& tree);
std::string Show(const Body& body);

}  // namespace sorntest
