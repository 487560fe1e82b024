// The writing half of JsonSornObject.
#include <cstring>

#include "sorn/dict/ByteBuffer.h"
#include "sorn/typedjson/JsonSornObject.h"
#include "sorn/typedjson/JsonTreeWriter.h"

namespace sorn {

RoxString JsonSornObject::SornObjectToJson(const SornObject* object, OrvoVersion version) {
    JsonTextOutput output(pMempoolM);
    JsonTreeWriter(pMempoolM, output, JsonFormat(false), {vStructDefM, nStructDefM}).Write(*object, version);
    return output.Take();
}

void JsonSornObject::SornObjectToJson(const SornObject* object, OrvoVersion version, ByteBuffer& out) {
    JsonBufferOutput output(out);
    JsonTreeWriter(pMempoolM, output, JsonFormat(false), {vStructDefM, nStructDefM}).Write(*object, version);
}

void JsonSornObject::WriteFieldName(const char* name, ByteBuffer& out, bool& first) {
    JsonBufferOutput output(out);
    ObjectWriter::WriteName(name, std::strlen(name), first, output);
}

void JsonSornObject::SingleFieldToJson(const char* name, const FieldInfo* field, const SornObject* object,
                                       ByteBuffer& out, bool& first, OrvoVersion version) {
    JsonBufferOutput output(out);
    JsonTreeWriter(pMempoolM, output, JsonFormat(false), {vStructDefM, nStructDefM})
        .WriteField(name, *field, false, *object, version, first);
}

void JsonSornObject::MultiFieldToJson(const char* name, const FieldInfo* field, const SornObject* object,
                                      ByteBuffer& out, bool& first, OrvoVersion version) {
    JsonBufferOutput output(out);
    JsonTreeWriter(pMempoolM, output, JsonFormat(false), {vStructDefM, nStructDefM})
        .WriteField(name, *field, true, *object, version, first);
}

void JsonSornObject::LazyToJson(const LazyDict* body, ByteBuffer& out) {
    if (body == nullptr) return;
    JsonBufferOutput output(out);
    JsonTreeWriter(pMempoolM, output, JsonFormat(false), {vStructDefM, nStructDefM})
        .Write(LazyBodyToWrite(ShareLazyBody(body), false, false));
}

}  // namespace sorn
