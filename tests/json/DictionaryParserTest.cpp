#include <gtest/gtest.h>

#include "json/Support.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/json/InputPointer.h"
#include "sorn/json/ReadScalarValue.h"

using namespace std::string_literals;
using jsontest::ExactBytes;
using jsontest::Parse;
using jsontest::String;
using jsontest::Text;
using sorn::ArrayValue;
using sorn::Dictionary;
using sorn::DictValue;
using sorn::InputPointer;
using sorn::StringValue;

namespace {

struct ParseCase {
    std::string input;
    std::string output;  // the compact text of what was read
};

TEST(DictionaryParser, Accepts) {
    const ParseCase cases[] = {
        {"{}", "{}"},
        {" { } ", "{}"},
        {"\t\r\n {\t\r\n }\t\r\n ", "{}"},
        {"{a:1}", R"({"a": 1})"},
        {"{1:2}", R"({"1": 2})"},
        {"{a-b.c+d:1}", R"({"a-b.c+d": 1})"},
        {R"({"":1})", R"({"": 1})"},
        {R"({"a":1,})", R"({"a": 1})"},
        {R"({"a":1 , })", R"({"a": 1})"},
        {R"({"a":1} )", R"({"a": 1})"},
        {R"({ "a" : 1 , "b" : [ 1 , 2 ] , "c" : { } })", R"({"a": 1, "b": [1, 2], "c": {}})"},
        {R"({"b":1,"a":2})", R"({"a": 2, "b": 1})"},
        {R"({"a":[]})", R"({"a": []})"},
        {R"({"a":[ ]})", R"({"a": []})"},
        {R"({"a":[[],[[]],{}]})", R"({"a": [[], [[]], {}]})"},
        {R"({"a":[{"b":[{"c":1},2]},3]})", R"({"a": [{"b": [{"c": 1}, 2]}, 3]})"},
        {R"({"a":{"b":1},"c":{"b":1}})", R"({"a": {"b": 1}, "c": {"b": 1}})"},
        {R"({"a":{"a":{"a":1}}})", R"({"a": {"a": {"a": 1}}})"},
        {R"({"a":null})", R"({"a": null})"},
        {R"({"a":"null"})", R"({"a": "null"})"},
        {R"({"a":Null})", R"({"a": Null})"},
        {R"({"a":NULL,"b":nul,"c":nulll})", R"({"a": NULL, "b": nul, "c": nulll})"},
        {R"({"a":-})", R"({"a": -})"},
        {R"({"a":.})", R"({"a": "."})"},
        {R"({"a":+})", R"({"a": "+"})"},
        {R"({"a":true,"b":0x10,"c":1.2.3,"d":-1.5e+3})",
         R"({"a": true, "b": 0x10, "c": "1.2.3", "d": "-1.5e+3"})"},
        {R"({"a":"\u00e9"})", R"({"a": "\u00e9"})"},
        {R"({"a":"\/\""})", R"({"a": "/\""})"},
        {R"({"\n":1})", R"({"\n": 1})"},
        {R"({"\u0041":1,"A":2})", R"({"A": 2, "\u0041": 1})"},
        {"{\"\xC3\xA9\":\"\xFF\"}", "{\"\xC3\xA9\": \"\xFF\"}"},
        {R"({"a":""})", R"({"a": ""})"},
        {"{\"a\":\"x\ny\"}", R"({"a": "x\ny"})"},
    };
    for (const ParseCase& c : cases) EXPECT_EQ(Parse(c.input), c.output) << c.input;
}

TEST(DictionaryParser, Refuses) {
    const std::string noOpen = "error: JSON must start with '{'.";
    const std::string noEnd = "error: JSON object does not end with '}'.";
    const std::string noColon = "error: JSON field name must be followed by a colon.";
    const std::string badKey = "error: Failed to parse a Dictionary key.";
    const std::string ofA = " Failed to parse value for key a";
    const ParseCase cases[] = {
        {"", noOpen},
        {" \t\r\n", noOpen},
        {"[]", noOpen},
        {"x{}", noOpen},
        {"\v{}", noOpen},
        {"\0{}"s, noOpen},
        {R"({"a":1}x)", "error: Extra data after JSON."},
        {"{}{}", "error: Extra data after JSON."},
        {"{}\0"s, "error: Extra data after JSON."},
        {"{}}", "error: Extra data after JSON."},
        {"{", noEnd},
        {"{ ", noEnd},
        {"{,}", noEnd},
        {"{-a:1}", noEnd},
        {"{.:1}", noEnd},
        {"{]", noEnd},
        {"{\x80:1}", noEnd},
        {"{\0}"s, noEnd},
        {R"({"a":1)", noEnd},
        {R"({"a":1,)", noEnd},
        {R"({"a":1,,})", noEnd},
        {R"({"a":1;})", noEnd},
        {R"({"a":1 "b":2})", noEnd},
        {R"({"a":"x)", noEnd},
        {R"({"a":1]})", noEnd},
        {"{\"a\":1\0}"s, noEnd},
        {R"({/* c */"a":1})", noEnd},
        {"{\"a\":1\x80}", noEnd},
        {R"({"a")", noColon},
        {R"({"a" )", noColon},
        {R"({"a" 1})", noColon},
        {R"({"a)", noColon},
        {R"({a b:1})", noColon},
        {"{a\0:1}"s, noColon},
        {R"({"a"::1})", "error: Empty scalar value for Object field a" + ofA},
        {R"({"\q":1})", badKey},
        {"{\"a\0\":1}"s, badKey},
        {"{\"a\\", badKey},
        {R"({"a":1,"\q":1})", badKey},
        {R"({"a":1,"a":2})", "error: Duplicate key: a"},
        {R"({"a":1,"a)", "error: Duplicate key: a"},
        {R"({"a":1,a:2})", "error: Duplicate key: a"},
        {R"({"a":null,"a":2})", "error: Duplicate key: a"},
        {R"({"":1,"":2})", "error: Duplicate key: "},
        {R"({"\n":1,"\n":2})", "error: Duplicate key: \n"},
        {R"({"a":{"b":1,"b":2}})", "error: Duplicate key: b" + ofA},
        {R"({"a":})", "error: Empty scalar value for Object field a" + ofA},
        {R"({"a":)", "error: Empty scalar value for Object field a" + ofA},
        {R"({"a":,})", "error: Empty scalar value for Object field a" + ofA},
        {R"({"a":]})", "error: Empty scalar value for Object field a" + ofA},
        {R"({"a":/})", "error: Empty scalar value for Object field a" + ofA},
        {"{\"a\":\x80}", "error: Empty scalar value for Object field a" + ofA},
        {"{\"a\":\0}"s, "error: Empty scalar value for Object field a" + ofA},
        {R"({"a":"\x"})", "error: Can't parse scalar field for Object field a" + ofA},
        {"{\"a\":\"\0\"}"s, "error: Can't parse scalar field for Object field a" + ofA},
        {"{\"a\":\"x\\", "error: Can't parse scalar field for Object field a" + ofA},
        {R"({"a":{})", noEnd},
        {R"({"a":{)", noEnd + ofA},
        {R"({"a":{"b":1)", noEnd + ofA},
        {R"({"a":{"b":{"c":[1,{"d")",
         noColon + " Failed to parse an array member. Failed to parse value for key c" +
             " Failed to parse value for key b" + ofA},
        {R"({"a":[1,]})",
         "error: Empty scalar value for Array element. Failed to parse an array member." + ofA},
        {R"({"a":[,]})",
         "error: Empty scalar value for Array element. Failed to parse an array element." + ofA},
        {R"({"a":[)", "error: Empty scalar value for Array element. Failed to parse an array element." + ofA},
        {R"({"a":["\x"]})",
         "error: Can't parse scalar field for Array element. Failed to parse an array element." + ofA},
        {R"({"a":[1,"\x"]})",
         "error: Can't parse scalar field for Array element. Failed to parse an array member." + ofA},
        {R"({"a":[1)", "error: Array must end with ']'." + ofA},
        {R"({"a":[1 )", "error: Array must end with ']'." + ofA},
        {R"({"a":[1 2]})", "error: Array must end with ']'." + ofA},
        {R"({"a":[1})", "error: Array must end with ']'." + ofA},
        {R"({"a":["x)", "error: Array must end with ']'." + ofA},
        {R"({"a":[[1)", "error: Array must end with ']'. Failed to parse an array element." + ofA},
        {R"({"a":[0,[1)", "error: Array must end with ']'. Failed to parse an array member." + ofA},
        {R"({"a":[[],[1)", "error: Array must end with ']'. Failed to parse an array member." + ofA},
        {R"({"a":[{"b":1,"b":2}]})", "error: Duplicate key: b Failed to parse an array element." + ofA},
        {R"({"a":[[],[[{"k":}]]]})",
         "error: Empty scalar value for Object field k Failed to parse value for key k"
         " Failed to parse an array element. Failed to parse an array element. Failed to parse an array "
         "member." +
             ofA},
    };
    for (const ParseCase& c : cases) EXPECT_EQ(Parse(c.input), c.output) << c.input;
}

TEST(DictionaryParser, ManyKeysAndDuplicatesAmongThem) {
    std::string text = "{";
    for (unsigned i = 0; i < 5000; ++i)
        text += (i == 0 ? "\"k" : ",\"k") + std::to_string(i) + "\":" + std::to_string(i);
    EXPECT_EQ(Parse(text + ",\"k4999\":1}"), "error: Duplicate key: k4999");
    EXPECT_EQ(Parse(text + ",k0:1}"), "error: Duplicate key: k0");
    RoxMempool pool("parse");
    RoxString error;
    const ref<Dictionary> dictionary = Dictionary::FromJson(Text(pool, text + "}"), error, &pool);
    ASSERT_NE(dictionary.get(), nullptr);
    EXPECT_EQ(dictionary->CountNames(), 5000u);
    for (unsigned i = 0; i < 5000; ++i) {
        const std::string number = std::to_string(i);
        EXPECT_EQ(String(dictionary->GetString(Text(pool, "k" + number))), number);
    }
}

TEST(DictionaryParser, KeysThatLookAlikeStayApart) {
    // Of one length, with the same first and last eight bytes; and one the beginning of the other.
    EXPECT_EQ(Parse(R"([{}])"), "error: JSON must start with '{'.");
    EXPECT_EQ(
        Parse(
            R"({"x":[{"aaaaaaaa1bbbbbbbb":1,"aaaaaaaa2bbbbbbbb":2},{"aaaaaaaa2bbbbbbbb":3,"aaaaaaaa1bbbbbbbb":4},)"
            R"({"a":1,"aa":2},{"aa":3,"a":4},{"":5}]})"),
        R"({"x": [{"aaaaaaaa1bbbbbbbb": 1, "aaaaaaaa2bbbbbbbb": 2}, {"aaaaaaaa1bbbbbbbb": 4, "aaaaaaaa2bbbbbbbb": 3}, )"
        R"({"a": 1, "aa": 2}, {"a": 4, "aa": 3}, {"": 5}]})");
}

TEST(DictionaryParser, KindsOfValues) {
    RoxMempool pool("parse");
    RoxString error;
    const ref<Dictionary> dictionary = Dictionary::FromJson(
        Text(pool, R"({"q":"12","b":12,"n":null,"s":"null","o":{},"a":[],"e":"","h":"caf\u00e9"})"), error,
        &pool);
    ASSERT_NE(dictionary.get(), nullptr);
    EXPECT_EQ(dictionary->GetMempool(), &pool);
    const auto find = [&](const char* name) { return dictionary->Find(Text(pool, name)); };
    const auto text = [&](const char* name) { return static_cast<StringValue*>(find(name)); };
    EXPECT_TRUE(text("q")->FNeedQuotes());
    EXPECT_FALSE(text("b")->FNeedQuotes());
    EXPECT_EQ(String(text("b")->GetValue()), "12");
    EXPECT_EQ(find("n")->GetTag(), sorn::dictvalue::LAZY_DICT);
    EXPECT_EQ(find("s")->GetTag(), sorn::dictvalue::STRING);
    EXPECT_EQ(find("o")->GetTag(), sorn::dictvalue::DICTIONARY);
    EXPECT_EQ(find("a")->GetTag(), sorn::dictvalue::ARRAY);
    EXPECT_EQ(find("e")->GetTag(), sorn::dictvalue::STRING);
    EXPECT_EQ(String(text("h")->GetValue()), "caf\\u00e9");
    for (const char* name : {"q", "b", "n", "o", "a", "e"})
        EXPECT_EQ(find(name)->GetMempool(), &pool) << name;
}

TEST(DictionaryParser, NothingStaysBehindInThePool) {
    RoxMempool pool("parse");
    for (const char* text :
         {R"({"a":[1,{"b":"\n"},null],"c":{}})", R"({"a":[1,{"b":"\n"},null],"c":{},"c":1})",
          R"({"a":[1,{"b":"\n"},null,)", "", R"({"a":"\x)"}) {
        RoxString error;
        Dictionary::FromJson(RoxString(text), error, &pool);
        EXPECT_EQ(pool.GetUsedBytes(), 0u) << text;
    }
}

TEST(DictionaryParser, Bytestring) {
    RoxMempool pool("parse");
    RoxString error;
    ref<Dictionary> dictionary =
        Dictionary::FromJsonBytestring(rox::ByteBuffer::New(&pool, R"({"a":1})", 7), error, &pool);
    ASSERT_NE(dictionary.get(), nullptr);
    EXPECT_EQ(String(dictionary->ToJson(false)), R"({"a": 1})");
    EXPECT_EQ(
        Dictionary::FromJsonBytestring(ref<rox::ByteBuffer>(new (&pool) rox::ByteBuffer()), error, &pool)
            .get(),
        nullptr);
    EXPECT_EQ(String(error), "JSON must start with '{'.");
    error = "";
    EXPECT_EQ(Dictionary::FromJsonBytestring(nullptr, error, &pool).get(), nullptr);
    EXPECT_EQ(String(error), "JSON must start with '{'.");
}

TEST(DictionaryParser, TextAndWordsInOneString) {
    RoxMempool pool("parse");
    RoxString text(&pool, R"({"a":1})");
    const ref<Dictionary> dictionary = Dictionary::FromJson(text, text, &pool);
    ASSERT_NE(dictionary.get(), nullptr);
    EXPECT_EQ(String(dictionary->ToJson(false)), R"({"a": 1})");
    EXPECT_TRUE(text.FEmpty());
}

TEST(DictionaryParser, OnTheGeneralHeap) {
    RoxString error;
    const ref<Dictionary> dictionary =
        Dictionary::FromJson(RoxString(R"({"b":[{"c":"\n"}],"a":1})"), error, nullptr);
    ASSERT_NE(dictionary.get(), nullptr);
    EXPECT_EQ(String(dictionary->ToJson(false)), R"({"a": 1, "b": [{"c": "\n"}]})");
}

/// A read in the middle of a text, into a container that is there.
class Part {
 public:
    explicit Part(std::string_view text) : bytesM(text) {}

    bool Object() { return dictionary->FromJson(cursorM, error); }
    bool Member(const char* key) { return dictionary->ReadFieldValue(cursorM, RoxString(key), error); }
    bool Array() { return array->FromJson(cursorM, error); }
    bool Element() { return array->ReadFieldValue(cursorM, error); }
    bool Scalar(ref<DictValue>* out) { return sorn::ReadScalarValue(cursorM, &poolM, error, out); }
    std::string Rest() const {
        return std::string(cursorM.pCurrentM,
                           cursorM.pCurrentM > cursorM.pEndM ? cursorM.pCurrentM : cursorM.pEndM);
    }
    long Behind() const { return cursorM.pCurrentM - bytesM.Begin(); }
    std::string Read() const { return String(dictionary->ToJson(false)) + String(array->ToJson(false)); }

 private:
    RoxMempool poolM{"part"};
    ExactBytes bytesM;
    InputPointer cursorM{bytesM.Begin(), bytesM.End()};

 public:
    ref<Dictionary> dictionary{new (&poolM) Dictionary(&poolM)};
    ref<ArrayValue> array{new (&poolM) ArrayValue(&poolM)};
    RoxString error{"untouched"};
};

TEST(DictionaryParser, ObjectInTheMiddle) {
    Part part(R"( {"a":[1],"b":2} ,x)");
    EXPECT_TRUE(part.Object());
    EXPECT_EQ(part.Read(), R"({"a": [1], "b": 2}[])");
    EXPECT_EQ(part.Rest(), " ,x");
    EXPECT_EQ(String(part.error), "untouched");
}

TEST(DictionaryParser, ObjectIntoADictionaryThatHasNames) {
    Part part(R"({"b":2,"a":3})");
    part.dictionary->Add(RoxString("a"), RoxString("1"));
    EXPECT_FALSE(part.Object());
    EXPECT_EQ(String(part.error), "Duplicate key: a");
    // What was read until then stays.
    EXPECT_EQ(part.Read(), R"({"a": "1", "b": 2}[])");
}

TEST(DictionaryParser, NullReferenceUnderAKeyIsNoDuplicate) {
    Part part(R"({"a":1,"b":{"a":2}})");
    part.dictionary->Add(RoxString("a"), ref<DictValue>());
    EXPECT_TRUE(part.Object());
    EXPECT_EQ(part.Read(), R"({"a": 1, "b": {"a": 2}}[])");
    EXPECT_EQ(part.dictionary->CountValues(RoxString("a")), 2u);
}

TEST(DictionaryParser, WordsOfTheGuards) {
    // The first byte is used up whatever it is, and the words stay on success.
    Part object("xa:1}");
    EXPECT_TRUE(object.Object());
    EXPECT_EQ(String(object.error), "JSON object does not start with '{'.");
    EXPECT_EQ(object.Read(), R"({"a": 1}[])");
    Part badObject("xa:1");
    EXPECT_FALSE(badObject.Object());
    EXPECT_EQ(String(badObject.error), "JSON object does not end with '}'.");
    Part noObject("  ");
    EXPECT_FALSE(noObject.Object());
    EXPECT_EQ(String(noObject.error), "JSON object does not end with '}'.");
    Part array("{1]");
    EXPECT_TRUE(array.Array());
    EXPECT_EQ(String(array.error), "Array must start with '['.");
    EXPECT_EQ(array.Read(), "{}[1]");
    Part badArray("x1");
    EXPECT_FALSE(badArray.Array());
    EXPECT_EQ(String(badArray.error), "Array must end with ']'.");
    Part noArray("");
    EXPECT_FALSE(noArray.Array());
    EXPECT_EQ(String(noArray.error),
              "Empty scalar value for Array element. Failed to parse an array element.");
}

TEST(DictionaryParser, ArrayInTheMiddle) {
    Part part(" [ 1 , [] , {\"a\":null} ] ]");
    part.array->Add(RoxString("0"));
    EXPECT_TRUE(part.Array());
    EXPECT_EQ(part.Read(), R"({}["0", 1, [], {"a": null}])");
    EXPECT_EQ(part.Rest(), " ]");
    EXPECT_EQ(String(part.error), "untouched");
    // The first element of this text, though not the array's.
    Part first("[,]");
    first.array->Add(RoxString("0"));
    EXPECT_FALSE(first.Array());
    EXPECT_EQ(String(first.error), "Empty scalar value for Array element. Failed to parse an array element.");
}

TEST(DictionaryParser, MemberValue) {
    Part part(R"( 1 "x"[2]{"b":3} null,)");
    for (int i = 0; i < 5; ++i) EXPECT_TRUE(part.Member("k")) << i;
    EXPECT_EQ(part.Read(), R"({"k": 1, "k": "x", "k": [2], "k": {"b": 3}, "k": null}[])");
    EXPECT_EQ(part.Rest(), ",");
    EXPECT_EQ(String(part.error), "untouched");
    EXPECT_FALSE(part.Member("k"));
    EXPECT_EQ(String(part.error), "Empty scalar value for Object field k");
    Part nested(R"({"b":[1,{"c"1}]})");
    EXPECT_FALSE(nested.Member("k"));
    EXPECT_EQ(String(nested.error),
              "JSON field name must be followed by a colon. Failed to parse an array member."
              " Failed to parse value for key b");
    // A container joins its parent before it is filled.
    EXPECT_EQ(nested.Read(), R"({"k": {"b": [1, {}]}}[])");
}

TEST(DictionaryParser, ElementValue) {
    Part part(R"( 1 "x"[2]{"b":3} null,)");
    for (int i = 0; i < 5; ++i) EXPECT_TRUE(part.Element()) << i;
    EXPECT_EQ(part.Read(), R"({}[1, "x", [2], {"b": 3}, null])");
    EXPECT_EQ(part.Rest(), ",");
    EXPECT_FALSE(part.Element());
    EXPECT_EQ(String(part.error), "Empty scalar value for Array element.");
    Part nested("[[1");
    EXPECT_FALSE(nested.Element());
    EXPECT_EQ(String(nested.error), "Array must end with ']'. Failed to parse an array element.");
    EXPECT_EQ(nested.Read(), "{}[[[1]]]");
    Part bad(R"("\x")");
    EXPECT_FALSE(bad.Element());
    EXPECT_EQ(String(bad.error), "Can't parse scalar field for Array element.");
}

TEST(DictionaryParser, UnterminatedTextLeavesTheCursorOneBehindTheEnd) {
    Part part("\"abc");
    EXPECT_TRUE(part.Member("k"));
    EXPECT_EQ(part.Behind(), 5);
    EXPECT_EQ(part.Read(), R"({"k": "abc"}[])");
    EXPECT_FALSE(part.Member("l"));
    EXPECT_EQ(String(part.error), "Empty scalar value for Object field l");
    EXPECT_FALSE(part.Element());
    EXPECT_FALSE(part.Object());
    EXPECT_EQ(String(part.error), "JSON object does not end with '}'.");
    EXPECT_FALSE(part.Array());
    EXPECT_EQ(part.Behind(), 5);
}

TEST(DictionaryParser, WordsStayInTheirPool) {
    Part part("");
    RoxMempool pool("words");
    part.error = RoxString(&pool, "before");
    EXPECT_FALSE(part.Member("k"));
    EXPECT_EQ(part.error.GetMempool(), &pool);
    part.error = RoxString();
}

TEST(DictionaryParser, Scalar) {
    Part part(R"( "a" b null "null" )");
    ref<DictValue> value;
    ASSERT_TRUE(part.Scalar(&value));
    EXPECT_EQ(String(value->ToJson(false)), "\"a\"");
    ASSERT_TRUE(part.Scalar(&value));
    EXPECT_EQ(String(value->ToJson(false)), "b");
    ASSERT_TRUE(part.Scalar(&value));
    EXPECT_EQ(value->GetTag(), sorn::dictvalue::LAZY_DICT);
    ASSERT_TRUE(part.Scalar(&value));
    EXPECT_EQ(String(value->ToJson(false)), "\"null\"");
    EXPECT_EQ(String(part.error), "untouched");
    const ref<DictValue> before = value;
    EXPECT_FALSE(part.Scalar(&value));
    EXPECT_EQ(String(part.error), "Empty scalar value");
    EXPECT_EQ(value, before);
    Part bad(R"("\q")");
    EXPECT_FALSE(bad.Scalar(&value));
    EXPECT_EQ(String(bad.error), "Can't parse scalar field");
    EXPECT_EQ(value, before);
    value = nullptr;
}

std::string ArrayText(unsigned nElements, const char* element) {
    std::string text = "{\"a\":[";
    for (unsigned i = 0; i < nElements; ++i) text.append(i == 0 ? "" : ",").append(element);
    return text + "]}";
}

TEST(DictionaryParser, ArrayAtItsLimit) {
    RoxMempool pool("parse");
    RoxString error;
    for (const char* element : {"1", "[]", "{}", "null"}) {
        ref<Dictionary> dictionary =
            Dictionary::FromJson(Text(pool, ArrayText(65535, element)), error, &pool);
        ASSERT_NE(dictionary.get(), nullptr);
        EXPECT_EQ(dictionary->GetArray(Text(pool, "a"))->CountValues(), 65535u);
        dictionary = Dictionary::FromJson(Text(pool, ArrayText(65536, element)), error, &pool);
        EXPECT_EQ(dictionary.get(), nullptr);
        EXPECT_EQ(
            String(error),
            "Too many elements in an array Failed to parse an array member. Failed to parse value for key a");
    }
}

TEST(DictionaryParser, ReadsIntoFullContainers) {
    for (const char* text : {"1", "[]", "{}"}) {
        Part part(text);
        const ref<DictValue> none;
        for (unsigned i = 0; i < 65535; ++i) {
            ASSERT_TRUE(part.array->Add(none));
            ASSERT_TRUE(part.dictionary->Add(RoxString("k"), none));
        }
        EXPECT_FALSE(part.Element());
        EXPECT_EQ(String(part.error), "Too many elements in an array");
    }
    for (const char* text : {"1", "[]", "{}"}) {
        Part part(text);
        const RoxString key("k");
        for (unsigned i = 0; i < 65535; ++i) ASSERT_TRUE(part.dictionary->Add(key, ref<DictValue>()));
        EXPECT_FALSE(part.Member("k"));
        EXPECT_EQ(String(part.error), "Too many values of a name");
        Part whole("{k:" + std::string(text) + "}");
        for (unsigned i = 0; i < 65535; ++i) ASSERT_TRUE(whole.dictionary->Add(key, ref<DictValue>()));
        EXPECT_FALSE(whole.Object());
        EXPECT_EQ(String(whole.error), "Too many values of a name Failed to parse value for key k");
    }
}

}  // namespace
