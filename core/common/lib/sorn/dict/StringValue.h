#pragma once

#include <utility>

#include "sorn/dict/DictValue.h"

namespace rox {
class ByteBuffer;
}

namespace sorn {

/// A scalar: its text, and whether the JSON writer always puts it in quotes. Numbers, dates and bools are
/// texts too; they get their meaning from whoever reads them.
class StringValue final : public DictValue {
 public:
    static const char classTagG;

    StringValue() : DictValue(dictvalue::STRING) {}
    explicit StringValue(const RoxString& text) : DictValue(dictvalue::STRING), valueM(text) {}
    /// With the pool that it is allocated in at hand.
    StringValue(RoxMempool* pool, RoxString text, bool needQuotes)
        : DictValue(pool, dictvalue::STRING), needQuotesM(needQuotes), valueM(std::move(text)) {}

    void SetNeedQuotes(bool needQuotes) { needQuotesM = needQuotes; }
    bool FNeedQuotes() const { return needQuotesM; }
    const RoxString& GetValue() const { return valueM; }

    /// Conversions of the text. False when it does not fit, and then the target is left alone. Numbers are
    /// scanned as sscanf does: leading white space is passed, and text behind the number is ignored on
    /// purpose (12abc reads as 12). The strict readers are those of Dict.
    bool GetValue(bool& out) const;                  ///< exactly "true" or "false"
    bool GetValue(ref<rox::ByteBuffer>& out) const;  ///< Base64; always true, empty for bad text
    bool GetValue(double& out) const;
    bool GetValue(long long& out) const;
    bool GetValue(unsigned long long& out) const;
    bool GetValue(int& out) const;       ///< as long long, and in range
    bool GetValue(unsigned& out) const;  ///< as unsigned long long, and in range

    /// An empty text in the pool.
    static RoxString EmptyValue(RoxMempool* pool);

    /// Values in the pool. Texts, bytes (as Base64) and 64-bit numbers are printed with quotes, 32-bit
    /// numbers, floats and bools without, as far as their text allows.
    static ref<StringValue> Make(const char* text, RoxMempool* pool);
    static ref<StringValue> Make(const ref<rox::ByteBuffer>& bytes, RoxMempool* pool);
    static ref<StringValue> Make(bool value, RoxMempool* pool);
    static ref<StringValue> Make(double value, RoxMempool* pool);
    static ref<StringValue> Make(int value, RoxMempool* pool);
    static ref<StringValue> Make(unsigned value, RoxMempool* pool);
    static ref<StringValue> Make(long long value, RoxMempool* pool);
    static ref<StringValue> Make(unsigned long long value, RoxMempool* pool);

    void* VkCastHelper(const void* classTag) override;
    /// Same text; the quotes do not count.
    bool Equals(const ref<DictValue>& other) const override;
    void ToJson(ByteBuffer& out, JsonFormat format) const override;
    void ToJson(kelbaselib::Bytesink& out, JsonFormat format) const override;
    using DictValue::ToJson;

 private:
    bool needQuotesM = true;
    RoxString valueM;
};

}  // namespace sorn
