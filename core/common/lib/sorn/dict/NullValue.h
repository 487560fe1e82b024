#pragma once

#include "sorn/dict/DictValue.h"

namespace sorn {

/// The JSON null. It carries the tag of a lazy dictionary while its Equals looks for tag NONE, so that it
/// never equals anything, itself included, and code that tests the tag alone takes it for a lazy dictionary
/// with a null body. Both facts are relied upon.
class NullValue final : public DictValue {
 public:
    static const char classTagG;

    NullValue() : DictValue(dictvalue::LAZY_DICT) {}
    /// With the pool that it is allocated in at hand.
    explicit NullValue(RoxMempool* pool) : DictValue(pool, dictvalue::LAZY_DICT) {}

    void* VkCastHelper(const void* classTag) override;
    bool Equals(const ref<DictValue>& other) const override;
    void ToJson(ByteBuffer& out, JsonFormat format) const override;
    void ToJson(kelbaselib::Bytesink& out, JsonFormat format) const override;
    using DictValue::ToJson;
};

}  // namespace sorn
