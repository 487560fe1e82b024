// Which fields of an object are written, and in which order.

#include <algorithm>

#include "sorn/json/JsonOutput.h"
#include "sorn/typedjson/JsonTreeWriter.h"
#include "sornschema/Account.h"
#include "sornschema/ChannelMap.h"
#include "sornschema/EveryTypeCompanion.h"
#include "sornschema/EveryTypePlain.h"
#include "sornschema/EveryTypeTyped.h"
#include "sornschema/LocalApplicationDataRemove.h"
#include "sornschema/Success.h"
#include "sornschema/TypedTvRating.h"
#include "typedjson/WriterFixture.h"

namespace sorntest {

using namespace sorn;
using namespace sornschema;

class ObjectWriterTest : public WriterFixture {};

TEST_F(ObjectWriterTest, TheTypeStandsBeforeTheLastFieldBelowIt) {
    const ref<Account> account = New<Account>();
    account->accountId = RoxString("5");
    EXPECT_EQ(Typed(account), R"({"accountId": "vuka:an.5", "type": "account"})");
    account->bodyId.Add(RoxString("a"));
    account->bodyId.Add(RoxString("b"));
    EXPECT_EQ(Typed(account), R"({"accountId": "vuka:an.5", "type": "account", "bodyId": ["a","b"]})");
}

TEST_F(ObjectWriterTest, TheTypeStandsLastWithoutAFieldBelowIt) {
    EXPECT_EQ(Typed(New<Success>()), R"({"type": "success"})");
    const ref<TypedTvRating> rating = New<TypedTvRating>();
    rating->value = 4000000000u;
    EXPECT_EQ(Typed(rating), R"({"value": "INVALID_VALUE:4000000000", "type": "typedTvRating"})");
}

TEST_F(ObjectWriterTest, AFieldNamedTypeIsNotBelow) {
    const ref<EveryTypeTyped> typed = New<EveryTypeTyped>();
    EXPECT_EQ(Typed(typed), R"({"type": "everyTypeTyped"})");
    typed->number = 1;
    typed->number_isSet = 1;
    typed->type = RoxString("own");
    typed->type_isSet = 1;
    EXPECT_EQ(Typed(typed), R"({"type": "everyTypeTyped", "number": 1, "type": "own"})");
}

TEST_F(ObjectWriterTest, PresenceOfOptionalFields) {
    const ref<EveryTypeCompanion> object = New<EveryTypeCompanion>();
    object->number = 5;  // its presence byte is 0
    object->label = RoxString("x");
    EXPECT_EQ(Typed(object), R"({"type": "everyTypeCompanion"})");
    object->number_isSet = 1;
    object->number = 0;
    object->label_isSet = 1;
    object->label = RoxString();
    EXPECT_EQ(Typed(object), R"({"label": "", "type": "everyTypeCompanion", "number": 0})");
    const ref<EveryTypePlain> plain = New<EveryTypePlain>();  // required, with its default
    EXPECT_EQ(Typed(plain), R"({"type": "everyTypePlain", "plainId": "0"})");
}

TEST_F(ObjectWriterTest, VersionsMoveTheType) {
    struct Row {
        const char* json;  // read without a version
        int version;
        const char* text;
    };
    const char* const tts = R"({"type": "ttsSettings", "enabled": true, "isFeatureEnabled": false})";
    const char* const tuners = R"({"type": "multiRoomSettings", "reservedTunerCount": 2})";
    const char* const locale = R"({"type": "orvoLocale", "language": "en", "region": "US"})";
    const Row vRow[] = {
        {tts, 0, R"({"enabled": true, "type": "ttsSettings", "isFeatureEnabled": false})"},
        {tts, 7, R"({"type": "ttsSettings", "enabled": true})"},
        {tts, 22, R"({"type": "ttsSettings", "enabled": true})"},
        {tts, 23, R"({"enabled": true, "type": "ttsSettings", "isFeatureEnabled": false})"},
        {tts, 42, R"({"enabled": true, "type": "ttsSettings", "isFeatureEnabled": false})"},
        {tuners, 0, R"({"type": "multiRoomSettings", "reservedTunerCount": 2})"},
        {tuners, 7, R"({"type": "multiRoomSettings"})"},
        {tuners, 22, R"({"type": "multiRoomSettings", "reservedTunerCount": 2})"},
        {locale, 7, R"({"type": "orvoLocale"})"},
        {locale, 22, R"({"language": "en", "type": "orvoLocale", "region": "US"})"},
    };
    for (const Row& row : vRow) EXPECT_EQ(TypedOf(row.json, row.version), row.text) << row.version;
}

TEST_F(ObjectWriterTest, TheFieldBehindWhichTheTypeMovesNeedsNoValue) {
    const ref<ChannelMap> map = New<ChannelMap>();
    map->versionCookie = RoxString("c");
    EXPECT_EQ(Typed(map, 0), R"({"versionCookie": "c", "type": "channelMap"})");
    EXPECT_EQ(Typed(map, 7), R"({"type": "channelMap", "versionCookie": "c"})");
    EXPECT_EQ(Typed(map, 21), R"({"type": "channelMap", "versionCookie": "c"})");
    EXPECT_EQ(Typed(map, 22), R"({"versionCookie": "c", "type": "channelMap"})");
    EXPECT_EQ(Typed(map, 42), R"({"versionCookie": "c", "type": "channelMap"})");
}

TEST_F(ObjectWriterTest, OlderFormsAreNotWritten) {
    const ref<LocalApplicationDataRemove> remove = New<LocalApplicationDataRemove>();
    remove->appName = RoxString("a");
    remove->key_7_25.Add(RoxString("old"));
    remove->key.Add(RoxString("new"));
    EXPECT_EQ(Typed(remove, 7), R"({"type": "localApplicationDataRemove", "appName": "a"})");
    EXPECT_EQ(Typed(remove, 25), R"({"type": "localApplicationDataRemove", "appName": "a"})");
    EXPECT_EQ(Typed(remove, 26), R"({"appName": "a", "type": "localApplicationDataRemove", "key": ["new"]})");
    EXPECT_EQ(Typed(remove, 0), R"({"appName": "a", "type": "localApplicationDataRemove", "key": ["new"]})");
}

TEST_F(ObjectWriterTest, SubObjectsTakeTheVersion) {
    ref<EveryType> inner = New<EveryType>();
    inner->limitedFirst = 1;
    inner->limitedFirst_isSet = 1;
    inner->requiredS32 = 77;
    const ref<EveryTypeCompanion> object = New<EveryTypeCompanion>();
    object->known = inner;
    const auto has = [&](int version, const char* text) {
        return Typed(object, version).find(text) != std::string::npos;
    };
    EXPECT_TRUE(has(0, R"("limitedFirst": 1)"));
    EXPECT_TRUE(has(7, R"("limitedFirst": 1)"));
    EXPECT_FALSE(has(22, "limitedFirst"));
    EXPECT_TRUE(has(22, R"("limitedRequired": false)"));
    EXPECT_FALSE(has(42, "limitedRequired"));
    EXPECT_TRUE(has(42, R"("requiredS32": 77)"));
}

TEST_F(ObjectWriterTest, EveryObjectHasItsTypeAtItsPlace) {
    const ref<SornObject> object = Object(
        R"({"type": "everyTypeCompanion", "child": {"type": "everyTypeCompanion", "number": 1},
            "children": [{"type": "everyTypeCompanion", "label": "a", "number": 2},
                         {"type": "everyTypeCompanion"}],
            "known": {"type": "account", "accountId": "vuka:an.5"}, "label": "z"})");
    EXPECT_EQ(Typed(object), R"({"child": {"type": "everyTypeCompanion", "number": 1}, )"
                             R"("children": [{"label": "a", "type": "everyTypeCompanion", "number": 2},)"
                             R"({"type": "everyTypeCompanion"}], )"
                             R"("known": {"accountId": "vuka:an.5", "type": "account"}, )"
                             R"("label": "z", "type": "everyTypeCompanion"})");
}

TEST_F(ObjectWriterTest, AFreshRecordOfEveryType) {
    // All required values with their defaults, and no references. The last slot whose name is below "type" is
    // 75 limitedRequired: the names of 76 to 80 begin with "v".
    const char* const values =
        R"("requiredBool": false, "requiredChannel": "invalid", "requiredCurrency": "invalid", )"
        R"("requiredDate": "1970-01-01", "requiredDateTime": "1970-01-01 00:00:00", )"
        R"("requiredEnum": "INVALID_VALUE:0", "requiredFloat": "0.0", "requiredIntId": "vuka:etc.0", )"
        R"("requiredLongId": "vuka:etc.0", "requiredS32": 0, "requiredS64": "0", "requiredString": "", )"
        R"("requiredStringId": "vuka:etc.", "requiredTime": "00:00:00", "requiredU32": 0, "requiredU64": "0")";
    const ref<EveryType> object = New<EveryType>();
    const std::string type = R"("type": "everyType")";
    EXPECT_EQ(Typed(object, 0), std::string("{") + values + ", " + type +
                                    R"(, "limitedRequired": false, "variantRequired": ""})");
    // 75 holds from 20 to 30; without it 74 limitedLast holds at 42 only; then 73 limitedFirst at 7 only;
    // then 71 idWithoutStructString. 79 variantRequired holds from 15.
    EXPECT_EQ(Typed(object, 7), std::string("{") + values + ", " + type + "}");
    EXPECT_EQ(Typed(object, 22), std::string("{") + values + ", " + type +
                                     R"(, "limitedRequired": false, "variantRequired": ""})");
    EXPECT_EQ(Typed(object, 42), std::string("{") + values + ", " + type + R"(, "variantRequired": ""})");
    // With a value behind the type: slot 71 at version 12.
    object->idWithoutStructString_isSet = 1;
    EXPECT_EQ(Typed(object, 12),
              std::string("{") + values + ", " + type + R"(, "idWithoutStructString": "XXX"})");
    EXPECT_EQ(Typed(object, 42), std::string("{") + values + R"(, "idWithoutStructString": "XXX", )" + type +
                                     R"(, "variantRequired": ""})");
}

TEST_F(ObjectWriterTest, BehindWhatStandsThere) {
    ByteBuffer out(&pool);
    out.AppendString("before ");
    JsonSornObject writer(&pool);
    const ref<Success> object = New<Success>();
    writer.SornObjectToJson(object.get(), 0, out);
    writer.SornObjectToJson(object.get(), 0, out);
    EXPECT_EQ(Text(out), R"(before {"type": "success"}{"type": "success"})");
}

TEST_F(ObjectWriterTest, LongTextsInBothForms) {
    const ref<EveryTypeCompanion> object = New<EveryTypeCompanion>();
    object->label_isSet = 1;
    for (const size_t n : {1000u, 4000u, 4095u, 4096u, 100000u}) {
        object->label = RoxString(&pool, std::string(n, 'x').c_str());
        const std::string expected =
            R"({"label": ")" + std::string(n, 'x') + R"(", "type": "everyTypeCompanion"})";
        EXPECT_EQ(Typed(object), expected);
        ByteBuffer out(&pool);
        JsonSornObject(&pool).SornObjectToJson(object.get(), 0, out);
        EXPECT_EQ(Text(out), expected);
    }
}

/// A table of one struct, with ids of a long prefix and odd names.
TEST_F(ObjectWriterTest, ATableOfTheCallers) {
    const std::string prefix(60, 'p');
    StructInfo info = EveryTypeTyped::structInfoG;
    info.name = "odd\"name";
    info.idPrefix = prefix.c_str();
    FieldInfo vField[3];
    std::copy(info.vFieldInfo, info.vFieldInfo + 3, vField);
    vField[2].dataType = SORN_DATA_TYPE_STRING_ID;
    vField[2].typeRef = 1;
    info.vFieldInfo = vField;
    const StructInfo* vStruct[5923] = {};
    vStruct[5922] = &info;
    vStruct[1] = &info;
    const ref<EveryTypeTyped> object = New<EveryTypeTyped>();
    object->type = RoxString(&pool, std::string(60, 's').c_str());
    object->type_isSet = 1;
    JsonTextOutput out(&pool);
    JsonTreeWriter(&pool, out, JsonFormat(false), {vStruct, 5923}).Write(*object, 0);
    EXPECT_EQ(sorntest::Text(out.Take()),
              R"({"type": "odd"name", "type": ")" + prefix + std::string(39, 's') + R"("})");
}

}  // namespace sorntest
