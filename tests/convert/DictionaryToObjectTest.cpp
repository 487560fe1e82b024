#include <string>
#include <vector>

#include "convert/ConvertFixture.h"
#include "convert/ShowField.h"
#include "sorn/dict/ArrayValue.h"
#include "sorn/dict/Dict.h"
#include "sorn/dict/LazyDictValue.h"
#include "sorn/dict/NullValue.h"
#include "sorn/dict/StringValue.h"
#include "sorn/lazy/LazyDict.h"
#include "sorn/model/Schema.h"
#include "sornschema/EveryType.h"
#include "sornschema/EveryTypeCompanion.h"

namespace sorntest {

using namespace sorn;

class DictionaryToObjectTest : public ConvertFixture {
 protected:
    const StructInfo& everyType = sornschema::EveryType::structInfoG;
    static std::string Record(const std::string& field, const std::string& value) {
        return R"({"type": "everyType", ")" + field + "\": " + value + "}";
    }
    std::vector<std::string> Shown(const std::string& field, const std::string& value) {
        ref<SornObject> object = Object(Record(field, value));
        return object != nullptr ? ShowField(*object, *FindField(everyType, field))
                                 : std::vector<std::string>();
    }
};

struct Accepted {
    const char* type;  // part of the name of everyType's fields
    const char* json;
    const char* shown;  // the raw value, see ShowField
};

const Accepted vAcceptedG[] = {
    {"Bool", R"("true")", "true"},
    {"Bool", "true", "true"},
    {"Bool", R"("false")", "false"},
    {"Bytes", R"("AP8=")", "bytes 00ff"},
    {"Bytes", R"("")", "bytes "},
    {"Bytes", R"("A")", "bytes "},
    {"Channel", R"("7")", "7/-2"},
    {"Channel", R"("7-2")", "7/2"},
    {"Channel", R"("seven")", "-2/-2"},
    {"Currency", R"("USD.100")", "USD/100"},
    {"Currency", R"("100")", "/0"},
    {"Date", R"("1970-01-02")", "1"},
    {"Date", R"("2000-03-01")", "11017"},
    {"Date", R"("2000-03-01 ")", "0"},
    {"DateTime", R"("1970-01-01 00:00:01")", "1000"},
    {"DateTime", R"("1970-01-02T00:00:00")", "86400000"},
    {"DateTime", R"("2040-01-01 00:00:00")", "2145916800000"},
    {"DateTime", R"("soon")", "0"},
    {"AnyDict", R"({"b": "c"})", R"(dict {"b": "c"})"},
    {"AnyDict", "{}", "dict {}"},
    {"Enum", R"("red")", "1"},
    {"Enum", R"("green")", "2"},
    {"Enum", "blue", "5"},
    {"Float", R"("2.5")", "2.5"},
    {"Float", R"(" 1e3x")", "1000"},
    {"Float", "-3", "-3"},
    {"IntId", R"("vuka:etc.12")", "12"},
    {"IntId", R"("vuka:etc.4294967295")", "4294967295"},
    {"IntId", R"("vuka:etc.4294967296")", "0"},
    {"IntId", R"("vuka:etc.twelve")", "0"},
    {"IntId", R"("vuka:etc.")", "0"},
    {"KnownDict", R"({"type": "everyTypePlain", "plainId": "7"})",
     R"(object {"plainId": "7", "type": "everyTypePlain"})"},
    {"Lazy", R"({"type": "nobody knows it", "a": "b"})", "lazy 4 at 0"},
    {"Lazy", "null", "null"},
    {"LongId", R"("vuka:etc.12")", "12"},
    {"LongId", R"("vuka:etc.ts.7")", "562949953421319"},  // 2 * 2^48 + 7
    {"LongId", R"("vuka:etc.no.7")", "0"},
    {"LongId", R"("vuka:etc.")", "0"},
    {"Object", R"({"type": "everyTypeCompanion", "number": 5})",
     R"(object {"number": 5, "type": "everyTypeCompanion"})"},
    {"Object", R"({"type": "everyTypePlain", "plainId": "7"})",
     R"(object {"plainId": "7", "type": "everyTypePlain"})"},
    {"S32", "-2147483648", "-2147483648"},
    {"S32", R"("2147483647")", "2147483647"},
    {"S32", R"("12abc")", "12"},
    {"S32", R"(" \n7")", "7"},
    {"S64", R"("9223372036854775807")", "9223372036854775807"},
    {"S64", "2147483648", "2147483648"},
    {"S64", R"("12abc")", "12"},
    {"String", R"("some text")", "'some text"},
    {"String", R"("")", "'"},
    {"String", "12", "'12"},
    {"StringId", R"("vuka:etc.some id")", "'some id"},
    {"StringId", R"("vuka:etc.")", "'"},
    {"Time", R"("23:59:59")", "86399000"},
    {"Time", R"("25:00:00")", "0"},
    {"U32", "4294967295", "4294967295"},
    {"U32", R"("12abc")", "12"},
    {"U64", R"("18446744073709551615")", "18446744073709551615"},
    {"U64", R"("-1")", "18446744073709551615"},
};

TEST_F(DictionaryToObjectTest, StoresWhatIsAccepted) {
    for (const Accepted& row : vAcceptedG) {
        SCOPED_TRACE(std::string(row.type) + " " + row.json);
        const std::string json = row.json;
        const std::vector<std::string> one{row.shown};
        for (const char* arity : {"optional", "required"}) {
            std::string name = std::string(arity) + row.type;
            EXPECT_EQ(Shown(name, json), one);
            EXPECT_EQ(Shown(name, "[" + json + "]"), one);
        }
        std::string multi = std::string("multi") + row.type;
        EXPECT_EQ(Shown(multi, json), one);
        EXPECT_EQ(Shown(multi, "[" + json + "]"), one);
        EXPECT_EQ(Shown(multi, "[" + json + ", " + json + "]"),
                  (std::vector<std::string>{row.shown, row.shown}));
    }
}

constexpr const char* notString = "Dictionary field is not a single string";
constexpr const char* notStringKept = "old;Dictionary field is not a single string";
constexpr const char* mustBeString = "old;Field must be a single string";
constexpr const char* notConverted = "Cannot convert field";
constexpr const char* notConvertedMulti =
    "Dictionary string cannot be converted to requested data type in SornObject array";
constexpr const char* mustBeDictionary = "old;Field must be a Dictionary";
constexpr const char* mustBeLazy = "old;Field must be a LazyDict or a Dictionary";

struct Refused {
    const char* type;
    const char* json;
    const char* single;  // words before ". Bad single field: "; "old;" stood there before the call
    const char* multi;   // words before ". Bad multi field: "
};

const Refused vRefusedG[] = {
    {"Bool", "{}", notString, notString},
    {"Bool", "null", notString, notString},
    {"Bool", R"("TRUE")", notConverted, notConvertedMulti},
    {"Bool", "1", notConverted, notConvertedMulti},
    {"Bool", R"("")", notConverted, notConvertedMulti},
    {"Bytes", "{}", notString, notString},
    {"Channel", "{}", notString, notString},
    {"Currency", "null", notString, notString},
    {"Date", "{}", notString, notString},
    {"DateTime", "{}", notString, notString},
    {"Time", "{}", notString, notString},
    {"Float", "{}", notString, notString},
    {"Float", "x", notConverted, notConvertedMulti},
    {"S64", "{}", notString, notString},
    {"S64", "x12", notConverted, notConvertedMulti},
    {"U64", "{}", notString, notString},
    {"U64", R"("")", notConverted, notConvertedMulti},
    {"S32", "{}", notString, notString},
    {"S32", "2147483648", notConverted, notConvertedMulti},
    {"S32", "-2147483649", notConverted, notConvertedMulti},
    {"U32", "{}", notString, notString},
    {"U32", "4294967296", notConverted, notConvertedMulti},
    {"U32", "-1", notConverted, notConvertedMulti},
    {"String", "{}", notStringKept, notStringKept},
    {"String", "null", notStringKept, notStringKept},
    {"Enum", "{}", mustBeString, mustBeString},
    {"Enum", "yellow", "old;bad enum item nameCannot convert value for the field.",
     "old;bad enum item nameBad value in field: "},
    {"Enum", "Red", "old;bad enum item nameCannot convert value for the field.",
     "old;bad enum item nameBad value in field: "},
    {"Enum", R"("")", "old;bad enum item nameCannot convert value for the field.",
     "old;bad enum item nameBad value in field: "},
    {"IntId", "{}", mustBeString, mustBeString},
    {"IntId", "1234", "old;wrong prefix on idbad prefix: 1234Cannot convert value for the field.",
     "old;wrong prefix on idbad prefix: 1234Bad value in field: "},
    {"IntId", R"("vuka:etc")",
     "old;wrong prefix on idbad prefix: vuka:etcCannot convert value for the field.",
     "old;wrong prefix on idbad prefix: vuka:etcBad value in field: "},
    {"LongId", "null", mustBeString, mustBeString},
    {"LongId", "ts", "old;wrong prefix on idbad prefix: tsCannot convert value for the field.",
     "old;wrong prefix on idbad prefix: tsBad value in field: "},
    {"StringId", "{}", mustBeString, mustBeString},
    {"StringId", R"("")", "old;wrong prefix on idbad prefix: Cannot convert value for the field.",
     "old;wrong prefix on idbad prefix: Bad value in field: "},
    {"AnyDict", "x", mustBeDictionary, mustBeDictionary},
    {"AnyDict", "null", mustBeDictionary, mustBeDictionary},
    {"KnownDict", "x", mustBeDictionary, mustBeDictionary},
    {"Object", "null", mustBeDictionary, mustBeDictionary},
    {"KnownDict", "{}", "old;Dictionary has no 'type' field.. Can't unmarshal inner Dictionary",
     "old;Dictionary has no 'type' field. Can't convert inner Dictionary to SornObject"},
    {"Object", R"({"type": "nope"})", "old;no such structure type: nope. Can't unmarshal inner Dictionary",
     "old;no such structure type: nope Can't convert inner Dictionary to SornObject"},
    {"Object", R"({"type": "everyTypeCompanion", "number": "x"})",
     "Cannot convert field. Bad single field: number. Can't unmarshal inner Dictionary",
     "Cannot convert field. Bad single field: number Can't convert inner Dictionary to SornObject"},
    {"Lazy", "x", mustBeLazy, mustBeLazy},
};

TEST_F(DictionaryToObjectTest, SaysWhyItRefuses) {
    for (const Refused& row : vRefusedG) {
        SCOPED_TRACE(std::string(row.type) + " " + row.json);
        const std::string json = row.json;
        for (const char* arity : {"optional", "required"}) {
            std::string name = std::string(arity) + row.type;
            std::string words = row.single + (". Bad single field: " + name);
            EXPECT_EQ(Words(Record(name, json), 0, "old;"), words);
            EXPECT_EQ(Words(Record(name, "[" + json + "]"), 0, "old;"), words);
        }
        std::string multi = std::string("multi") + row.type;
        std::string words = row.multi + (". Bad multi field: " + multi);
        EXPECT_EQ(Words(Record(multi, json), 0, "old;"), words);
        EXPECT_EQ(Words(Record(multi, "[" + json + "]"), 0, "old;"), words);
    }
}

TEST_F(DictionaryToObjectTest, ArraysInSingleFields) {
    const char* const words = "old;Cannot convert array to single field: optionalS32";
    EXPECT_EQ(Words(Record("optionalS32", "[]"), 0, "old;"), words);
    EXPECT_EQ(Words(Record("optionalS32", "[1, 2]"), 0, "old;"), words);
    EXPECT_EQ(Words(Record("optionalS32", "[[1]]"), 0, "old;"),
              std::string(notString) + ". Bad single field: optionalS32");
    EXPECT_EQ(Shown("multiS32", "[]"), std::vector<std::string>());
    EXPECT_EQ(Words(Record("multiS32", "[1, [2]]"), 0, "old;"),
              std::string(notString) + ". Bad multi field: multiS32");
    EXPECT_EQ(Words(Record("multiString", R"(["a", ["b"]])"), 0, "old;"),
              std::string(notStringKept) + ". Bad multi field: multiString");
}

TEST_F(DictionaryToObjectTest, TypeEntry) {
    EXPECT_EQ(Words("{}", 0, "old;"), "old;Dictionary has no 'type' field.");
    EXPECT_EQ(Words(R"({"type": ""})", 0, "old;"), "old;Dictionary has no 'type' field.");
    EXPECT_EQ(Words(R"({"type": {}})"), "Dictionary has no 'type' field.");
    EXPECT_EQ(Words(R"({"type": ["everyType"]})"), "Dictionary has no 'type' field.");
    EXPECT_EQ(Words(R"({"type": "EveryType"})", 0, "old;"), "old;no such structure type: EveryType");
    EXPECT_EQ(Words(ref<Dictionary>(), 0), "Dictionary has no 'type' field.");
    ref<SornObject> empty = Object(R"({"type": "everyType"})");
    EXPECT_EQ(empty->structId, 5921u);
    EXPECT_EQ(empty->GetMempool(), &pool);
}

TEST_F(DictionaryToObjectTest, OnlyTheFirstBadFieldInSlotOrderIsReported) {
    EXPECT_EQ(Words(R"({"requiredU32": "x", "multiBool": "x", "optionalS32": "x", "type": "everyType"})"),
              std::string(notConvertedMulti) + ". Bad multi field: multiBool");
}

TEST_F(DictionaryToObjectTest, UnknownNamesAreIgnoredWhereverTheyStand) {
    ref<sornschema::EveryType> object = ObjectOf<sornschema::EveryType>(
        R"({"aaa": {}, "optionalS32": 5, "optionalS3": "x", "type": "everyType", "zzz": [[null]]})");
    EXPECT_EQ(object->optionalS32, 5);
    EXPECT_EQ(object->optionalS32_isSet, 1);
    EXPECT_EQ(object->optionalU32_isSet, 0);
}

TEST_F(DictionaryToObjectTest, PresenceFollowsTheEntries) {
    ref<SornObject> object =
        Object(R"({"type": "everyType", "optionalString": "", "optionalObject": {"type": "everyType"}})");
    EXPECT_TRUE(object->FPresent(*FindField(everyType, "optionalString")));
    EXPECT_TRUE(object->FPresent(*FindField(everyType, "optionalObject")));
    EXPECT_FALSE(object->FPresent(*FindField(everyType, "optionalStringId")));
    EXPECT_FALSE(object->FPresent(*FindField(everyType, "optionalKnownDict")));
    EXPECT_FALSE(object->FPresent(*FindField(everyType, "optionalLazy")));
}

TEST_F(DictionaryToObjectTest, OnlyTheFirstOfSeveralValuesOfANameCounts) {
    ref<Dictionary> dictionary = Parse(R"({"type": "everyType", "multiS32": 1})");
    dictionary->Add(RoxString("multiS32"), RoxString("2"));
    dictionary->Add(RoxString("type"), RoxString("ad"));
    ref<SornObject> object;
    RoxString error;
    ASSERT_TRUE(Context().DictionaryToSornObject(dictionary, 0, object, error));
    EXPECT_EQ(ShowField(*object, *FindField(everyType, "multiS32")), std::vector<std::string>{"1"});
}

TEST_F(DictionaryToObjectTest, AnyDictAndLazyFieldsShareWhatTheyAreGiven) {
    ref<Dictionary> dictionary =
        Parse(R"({"type": "everyType", "optionalAnyDict": {}, "multiAnyDict": [{}]})");
    ref<LazyDict> lazy = LazyDict::FromJsonString(&pool, RoxString("{}"), 7);
    dictionary->Add(RoxString("optionalLazy"), lazy);
    ref<SornObject> made;
    RoxString error;
    ASSERT_TRUE(Context().DictionaryToSornObject(dictionary, 0, made, error));
    const sornschema::EveryType& object = static_cast<sornschema::EveryType&>(*made);
    EXPECT_EQ(object.optionalLazy, lazy);
    EXPECT_EQ(object.optionalAnyDict->GetDictionary(),
              dictionary->GetDictionary(RoxString("optionalAnyDict")));
    dictionary->GetDictionary(RoxString("optionalAnyDict"))->Add(RoxString("later"), RoxString("x"));
    EXPECT_EQ(Text(object.optionalAnyDict->GetString("later", 0)), "x");
}

TEST_F(DictionaryToObjectTest, LazyBodiesTakeTheVersionAndAreNotConverted) {
    std::string json =
        R"({"type": "everyTypeCompanion", "known": {"type": "everyType", "optionalLazy": {"type": "nope"}}})";
    EXPECT_EQ(
        Words(json, 9),
        "Required field not set: requiredAnyDict. Can't unmarshal inner Dictionary. Bad single field: known");
    ref<LazyDict> lazy =
        ObjectOf<sornschema::EveryType>(R"({"type": "everyType", "optionalLazy": {"type": "nope"}})")
            ->optionalLazy;
    EXPECT_EQ(lazy->GetVersion(), OrvoVersion(0));
    ref<SornObject> object = sornschema::EveryType::Factory(&pool);
    RoxString error;
    ref<DictValue> value(Parse("{}"));
    ASSERT_TRUE(
        Context().DictToSingleField(FindField(everyType, "optionalLazy"), value, object.get(), error, 9));
    EXPECT_EQ(ShowField(*object, *FindField(everyType, "optionalLazy")),
              std::vector<std::string>{"lazy 4 at 9"});
}

TEST_F(DictionaryToObjectTest, WordsOfNestedObjectsGrowFromTheInsideOut) {
    std::string json =
        R"({"type": "everyTypeCompanion", "child": {"type": "everyTypeCompanion", "children": [)"
        R"({"type": "everyTypeCompanion"}, {"type": "everyTypeCompanion", "companionId": "9"}]}})";
    EXPECT_EQ(Words(json, 0, "old;"),
              "old;wrong prefix on idbad prefix: 9Cannot convert value for the field.. Bad single field: "
              "companionId"
              " Can't convert inner Dictionary to SornObject. Bad multi field: children"
              ". Can't unmarshal inner Dictionary. Bad single field: child");
}

TEST_F(DictionaryToObjectTest, IdsOfARealRecord) {
    const StructInfo& recording = *Schema::FindStruct(463);
    ref<SornObject> object = Object(R"({"type": "recording", "recordingId": "vuka:rc.1234"})");
    EXPECT_EQ(ShowField(*object, *FindField(recording, "recordingId")), std::vector<std::string>{"1234"});
    EXPECT_EQ(Words(R"({"type": "recording", "recordingId": "1234"})"),
              "wrong prefix on idbad prefix: 1234Cannot convert value for the field.. Bad single field: "
              "recordingId");
}

struct VersionRow {
    int version;
    const char* raw;  // the one raw byte
    size_t nRaw;
};

TEST_F(DictionaryToObjectTest, VersionsOutOfRangeEndInOneRawByte) {
    const VersionRow rows[] = {{6, "\x06", 1},  {43, "+", 1},   {1, "\x01", 1},
                               {-1, "\xFF", 1}, {256, "\0", 1}, {263, "\x07", 1}};
    for (const VersionRow& row : rows) {
        std::string words =
            "old;Unmarshaling to SornObject: given orvo version is out of range used in code generation: ";
        EXPECT_EQ(Words(R"({"type": "everyTypeCompanion"})", row.version, "old;"),
                  words + std::string(row.raw, row.nRaw));
    }
    EXPECT_NE(Object(R"({"type": "everyTypeCompanion"})", 7), nullptr);
    EXPECT_NE(Object(R"({"type": "everyTypeCompanion"})", 42), nullptr);
}

TEST_F(DictionaryToObjectTest, LowByteZeroGoesWhenWordsFollow) {
    ref<SornObject> object = sornschema::EveryTypeCompanion::Factory(&pool);
    ref<DictValue> value(Parse(R"({"type": "everyTypeCompanion"})"));
    RoxString error;
    const FieldInfo* child = FindField(sornschema::EveryTypeCompanion::structInfoG, "child");
    EXPECT_FALSE(Context().DictToSingleField(child, value, object.get(), error, 256));
    EXPECT_EQ(Text(error),
              "Unmarshaling to SornObject: given orvo version is out of range used in code generation: "
              ". Can't unmarshal inner Dictionary");
}

TEST_F(DictionaryToObjectTest, RequiredFieldsCountOnlyWithAVersion) {
    EXPECT_EQ(Words(R"({"type": "everyType"})", 42, "old;"), "old;Required field not set: requiredAnyDict");
    EXPECT_EQ(Words(R"({"type": "everyTypePlain"})", 7), "Required field not set: plainId");
    EXPECT_NE(Object(R"({"type": "everyTypePlain"})", 0), nullptr);
}

TEST_F(DictionaryToObjectTest, SingleOperationsNeitherNameTheFieldNorSetItsPresence) {
    ref<SornObject> object = sornschema::EveryType::Factory(&pool);
    const FieldInfo* field = FindField(everyType, "optionalS32");
    RoxString error("old;");
    ref<DictValue> bad(new (&pool) StringValue(RoxString("x")));
    EXPECT_FALSE(Context().DictToSingleField(field, bad, object.get(), error, 0));
    EXPECT_EQ(Text(error), notConverted);
    error = "old;";
    EXPECT_FALSE(Context().DictToSingleField(field, nullptr, object.get(), error, 0));
    EXPECT_EQ(Text(error), notString);
    ref<DictValue> good(new (&pool) StringValue(RoxString("5")));
    error = "old;";
    EXPECT_TRUE(Context().DictToSingleField(field, good, object.get(), error, 0));
    EXPECT_EQ(Text(error), "old;");
    EXPECT_EQ(ShowField(*object, *field), std::vector<std::string>{"5"});
    EXPECT_FALSE(object->FPresent(*field));
}

TEST_F(DictionaryToObjectTest, AFailedInnerObjectLeavesTheFieldAsItWas) {
    ref<sornschema::EveryTypeCompanion> object = ObjectOf<sornschema::EveryTypeCompanion>(
        R"({"type": "everyTypeCompanion", "child": {"type": "everyTypeCompanion"}})");
    ref<SornObject> before = object->child;
    const FieldInfo* child = FindField(sornschema::EveryTypeCompanion::structInfoG, "child");
    RoxString error;
    ref<DictValue> bad(Parse(R"({"type": "everyTypeCompanion", "number": "x"})"));
    EXPECT_FALSE(Context().DictToSingleField(child, bad, object.get(), error, 0));
    EXPECT_EQ(Text(error),
              "Cannot convert field. Bad single field: number. Can't unmarshal inner Dictionary");
    EXPECT_EQ(object->child, before);
    ref<DictValue> good(Parse(R"({"type": "everyTypeCompanion", "number": 3})"));
    EXPECT_TRUE(Context().DictToSingleField(child, good, object.get(), error, 0));
    EXPECT_NE(object->child, before);
}

TEST_F(DictionaryToObjectTest, UnknownDataTypesAreNamedByOneRawByte) {
    ref<SornObject> object = sornschema::EveryType::Factory(&pool);
    ref<DictValue> value(new (&pool) StringValue(RoxString("5")));
    for (unsigned type = 21; type < 32; ++type) {
        FieldInfo field = *FindField(everyType, "optionalS32");
        field.dataType = type & 0x1F;
        RoxString error("old;");
        EXPECT_FALSE(Context().DictToSingleField(&field, value, object.get(), error, 0));
        EXPECT_EQ(Text(error), std::string("old;unhandled data type: ") + static_cast<char>(type));
        error = "old;";
        EXPECT_FALSE(Context().DictToMultiField(&field, value, object.get(), error, 0));
        EXPECT_EQ(Text(error), std::string("old;unhandled data type: ") + static_cast<char>(type));
    }
}

TEST_F(DictionaryToObjectTest, TheSixtyFiveThousandFiveHundredAndThirtySixthElementIsRefused) {
    struct Row {
        const char* field;
        const char* json;
    };
    for (const Row& row :
         {Row{"multiBool", "true"}, Row{"multiU64", "7"}, Row{"multiString", "x"}, Row{"multiAnyDict", "{}"},
          Row{"multiObject", R"({"type": "everyTypeCompanion"})"}}) {
        SCOPED_TRACE(row.field);
        ref<SornObject> object = sornschema::EveryType::Factory(&pool);
        ref<Dictionary> holder = Parse(std::string(R"({"v": )") + row.json + "}");
        ref<DictValue> value = holder->Get(RoxString("v"));
        const FieldInfo* field = FindField(everyType, row.field);
        RoxString error("old;");
        for (int i = 0; i < 65535; ++i) {
            ASSERT_TRUE(Context().DictToMultiField(field, value, object.get(), error, 0))
                << i << " " << error.Utf8();
        }
        EXPECT_EQ(Text(error), "old;");
        EXPECT_FALSE(Context().DictToMultiField(field, value, object.get(), error, 0));
        EXPECT_EQ(Text(error), "old;Too many elements in field");
        EXPECT_EQ(ShowField(*object, *field).size(), 65535u);
    }
}

TEST_F(DictionaryToObjectTest, AllMemoryComesBackAfterAFailureDeepInside) {
    ref<Dictionary> dictionary = Parse(
        R"({"type": "everyTypeCompanion", "label": "a label that is long enough for a block of its own", "children": [)"
        R"({"type": "everyTypeCompanion", "dict": {}}, {"type": "everyTypeCompanion", "child": {"type": "everyTypeCompanion", "number": "x"}}]})");
    size_t before = pool.GetUsedBytes();
    for (int i = 0; i < 3; ++i) {
        EXPECT_EQ(Words(dictionary),
                  "Cannot convert field. Bad single field: number. Can't unmarshal inner Dictionary. Bad "
                  "single field: child"
                  " Can't convert inner Dictionary to SornObject. Bad multi field: children");
        EXPECT_EQ(pool.GetUsedBytes(), before);
    }
}

TEST_F(DictionaryToObjectTest, LazyMultiElements) {
    ref<ArrayValue> array(new (&pool) ArrayValue);
    ref<LazyDict> lazy = LazyDict::FromJsonString(&pool, RoxString("{}"), 7);
    array->Add(lazy);
    array->Add(ref<NullValue>(new (&pool) NullValue));
    array->Add(Parse("{}"));
    ref<Dictionary> dictionary = Parse(R"({"type": "everyType"})");
    dictionary->Add(RoxString("multiLazy"), array);
    ref<SornObject> object;
    RoxString error;
    ASSERT_TRUE(Context().DictionaryToSornObject(dictionary, 0, object, error)) << error.Utf8();
    EXPECT_EQ(ShowField(*object, *FindField(everyType, "multiLazy")),
              (std::vector<std::string>{"lazy 1 at 7", "null", "lazy 4 at 0"}));
}

}  // namespace sorntest
