#include "sorn/dict/StringValue.h"

#include <limits>

#include "sorn/dict/Base64.h"
#include "sorn/dict/Dict.h"
#include "sorn/dict/ScalarFormat.h"

namespace sorn {

const char StringValue::classTagG = 0;

namespace {

ref<StringValue> New(RoxMempool* pool, RoxString text, bool needQuotes) {
    return new (pool) StringValue(pool, std::move(text), needQuotes);
}

}  // namespace

bool StringValue::GetValue(bool& out) const {
    if (valueM.FEqual("true")) {
        out = true;
        return true;
    }
    if (valueM.FEqual("false")) {
        out = false;
        return true;
    }
    return false;
}

bool StringValue::GetValue(ref<rox::ByteBuffer>& out) const {
    out = DecodeBase64(GetMempool(), valueM);
    return true;
}

bool StringValue::GetValue(double& out) const {
    return scalarformat::ScanFloat(valueM.Utf8(), out);
}

bool StringValue::GetValue(long long& out) const {
    return scalarformat::ScanS64(valueM.Utf8(), out);
}

bool StringValue::GetValue(unsigned long long& out) const {
    return scalarformat::ScanU64(valueM.Utf8(), out);
}

bool StringValue::GetValue(int& out) const {
    long long value = 0;
    if (!GetValue(value)) return false;
    if (value < std::numeric_limits<int>::min() || value > std::numeric_limits<int>::max()) return false;
    out = static_cast<int>(value);
    return true;
}

bool StringValue::GetValue(unsigned& out) const {
    unsigned long long value = 0;
    if (!GetValue(value) || value > std::numeric_limits<unsigned>::max()) return false;
    out = static_cast<unsigned>(value);
    return true;
}

RoxString StringValue::EmptyValue(RoxMempool* pool) {
    return RoxString(pool, "");
}

ref<StringValue> StringValue::Make(const char* text, RoxMempool* pool) {
    return New(pool, RoxString(pool, text), true);
}

ref<StringValue> StringValue::Make(const ref<rox::ByteBuffer>& bytes, RoxMempool* pool) {
    return New(pool, EncodeBase64(pool, bytes), true);
}

ref<StringValue> StringValue::Make(bool value, RoxMempool* pool) {
    return New(pool, Dict::FormatBool(pool, value), false);
}

ref<StringValue> StringValue::Make(double value, RoxMempool* pool) {
    return New(pool, Dict::FormatFloat(pool, value), false);
}

ref<StringValue> StringValue::Make(int value, RoxMempool* pool) {
    return New(pool, Dict::FormatS32(pool, value), false);
}

ref<StringValue> StringValue::Make(unsigned value, RoxMempool* pool) {
    return New(pool, Dict::FormatU32(pool, value), false);
}

// 64-bit numbers keep their quotes in JSON, on purpose.
ref<StringValue> StringValue::Make(long long value, RoxMempool* pool) {
    return New(pool, Dict::FormatS64(pool, value), true);
}

ref<StringValue> StringValue::Make(unsigned long long value, RoxMempool* pool) {
    return New(pool, Dict::FormatU64(pool, value), true);
}

void* StringValue::VkCastHelper(const void* classTag) {
    return classTag == &classTagG ? this : DictValue::VkCastHelper(classTag);
}

bool StringValue::Equals(const ref<DictValue>& other) const {
    return other != nullptr && other->GetTag() == dictvalue::STRING &&
           valueM.FEqual(static_cast<const StringValue*>(other.get())->valueM);
}

}  // namespace sorn
