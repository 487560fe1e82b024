#include <string>
#include <vector>

#include "convert/ConvertFixture.h"
#include "convert/ShowField.h"
#include "sorn/model/Schema.h"
#include "sornschema/AudioStream.h"
#include "sornschema/EveryType.h"
#include "sornschema/LocalApplicationDataRemove.h"
#include "sornschema/ViewStartEvent.h"
#include "sornschema/ViewStopEvent.h"

namespace sorntest {

using namespace sorn;
using sornschema::AudioStream;
using sornschema::EveryType;
using sornschema::LocalApplicationDataRemove;
using sornschema::ViewStartEvent;
using sornschema::ViewStopEvent;

using VersionsTest = ConvertFixture;

// The names of the second and third values of the enumerations in use, as the schema has them.
std::string EnumName(const StructInfo& info, const char* field, uint32_t value) {
    return Schema::FindEnum(FindField(info, field)->typeRef)->names[value];
}

std::string AudioStreamJson(uint32_t format) {
    return R"({"audioStreamFormat": ")" + EnumName(AudioStream::structInfoG, "audioStreamFormat", format) +
           R"(", "audioStreamId": "vuka:aus.5", "type": "audioStream"})";
}

TEST_F(VersionsTest, AudioStreamUpTo21FillsTheOlderMembers) {
    for (int version : {7, 11, 12, 21}) {
        ref<AudioStream> object = ObjectOf<AudioStream>(AudioStreamJson(2), version);
        EXPECT_EQ(object->audioStreamFormat_7_21, 2u);
        EXPECT_EQ(object->audioStreamId_7_21, 5u);
        EXPECT_EQ(object->audioStreamFormat_isSet, 0);
        EXPECT_EQ(object->audioStreamFormat, 0u);
        EXPECT_EQ(object->audioStreamId, 0u);
        EXPECT_EQ(Json(object, version), AudioStreamJson(2));
        EXPECT_EQ(Json(object, 22), R"({"type": "audioStream"})");
        EXPECT_EQ(Json(object, 0), R"({"type": "audioStream"})");
    }
}

TEST_F(VersionsTest, AudioStreamFrom22FillsTheCurrentMembers) {
    for (int version : {0, 22, 25, 42}) {
        ref<AudioStream> object = ObjectOf<AudioStream>(AudioStreamJson(1), version);
        EXPECT_EQ(object->audioStreamFormat, 1u);
        EXPECT_EQ(object->audioStreamFormat_isSet, 1);
        EXPECT_EQ(object->audioStreamId, 5u);
        EXPECT_EQ(object->audioStreamId_isSet, 1);
        EXPECT_EQ(object->audioStreamFormat_7_21, 0u);
        EXPECT_EQ(Json(object, version), AudioStreamJson(1));
    }
}

TEST_F(VersionsTest, RequiredUpTo21AndOptionalFrom22) {
    const char* const json = R"({"type": "audioStream"})";
    EXPECT_EQ(Words(json, 7), "Required field not set: audioStreamFormat");
    EXPECT_EQ(Words(json, 21), "Required field not set: audioStreamFormat");
    EXPECT_NE(Object(json, 22), nullptr);
    EXPECT_NE(Object(json, 0), nullptr);
}

TEST_F(VersionsTest, FieldsOutsideTheVersionAreIgnored) {
    const char* const json = R"({"type": "audioStream", "streamServiceMode": "no such mode"})";
    EXPECT_EQ(Words(json, 22),
              "bad enum item nameCannot convert value for the field.. Bad single field: streamServiceMode");
    EXPECT_EQ(Words(json, 21), "Required field not set: audioStreamFormat");
    ref<EveryType> object = ObjectOf<EveryType>(R"({"type": "everyType", "limitedFirst": 5})", 0);
    EXPECT_EQ(object->limitedFirst, 5);
    EXPECT_EQ(Json(object, 8).find("limitedFirst"), std::string::npos);
    EXPECT_NE(Json(object, 7).find(R"("limitedFirst": 5)"), std::string::npos);
    EXPECT_NE(Json(object, 0).find(R"("limitedFirst": 5)"), std::string::npos);
}

TEST_F(VersionsTest, LocalApplicationDataRemove) {
    const char* const json = R"({"appName": "a", "key": ["k", "l"], "type": "localApplicationDataRemove"})";
    for (int version : {7, 21, 25}) {
        ref<LocalApplicationDataRemove> object = ObjectOf<LocalApplicationDataRemove>(json, version);
        EXPECT_EQ(object->key_7_25.GetCount(), 2u);
        EXPECT_EQ(object->key.GetCount(), 0u);
        EXPECT_EQ(Json(object, version), json);
        EXPECT_EQ(Json(object, 26), R"({"appName": "a", "type": "localApplicationDataRemove"})");
    }
    for (int version : {0, 26, 42}) {
        ref<LocalApplicationDataRemove> object = ObjectOf<LocalApplicationDataRemove>(json, version);
        EXPECT_EQ(object->key.GetCount(), 2u);
        EXPECT_EQ(object->key_7_25.GetCount(), 0u);
        EXPECT_EQ(Json(object, version), json);
        EXPECT_EQ(Json(object, 25), R"({"appName": "a", "type": "localApplicationDataRemove"})");
    }
}

template <class Event>
class ViewEventTest : public ConvertFixture {
 protected:
    /// A record with all that the version requires but for `more`.
    std::string EventJson(const std::string& more) {
        const StructInfo& info = Event::structInfoG;
        return std::string(R"({"type": ")") + info.name + R"(", "bodyId": "b", "deviceType": ")" +
               EnumName(info, "deviceType", 1) + R"(", "source": ")" + EnumName(info, "source", 1) +
               R"(", "what": {"type": "everyTypeCompanion"})" + more + "}";
    }
};

using ViewEvents = ::testing::Types<ViewStartEvent, ViewStopEvent>;
TYPED_TEST_SUITE(ViewEventTest, ViewEvents);

constexpr const char* upTo11 = R"(, "timestamp": "1970-01-01 00:00:01")";
constexpr const char* milliseconds = R"(, "timestampMilliseconds": "1234567890123")";
constexpr const char* from13 = R"(, "programPosition": 1, "sequenceNumber": 2)";

TYPED_TEST(ViewEventTest, TimestampMillisecondsUpTo11IsOptionalAndOfItsOwn) {
    for (int version : {7, 11}) {
        ref<TypeParam> without = this->template ObjectOf<TypeParam>(this->EventJson(upTo11), version);
        EXPECT_EQ(without->timestampMilliseconds_7_11_isSet, 0);
        EXPECT_EQ(this->Json(without, version).find("timestampMilliseconds"), std::string::npos);
        ref<TypeParam> with =
            this->template ObjectOf<TypeParam>(this->EventJson(std::string(upTo11) + milliseconds), version);
        EXPECT_EQ(with->timestampMilliseconds_7_11_isSet, 1);
        EXPECT_EQ(with->timestampMilliseconds_7_11, 1234567890123);
        EXPECT_EQ(with->timestampMilliseconds, 0);
        EXPECT_NE(this->Json(with, version).find(R"("timestampMilliseconds": "1234567890123")"),
                  std::string::npos);
        EXPECT_NE(this->Json(with, 0).find(R"("timestampMilliseconds": "0")"), std::string::npos);
    }
}

TYPED_TEST(ViewEventTest, TimestampMillisecondsFrom12IsRequired) {
    EXPECT_EQ(this->Words(this->EventJson(upTo11), 12), "Required field not set: timestampMilliseconds");
    ref<TypeParam> at12 = this->template ObjectOf<TypeParam>(this->EventJson(milliseconds), 12);
    EXPECT_EQ(at12->timestampMilliseconds, 1234567890123);
    EXPECT_EQ(at12->timestampMilliseconds_7_11_isSet, 0);
    EXPECT_EQ(this->Words(this->EventJson(milliseconds), 13), "Required field not set: programPosition");
    for (int version : {21, 42}) {
        ref<TypeParam> object =
            this->template ObjectOf<TypeParam>(this->EventJson(std::string(milliseconds) + from13), version);
        EXPECT_EQ(object->timestampMilliseconds, 1234567890123);
    }
}

TYPED_TEST(ViewEventTest, AirTimeEndsAt11) {
    const std::string airTime = R"(, "airTime": "1970-01-01 00:00:02")";
    ref<TypeParam> at11 = this->template ObjectOf<TypeParam>(this->EventJson(upTo11 + airTime), 11);
    EXPECT_EQ(at11->airTime.milliseconds, 2000);
    EXPECT_EQ(at11->airTime_isSet, 1);
    ref<TypeParam> at12 = this->template ObjectOf<TypeParam>(this->EventJson(milliseconds + airTime), 12);
    EXPECT_EQ(at12->airTime.milliseconds, 0);
    EXPECT_EQ(at12->airTime_isSet, 0);
    at12->airTime = DateTime(2000);
    at12->airTime_isSet = 1;
    EXPECT_EQ(this->Json(at12, 12).find("airTime\""), std::string::npos);
    EXPECT_NE(this->Json(at12, 11).find(R"("airTime": "1970-01-01 00:00:02")"), std::string::npos);
    EXPECT_EQ(at12->airTime.milliseconds, 2000);
}

TEST_F(VersionsTest, VariantsOfOtherTypesAndArities) {
    struct Row {
        int version;
        const char* entry;    // in
        const char* printed;  // out, at the same version
    };
    const Row rows[] = {
        {7, R"("variantMulti": "a")", R"("variantMulti": ["a"])"},
        {25, R"("variantMulti": ["a", "5"])", R"("variantMulti": ["a", "5"])"},
        {26, R"("variantMulti": ["5"])", R"("variantMulti": [5])"},
        {0, R"("variantMulti": ["5"])", R"("variantMulti": [5])"},
        {7, R"("variantOptional": "text")", R"("variantOptional": "text")"},
        {9, R"("variantOptional": "")", R"("variantOptional": "")"},
        {20, R"("variantOptional": "5")", R"("variantOptional": "5")"},
        {42, R"("variantOptional": 5)", R"("variantOptional": "5")"},
        {29, R"("variantReference": {"type": "everyTypeCompanion"})",
         R"("variantReference": [{"type": "everyTypeCompanion"}])"},
        {30, R"("variantReference": [{"type": "everyTypeCompanion"}])",
         R"("variantReference": {"type": "everyTypeCompanion"})"},
        {12, R"("variantWithGap": 5)", R"("variantWithGap": 5)"},
        {20, R"("variantWithGap": "true")", R"("variantWithGap": true)"},
    };
    for (const Row& row : rows) {
        SCOPED_TRACE(std::string(row.entry) + " at " + std::to_string(row.version));
        // All that any version requires.
        std::string json =
            R"({"type": "everyType", "requiredAnyDict": {}, "requiredBool": true, "requiredBytes": "", )"
            R"("requiredChannel": "1", "requiredCurrency": "", "requiredDate": "", "requiredDateTime": "", )"
            R"("requiredEnum": "red", "requiredFloat": "1", "requiredIntId": "vuka:etc.1", )"
            R"("requiredKnownDict": {"type": "everyTypeCompanion"}, "requiredLazy": {}, "requiredLongId": "vuka:etc.1", )"
            R"("requiredObject": {"type": "everyTypeCompanion"}, "requiredS32": 1, "requiredS64": 1, )"
            R"("requiredString": "", "requiredStringId": "vuka:etc.", "requiredTime": "", "requiredU32": 1, )"
            R"("requiredU64": 1, "limitedRequired": true, "variantRequired": "v")";
        if (std::string(row.entry).find("variantOptional") == std::string::npos && row.version >= 10 &&
            row.version <= 19) {
            json += R"(, "variantOptional": 1)";
        }
        json += std::string(", ") + row.entry + "}";
        ref<SornObject> object = Object(json, row.version);
        ASSERT_NE(object, nullptr);
        EXPECT_NE(Json(object, row.version).find(row.printed), std::string::npos)
            << Json(object, row.version);
    }
}

TEST_F(VersionsTest, SelectedVariantsDecideOnArityAndPresence) {
    ref<EveryType> object = ref<EveryType>(static_cast<EveryType*>(EveryType::Factory(&pool).get()));
    auto entry = [&](int version, const char* name) {
        std::string text = Json(object, version);
        size_t at = text.find(std::string("\"") + name + "\": ");
        return at == std::string::npos ? std::string("none")
                                       : text.substr(at, text.find_first_of(",}", at) - at);
    };
    EXPECT_EQ(entry(9, "variantOptional"), "none");                      // optional, absent
    EXPECT_EQ(entry(10, "variantOptional"), R"("variantOptional": 0)");  // required
    EXPECT_EQ(entry(19, "variantOptional"), R"("variantOptional": 0)");
    EXPECT_EQ(entry(20, "variantOptional"), "none");
    object->variantOptional = 7;
    object->variantOptional_isSet = 1;
    EXPECT_EQ(entry(20, "variantOptional"), R"("variantOptional": "7")");
    EXPECT_EQ(entry(19, "variantOptional"), R"("variantOptional": 0)");
    EXPECT_EQ(entry(14, "variantRequired"), "none");
    EXPECT_EQ(entry(15, "variantRequired"), R"("variantRequired": "")");
    object->variantWithGap_isSet = object->variantWithGap_7_12_isSet = 1;
    EXPECT_EQ(entry(12, "variantWithGap"), R"("variantWithGap": 0)");
    EXPECT_EQ(entry(13, "variantWithGap"), "none");  // in the gap
    EXPECT_EQ(entry(19, "variantWithGap"), "none");
    EXPECT_EQ(entry(20, "variantWithGap"), R"("variantWithGap": false)");
    EXPECT_EQ(entry(19, "limitedRequired"), "none");
    EXPECT_EQ(entry(20, "limitedRequired"), R"("limitedRequired": false)");
    EXPECT_EQ(entry(30, "limitedRequired"), R"("limitedRequired": false)");
    EXPECT_EQ(entry(31, "limitedRequired"), "none");
}

TEST_F(VersionsTest, ANullRequiredLazyBodyCannotBeReadBackWithAVersion) {
    const StructInfo* info = Schema::FindStruct(975);  // orvoRpcRequest
    ref<SornObject> object = info->Factory(&pool);
    ref<Dictionary> dictionary = object->ToDictionary(42);
    EXPECT_EQ(dictionary->Find(RoxString("request")), nullptr);
    EXPECT_EQ(Words(dictionary, 42), "Required field not set: request");
    ref<SornObject> back;
    RoxString error;
    EXPECT_TRUE(Context().DictionaryToSornObject(dictionary, 0, back, error));
}

}  // namespace sorntest
