// What each data type takes, the words of what is refused, and the shapes of values.

#include <vector>

#include "sorn/model/Schema.h"
#include "typedjson/ReaderFixture.h"

namespace sorntest {

using namespace sorn;

class FieldReadTest : public ReaderFixture {
 protected:
    static std::string Record(const std::string& members) {
        return "{" + members + (members.empty() ? "" : ", ") + "\"type\": \"everyType\"}";
    }
    static std::string Member(const std::string& field, const std::string& value) {
        return "\"" + field + "\": " + value;
    }
    /// What a record shows under a field, memory and stream alike; the words when it is refused.
    std::string Shown(const std::string& members, const std::string& field) {
        const std::string text = Record(members);
        const ReadOutcome outcome = Read(text);
        EXPECT_EQ(ReadStream(text, 3), outcome) << text;
        EXPECT_EQ(ReadInMemory(text), outcome) << text;
        if (!outcome.isRead) return "refused" + outcome.words;
        size_t begin = outcome.shown.find(";" + field);
        if (begin == std::string::npos) begin = outcome.shown.find("{" + field);
        if (begin == std::string::npos) return "?";
        begin += 1 + field.size();
        return outcome.shown.substr(begin, outcome.shown.find(';', begin) - begin);
    }
};

struct Accepted {
    const char* type;  // behind "optional", "required" and "multi" in the names of everyType's fields
    const char* json;
    const char* shown;
};

const Accepted vAcceptedG[] = {
    {"Bool", "true", "true"},
    {"Bool", "\"false\"", "false"},
    {"Bytes", "\"QUI=\"", "bytes 4142"},
    {"Bytes", "\"Q\"", "bytes "},
    {"Bytes", "\"\"", "bytes "},
    {"Channel", "7", "7/-2"},
    {"Channel", "\"7-2\"", "7/2"},
    {"Currency", "\"USD.100\"", "USD/100"},
    {"Currency", "USD.100", "USD/100"},
    {"Date", "\"1970-01-02\"", "1"},
    {"Date", "1970-01-02", "1"},
    {"Date", "null", "0"},
    {"Date", "\"soon\"", "0"},
    {"DateTime", "\"1970-01-01 00:00:01\"", "1000"},
    {"DateTime", "\"2040-01-01 00:00:00\"", "2145916800000"},
    {"DateTime", "null", "0"},
    {"Time", "\"00:00:02\"", "2000"},
    {"Time", "null", "0"},
    {"AnyDict", R"({"b": "c"})", R"(dict {"b": "c"})"},
    {"AnyDict", R"({"a": {"b": "c"}})", R"(dict {"a": {"b": "c"}})"},
    {"AnyDict", R"({a:1,a:2})", R"(dict {"a": ["1", "2"]})"},
    {"AnyDict", R"({"a": []})", R"(dict {"a": ""})"},
    {"AnyDict", R"({"a": ["p"]})", R"(dict {"a": "p"})"},
    {"AnyDict", R"({"a": null})", R"(dict {"a": "null"})"},
    {"AnyDict", R"({"a": [p, ]})", R"(dict {"a": ["p", ""]})"},
    {"AnyDict", R"({"a": [{"x": 1}, {"y": 2}]})", R"(dict {"a": [{"x": "1"}, {"y": "2"}]})"},
    {"Enum", "\"red\"", "1"},
    {"Enum", "blue", "5"},
    {"Float", "1.5", "1.5"},
    {"Float", "\"-2e3x\"", "-2000"},
    {"IntId", "\"vuka:etc.12\"", "12"},
    {"IntId", "\"vuka:etc.word\"", "0"},
    {"LongId", "\"vuka:etc.rs.12\"", "281474976710668"},
    {"LongId", "\"vuka:etc.\"", "0"},
    {"StringId", "\"vuka:etc.a:b\"", "'a:b"},
    {"StringId", "\"vuka:etc.\"", "'"},
    {"S32", "-5", "-5"},
    {"S32", "\"12abc\"", "12"},
    {"S32", "\"  12\"", "12"},
    {"S64", "\"-9223372036854775808\"", "-9223372036854775808"},
    {"S64", "99999999999999999999", "9223372036854775807"},
    {"U32", "-1", "4294967295"},
    {"U64", "18446744073709551615", "18446744073709551615"},
    {"String", "\"a b\"", "'a b"},
    {"String", "bare", "'bare"},
    {"String", "null", "'null"},
    {"String", "17", "'17"},
    {"String", "\"\"", "'"},
    {"String", "\"\\u00e9\"", "'00e9"},
    {"Lazy", R"({ "a" :1 })", R"(lazy { "a" :1 })"},
    {"Lazy", "{}", "lazy {}"},
    {"KnownDict", R"({"number": 1})", "null"},
    {"KnownDict", R"({"type": "noSuchStruct"})", "null"},
    {"KnownDict", R"({"type": "success"})", "success{}"},
};

TEST_F(FieldReadTest, AcceptedValues) {
    for (const Accepted& each : vAcceptedG) {
        SCOPED_TRACE(std::string(each.type) + " " + each.json);
        const std::string json = each.json;
        const std::string one = "|" + std::string(each.shown);
        const bool hasByte = std::string("AnyDict Bytes KnownDict Lazy").find(each.type) == std::string::npos;
        const auto name = [&each](const char* arity) { return arity + std::string(each.type); };
        EXPECT_EQ(Shown(Member(name("optional"), json), name("optional")), (hasByte ? "!" : "") + one);
        EXPECT_EQ(Shown(Member(name("required"), json), name("required")), one);
        EXPECT_EQ(Shown(Member(name("multi"), json), name("multi")), one);
        EXPECT_EQ(Shown(Member(name("multi"), "[" + json + "]"), name("multi")), one);
        EXPECT_EQ(Shown(Member(name("multi"), "[ " + json + " , " + json + "]"), name("multi")), one + one);
        EXPECT_EQ(Shown(Member(name("multi"), "[]"), name("multi")), "");
        EXPECT_EQ(Shown(Member(name("multi"), json) + "," + Member(name("multi"), "[[" + json + "]]"),
                        name("multi")),
                  one + one);
    }
}

struct Refused {
    const char* type;
    const char* json;
    const char* singleWords;  // in front of the wrappers
    const char* multiWords;
};

const char* const knownMultiG = " failed to Unmarshal KNOWN_DICT in Multi";
const char* const objectMultiG = " failed to Unmarshal TYPE_OBJECT in Multi";
const char* const lazySingleG =
    "JSON object does not start with '{'. Single SORN_DATA_TYPE_KNOWN_DICT_AS_LAZY can't Unmarshal";
const char* const lazyMultiG =
    "JSON object does not start with '{'. Multi SORN_DATA_TYPE_KNOWN_DICT_AS_LAZY can't unmarshal";

/// What the writer gives for an id without a struct; no reader takes it.
const char* const noStructG =
    "\"X"
    "XX\"";

const Refused vRefusedG[] = {
    {"Bool", "TRUE", "", ""},
    {"Bool", "1", "", ""},
    {"Bool", "null", "", ""},
    {"Bool", "\"\"", "", ""},
    {"Channel", "null", "", ""},
    {"Channel", "\"invalid\"", "", ""},
    {"Currency", "\"5\"", "", ""},
    {"Currency", "null", "", ""},
    {"AnyDict", "5", "", ""},
    {"AnyDict", "{}", "", ""},
    {"AnyDict", "{ }", "", ""},
    {"AnyDict", R"({"a": 1,})", "", ""},
    {"AnyDict", R"({"a": [[1]]})", "", ""},
    {"Enum", "\"purple\"", "", ""},
    {"Enum", "null", "", ""},
    {"Enum", "1", "", ""},
    {"Enum", "\"INVALID_VALUE:3\"", "", ""},
    {"Float", "x", "", ""},
    {"Float", "\"\"", "", ""},
    {"IntId", "12", "", ""},
    {"IntId", "\"vuka:ety.12\"", "", ""},
    {"LongId", noStructG, "", ""},
    {"StringId", "null", "", ""},
    {"S32", "\"x\"", "", ""},
    {"S64", "null", "", ""},
    {"U32", "\"\"", "", ""},
    {"U64", "-", "", ""},
    {"KnownDict", "null", "", knownMultiG},
    {"KnownDict", "\"scalar\"", "", knownMultiG},
    {"KnownDict", R"({"type": "everyTypeCompanion", "number": "x"})", "", knownMultiG},
    {"Object", "null", "", objectMultiG},
    {"Object", R"({"number": "x", "multiS32": "x"})", "", objectMultiG},
    {"Lazy", "null", lazySingleG, lazyMultiG},
    {"Lazy", "5", lazySingleG, lazyMultiG},
};

TEST_F(FieldReadTest, RefusedValues) {
    for (const Refused& each : vRefusedG) {
        SCOPED_TRACE(std::string(each.type) + " " + each.json);
        for (const char* arity : {"optional", "required"}) {
            const std::string field = arity + std::string(each.type);
            EXPECT_EQ(
                Shown(Member(field, each.json), field),
                "refused" + std::string(each.singleWords) +
                    " failed to UnmarshalOneSingleValue in ReadFieldValue Failed to parse value for key " +
                    field);
        }
        const std::string field = "multi" + std::string(each.type);
        const std::string multi = "refused" + std::string(each.multiWords) +
                                  " failed to UnmarshalOneMultiValue in AVReadFieldValue";
        const std::string element = " Failed to parse an array element.";
        const std::string key = " Failed to parse value for key " + field;
        EXPECT_EQ(Shown(Member(field, each.json), field), multi + element + key);
        EXPECT_EQ(Shown(Member(field, "[" + std::string(each.json) + "]"), field), multi + element + key);
        EXPECT_EQ(Shown(Member(field, "[[[" + std::string(each.json) + "]]]"), field),
                  multi + element + element + element + key);
    }
}

// The object of this type is everyType itself in one field, so that its own table stands here.
TEST_F(FieldReadTest, ObjectsOfADeclaredStruct) {
    const std::string shown = "|everyTypeCompanion{child|null";  // Shown ends at the first semicolon
    EXPECT_EQ(Shown(Member("requiredObject", "{}"), "requiredObject"), shown);
    EXPECT_EQ(Shown(Member("requiredObject", R"({"type": "success"})"), "requiredObject"), shown);
    EXPECT_EQ(Shown(Member("requiredObject", R"({"type": "noSuchStruct", "x": 1})"), "requiredObject"),
              shown);
    EXPECT_EQ(Shown(Member("multiObject", R"([{"type": 1}])"), "multiObject"), shown);
    EXPECT_EQ(Shown(Member("optionalObject", R"({"type": "everyType"})"), "optionalObject"),
              "|everyType{multiAnyDict");
}

TEST_F(FieldReadTest, PresenceIsSetForNamedFieldsAlone) {
    EXPECT_EQ(Shown("", "optionalS32"), "|0");
    EXPECT_EQ(Shown(Member("optionalS32", "0"), "optionalS32"), "!|0");
    EXPECT_EQ(Shown(Member("requiredS32", "0"), "requiredS32"), "|0");
    // Nothing is stored for it, and nothing is refused.
    EXPECT_EQ(Shown(Member("optionalS32", "[]"), "optionalS32"), "!|0");
    EXPECT_EQ(Shown(Member("optionalS32", "[[ ] ]"), "optionalS32"), "!|0");
}

TEST_F(FieldReadTest, AnArrayForASingleFieldIsRefused) {
    for (const char* field : {"optionalS32", "requiredString", "optionalAnyDict", "requiredKnownDict",
                              "optionalObject", "requiredLazy"}) {
        for (const char* value : {"[1]", "[{}]", "[null, 2]", "[\"a\"]"}) {
            EXPECT_EQ(Shown(Member(field, value), field),
                      "refused failed to UnmarshalOneMultiValue in AVReadFieldValue Failed to parse an array "
                      "element."
                      " Failed to parse value for key " +
                          std::string(field))
                << value;
        }
    }
}

TEST_F(FieldReadTest, ShapesOfRepeatedValues) {
    const struct {
        const char* json;
        const char* shown;
    } cases[] = {
        {"5", "|5"}, {"[5]", "|5"},   {"[[1,2],[3]]", "|1|2|3"},
        {"[]", ""},  {"[[],[]]", ""}, {"[ [ ] , 1 , [ 2 , [ 3 ] ] ]", "|1|2|3"},
    };
    for (const auto& each : cases)
        EXPECT_EQ(Shown(Member("multiS32", each.json), "multiS32"), each.shown) << each.json;
    EXPECT_EQ(Shown(Member("multiS32", "[1,2,]"), "multiS32"),
              "refused failed to UnmarshalOneMultiValue in AVReadFieldValue Failed to parse an array member."
              " Failed to parse value for key multiS32");
    EXPECT_EQ(Shown(Member("multiString", "[a,\"b\",]"), "multiString"), "|'a|'b|'");
    EXPECT_EQ(Shown(Member("multiString", "[,]"), "multiString"), "|'|'");
    EXPECT_EQ(Shown(Member("multiString", "[a b]"), "multiString"),
              "refusedArray must end with ']'. Failed to parse value for key multiString");
}

TEST_F(FieldReadTest, KeysThatComeTwice) {
    EXPECT_EQ(Shown(R"("optionalS32": 1, "optionalS32": 2)", "optionalS32"), "!|2");
    EXPECT_EQ(Shown(R"("multiS32": 1, "multiS32": [2, 3], "multiS32": 4)", "multiS32"), "|1|2|3|4");
    EXPECT_EQ(Shown(R"("optionalAnyDict": {"a": 1}, "optionalAnyDict": {"a": 2, "b": 3})", "optionalAnyDict"),
              R"(|dict {"a": ["1", "2"], "b": "3"})");
    EXPECT_EQ(Shown(R"("multiAnyDict": {"a": 1}, "multiAnyDict": {"a": 2})", "multiAnyDict"),
              R"(|dict {"a": "1"}|dict {"a": "2"})");
    EXPECT_EQ(
        Shown(R"("optionalKnownDict": {"type": "success"}, "optionalKnownDict": {})", "optionalKnownDict"),
        "|null");
}

struct WholeText {
    const char* text;
    bool isRead;
    const char* words;
};

const WholeText vWholeTextsG[] = {
    {R"({"type":"success"})", true, ""},
    {R"( {type:success} behind { it )", true, ""},
    {R"({"type":"success",})", true, ""},
    {R"({"a":1,"type":"success",})", true, ""},
    {R"({"type":"error","type":"success"})", true, ""},
    {R"({"a": {"type": "error"}, "b": [{}], "type": "success"})", true, ""},
    {R"({"":1, "type": "success"})", true, ""},
    {R"({"ty\pe": 1})", false, "Failed to parse a fieldName key."},
    {R"({"\t\"": 1, "type": "success"})", true, ""},
    {"{}", false, "before"},
    {R"({"a":1})", false, "before"},
    {R"({"type":"noSuchStruct"})", false, "before"},
    {R"({"type":"Success"})", false, "before"},
    {R"({"type":""})", false, "before"},
    {R"({"type":"success","type":"noSuchStruct"})", false, "before"},
    {"", false, "JSON object does not start with '{'."},
    {"  ", false, "JSON object does not start with '{'."},
    {"[]", false, "JSON object does not start with '{'."},
    {"null", false, "JSON object does not start with '{'."},
    {"{", false, "JSON object does not end with '}'."},
    {R"({"type":"success")", false, "JSON object does not end with '}'."},
    {R"({"type":"success";})", false, "JSON object does not end with '}'."},
    {R"({"type":{"a":1}})", false, "JSON object does not end with '}'."},
    {R"({"a":1 "b":2})", false, "JSON object does not end with '}'."},
    {R"({"a"})", false, "JSON field name must be followed by a colon."},
    {R"({"a")", false, "JSON field name must be followed by a colon."},
    {R"({"a" 1})", false, "JSON field name must be followed by a colon."},
    {R"({"a)", false, "Failed to parse a fieldName key."},
    {R"({"type":"succ)", false, "Can't parse type."},
    {R"({"type":"\q"})", false, "Can't parse type."},
    {R"({"a":"\q"})", false,
     "before failed to UnmarshalOneSingleValue in ReadFieldValue Failed to parse value for key a"},
    {R"({"a\"b":"\q"})", false,
     "before failed to UnmarshalOneSingleValue in ReadFieldValue Failed to parse value for key a\"b"},
    {R"({"a":["\q"]})", false,
     "before failed to UnmarshalOneMultiValue in AVReadFieldValue Failed to parse an array element."
     " Failed to parse value for key a"},
    {R"({"a":[1,[2,"\q"]]})", false,
     "before failed to UnmarshalOneMultiValue in AVReadFieldValue Failed to parse an array member."
     " Failed to parse an array member. Failed to parse value for key a"},
    {R"({"a":[1 2]})", false, "Array must end with ']'. Failed to parse value for key a"},
    {R"({"a":[1,[2)", false,
     "Array must end with ']'. Failed to parse an array member. Failed to parse value for key a"},
    {R"({"a":{"b":{"c" 1}}})", false,
     "JSON field name must be followed by a colon. failed to UnmarshalOneSingleValue in ReadFieldValue"
     " Failed to parse value for key b failed to UnmarshalOneSingleValue in ReadFieldValue"
     " Failed to parse value for key a"},
    {R"({"a":[0,{"b":{]}]})", false,
     "JSON object does not end with '}'. failed to UnmarshalOneSingleValue in ReadFieldValue"
     " Failed to parse value for key b failed to UnmarshalOneMultiValue in AVReadFieldValue"
     " Failed to parse an array member. Failed to parse value for key a"},
    // A scalar field at an object: an empty bare text is read, and then the object does not go on.
    {R"({"type":"everyType","optionalString":{}})", false, "JSON object does not end with '}'."},
    {R"({"type":"everyType","optionalS32":{}})", false,
     "before failed to UnmarshalOneSingleValue in ReadFieldValue Failed to parse value for key optionalS32"},
    {R"({"type":"everyType","requiredKnownDict":{"type":"everyType","multiS32":["x"]}})", false,
     "before failed to UnmarshalOneSingleValue in ReadFieldValue"
     " Failed to parse value for key requiredKnownDict"},
};

TEST_F(FieldReadTest, WholeTexts) {
    for (const WholeText& each : vWholeTextsG) {
        SCOPED_TRACE(each.text);
        const ReadOutcome outcome = Read(each.text, "before");
        EXPECT_EQ(outcome.isRead, each.isRead);
        EXPECT_EQ(outcome.words, each.isRead ? "before" : each.words);
        EXPECT_EQ(outcome.shown, each.isRead ? "success{}" : "null");
        for (unsigned nPiece : {1u, 2u, 5u, 16384u})
            EXPECT_EQ(ReadStream(each.text, nPiece, "before"), outcome);
        EXPECT_EQ(ReadInMemory(each.text, "before"), outcome);
    }
}

TEST_F(FieldReadTest, AStringForANumberSaysWhere) {
    EXPECT_EQ(Read(R"({"type": "everyTypeCompanion", "number": "x"})").words,
              " failed to UnmarshalOneSingleValue in ReadFieldValue Failed to parse value for key number");
}

TEST_F(FieldReadTest, TheOrderOfKeysDoesNotMatter) {
    const std::string first =
        R"({"type":"everyType","requiredKnownDict":{"type":"everyTypeCompanion","number":3},"optionalS32":4})";
    const std::string last =
        R"({"optionalS32":4,"requiredKnownDict":{"number":3,"type":"everyTypeCompanion"},"type":"everyType"})";
    const ReadOutcome outcome = Read(first);
    EXPECT_TRUE(outcome.isRead) << outcome.words;
    EXPECT_EQ(Read(last), outcome);
    EXPECT_NE(outcome.shown.find("requiredKnownDict|everyTypeCompanion{child|null;"), std::string::npos);
}

TEST_F(FieldReadTest, ATypeFieldOfAStructsOwn) {
    const ReadOutcome outcome = Read(R"({"number": 1, "type": "everyTypeTyped"})");
    EXPECT_EQ(outcome.shown, "everyTypeTyped{number!|1;type!|'everyTypeTyped;}");
}

// An any-dict value counts as one object, though it holds two: the field behind it takes the struct of the
// inner map, which names none, and the one behind that is built as the struct of the object before it.
TEST_F(FieldReadTest, TheCountLagsBehindAnyDictsWithMaps) {
    const char* const known = R"("requiredKnownDict": {"type": "success"})";
    EXPECT_EQ(Shown(std::string(R"("optionalAnyDict": {"a": "b"}, )") + known, "requiredKnownDict"),
              "|success{}");
    EXPECT_EQ(Shown(std::string(R"("optionalAnyDict": {"a": {"b": "c"}}, )") + known, "requiredKnownDict"),
              "|null");
    EXPECT_EQ(Shown(std::string(R"("optionalAnyDict": {"a": {"type": "everyTypeTyped"}}, )") + known,
                    "requiredKnownDict"),
              "|everyTypeTyped{number|0");
    EXPECT_EQ(
        Shown(
            std::string(
                R"("optionalAnyDict": {"a": {"b": "c"}}, "optionalKnownDict": {"type": "everyTypeTyped"}, )") +
                known,
            "requiredKnownDict"),
        "|everyTypeTyped{number|0");
}

}  // namespace sorntest
