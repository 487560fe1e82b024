#include "sorn/dict/ArrayValue.h"

#include "sorn/dict/Dictionary.h"
#include "sorn/dict/LazyDictValue.h"
#include "sorn/dict/NullValue.h"
#include "sorn/dict/StringValue.h"
#include "sorn/dict/ValueComparison.h"

namespace sorn {

const char ArrayValue::classTagG = 0;

ArrayValue::ArrayValue() : DictValue(dictvalue::ARRAY), elementsM(GetMempool(), roxMempoolUserSorn) {}

ArrayValue::ArrayValue(RoxMempool* pool)
    : DictValue(pool, dictvalue::ARRAY), elementsM(pool, roxMempoolUserSorn) {}

ArrayValue::~ArrayValue() = default;

bool ArrayValue::Add(const ref<DictValue>& value) {
    return elementsM.Add(value.get());
}

bool ArrayValue::Add(const ref<ArrayValue>& value) {
    return elementsM.Add(value.get());
}

bool ArrayValue::Add(const ref<NullValue>& value) {
    return elementsM.Add(value.get());
}

bool ArrayValue::Add(const ref<StringValue>& value) {
    return elementsM.Add(value.get());
}

bool ArrayValue::Add(const ref<Dictionary>& value) {
    return elementsM.Add(value.get());
}

bool ArrayValue::Add(const RoxString& text) {
    return Add(ref<StringValue>(new (GetMempool()) StringValue(GetMempool(), text, true)));
}

bool ArrayValue::Add(const ref<LazyDict>& body) {
    return Add(ref<DictValue>(new (GetMempool()) LazyDictValue(body)));
}

bool ArrayValue::AddBytestring(const ref<rox::ByteBuffer>& bytes) {
    return Add(StringValue::Make(bytes, GetMempool()));
}

ref<DictValue> ArrayValue::GetValueAt(unsigned i) const {
    return i < elementsM.GetCount() ? At(i) : nullptr;
}

bool ArrayValue::Remove(unsigned i) {
    if (i >= elementsM.GetCount()) return false;
    elementsM.Remove(elementsM.At(i));  // the first with this pointer, which need not be element i
    return true;
}

void* ArrayValue::VkCastHelper(const void* classTag) {
    return classTag == &classTagG ? this : DictValue::VkCastHelper(classTag);
}

bool ArrayValue::Equals(const ref<DictValue>& other) const {
    return FEqualValues(this, other.get());
}

}  // namespace sorn
