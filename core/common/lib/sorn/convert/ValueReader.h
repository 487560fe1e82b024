#pragma once

#include "sorn/convert/ErrorWords.h"
#include "sorn/convert/FieldAccess.h"
#include "sorn/convert/StructTable.h"
#include "sorn/dict/DictValue.h"
#include "sorn/model/FieldInfo.h"
#include "sorn/model/OrvoVersion.h"

namespace sorn {

/// Reads a dynamic value as the data type of a field says and stores it there: the one table of data types on
/// the way from dictionaries to objects. Fields that hold objects are not its business.
class ValueReader {
 public:
    ValueReader(RoxMempool* pool, StructTable table, OrvoVersion version, ErrorWords& words)
        : pMempoolM(pool), tableM(table), versionM(version), wordsM(words) {}

    /// False and words when the value does not fit, or when a repeated field is full. A null value fits
    /// nothing.
    bool Read(const FieldInfo& field, DictValue* value, const FieldTarget& target);

    /// Words of a repeated field that has 65,535 values, the most that its container takes.
    static constexpr const char* tooManyG = "Too many elements in field";

 private:
    /// Fields that are texts in a dictionary.
    bool ReadText(const FieldInfo& field, DictValue* value, const FieldTarget& target);
    template <class Scan, class Member>
    bool ReadScanned(DictValue* value, const FieldTarget& target);
    template <class Scalar>
    bool ReadScalar(DictValue* value, const FieldTarget& target);
    bool ReadBytes(DictValue* value, const FieldTarget& target);
    bool ReadString(DictValue* value, const FieldTarget& target);
    bool ReadEnum(const FieldInfo& field, DictValue* value, const FieldTarget& target);
    bool ReadId(const FieldInfo& field, DictValue* value, const FieldTarget& target);
    bool ReadAnyDict(DictValue* value, const FieldTarget& target);
    bool ReadLazy(DictValue* value, const FieldTarget& target);

    bool StoreId(const FieldInfo& field, const RoxString& text, const char* bare, const FieldTarget& target);
    bool Stored(bool isStored);
    bool NotAccepted(const char* text);

    RoxMempool* pMempoolM;
    StructTable tableM;
    OrvoVersion versionM;
    ErrorWords& wordsM;
};

}  // namespace sorn
