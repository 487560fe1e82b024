// The parts of a read called directly: the numbering of objects, the words of each part, dictionaries.

#include "rox/RoxGenericIntArray.h"
#include "sorn/dict/Dict.h"
#include "sorn/model/Schema.h"
#include "sornschema/EveryType.h"
#include "sornschema/EveryTypeCompanion.h"
#include "sornschema/Success.h"
#include "typedjson/ReaderFixture.h"

namespace sorntest {

using namespace sorn;
using sornschema::EveryType;
using sornschema::EveryTypeCompanion;

class PartsReadTest : public ReaderFixture {
 protected:
    using Part = bool (JsonSornObject::*)(int, InputPointerBytesource&, const FieldInfo*, ref<SornObject>,
                                          RoxString&);

    static const FieldInfo* Field(const std::string& name) {
        const StructInfo& info = EveryType::structInfoG;
        for (int slot = 0; slot < info.nFields; ++slot) {
            const FieldInfo& field = info.vFieldInfo[slot];
            if (!field.FHole() && name == info.FieldName(field)) return &field;
        }
        return nullptr;
    }
    ref<EveryType> New() { return ref<EveryType>(static_cast<EveryType*>(EveryType::Factory(&pool).get())); }

    /// What a part leaves of a text, or the words with which it refuses it.
    std::string Run(Part part, const std::string& text, const FieldInfo* field,
                    const ref<EveryType>& object) {
        const ExactText exact(text);
        InputPointerBytesource cursor(exact.Bytes(), exact.Length());
        JsonSornObject context(&pool);
        RoxString words("before");
        if (!(context.*part)(0, cursor, field, object, words)) return std::string(words.View());
        EXPECT_EQ(words.View(), "before");
        return "rest " + std::string(reinterpret_cast<const char*>(cursor.pCurrentM),
                                     static_cast<size_t>(cursor.pEndM - cursor.pCurrentM));
    }
};

TEST_F(PartsReadTest, WordsOfEachPart) {
    const FieldInfo* const none = nullptr;
    const std::string single = " failed to UnmarshalOneSingleValue in ReadFieldValue";
    const std::string multi = " failed to UnmarshalOneMultiValue in AVReadFieldValue";
    const std::string element = " Failed to parse an array element.";
    const struct {
        Part part;
        const FieldInfo* field;
        const char* text;
        std::string result;
    } cases[] = {
        {&JsonSornObject::ReadFieldValue, Field("optionalS32"), " 5,", "rest ,"},
        {&JsonSornObject::ReadFieldValue, Field("optionalS32"), "x", "before" + single},
        {&JsonSornObject::ReadFieldValue, Field("optionalS32"), "[]x", "rest x"},
        {&JsonSornObject::ReadFieldValue, Field("optionalS32"), "[1]", "before" + multi + element},
        {&JsonSornObject::ReadFieldValue, Field("multiS32"), "5]", "rest ]"},
        {&JsonSornObject::ReadFieldValue, Field("multiS32"), "x", "before" + multi + element},
        {&JsonSornObject::ReadFieldValue, none, "{\"a\": [1]} ", "rest  "},
        {&JsonSornObject::ReadFieldValue, none, "\"\\q\"", "before" + single},
        {&JsonSornObject::ReadFieldValue, none, "[\"\\q\"]", "before" + multi + element},
        {&JsonSornObject::ReadFieldValue, none, "{", "JSON object does not end with '}'." + single},
        {&JsonSornObject::ArrayValueFromJson, Field("multiS32"), "[1, 2]]", "rest ]"},
        {&JsonSornObject::ArrayValueFromJson, Field("multiS32"), "1, 2", "rest , 2"},
        {&JsonSornObject::ArrayValueFromJson, Field("multiS32"), " ]", "rest ]"},
        {&JsonSornObject::ArrayValueFromJson, Field("multiS32"), "[1 2]", "Array must end with ']'."},
        {&JsonSornObject::ArrayValueFromJson, Field("multiS32"), "x", "before" + multi + element},
        {&JsonSornObject::ArrayValueFromJson, none, "[1, {}]x", "rest x"},
        {&JsonSornObject::ArrayValueFromJson, none, "a b", "rest  b"},
        {&JsonSornObject::ArrayValueFromJson, none, "]", "rest ]"},
        {&JsonSornObject::ArrayValueFromJson, none, "[[1", "Array must end with ']'." + element},
        {&JsonSornObject::ArrayValueReadFieldValue, Field("multiS32"), " 1, 2", "rest , 2"},
        {&JsonSornObject::ArrayValueReadFieldValue, Field("multiS32"), "[1, 2], 3", "rest , 3"},
        {&JsonSornObject::ArrayValueReadFieldValue, Field("multiS32"), "x", "before" + multi},
        {&JsonSornObject::ArrayValueReadFieldValue, Field("multiS32"), "[x]", "before" + multi + element},
        {&JsonSornObject::ArrayValueReadFieldValue, none, "[1] 2", "rest  2"},
        {&JsonSornObject::ArrayValueReadFieldValue, none, "[\"\\q\"]", "before" + multi + element},
        {&JsonSornObject::ArrayValueReadFieldValue, none, "\"\\q\"", "before" + multi},
        {&JsonSornObject::UnmarshalOneSingleValue, Field("optionalS32"), "7,", "rest ,"},
        {&JsonSornObject::UnmarshalOneSingleValue, Field("optionalS32"), "x", "before"},
        {&JsonSornObject::UnmarshalOneSingleValue, Field("multiS32"), "7", "before"},
        {&JsonSornObject::UnmarshalOneSingleValue, Field("optionalLazy"), "7",
         "JSON object does not start with '{'. Single SORN_DATA_TYPE_KNOWN_DICT_AS_LAZY can't Unmarshal"},
        {&JsonSornObject::UnmarshalOneSingleValue, none, " [1]", "rest [1]"},
        {&JsonSornObject::UnmarshalOneSingleValue, none, " {} ", "rest  "},
        {&JsonSornObject::UnmarshalOneSingleValue, none, "\"x", "before"},
        {&JsonSornObject::UnmarshalOneMultiValue, Field("multiS32"), "7,", "rest ,"},
        {&JsonSornObject::UnmarshalOneMultiValue, Field("multiS32"), "[7]", "before"},
        {&JsonSornObject::UnmarshalOneMultiValue, Field("optionalS32"), "7", "before"},
        {&JsonSornObject::UnmarshalOneMultiValue, Field("multiKnownDict"), "7",
         "before failed to Unmarshal KNOWN_DICT in Multi"},
        {&JsonSornObject::UnmarshalOneMultiValue, Field("multiObject"), "7",
         "before failed to Unmarshal TYPE_OBJECT in Multi"},
        {&JsonSornObject::UnmarshalOneMultiValue, Field("multiLazy"), "7",
         "JSON object does not start with '{'. Multi SORN_DATA_TYPE_KNOWN_DICT_AS_LAZY can't unmarshal"},
    };
    for (const auto& each : cases)
        EXPECT_EQ(Run(each.part, each.text, each.field, New()), each.result) << each.text;
}

TEST_F(PartsReadTest, UnknownDataTypes) {
    FieldInfo field{};
    for (unsigned type : {21u, 22u, 31u}) {
        for (unsigned arity : {0u, 1u, 2u, 3u}) {
            field.dataType = type & 31;
            field.arity = arity & 3;
            EXPECT_EQ(Run(&JsonSornObject::UnmarshalOneSingleValue, "1", &field, New()),
                      "Single: unhandled data type");
            EXPECT_EQ(Run(&JsonSornObject::UnmarshalOneMultiValue, "1", &field, New()),
                      "Multi: unhandled data type");
        }
    }
}

TEST_F(PartsReadTest, ValuesGoIntoTheObjectAndLeavePresenceAlone) {
    ref<EveryType> object = New();
    EXPECT_EQ(Run(&JsonSornObject::ReadFieldValue, "5", Field("optionalS32"), object), "rest ");
    EXPECT_EQ(object->optionalS32, 5);
    EXPECT_EQ(object->optionalS32_isSet, 0);
    EXPECT_EQ(Run(&JsonSornObject::UnmarshalOneMultiValue, "6", Field("multiS32"), object), "rest ");
    EXPECT_EQ(Run(&JsonSornObject::ArrayValueFromJson, "[7, 8, x]", Field("multiS32"), object),
              "before failed to UnmarshalOneMultiValue in AVReadFieldValue Failed to parse an array member.");
    EXPECT_EQ(object->multiS32.GetCount(), 3u);
    EXPECT_EQ(Run(&JsonSornObject::ReadFieldValue, "x", Field("optionalS32"), object),
              "before failed to UnmarshalOneSingleValue in ReadFieldValue");
    EXPECT_EQ(object->optionalS32, 5);
}

// Without a list of a first pass every object is met for the first time: it is noted, and nothing is built.
TEST_F(PartsReadTest, FirstVisitsBuildNothing) {
    const std::string text = R"({"child": {"type": "success"}, "number": 3, "type": "everyTypeCompanion"})";
    const ExactText exact(text);
    JsonSornObject context(&pool);
    RoxString words;
    for (int round = 0; round < 2; ++round) {
        InputPointerBytesource cursor(exact.Bytes(), exact.Length());
        ref<SornObject> object = New();
        EXPECT_TRUE(context.Unmarshal(0, cursor, &EveryTypeCompanion::structInfoG, &object, words));
        EXPECT_EQ(object, nullptr);
        EXPECT_EQ(cursor.pCurrentM, cursor.pEndM);
    }
    InputPointerBytesource cursor(exact.Bytes(), exact.Length());
    ref<EveryType> object = New();
    object->optionalKnownDict = New();
    object->optionalObject = New();
    EXPECT_TRUE(context.ReadFieldValue(0, cursor, Field("optionalKnownDict"), object, words));
    EXPECT_EQ(object->optionalKnownDict, nullptr);
    InputPointerBytesource again(exact.Bytes(), exact.Length());
    EXPECT_TRUE(context.ReadFieldValue(0, again, Field("optionalObject"), object, words));
    EXPECT_EQ(object->optionalObject, nullptr);
    InputPointerBytesource bad(exact.Bytes(), exact.Length() - 1);
    EXPECT_FALSE(context.Unmarshal(0, bad, &EveryTypeCompanion::structInfoG, nullptr, words));
    EXPECT_EQ(words.View(), "JSON object does not end with '}'.");
}

// A first pass by hand, and then the second pass from the middle of the text.
TEST_F(PartsReadTest, LaterVisitsTakeTheStructThatWasNoted) {
    JsonSornObject context(&pool);
    RoxString words;
    ref<SornObject> whole;
    const std::string text =
        R"({"type": "success", "a": {"number": 5, "type": "everyTypeCompanion"}, "b": {}})";
    const ExactText exact(text);
    ASSERT_TRUE(context.JsonToSornObject(exact.Bytes(), static_cast<int>(exact.Length()), 0, &whole, words));
    // Three objects were met, in both passes. The next one is new, and what follows it is not affected.
    const std::string value = R"({"type": "success"})";
    const ExactText exactValue(value);
    InputPointerBytesource cursor(exactValue.Bytes(), exactValue.Length());
    ref<SornObject> object = New();
    EXPECT_TRUE(context.Unmarshal(7, cursor, &sornschema::Success::structInfoG, &object, words));
    EXPECT_EQ(object, nullptr);
    // A text whose second pass ends early leaves numbers that are known.
    const std::string bad =
        R"({"type": "everyTypeCompanion", "number": "x", "known": {"number": 5, "type": "everyTypeCompanion"}})";
    const ExactText exactBad(bad);
    ASSERT_FALSE(
        context.JsonToSornObject(exactBad.Bytes(), static_cast<int>(exactBad.Length()), 0, &whole, words));
    EXPECT_EQ(whole, nullptr);
    ref<EveryType> holder = New();
    words = RoxString();
    const std::string inner = R"({"number": 6, "child": {}})";
    const ExactText exactInner(inner);
    InputPointerBytesource innerCursor(exactInner.Bytes(), exactInner.Length());
    EXPECT_TRUE(context.ReadFieldValue(0, innerCursor, Field("optionalKnownDict"), holder, words));
    ASSERT_NE(holder->optionalKnownDict, nullptr);
    const EveryTypeCompanion& companion = static_cast<EveryTypeCompanion&>(*holder->optionalKnownDict);
    EXPECT_EQ(companion.number, 6);
    EXPECT_EQ(companion.child, nullptr) << "a third object, which the list does not have";
}

TEST_F(PartsReadTest, AFailureInsideLeavesTheCallersObject) {
    JsonSornObject context(&pool);
    RoxString words;
    ref<SornObject> whole;
    const std::string bad =
        R"({"type": "everyTypeCompanion", "number": "x", "child": {"number": 5}, "known": {}})";
    const ExactText exactBad(bad);
    ASSERT_FALSE(
        context.JsonToSornObject(exactBad.Bytes(), static_cast<int>(exactBad.Length()), 0, &whole, words));
    ref<EveryType> holder = New();
    ref<SornObject> before = New();
    holder->requiredObject = static_cast<EveryTypeCompanion*>(EveryTypeCompanion::Factory(&pool).get());
    const ref<SornObject> kept = holder->requiredObject;
    words = RoxString();
    const std::string inner = R"({"number": 6, "child": {"number": "x"}})";
    const ExactText exactInner(inner);
    InputPointerBytesource cursor(exactInner.Bytes(), exactInner.Length());
    EXPECT_FALSE(context.ReadFieldValue(0, cursor, Field("requiredObject"), holder, words));
    EXPECT_EQ(words.View(), " failed to UnmarshalOneSingleValue in ReadFieldValue");
    EXPECT_EQ(holder->requiredObject, kept);
}

struct AnyCase {
    const char* text;
    const char* json;   // of the map, or null
    const char* words;  // of the form with words
};

const AnyCase vAnyG[] = {
    {R"({"a": 1})", R"({"a": "1"})", ""},
    {R"( {"a": 1, b : "two"} x)", R"({"a": "1", "b": "two"})", ""},
    {R"({"a": {"b": {"c": d}}})", R"({"a": {"b": {"c": "d"}}})", ""},
    {R"({"a": [1, {"b": 2}, {"c": [3]}], "a": 4})", R"({"a": ["1", {"b": "2"}, {"c": "3"}, "4"]})", ""},
    {R"({"a": ["p" "q"]})", R"({"a": ["p", "q"]})", ""},
    {R"({"a": [{"b": 1} {"b": 2}]})", R"({"a": [{"b": "1"}, {"b": "2"}]})", ""},
    {R"({"a": []})", R"({"a": ""})", ""},
    {R"({"a": [ ] , "b":})", R"({"a": "", "b": ""})", ""},
    {R"({"a": [p,]})", R"({"a": ["p", ""]})", ""},
    {R"({"a": [,]})", R"({"a": ["", ""]})", ""},
    {R"({"a": "\u00e9"})", R"({"a": "00e9"})", ""},
    {R"({:1})", R"({"": "1"})", ""},
    {"{}", nullptr, "bad field in AnyDictValue"},
    {"{ }", nullptr, "bad field in AnyDictValue"},
    {R"({"a": 1,})", nullptr, "bad field in AnyDictValue"},
    {R"({"a" 1})", nullptr, "bad field in AnyDictValue"},
    {R"({"\q": 1})", nullptr, "bad field in AnyDictValue"},
    {R"({"a": "\q"})", nullptr, "bad field in AnyDictValue"},
    {R"({"a": {}})", nullptr, "bad field in AnyDictValue"},
    {R"({"a": {"b": 1)", nullptr, "bad field in AnyDictValue"},
    {R"({"a": [[1]]})", nullptr, "bad field in AnyDictValue"},
    {R"({"a": [1, [2]]})", nullptr, "bad field in AnyDictValue"},
    {R"({"a": [1 : 2]})", nullptr, "bad field in AnyDictValue"},
    {R"({"a": [1)", nullptr, "bad field in AnyDictValue"},
    {R"({"a": [)", nullptr, "bad field in AnyDictValue"},
    {R"({"a": 1)", nullptr, "expected , or }"},
    {R"({"a": 1 "b": 2})", nullptr, "expected , or }"},
    {R"({"a": 1])", nullptr, "expected , or }"},
    {"scalar", nullptr, "before"},
    {"", nullptr, "before"},
    {"[1]", nullptr, "before"},
    {"\"x", nullptr, "failed to read string in UnmarshalAnyDictValue"},
};

TEST_F(PartsReadTest, AnyDicts) {
    for (const AnyCase& each : vAnyG) {
        SCOPED_TRACE(each.text);
        WithCursors(each.text, [&](InputPointerBytesource& cursor) {
            ref<Dict> dict;
            RoxString words("before");
            EXPECT_EQ(JsonSornObject(&pool).UnmarshalAnyDict(0, cursor, &dict, words), each.json != nullptr);
            EXPECT_EQ(words.View(), each.json != nullptr ? "before" : each.words);
            if (each.json != nullptr) {
                EXPECT_EQ(dict->ToString(false).View(), each.json);
            }
        });
        WithCursors(each.text, [&](InputPointerBytesource& cursor) {
            ref<Dict> dict;
            EXPECT_EQ(JsonSornObject(&pool).UnmarshalAnyDict(cursor, &dict), each.json != nullptr);
        });
    }
}

TEST_F(PartsReadTest, AnyDictValuesAndFields) {
    const ExactText exact(R"(5 {"a": 1} "b": [2, 3] , "c": 4 "c" 5)");
    InputPointerBytesource cursor(exact.Bytes(), exact.Length());
    JsonSornObject context(&pool);
    dictvalue::Type type = dictvalue::ARRAY;
    RoxString text;
    RoxString words;
    ref<Dict> dict;
    EXPECT_TRUE(context.UnmarshalAnyDictValue(0, cursor, type, text, dict, words));
    EXPECT_EQ(type, dictvalue::STRING);
    EXPECT_EQ(text.View(), "5");
    EXPECT_EQ(dict, nullptr);
    EXPECT_TRUE(context.UnmarshalAnyDictValue(0, cursor, type, text, dict, words));
    EXPECT_EQ(type, dictvalue::LAZY_DICT);
    EXPECT_TRUE(context.UnmarshalAnyDictField(0, cursor, dict, words));
    cursor.FTake(',');
    EXPECT_TRUE(context.UnmarshalAnyDictField(0, cursor, dict, words));
    EXPECT_EQ(dict->ToString(false).View(), R"({"a": "1", "b": ["2", "3"], "c": "4"})");
    EXPECT_FALSE(context.UnmarshalAnyDictField(0, cursor, dict, words));
    EXPECT_EQ(words.View(), "UnmarshalAnyDictField expected :");
    const struct {
        const char* text;
        const char* words;
    } bad[] = {
        {"\"x", "UnmarshalAnyDictField can't read fieldName"},
        {"", "UnmarshalAnyDictField expected :"},
        {"a: \"x", "bad value in AnyDictField"},
        {"a: {}", "bad value in AnyDictField"},
        {"a: {b: 1", "bad value in AnyDictField"},
        {"a: [[", "bad value in AnyDictField"},
    };
    for (const auto& each : bad) {
        const ExactText exactBad(each.text);
        InputPointerBytesource badCursor(exactBad.Bytes(), exactBad.Length());
        EXPECT_FALSE(context.UnmarshalAnyDictField(0, badCursor, dict, words));
        EXPECT_EQ(words.View(), each.words) << each.text;
    }
}

}  // namespace sorntest
