#pragma once

#include "sorn/dict/DictValue.h"
#include "sorn/dict/LazyBody.h"

namespace sorn {

/// A dictionary whose conversion is deferred.
class LazyDictValue final : public DictValue {
 public:
    static const char classTagG;

    LazyDictValue() : DictValue(dictvalue::LAZY_DICT) {}
    explicit LazyDictValue(const ref<LazyDict>& body) : DictValue(dictvalue::LAZY_DICT), bodyM(body) {}

    /// The body; null when the value was made without one.
    const ref<LazyDict>& GetValue() const { return bodyM; }

    /// The body of a value with tag LAZY_DICT: null for a NullValue, which carries that tag too.
    static ref<LazyDict> BodyOf(const DictValue& value);

    /// A body of the text "{}" in the pool.
    static ref<LazyDict> EmptyValue(RoxMempool* pool);

    void* VkCastHelper(const void* classTag) override;
    /// Tag LAZY_DICT required, then the two bodies compare by their contents.
    bool Equals(const ref<DictValue>& other) const override;
    void ToJson(ByteBuffer& out, JsonFormat format) const override;
    void ToJson(kelbaselib::Bytesink& out, JsonFormat format) const override;
    using DictValue::ToJson;

 private:
    ref<LazyDict> bodyM;
};

}  // namespace sorn
