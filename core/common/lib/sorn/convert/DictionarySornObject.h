#pragma once

#include <cstdint>

#include "rox/RoxString.h"
#include "rox/ref.h"
#include "sorn/dict/DictValue.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/model/SornObject.h"
#include "sorn/model/StructInfo.h"

namespace sorn {

/// Converts between dictionaries and typed objects: the strict converter, which honours schema versions and
/// required fields. A small context that callers build on the spot; it owns nothing and keeps no state
/// between calls. New objects, strings and dictionaries are made in the pool. Dictionaries are shared into
/// any-dict fields and back, not copied.
///
/// Words of failures are put into a caller's string, from the inside out. Some are appended to what the
/// string holds and some replace it; docs/errors.md lists which. The string is not cleared at the start, so
/// callers hand in an empty one.
class DictionarySornObject {
 public:
    DictionarySornObject(RoxMempool* pool, const StructInfo* const* vStructDef, uint32_t nStructDef)
        : pMempoolM(pool), vStructDefM(vStructDef), nStructDefM(nStructDef) {}

    /// Makes an object of the struct that the dictionary's "type" names. Entries that name no field, or a
    /// field outside the version, are ignored. The first bad field, in slot order, ends the conversion:
    /// false, words in `error`, `out` untouched.
    bool DictionaryToSornObject(const ref<Dictionary>& dictionary, OrvoVersion version, ref<SornObject>& out,
                                RoxString& error);
    /// Stores one value in a field that is not repeated.
    bool DictToSingleField(const FieldInfo* field, const ref<DictValue>& value, SornObject* object,
                           RoxString& error, OrvoVersion version);
    /// Appends one value to a repeated field.
    bool DictToMultiField(const FieldInfo* field, const ref<DictValue>& value, SornObject* object,
                          RoxString& error, OrvoVersion version);

    /// The object as a dictionary. Cannot fail: what cannot be expressed becomes text ("XXX",
    /// "INVALID_VALUE:%u") or is left out (null references).
    ref<Dictionary> SornObjectToDictionary(const SornObject* object, OrvoVersion version);
    /// Adds one field that is not repeated.
    void SingleFieldToDict(const RoxString& name, const FieldInfo* field, const SornObject* object,
                           ref<Dictionary>& out, OrvoVersion version);
    /// Adds one repeated field, as one array; an empty container adds nothing. Lazy elements go to the
    /// dictionary one by one, as values of the same name, and not into an array: both readers and writers
    /// count on it.
    void MultiFieldToDict(const RoxString& name, const FieldInfo* field, const SornObject* object,
                          ref<Dictionary>& out, OrvoVersion version);

    /// Text with the idPrefix of the field's struct to the bare id. Bad digits give 0 and succeed all the
    /// same.
    static bool StringToIntId(RoxMempool* pool, const FieldInfo* field, const RoxString& text,
                              RoxString& error, unsigned& out);
    static bool StringToLongId(RoxMempool* pool, const FieldInfo* field, const RoxString& text,
                               RoxString& error, unsigned long long& out);
    static bool StringToStringId(RoxMempool* pool, const FieldInfo* field, const RoxString& text,
                                 RoxString& error, RoxString& out);

 private:
    RoxMempool* pMempoolM;
    const StructInfo* const* vStructDefM;
    uint32_t nStructDefM;
};

}  // namespace sorn
