// The shapes of values, and what a field makes of them: presence, lists, keys that come twice. Invariant for
// untrusted input: 7.

#include "typedjson/FieldReadFixture.h"

namespace sorntest {

using namespace sorn;

using ShapeReadTest = FieldReadFixture;

TEST_F(ShapeReadTest, PresenceIsSetForNamedFieldsAlone) {
    EXPECT_EQ(Shown("", "optionalS32"), "|0");
    EXPECT_EQ(Shown(Member("optionalS32", "0"), "optionalS32"), "!|0");
    EXPECT_EQ(Shown(Member("requiredS32", "0"), "requiredS32"), "|0");
}

// Also one without elements, for which nothing would have to be stored.
TEST_F(ShapeReadTest, AnArrayForASingleFieldIsRefused) {
    const struct {
        const char* json;
        unsigned nArrays;  // around what is refused
    } cases[] = {
        {"[1]", 1},   {"[{}]", 1}, {"[null, 2]", 1}, {"[\"a\"]", 1}, {"[]", 1},
        {" [ ] ", 1}, {"[[]]", 2}, {"[ [ ], 1]", 2}, {"[[[5]]]", 3},
    };
    for (const char* field : {"optionalS32", "requiredString", "optionalAnyDict", "requiredKnownDict",
                              "optionalObject", "requiredLazy", "requiredBytes", "optionalEnum"}) {
        for (const auto& each : cases) {
            std::string words = "refused failed to UnmarshalOneMultiValue in AVReadFieldValue";
            for (unsigned i = 0; i < each.nArrays; ++i) words += " Failed to parse an array element.";
            EXPECT_EQ(Shown(Member(field, each.json), field),
                      words + " Failed to parse value for key " + field)
                << each.json;
        }
    }
    // Inside an object in a field, where no words come from, and in an object that nobody builds.
    EXPECT_EQ(Shown(Member("requiredObject", R"({"number": []})"), "requiredObject"),
              "refused failed to UnmarshalOneSingleValue in ReadFieldValue Failed to parse value for key "
              "requiredObject");
    EXPECT_EQ(Shown(R"("unknown": [], "optionalS32": 3)", "optionalS32"), "!|3");
    EXPECT_EQ(Shown(R"("unknown": {"optionalS32": [[]]}, "optionalS32": 3)", "optionalS32"), "!|3");
    EXPECT_EQ(Shown(R"("optionalKnownDict": {"number": []}, "optionalS32": 3)", "optionalS32"), "!|3");
}

TEST_F(ShapeReadTest, ShapesOfRepeatedValues) {
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

TEST_F(ShapeReadTest, KeysThatComeTwice) {
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
TEST_F(ShapeReadTest, ATypeFieldOfAStructsOwn) {
    const ReadOutcome outcome = Read(R"({"number": 1, "type": "everyTypeTyped"})");
    EXPECT_EQ(outcome.shown, "everyTypeTyped{number!|1;type!|'everyTypeTyped;}");
}

// An any-dict value counts as one object, though it holds two: the field behind it takes the struct of the
// inner map, which names none, and the one behind that is built as the struct of the object before it.
TEST_F(ShapeReadTest, TheCountLagsBehindAnyDictsWithMaps) {
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
