#pragma once

#include <gtest/gtest.h>

#include <string>

#include "rox/RoxMempool.h"
#include "rox/RoxString.h"
#include "rox/ref.h"
#include "sorn/convert/DictionarySornObject.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/model/Schema.h"
#include "sorn/model/SornObject.h"
#include "sorn/model/StructInfo.h"

namespace sorntest {

/// A test over a pool of its own, which must be as empty at the end as at the start: results die with their
/// tests.
class ConvertFixture : public ::testing::Test {
 protected:
    void TearDown() override { EXPECT_EQ(pool.GetUsedBytes(), 0u) << "bytes left in the pool"; }

    sorn::DictionarySornObject Context();
    /// The dictionary of a JSON text, which must parse.
    ref<sorn::Dictionary> Parse(const std::string& json);
    /// The object of a JSON text at a version; a failure fails the test.
    ref<sorn::SornObject> Object(const std::string& json, int version = 0);
    template <class T>
    ref<T> ObjectOf(const std::string& json, int version = 0) {
        return ref<T>(static_cast<T*>(Object(json, version).get()));
    }
    /// The words of a conversion that must fail, with `before` in the caller's string beforehand.
    std::string Words(const std::string& json, int version = 0, const char* before = "");
    std::string Words(const ref<sorn::Dictionary>& dictionary, int version = 0, const char* before = "");
    /// The object's compact JSON text by way of its dictionary.
    std::string Json(const ref<sorn::SornObject>& object, int version = 0);

    RoxMempool pool{"convert"};
};

std::string Text(const RoxString& text);
/// The current record of a field by its name, which must exist.
const sorn::FieldInfo* FindField(const sorn::StructInfo& info, const std::string& name);

inline sorn::DictionarySornObject ConvertFixture::Context() {
    return sorn::DictionarySornObject(&pool, sorn::Schema::vStructDefG, sorn::Schema::nStructDefG);
}

inline ref<sorn::Dictionary> ConvertFixture::Parse(const std::string& json) {
    RoxString error;
    ref<sorn::Dictionary> dictionary = sorn::Dictionary::FromJson(RoxString(json.c_str()), error, &pool);
    EXPECT_NE(dictionary, nullptr) << json << ": " << error.Utf8();
    return dictionary;
}

inline ref<sorn::SornObject> ConvertFixture::Object(const std::string& json, int version) {
    ref<sorn::SornObject> object;
    RoxString error;
    EXPECT_TRUE(Context().DictionaryToSornObject(Parse(json), version, object, error))
        << json << ": " << error.Utf8();
    EXPECT_EQ(Text(error), "") << json;
    return object;
}

inline std::string ConvertFixture::Words(const std::string& json, int version, const char* before) {
    return Words(Parse(json), version, before);
}

inline std::string ConvertFixture::Words(const ref<sorn::Dictionary>& dictionary, int version,
                                         const char* before) {
    ref<sorn::SornObject> untouched = sorn::Schema::FindStruct(140)->Factory(&pool);
    ref<sorn::SornObject> out = untouched;
    RoxString error(before);
    EXPECT_FALSE(Context().DictionaryToSornObject(dictionary, version, out, error));
    EXPECT_EQ(out, untouched);
    return Text(error);
}

inline std::string ConvertFixture::Json(const ref<sorn::SornObject>& object, int version) {
    return Text(Context().SornObjectToDictionary(object.get(), version)->ToJson(false));
}

inline std::string Text(const RoxString& text) {
    return std::string(text.Utf8(), text.NByte());
}

inline const sorn::FieldInfo* FindField(const sorn::StructInfo& info, const std::string& name) {
    for (int i = 0; i < info.nFields; ++i) {
        const sorn::FieldInfo& field = info.vFieldInfo[i];
        if (!field.FHole() && name == info.FieldName(field)) return &field;
    }
    ADD_FAILURE() << "no field " << name;
    return nullptr;
}

}  // namespace sorntest
