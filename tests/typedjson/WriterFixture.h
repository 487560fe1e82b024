#pragma once

#include <string>

#include "convert/ConvertFixture.h"
#include "sorn/dict/ByteBuffer.h"
#include "sorn/typedjson/JsonSornObject.h"
#include "sornschema/EveryType.h"

namespace sorntest {

inline std::string Text(const sorn::ByteBuffer& buffer) {
    return std::string(reinterpret_cast<const char*>(buffer.GetData()), buffer.GetLength());
}

/// Objects and their text by the typed writer.
class WriterFixture : public ConvertFixture {
 protected:
    template <class T>
    ref<T> New() {
        return ref<T>(static_cast<T*>(T::Factory(&pool).get()));
    }
    template <class T>
    std::string Typed(const ref<T>& object, int version = 0) {
        return ::sorntest::Text(sorn::JsonSornObject(&pool).SornObjectToJson(object.get(), version));
    }
    /// The text of an object that is made of JSON text, without a version.
    std::string TypedOf(const std::string& json, int version = 0) { return Typed(Object(json), version); }
    /// One field under the name "k".
    std::string Single(const sorn::SornObject& object, const sorn::FieldInfo& field, int version = 0) {
        sorn::ByteBuffer out(&pool);
        bool first = true;
        sorn::JsonSornObject(&pool).SingleFieldToJson("k", &field, &object, out, first, version);
        return ::sorntest::Text(out);
    }
    std::string Multi(const sorn::SornObject& object, const sorn::FieldInfo& field, int version = 0) {
        sorn::ByteBuffer out(&pool);
        bool first = true;
        sorn::JsonSornObject(&pool).MultiFieldToJson("k", &field, &object, out, first, version);
        return ::sorntest::Text(out);
    }
    static const sorn::FieldInfo& Field(const std::string& name) {
        return *FindField(sornschema::EveryType::structInfoG, name);
    }
};

}  // namespace sorntest
