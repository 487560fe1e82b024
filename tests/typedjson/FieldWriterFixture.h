#pragma once

#include <string>

#include "sorn/dict/Dict.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/lazy/LazyDict.h"
#include "sornschema/EveryTypeCompanion.h"
#include "sornschema/EveryTypePlain.h"
#include "typedjson/WriterFixture.h"

namespace sorntest {

/// Values for the members of objects whose fields are written.
class FieldWriterFixture : public WriterFixture {
 protected:
    ref<sorn::SornObject> Companion(int32_t number) {
        ref<sornschema::EveryTypeCompanion> object = New<sornschema::EveryTypeCompanion>();
        object->number = number;
        object->number_isSet = 1;
        return object;
    }
    ref<sorn::SornObject> Plain(uint64_t id) {
        ref<sornschema::EveryTypePlain> object = New<sornschema::EveryTypePlain>();
        object->plainId = id;
        return object;
    }
    ref<rox::ByteBuffer> Bytes(const std::string& bytes) {
        return rox::ByteBuffer::New(&pool, bytes.data(), static_cast<unsigned>(bytes.size()));
    }
    ref<sorn::Dict> AnyDict(const std::string& json) { return new (&pool) sorn::Dict(Parse(json)); }
    ref<sorn::LazyDict> Lazy(const char* json) {
        return sorn::LazyDict::FromJsonString(&pool, RoxString(&pool, json), 0);
    }
    static RoxString Bytes0(const std::string& text) {
        return RoxString::FromUtf8Bytes(nullptr, static_cast<unsigned>(text.size()), text.data());
    }
};

}  // namespace sorntest
