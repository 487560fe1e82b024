#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "sorn/convert/FieldAccess.h"
#include "sorn/model/SornObject.h"
#include "sorn/model/StructInfo.h"

namespace sorn::service {

/// What a record must have to be found: for each of some fields one of some values. Made of a query object
/// and compared with records; keeps values, no objects. What it takes is in proportion to the values given.
///
/// Fields are compared that query and record share by name, data type and, for enumerations, ids and objects,
/// by what they refer to. Values are compared as such: ids, enumerations, numbers, moments, bools, texts byte
/// by byte, bytes. An object agrees with one that has all the plain values that are set in it; objects inside
/// it, any dicts and lazy bodies do not count.
class Conditions {
 public:
    /// Which fields of the query object are looked at.
    class Fields {
     public:
        virtual ~Fields() = default;
        virtual bool FWanted(const char* name) const = 0;
    };

    /// Adds those of the fields that the query object has and the record's struct shares. An empty list
    /// counts as not given. The version is the query object's.
    void Add(const SornObject& query, OrvoVersion version, const StructInfo& record, const Fields& fields);

    bool FEmpty() const { return vConditionsM.empty(); }
    /// Whether a record of that struct, made at the version, meets all of them.
    bool FMatches(const SornObject& record, OrvoVersion version) const;
    /// Objects among the values, each of which is compared with each object of a record's field.
    size_t CountObjects() const;
    /// Appends bytes that are equal for equal conditions only.
    void AppendIdentity(std::string& out) const;

 private:
    /// The plain values that an object must have.
    struct Value {
        uint64_t number = 0;          // of a type without text; the struct's id of an object
        std::string text;             // of texts and bytes
        std::vector<Conditions> vOf;  // none or one: of an object
    };
    struct Condition {
        int32_t slot;  // of the record
        DataType type;
        uint16_t typeRef;
        std::vector<Value> vValues;  // one of them; ascending, but for objects
    };

    void AddFields(const SornObject& query, OrvoVersion version, const StructInfo& record,
                   const Fields& fields, bool isWhole);
    void AddOne(const FieldInfo& given, const SornObject& query, OrvoVersion version, int32_t slot,
                bool isWhole);
    static bool ReadValue(DataType type, const FieldSource& source, unsigned i, OrvoVersion version,
                          bool isWhole, Value& value);
    static void Sort(std::vector<Value>& vValues);
    static bool FHas(const std::vector<Value>& vValues, uint64_t number, std::string_view text);
    static bool FHasObject(const std::vector<Value>& vValues, const SornObject* object, OrvoVersion version);
    static bool FMeets(const Condition& condition, const FieldInfo& field, const SornObject& record,
                       OrvoVersion version);

    std::vector<Condition> vConditionsM;
};

}  // namespace sorn::service
