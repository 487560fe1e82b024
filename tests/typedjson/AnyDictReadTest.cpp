// Dictionaries without a schema, by the operations that read them. Invariants for untrusted input: 1, 9, 13.

#include "sorn/dict/Dict.h"
#include "typedjson/ReaderFixture.h"

namespace sorntest {

using namespace sorn;

using AnyDictReadTest = ReaderFixture;

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

TEST_F(AnyDictReadTest, Maps) {
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

TEST_F(AnyDictReadTest, ValuesAndFields) {
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