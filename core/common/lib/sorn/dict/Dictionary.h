#pragma once

#include "rox/RoxArray.h"
#include "rox/RoxHashStringToCore.h"
#include "rox/RoxStringArray.h"
#include "sorn/dict/DictValue.h"
#include "sorn/dict/LazyBody.h"

namespace kelbaselib {
class Bytesource;
}
namespace rox {
class ByteBuffer;
}

namespace sorn {

class ArrayValue;
class InputPointer;
class NullValue;
class StringValue;

/// Names to values. A name may have several values: adding to a name that is there appends, up to 65,535
/// values, the runtime's limit for containers; the operations that add give false, and change nothing, beyond
/// it. The order of the names is not defined; those who print sort them. A dictionary must not come to hold
/// itself, at any depth: walks over it would not end, and it would never be destroyed.
class Dictionary final : public DictValue {
 public:
    static const char classTagG;

    Dictionary();
    /// With the pool that it is allocated in at hand.
    explicit Dictionary(RoxMempool* pool);
    ~Dictionary() override;

    /// A new dictionary; a type name that is not empty becomes its "type".
    static ref<Dictionary> New(RoxMempool* pool, const RoxString& typeName);

    bool Add(const RoxString& name, const ref<DictValue>& value);
    bool Add(const RoxString& name, const ref<ArrayValue>& value);
    bool Add(const RoxString& name, const ref<NullValue>& value);
    bool Add(const RoxString& name, const ref<StringValue>& value);
    bool Add(const RoxString& name, const ref<Dictionary>& value);
    /// The same with a new StringValue or LazyDictValue in the dictionary's pool.
    bool Add(const RoxString& name, const RoxString& text);
    bool Add(const RoxString& name, const ref<LazyDict>& body);
    bool AddBytestring(const RoxString& name, const ref<rox::ByteBuffer>& bytes);  ///< their Base64 text

    /// The name's first value, or a null reference.
    ref<DictValue> Get(const RoxString& name) const;
    /// Appends all the name's values, in the order of their addition. False when the array becomes full: it
    /// lacks the last ones then.
    bool GetRange(const RoxString& name, RoxArray<DictValue>& values) const;
    /// The text of the first value when that is a string, else an empty one in the dictionary's pool.
    RoxString GetString(const RoxString& name) const;
    /// Appends the texts of those of the name's values that are strings. False when the array becomes full,
    /// as above.
    bool GetStringRange(const RoxString& name, RoxStringArray& texts) const;
    /// The first value when it is an array or a dictionary, else a null reference.
    ref<ArrayValue> GetArray(const RoxString& name) const;
    ref<Dictionary> GetDictionary(const RoxString& name) const;

    /// The number of values of all names together: more than the number of names when a name has several. The
    /// operation keeps its name although it counts values.
    unsigned CountNames() const { return nValuesM; }
    unsigned CountValues(const RoxString& name) const;
    /// Empties the array, then gives it all names in ascending byte order (strcmp): the lowest 65,535, where
    /// there are more.
    void GetSortedNames(RoxStringArray& names) const;
    /// Removes the name with all its values; an unknown one is ignored.
    void Remove(const RoxString& name);

    void SetDebugLockOwner(RoxLockId) {}

    /// The JSON text as bytes, in the dictionary's pool.
    ref<rox::ByteBuffer> ToBytestring(bool pretty) const;

    /// Reads a whole JSON text in the dialect of this library; null and words on failure. `error` is
    /// replaced.
    static ref<Dictionary> FromJson(const unsigned char* data, unsigned length, RoxString& error,
                                    RoxMempool* pool);
    static ref<Dictionary> FromJson(const RoxString& text, RoxString& error, RoxMempool* pool);
    static ref<Dictionary> FromJsonBytestring(const ref<rox::ByteBuffer>& bytes, RoxString& error,
                                              RoxMempool* pool);
    /// Reads a whole JSON text from a source, which is released whatever comes, by the rules of JsonParser:
    /// real JSON, in UTF-8; a name that comes twice gets two values. On failure `error` is set, in the pool,
    /// and the result may be null or hold what was built until then, which is not to be used; on success
    /// `error` is untouched. So hand in an empty string and look at it first.
    static ref<Dictionary> FromJsonBytesource(kelbaselib::Bytesource* source, RoxString& error,
                                              RoxMempool* pool);
    /// Reads the members of an object into this dictionary, the cursor standing before its '{'. False and
    /// words on failure; what was read until then stays.
    bool FromJson(InputPointer& cursor, RoxString& error);
    /// Reads the value of a key and adds it.
    bool ReadFieldValue(InputPointer& cursor, const RoxString& key, RoxString& error);

    /// The name's first value without taking a reference, or null; it holds until the name is removed or the
    /// dictionary destroyed. The second form makes no string and takes a null for the empty name.
    DictValue* Find(const RoxString& name) const;
    DictValue* Find(const char* name) const;

    void* VkCastHelper(const void* classTag) override;
    /// A dictionary with the same names, each with equal values in the same order.
    bool Equals(const ref<DictValue>& other) const override;
    bool Equals(const ref<Dictionary>& other) const;
    void ToJson(ByteBuffer& out, JsonFormat format) const override;
    void ToJson(kelbaselib::Bytesink& out, JsonFormat format) const override;
    RoxString ToJson(bool pretty) const override;

 private:
    friend class DictionaryEntries;
    friend class DictionaryFiller;

    // A name's only value itself, or, from the second value on, an ArrayCore of them.
    RoxHashStringToCore<RoxCore> tableM;
    unsigned nValuesM = 0;
};

}  // namespace sorn
