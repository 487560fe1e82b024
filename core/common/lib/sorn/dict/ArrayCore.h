#pragma once

#include "rox/RoxGenericArray.h"
#include "sorn/dict/DictValue.h"

namespace sorn {

/// What a Dictionary keeps under a name with several values: the values in the order of their addition. It
/// never leaves the dictionary; it is a DictValue only so that its tag tells it from a value.
class ArrayCore final : public DictValue {
 public:
    explicit ArrayCore(RoxMempool* pool)
        : DictValue(pool, dictvalue::NONE), valuesM(pool, roxMempoolUserSorn) {}

    /// The holder that a table has as its value; null for a value itself.
    static ArrayCore* From(DictValue* value) {
        return value != nullptr && value->GetTag() == dictvalue::NONE ? static_cast<ArrayCore*>(value)
                                                                      : nullptr;
    }

    bool Add(DictValue* value) { return valuesM.Add(value); }
    unsigned CountValues() const { return valuesM.GetCount(); }
    DictValue* At(unsigned i) const { return static_cast<DictValue*>(valuesM.At(i)); }
    const RoxGenericArray& GetValues() const { return valuesM; }

    bool Equals(const ref<DictValue>&) const override { return false; }
    /// Nothing: writers walk the values. Defined with the other writers.
    void ToJson(ByteBuffer&, JsonFormat) const override;
    void ToJson(kelbaselib::Bytesink&, JsonFormat) const override;
    using DictValue::ToJson;

 private:
    RoxGenericArray valuesM;
};

}  // namespace sorn
