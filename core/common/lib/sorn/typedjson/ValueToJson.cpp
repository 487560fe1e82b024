// The ToJson operations of the value classes.
#include "kelbaselib/Bytesink.h"
#include "sorn/dict/ArrayValue.h"
#include "sorn/dict/ByteBuffer.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/dict/LazyDictValue.h"
#include "sorn/dict/NullValue.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/dict/StringValue.h"
#include "sorn/typedjson/JsonTreeWriter.h"

namespace sorn {

namespace {

void WriteValue(const DictValue& value, ByteBuffer& out, JsonFormat format) {
    JsonBufferOutput output(out);
    JsonTreeWriter(value.GetMempool(), output, format).Write(value);
}

void WriteValue(const DictValue& value, kelbaselib::Bytesink& out, JsonFormat format) {
    JsonSinkOutput output(out);
    JsonTreeWriter(value.GetMempool(), output, format).Write(value);
}

}  // namespace

void NullValue::ToJson(ByteBuffer& out, JsonFormat format) const {
    WriteValue(*this, out, format);
}
void NullValue::ToJson(kelbaselib::Bytesink& out, JsonFormat format) const {
    WriteValue(*this, out, format);
}

void StringValue::ToJson(ByteBuffer& out, JsonFormat format) const {
    WriteValue(*this, out, format);
}
void StringValue::ToJson(kelbaselib::Bytesink& out, JsonFormat format) const {
    WriteValue(*this, out, format);
}

void ArrayValue::ToJson(ByteBuffer& out, JsonFormat format) const {
    WriteValue(*this, out, format);
}
void ArrayValue::ToJson(kelbaselib::Bytesink& out, JsonFormat format) const {
    WriteValue(*this, out, format);
}

void Dictionary::ToJson(ByteBuffer& out, JsonFormat format) const {
    WriteValue(*this, out, format);
}
void Dictionary::ToJson(kelbaselib::Bytesink& out, JsonFormat format) const {
    WriteValue(*this, out, format);
}

void LazyDictValue::ToJson(ByteBuffer& out, JsonFormat format) const {
    WriteValue(*this, out, format);
}
void LazyDictValue::ToJson(kelbaselib::Bytesink& out, JsonFormat format) const {
    WriteValue(*this, out, format);
}

RoxString DictValue::ToJson(bool pretty) const {
    JsonTextOutput output(GetMempool());
    JsonTreeWriter(GetMempool(), output, JsonFormat(pretty)).Write(*this);
    return output.Take();
}

RoxString Dictionary::ToJson(bool pretty) const {
    return DictValue::ToJson(pretty);
}

ref<rox::ByteBuffer> Dictionary::ToBytestring(bool pretty) const {
    ByteBuffer text(GetMempool());
    ToJson(text, JsonFormat(pretty));
    return rox::ByteBuffer::New(GetMempool(), text.GetData(), text.GetLength());
}

}  // namespace sorn
