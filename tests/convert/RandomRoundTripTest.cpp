// Random objects of all structs to dictionaries and back, against a second writer.

#include <cstdlib>
#include <string>

#include "convert/ConvertFixture.h"
#include "convert/ExpectedRecord.h"
#include "convert/RandomRecord.h"
#include "sorn/model/Schema.h"

namespace sorntest {

using namespace sorn;

/// The seed: another one is given by the environment variable SORN_TEST_SEED.
uint32_t Seed() {
    const char* given = getenv("SORN_TEST_SEED");
    return given != nullptr ? static_cast<uint32_t>(strtoul(given, nullptr, 10)) : 20240917;
}

class RandomRoundTripTest : public ConvertFixture {
 protected:
    /// Asserts that the object's dictionary is the expected one and gives the object back.
    void RoundTrip(const SornObject& object, int version) {
        ref<Dictionary> dictionary = object.ToDictionary(version);
        ASSERT_EQ(Text(dictionary->ToJson(false)), ExpectedJson(object, version));
        ref<SornObject> back;
        RoxString error;
        if (ExpectedJson(object, version).find("INVALID_VALUE:") != std::string::npos) {
            // A required enumeration without names.
            ASSERT_FALSE(Context().DictionaryToSornObject(dictionary, version, back, error));
            ASSERT_EQ(
                Text(error).find("bad enum item nameCannot convert value for the field.. Bad single field: "),
                0u);
            ++nUnreadable;
            return;
        }
        ASSERT_TRUE(Context().DictionaryToSornObject(dictionary, version, back, error)) << error.Utf8();
        ASSERT_EQ(back->structId, object.structId);
        ASSERT_EQ(ExpectedJson(*back, version), ExpectedJson(object, version));
        ref<SornObject> again;
        ASSERT_TRUE(Context().DictionaryToSornObject(dictionary, version, again, error)) << error.Utf8();
        ASSERT_TRUE(*back == *again);
        if (version == 0) {
            ASSERT_TRUE(*back == object);
        }
        // By way of the text, in which nothing is shared.
        ref<SornObject> fromText;
        ref<Dictionary> parsed = Parse(Text(dictionary->ToJson(true)));
        ASSERT_TRUE(Context().DictionaryToSornObject(parsed, version, fromText, error)) << error.Utf8();
        ASSERT_TRUE(*fromText == *back);
    }

    unsigned nUnreadable = 0;
};

TEST_F(RandomRoundTripTest, EveryStructAtEveryKindOfVersion) {
    const uint32_t seed = Seed();
    SCOPED_TRACE("SORN_TEST_SEED=" + std::to_string(seed));
    constexpr unsigned nRounds = 2;
    unsigned nStructs = 0;
    for (uint32_t id = 1; id <= 5918; ++id) {
        const StructInfo* info = Schema::FindStruct(id);
        if (info == nullptr) continue;
        ++nStructs;
        for (uint32_t i = 0; i < nRounds; ++i) {
            ref<SornObject> object = RandomRecord(&pool, seed + id * 16 + i).Make(*info);
            for (int version : {0, 7, 11, 12, 21, 22, 25, 26, 42}) {
                SCOPED_TRACE(std::string(info->name) + " " + std::to_string(i) + " at " +
                             std::to_string(version));
                RoundTrip(*object, version);
                if (HasFatalFailure()) return;
            }
        }
    }
    EXPECT_EQ(nStructs, 286u);
    EXPECT_GE(nUnreadable, 2 * nRounds * 9);  // the two structs that require such an enumeration
    EXPECT_LT(nUnreadable, nStructs * nRounds * 9 / 10);
}

TEST_F(RandomRoundTripTest, EveryTypeIsWrittenAsTheSecondWriterDoes) {
    const uint32_t seed = Seed();
    SCOPED_TRACE("SORN_TEST_SEED=" + std::to_string(seed));
    const StructInfo& info = *Schema::FindStruct(5921);
    for (uint32_t i = 0; i < 50; ++i) {
        ref<SornObject> object = RandomRecord(&pool, seed + i).Make(info);
        for (int version : {0, 7, 9, 10, 12, 13, 14, 15, 19, 20, 25, 26, 29, 30, 42}) {
            SCOPED_TRACE(std::to_string(i) + " at " + std::to_string(version));
            const std::string expected = ExpectedJson(*object, version);
            ASSERT_EQ(Json(object, version), expected);
            if (expected.find("INVALID_VALUE:") != std::string::npos) continue;
            ref<SornObject> back;
            RoxString error;
            ASSERT_TRUE(Context().DictionaryToSornObject(object->ToDictionary(version), version, back, error))
                << error.Utf8();
        }
    }
}

}  // namespace sorntest
