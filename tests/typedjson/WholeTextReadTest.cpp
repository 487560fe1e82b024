// Texts as a whole: what is taken, the words of what is refused, and the order of keys. Invariants for
// untrusted input: 4, 9, 13.

#include "typedjson/ReaderFixture.h"

namespace sorntest {

using namespace sorn;

using WholeTextReadTest = ReaderFixture;

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

TEST_F(WholeTextReadTest, WholeTexts) {
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

TEST_F(WholeTextReadTest, AStringForANumberSaysWhere) {
    EXPECT_EQ(Read(R"({"type": "everyTypeCompanion", "number": "x"})").words,
              " failed to UnmarshalOneSingleValue in ReadFieldValue Failed to parse value for key number");
}

// What is appended is at most 1 MiB, not counting what the caller's string held; then one piece closes it.
TEST_F(WholeTextReadTest, WordsAreBounded) {
    const std::string single = " failed to UnmarshalOneSingleValue in ReadFieldValue";
    const std::string key = " Failed to parse value for key ";
    const std::string before(100, 'b');
    const std::string longest(1048576 - single.size() - key.size(), 'k');
    const struct {
        std::string text;
        std::string words;
    } cases[] = {
        {"{\"" + longest + "\": \"\\q\"}", before + single + key + longest},
        {"{\"k" + longest + "\": \"\\q\"}", before + single + " The rest of the words is left out."},
        // Nothing is told behind the piece that was left out, though it would fit.
        {"{a: {\"k" + longest + "\": \"\\q\"}}", before + single + " The rest of the words is left out."},
    };
    for (const auto& each : cases) {
        EXPECT_TRUE(Read(each.text, before).words == each.words);
        EXPECT_TRUE(ReadStream(each.text, 16384, before).words == each.words);
    }
}

TEST_F(WholeTextReadTest, TheOrderOfKeysDoesNotMatter) {
    const std::string first =
        R"({"type":"everyType","requiredKnownDict":{"type":"everyTypeCompanion","number":3},"optionalS32":4})";
    const std::string last =
        R"({"optionalS32":4,"requiredKnownDict":{"number":3,"type":"everyTypeCompanion"},"type":"everyType"})";
    const ReadOutcome outcome = Read(first);
    EXPECT_TRUE(outcome.isRead) << outcome.words;
    EXPECT_EQ(Read(last), outcome);
    EXPECT_NE(outcome.shown.find("requiredKnownDict|everyTypeCompanion{child|null;"), std::string::npos);
}

}  // namespace sorntest
