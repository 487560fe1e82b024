#pragma once

#include "rox/RoxGenericArray.h"
#include "sorn/dict/DictValue.h"
#include "sorn/dict/LazyBody.h"

namespace rox {
class ByteBuffer;
}

namespace sorn {

class Dictionary;
class InputPointer;
class NullValue;
class StringValue;

/// A list of values, in order; at most 65,535 of them, the runtime's limit for containers. The operations
/// that add give false, and change nothing, when the list is full. A list must not come to hold itself, at
/// any depth: walks over it would not end, and it would never be destroyed.
class ArrayValue final : public DictValue {
 public:
    static const char classTagG;

    ArrayValue();
    /// With the pool that it is allocated in at hand.
    explicit ArrayValue(RoxMempool* pool);
    ~ArrayValue() override;

    bool Add(const ref<DictValue>& value);
    bool Add(const ref<ArrayValue>& value);
    bool Add(const ref<NullValue>& value);
    bool Add(const ref<StringValue>& value);
    bool Add(const ref<Dictionary>& value);
    bool Add(const RoxString& text);                        ///< a new StringValue in the array's pool
    bool Add(const ref<LazyDict>& body);                    ///< a new LazyDictValue in the array's pool
    bool AddBytestring(const ref<rox::ByteBuffer>& bytes);  ///< their Base64 text

    /// Adds a value that has just been made and has no holder yet. When the array is full the value stays the
    /// caller's.
    bool AddNew(DictValue* value) { return elementsM.Add(value); }

    /// Element i, or a null reference when i is not below the count.
    ref<DictValue> GetValueAt(unsigned i) const;
    unsigned CountValues() const { return elementsM.GetCount(); }
    /// Removes the first element that is the same value as element i, even when i is a later position of it.
    /// False when i is out of range.
    bool Remove(unsigned i);

    /// Element i without taking a reference; i must be below the count.
    DictValue* At(unsigned i) const { return static_cast<DictValue*>(elementsM.At(i)); }
    /// The elements, each a DictValue or null, for those who walk them without taking references.
    const RoxGenericArray& GetElements() const { return elementsM; }

    /// Reads the elements of an array, the cursor standing before its '['. False and words on failure; what
    /// was read until then stays.
    bool FromJson(InputPointer& cursor, RoxString& error);
    /// Reads one element and adds it.
    bool ReadFieldValue(InputPointer& cursor, RoxString& error);

    void* VkCastHelper(const void* classTag) override;
    /// An array of the same count whose elements are equal, in order.
    bool Equals(const ref<DictValue>& other) const override;
    void ToJson(ByteBuffer& out, JsonFormat format) const override;
    void ToJson(kelbaselib::Bytesink& out, JsonFormat format) const override;
    using DictValue::ToJson;

 private:
    RoxGenericArray elementsM;
};

}  // namespace sorn
