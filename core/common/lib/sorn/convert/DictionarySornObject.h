#pragma once

#include <cstdint>

#include "rox/RoxString.h"
#include "rox/ref.h"
#include "sorn/convert/StructTable.h"
#include "sorn/dict/DictValue.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/model/SornObject.h"
#include "sorn/model/StructInfo.h"

namespace sorn {

/// Converts between dictionaries and typed objects: the strict converter, which honours schema versions and
/// required fields. A small context that callers build on the spot; it owns nothing and keeps no state
/// between calls. New objects, strings and dictionaries are made in the pool. Dictionaries are shared into
/// any-dict fields and back, not copied. The table of structs gives objects their fields and ids their
/// prefixes; where a dictionary names a struct, the name is looked up in the schema itself.
///
/// Words of failures are put into a caller's string, from the inside out. Some are appended to what the
/// string holds and some replace it; docs/errors.md lists which. The string is not cleared at the start, so
/// callers hand in an empty one.
class DictionarySornObject {
 public:
    DictionarySornObject(RoxMempool* pool, const StructInfo* const* vStructDef, uint32_t nStructDef)
        : pMempoolM(pool), tableM{vStructDef, nStructDef} {}

    /// Makes an object of the struct that the dictionary's "type" names. Entries that name no field, or a
    /// field outside the version, are ignored. The first bad field, in slot order, ends the conversion:
    /// false, words in `error`, `out` untouched.
    bool DictionaryToSornObject(const ref<Dictionary>& dictionary, OrvoVersion version, ref<SornObject>& out,
                                RoxString& error);
    /// Stores one value in a field that is not repeated. The presence byte of an optional field is left as it
    /// is: the caller sets it.
    bool DictToSingleField(const FieldInfo* field, const ref<DictValue>& value, SornObject* object,
                           RoxString& error, OrvoVersion version);
    /// Appends one value to a repeated field.
    bool DictToMultiField(const FieldInfo* field, const ref<DictValue>& value, SornObject* object,
                          RoxString& error, OrvoVersion version);

    /// The object as a dictionary. Cannot fail: what cannot be expressed becomes text ("XXX",
    /// "INVALID_VALUE:%u") or is left out (null references).
    ref<Dictionary> SornObjectToDictionary(const SornObject* object, OrvoVersion version);
    /// Adds one field that is not repeated. The name may have values already: this is one more. A full name,
    /// of 65,535 values, is left as it is.
    void SingleFieldToDict(const RoxString& name, const FieldInfo* field, const SornObject* object,
                           ref<Dictionary>& out, OrvoVersion version);
    /// Adds one repeated field, as one array; an empty container adds nothing. Lazy elements go to the
    /// dictionary one by one, as values of the same name, and not into an array; the way back takes only the
    /// first of them. A name that is full, or gets full, takes no more.
    void MultiFieldToDict(const RoxString& name, const FieldInfo* field, const SornObject* object,
                          ref<Dictionary>& out, OrvoVersion version);

    /// Text with the idPrefix of the field's struct to the bare id, in the pool. Bad digits, of which a NUL
    /// inside is one, give 0 and succeed all the same. False and words, and `out` untouched, when the struct
    /// is not in the table or the text has another prefix.
    bool StringToIntId(RoxMempool* pool, const FieldInfo* field, const RoxString& text, RoxString& error,
                       unsigned& out);
    bool StringToLongId(RoxMempool* pool, const FieldInfo* field, const RoxString& text, RoxString& error,
                        unsigned long long& out);
    bool StringToStringId(RoxMempool* pool, const FieldInfo* field, const RoxString& text, RoxString& error,
                          RoxString& out);

 private:
    RoxMempool* pMempoolM;
    StructTable tableM;
};

}  // namespace sorn
