#pragma once

#include "rox/RoxCore.h"
#include "rox/RoxLockId.h"
#include "rox/RoxString.h"
#include "rox/RoxStringArray.h"
#include "rox/ref.h"
#include "sorn/dict/DictValue.h"
#include "sorn/dict/LazyBody.h"

namespace rox {
class ByteBuffer;
}

namespace sorn {

class Dictionary;

/// The handle that applications and codecs use for dynamic records. It wraps a Dictionary, which may be
/// shared, and gives it one value per name: a second value under a name turns that name's value into an
/// array. A null reference that a program put under a name through the Dictionary counts as no value. It also
/// owns the text forms of all scalars. Absence gives empty forms, never null and never an error; a null
/// `const char*` is the empty text. One thread at a time.
class Dict : public RoxCore {
 public:
    static const char classTagG;

    /// Wraps a new dictionary in the object's pool.
    Dict();
    /// Wraps a dictionary, shared with whoever handed it over and never null.
    explicit Dict(const ref<Dictionary>& dictionary);
    ~Dict() override;

    /// A new Dict in the pool; a type name that is not empty becomes its "type".
    static ref<Dict> New(RoxMempool* pool, const RoxString& typeName);
    /// Adds the type name under "type", and nothing else: a type that is there becomes an array.
    void InsertTypeZero(const RoxString& typeName);
    const ref<Dictionary>& GetDictionary() const { return dictionaryM; }

    // Reading. The index is the position among a name's values; a single value is at index 0.

    unsigned CountNames() const;
    unsigned CountValues(const RoxString& name) const;
    unsigned CountValues(const char* name) const;
    void GetSortedNames(RoxStringArray& names) const;
    /// The value, or a null reference.
    ref<DictValue> FindValue(const RoxString& name, unsigned index) const;
    ref<DictValue> FindValue(const char* name, unsigned index) const;
    /// The text of a string value, else an empty string in the pool.
    RoxString GetString(const RoxString& name, unsigned index) const;
    RoxString GetString(const char* name, unsigned index) const;
    /// A new Dict around a dictionary value, the Dict of a lazy value, else a new empty Dict.
    ref<Dict> GetDict(const RoxString& name, unsigned index) const;
    ref<Dict> GetDict(const char* name, unsigned index) const;
    /// The body of a lazy value, one made of a dictionary value, else one of the text "{}" and a line on
    /// standard error. Null for a null value.
    ref<LazyDict> GetLazyDict(const RoxString& name, unsigned index) const;
    ref<LazyDict> GetLazyDict(const char* name, unsigned index) const;
    /// 0 for a string, 1 for a dictionary or a lazy value (isLazy tells which), 2 for anything else and for
    /// absence.
    int GetType(const RoxString& name, unsigned index, bool& isLazy) const;
    int GetType(const char* name, unsigned index, bool& isLazy) const;
    int GetType(const RoxString& name, unsigned index) const;
    int GetType(const char* name, unsigned index) const;
    /// JSON text.
    RoxString ToString(bool pretty) const;
    ref<rox::ByteBuffer> ToBytestring(bool pretty) const;

    // Changing. False, and no change, when the name's array is full (65,535 values) or the reference is null.
    // Names and values may be parts of what the operation removes.

    bool AddString(const RoxString& name, const RoxString& text);
    bool AddString(const char* name, const char* text);
    bool AddDict(const RoxString& name, const ref<Dict>& value);  ///< its dictionary is shared
    bool AddDict(const char* name, const ref<Dict>& value);
    bool AddLazyDict(const RoxString& name, const ref<LazyDict>& value);
    bool AddLazyDict(const char* name, const ref<LazyDict>& value);
    void Remove(const RoxString& name);
    void Remove(const char* name);
    /// Removes one value of an array, and the name with its last one; a name whose value is no array goes
    /// whatever the index is.
    void Remove(const RoxString& name, unsigned index);
    void Remove(const char* name, unsigned index);
    void SetDebugLockOwner(RoxLockId id);

    // Comparison: three kinds, each with its users.

    /// Dictionary::Equals of the two dictionaries.
    bool Equals(const Dict* other) const;
    /// By structure: the other has as many values as this one has names, and under each name what GetType and
    /// the getters give agrees. Arrays in arrays (type 2) are equal to nothing, themselves included; two lazy
    /// values are equal when their bodies are the same object, and two null values, which count as lazy, when
    /// neither has one.
    bool Equals(const ref<Dict>& other) const;
    /// By compact JSON text.
    bool operator==(const Dict& other) const;
    bool operator!=(const Dict& other) const { return !(*this == other); }

    // Text forms of scalars. Strings are made in the pool. Parsers give 0 (or false, or an empty buffer) for
    // bad text.

    static RoxString FormatBool(RoxMempool* pool, bool value);
    static bool ParseBool(RoxMempool* pool, const RoxString& text);  ///< true for exactly "true"
    static RoxString FormatS32(RoxMempool* pool, int value);
    static RoxString FormatS64(RoxMempool* pool, long long value);
    static RoxString FormatU32(RoxMempool* pool, unsigned value);
    static RoxString FormatU64(RoxMempool* pool, unsigned long long value);
    /// "%1.8g", with ".0" appended when the text has no point: 5.0, and also 1e+20.0, which is the required
    /// form.
    static RoxString FormatFloat(RoxMempool* pool, double value);
    static double ParseFloat(RoxMempool* pool, const RoxString& text);  ///< sscanf with "%lg"
    /// Base64, as EncodeBase64 and with its limit; the empty text for a null buffer.
    static RoxString FormatBytestring(RoxMempool* pool, const ref<rox::ByteBuffer>& bytes);
    static ref<rox::ByteBuffer> ParseBytestring(RoxMempool* pool, const RoxString& text);  ///< never null
    /// Top 16 bits a namespace code, low 48 bits a number: the bare number for code 0, else the namespace's
    /// name, a point and the number; "xxx" stands for a code without a name.
    static RoxString FormatLongId(RoxMempool* pool, unsigned long long value);
    /// Splits at the last point; 0 for an unknown namespace.
    static unsigned long long ParseLongId(RoxMempool* pool, const char* text);
    static int ParseS32(RoxMempool* pool, const RoxString& text);  ///< as ParseS64, 0 when out of range
    /// A decimal number with a minus sign or a digit first, the whole text; the nearest one when out of
    /// range.
    static long long ParseS64(RoxMempool* pool, const RoxString& text);
    static unsigned ParseU32(RoxMempool* pool, const char* text);  ///< as ParseU64, 0 when out of range
    /// Digits only, at least one, else 0. Wraps modulo 2^64 without notice.
    static unsigned long long ParseU64(RoxMempool* pool, const char* text);

    void* VkCastHelper(const void* classTag) override;

 private:
    ref<Dictionary> dictionaryM;
};

/// A new empty Dict in the pool.
ref<Dict> MakeDict(RoxMempool* pool);

}  // namespace sorn
