// The parts of a read called directly: the numbering of objects, the words of each part.

#include "rox/RoxGenericIntArray.h"
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
        {&JsonSornObject::ReadFieldValue, Field("optionalS32"), "[]x", "before" + multi + element},
        {&JsonSornObject::ReadFieldValue, Field("optionalS32"), "[[]]", "before" + multi + element + element},
        {&JsonSornObject::ReadFieldValue, Field("multiS32"), "[]x", "rest x"},
        {&JsonSornObject::ReadFieldValue, none, "[]x", "rest x"},
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
        {&JsonSornObject::ArrayValueFromJson, Field("optionalS32"), "[]", "before" + multi + element},
        {&JsonSornObject::ArrayValueFromJson, Field("optionalS32"), "]", "rest ]"},
        {&JsonSornObject::ArrayValueFromJson, none, "[1, {}]x", "rest x"},
        {&JsonSornObject::ArrayValueFromJson, none, "a b", "rest  b"},
        {&JsonSornObject::ArrayValueFromJson, none, "]", "rest ]"},
        {&JsonSornObject::ArrayValueFromJson, none, "[[1", "Array must end with ']'." + element},
        {&JsonSornObject::ArrayValueReadFieldValue, Field("multiS32"), " 1, 2", "rest , 2"},
        {&JsonSornObject::ArrayValueReadFieldValue, Field("multiS32"), "[1, 2], 3", "rest , 3"},
        {&JsonSornObject::ArrayValueReadFieldValue, Field("multiS32"), "x", "before" + multi},
        {&JsonSornObject::ArrayValueReadFieldValue, Field("multiS32"), "[x]", "before" + multi + element},
        {&JsonSornObject::ArrayValueReadFieldValue, Field("optionalS32"), "[]", "before" + multi + element},
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

// An any-dict value counts as one object and is noted nowhere: the number of what follows lies behind the
// list, which makes it no first visit.
TEST_F(PartsReadTest, NumbersRunPastTheListWithAnyDicts) {
    JsonSornObject context(&pool);
    RoxString words;
    ref<EveryType> holder = New();
    const ExactText exact(R"({"a": 1}{"number": 6, "child": {}}{"type": "success"})");
    InputPointerBytesource cursor(exact.Bytes(), exact.Length());
    ASSERT_TRUE(context.ReadFieldValue(0, cursor, Field("optionalAnyDict"), holder, words));
    ref<SornObject> object;
    ASSERT_TRUE(context.Unmarshal(0, cursor, &EveryTypeCompanion::structInfoG, &object, words));
    ASSERT_NE(object, nullptr);
    const EveryTypeCompanion& companion = static_cast<EveryTypeCompanion&>(*object);
    EXPECT_EQ(companion.number, 6);
    EXPECT_NE(companion.child, nullptr);
    holder->requiredKnownDict = New();
    ASSERT_TRUE(context.ReadFieldValue(0, cursor, Field("requiredKnownDict"), holder, words));
    EXPECT_EQ(holder->requiredKnownDict, nullptr);
    EXPECT_EQ(cursor.pCurrentM, cursor.pEndM);
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

}  // namespace sorntest
