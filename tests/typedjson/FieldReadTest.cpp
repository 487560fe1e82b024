// What each data type takes, and the words of what is refused. Invariants for untrusted input: 7, 8, 9.

#include "typedjson/FieldReadFixture.h"

namespace sorntest {

using namespace sorn;

using FieldReadTest = FieldReadFixture;

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

}  // namespace sorntest
