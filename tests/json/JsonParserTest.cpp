#include "sorn/json/JsonParser.h"

#include <gtest/gtest.h>

#include "json/JsonParserFixture.h"
#include "rox/VkCast.h"

using namespace std::string_literals;
using jsontest::ParseWhole;
using jsontest::Show;
using sorn::Dictionary;
using sorn::DictValue;
using sorn::JsonParser;

namespace {

const std::string cancelledG = "error: parse error: client cancelled parse via callback return value\n";
const std::string prematureG = "error: parse error: premature EOF\n";
const std::string garbageG = "error: parse error: trailing garbage\n";

struct Case {
    std::string text;
    std::string shown;
};

TEST(JsonParser, Values) {
    const Case cases[] = {
        {"{}", "{}"},
        {" {\t\r\n} ", "{}"},
        {R"({"a":1})", "{a:1}"},
        {R"({"a":"1"})", "{a:'1'}"},
        {R"({"a":""})", "{a:''}"},
        {R"({"":"x"})", "{:'x'}"},
        {R"({"a":true,"b":false})", "{a:true,b:false}"},
        {R"({"a":"true","b":"null"})", "{a:'true',b:'null'}"},
        {R"({"a":null})", "{a:null}"},
        {R"({"a":1.5e3})", "{a:1.5e3}"},
        {R"({"a":-0,"b":1E+2,"c":0.0e-7})", "{a:-0,b:1E+2,c:0.0e-7}"},
        {R"({"a":123456789012345678901234567890})", "{a:123456789012345678901234567890}"},
        {R"({"a":[]})", "{a:[]}"},
        {R"({"a":[null,true,"x",-1,[],{}]})", "{a:[null,true,'x',-1,[],{}]}"},
        {R"({"a":{"b":[1,{"c":2}]},"d":3})", "{a:{b:[1,{c:2}]},d:3}"},
        {R"({"a":[[1],[2,[3]],4],"b":5})", "{a:[[1],[2,[3]],4],b:5}"},
        {R"({"a":[{"b":1},{"b":2}],"c":{"b":3}})", "{a:[{b:1},{b:2}],c:{b:3}}"},
        {R"({"a":1,"a":2})", "{a:1,a:2}"},
        {R"({"a":1,"b":0,"a":[2],"a":{"a":3}})", "{a:1,a:[2],a:{a:3},b:0}"},
        // Escapes are decoded, in keys too.
        {R"({"a":"\"\\\/\b\f\n\r\t"})", "{a:'\"\\/\b\f\n\r\t'}"},
        {R"({"a":"\u00e9"})", "{a:'\xC3\xA9'}"},
        {R"({"a":"\u20AC\u0041"})",
         "{a:'\xE2\x82\xAC"
         "A'}"},
        {R"({"a":"\ud83d\ude00"})", "{a:'\xF0\x9F\x98\x80'}"},
        {R"({"\u0061\n":1})", "{a\n:1}"},
        {R"({"a":"x\u0000y"})", "{a:'x\0y'}"s},
        {"{\"a\":\"\xC3\xA9\x7F\"}", "{a:'\xC3\xA9\x7F'}"},
    };
    for (const Case& c : cases) EXPECT_EQ(ParseWhole(c.text), c.shown) << c.text;
}

// The words are yajl's own.
TEST(JsonParser, Refusals) {
    const Case cases[] = {
        {"", prematureG},
        {" \n", prematureG},
        {"{", prematureG},
        {R"({"a")", prematureG},
        {R"({"a":)", prematureG},
        {R"({"a":1)", prematureG},
        {R"({"a":"b)", prematureG},
        {R"({"a":[1)", prematureG},
        {"[1]", cancelledG},
        {"[", cancelledG},
        {"5", cancelledG},
        {"-5.25e7", cancelledG},
        {"5 ", cancelledG},
        {"true", cancelledG},
        {"null", cancelledG},
        {R"("text")", cancelledG},
        {R"("text)", prematureG},
        {"tru", "error: lexical error: invalid string in json text.\n"},
        {"x", "error: lexical error: invalid char in json text.\n"},
        {"\xEF\xBB\xBF{}", "error: lexical error: invalid char in json text.\n"},
        {"]", "error: parse error: unallowed token at this point in JSON text\n"},
        {"{} x", garbageG},
        {"{}{}", garbageG},
        {"{} 1", garbageG},
        {"{} tru", garbageG},
        {R"({}"a")", garbageG},
        {"{a:1}", "error: lexical error: invalid char in json text.\n"},
        {R"({"a":word})", "error: lexical error: invalid char in json text.\n"},
        {R"({"a":+1})", "error: lexical error: invalid char in json text.\n"},
        {R"({"a":.5})", "error: lexical error: invalid char in json text.\n"},
        {R"({"a":1,})", "error: parse error: invalid object key (must be a string)\n"},
        {R"({"a":[1,]})", "error: parse error: unallowed token at this point in JSON text\n"},
        {R"({"a":01})", "error: parse error: after key and value, inside map, I expect ',' or '}'\n"},
        {R"({"a" 1})", "error: parse error: object key and value must be separated by a colon (':')\n"},
        {R"({"a":/**/1})",
         "error: lexical error: probable comment found in input text, comments are not enabled.\n"},
        {R"({"a":"\q"})",
         "error: lexical error: inside a string, '\\' occurs before a character which it may not.\n"},
        {R"({"a":"\u12g4"})",
         "error: lexical error: invalid (non-hex) character occurs after '\\u' inside string.\n"},
        {"{\"a\":\"\xFF\"}", "error: lexical error: invalid bytes in UTF8 string.\n"},
        {"{\"a\":\"\xC3\"}", "error: lexical error: invalid bytes in UTF8 string.\n"},
        {"{\"a\":\"\x01\"}", "error: lexical error: invalid character inside string.\n"},
        {"{\"a\":\"\0\"}"s, "error: lexical error: invalid character inside string.\n"},
        {"{\0}"s, "error: lexical error: invalid char in json text.\n"},
    };
    for (const Case& c : cases) EXPECT_EQ(ParseWhole(c.text), c.shown) << c.text;
}

// yajl alone would pass over a string behind the object that has no end.
TEST(JsonParser, AnUnfinishedStringBehindTheObjectIsRefused) {
    for (const char* text : {R"({}")", R"({} "abc)", R"({"a":1} "ab\n)", R"({} "\)", R"({} "\u)",
                             R"({} "\u00)", "{} \"\xC3", "{} \"\x01"}) {
        EXPECT_EQ(ParseWhole(text), garbageG) << text;
    }
}

bool Feed(JsonParser& parser, std::string_view text) {
    return parser.ParseChunk(text.data(), text.size());
}

TEST(JsonParser, NoMapAtTheTopIsRefusedByItsChunk) {
    for (const char* text : {"[1]", "[", "5", "17", "-1.5", "true ", "null", "\"a\""}) {
        RoxMempool pool("test");
        ref<Dictionary> result;
        JsonParser parser(&pool);
        parser.BeginParse(result);
        EXPECT_FALSE(Feed(parser, text)) << text;
        EXPECT_EQ(std::string("error: ") + parser.GetErrorMessage(), cancelledG) << text;
        EXPECT_EQ(result.get(), nullptr) << text;
        EXPECT_FALSE(Feed(parser, "{}")) << text;
        EXPECT_FALSE(parser.EndParse()) << text;
        EXPECT_STRNE(parser.GetErrorMessage(), nullptr) << text;
        EXPECT_EQ(result.get(), nullptr) << text;
    }
}

TEST(JsonParser, ThePartThatWasBuiltStaysAfterAFailure) {
    const Case cases[] = {
        {R"({"a":)", "{}"},
        {R"({"a":1,"b":)", "{a:1}"},
        {R"({"a":[1,{"b":2},x)", "{a:[1,{b:2}]}"},
        {R"({"a":{"b":{)", "{a:{b:{}}}"},
        {"{}}", "{}"},
        {"", "nothing"},
    };
    for (const Case& c : cases) {
        RoxMempool pool("test");
        ref<Dictionary> result;
        JsonParser parser(&pool);
        parser.BeginParse(result);
        EXPECT_FALSE(Feed(parser, c.text) && parser.EndParse()) << c.text;
        EXPECT_NE(parser.GetErrorMessage(), nullptr) << c.text;
        EXPECT_EQ(Show(result.get()), c.shown) << c.text;
    }
}

TEST(JsonParser, TheResultIsTakenWithTheBraceAndReplacesWhatWasThere) {
    RoxMempool pool("test");
    ref<Dictionary> result = Dictionary::New(&pool, "before");
    JsonParser parser(&pool);
    parser.BeginParse(result);
    EXPECT_TRUE(Feed(parser, " "));
    EXPECT_EQ(Show(result.get()), "{type:'before'}");
    EXPECT_TRUE(Feed(parser, "{"));
    EXPECT_EQ(Show(result.get()), "{}");
    EXPECT_TRUE(Feed(parser, R"("a":tr)"));
    EXPECT_EQ(Show(result.get()), "{}");
    EXPECT_TRUE(Feed(parser, R"(ue,)"));
    EXPECT_EQ(Show(result.get()), "{a:true}");
    EXPECT_TRUE(Feed(parser, R"("b":0})"));
    EXPECT_TRUE(parser.EndParse());
    EXPECT_EQ(Show(result.get()), "{a:true,b:0}");
}

TEST(JsonParser, EndMayBeAskedAgain) {
    RoxMempool pool("test");
    for (const bool isGood : {true, false}) {
        ref<Dictionary> result;
        JsonParser parser(&pool);
        parser.BeginParse(result);
        EXPECT_TRUE(Feed(parser, isGood ? "{}" : "{"));
        for (unsigned i = 0; i < 3; ++i) {
            EXPECT_EQ(parser.EndParse(), isGood);
            EXPECT_EQ(parser.GetErrorMessage() == nullptr, isGood);
        }
    }
}

TEST(JsonParser, DuplicatesCountAndAreWrittenTwice) {
    RoxMempool pool("test");
    ref<Dictionary> result;
    JsonParser parser(&pool);
    parser.BeginParse(result);
    EXPECT_TRUE(Feed(parser, R"({"a":1,"a":2})") && parser.EndParse());
    EXPECT_EQ(result->CountValues("a"), 2u);
    EXPECT_EQ(jsontest::String(result->ToJson(false)), R"({"a": 1, "a": 2})");
}

TEST(JsonParser, AFractionIsBareAndWrittenWithQuotes) {
    RoxMempool pool("test");
    ref<Dictionary> result;
    JsonParser parser(&pool);
    parser.BeginParse(result);
    EXPECT_TRUE(Feed(parser, R"({"a":1.5e3})") && parser.EndParse());
    EXPECT_EQ(parser.GetErrorMessage(), nullptr);
    EXPECT_EQ(Show(result.get()), "{a:1.5e3}");
    EXPECT_EQ(jsontest::String(result->ToJson(false)), R"({"a": "1.5e3"})");
}

TEST(JsonParser, NullHasItsClass) {
    RoxMempool pool("test");
    ref<Dictionary> result;
    JsonParser parser(&pool);
    parser.BeginParse(result);
    EXPECT_TRUE(Feed(parser, R"({"a":null})") && parser.EndParse());
    EXPECT_NE(VkCast<sorn::NullValue>(result->Get("a").get()), nullptr);
}

TEST(JsonParser, SyntaxAlone) {
    for (const char* text : {"{}", "[1,2]", "5", "\"a\"", "null", R"({"a":1e999999,"b":[{"c":"\u0041"}]})"}) {
        RoxMempool pool("test");
        {
            JsonParser parser(&pool);
            parser.BeginParse();
            EXPECT_TRUE(Feed(parser, text)) << text;
            EXPECT_TRUE(parser.EndParse()) << text;
            EXPECT_EQ(parser.GetErrorMessage(), nullptr) << text;
        }
        EXPECT_EQ(pool.GetUsedBytes(), 0u) << text;
    }
    for (const char* text : {"", "[", "[1,]", "{a:1}", "5 5", "\"a", "{} \"a"}) {
        RoxMempool pool("test");
        JsonParser parser(&pool);
        parser.BeginParse();
        EXPECT_FALSE(Feed(parser, text) && parser.EndParse()) << text;
        EXPECT_NE(parser.GetErrorMessage(), nullptr) << text;
    }
}

TEST(JsonParser, EmptyChunks) {
    RoxMempool pool("test");
    ref<Dictionary> result;
    JsonParser parser(&pool);
    parser.BeginParse(result);
    EXPECT_TRUE(parser.ParseChunk(nullptr, 0));
    for (const char c : R"({"key":"value","n":12})"s) {
        EXPECT_TRUE(parser.ParseChunk(&c, 1));
        EXPECT_TRUE(parser.ParseChunk(&c, 0));
    }
    EXPECT_TRUE(parser.EndParse());
    EXPECT_EQ(Show(result.get()), "{key:'value',n:12}");
}

TEST(JsonParser, DestructionEndsTheParse) {
    RoxMempool pool("test");
    ref<Dictionary> result;
    {
        JsonParser neverBegun(&pool);
        EXPECT_EQ(neverBegun.GetErrorMessage(), nullptr);
        JsonParser parser(&pool);
        parser.BeginParse(result);
        EXPECT_TRUE(Feed(parser, R"({"a":[{"b":)"));
    }
    EXPECT_EQ(Show(result.get()), "{a:[{}]}");
    // The words about the missing end are left in the pool; nothing else is.
    result = nullptr;
    EXPECT_LE(pool.GetUsedBytes(), 64u);
}

TEST(JsonParser, DictStack) {
    RoxMempool pool("test");
    const ref<Dictionary> map = Dictionary::New(&pool, "");
    const ref<sorn::ArrayValue> array(new (&pool) sorn::ArrayValue);
    JsonParser::DictStack stack;
    nonRef<DictValue> value(map.get());
    JsonParser::State state = JsonParser::STATE_ARRAY;

    EXPECT_TRUE(stack.IsEmpty());
    EXPECT_FALSE(stack.Peek(value, state) || stack.PeekDictValue(value) || stack.PeekState(state) ||
                 stack.Pop(value, state));
    EXPECT_EQ(value.Get(), map.get());
    EXPECT_EQ(state, JsonParser::STATE_ARRAY);
    EXPECT_FALSE(stack.Push(nonRef<DictValue>(), JsonParser::STATE_MAP));
    EXPECT_TRUE(stack.IsEmpty());

    EXPECT_TRUE(stack.Push(nonRef<DictValue>(map.get()), JsonParser::STATE_MAP));
    EXPECT_TRUE(stack.Push(nonRef<DictValue>(array.get()), JsonParser::STATE_ARRAY));
    EXPECT_EQ(map->GetRefCount(), 1u);
    EXPECT_TRUE(stack.PeekDictValue(value) && stack.PeekState(state));
    EXPECT_EQ(value.Get(), array.get());
    EXPECT_EQ(state, JsonParser::STATE_ARRAY);
    EXPECT_TRUE(stack.Pop(value, state));
    EXPECT_EQ(value.Get(), array.get());
    EXPECT_EQ(state, JsonParser::STATE_ARRAY);
    EXPECT_TRUE(stack.Peek(value, state));
    EXPECT_EQ(value.Get(), map.get());
    EXPECT_EQ(state, JsonParser::STATE_MAP);
    EXPECT_FALSE(stack.IsEmpty());
    // The destructor frees the node that is left; the leak checker looks.
}

TEST(JsonParser, AStackOfManyBlocks) {
    RoxMempool pool("test");
    const ref<Dictionary> map = Dictionary::New(&pool, "");
    const ref<sorn::ArrayValue> array(new (&pool) sorn::ArrayValue);
    JsonParser::DictStack stack;
    nonRef<DictValue> value;
    JsonParser::State state = JsonParser::STATE_NONE;
    for (const unsigned n : {509u, 510u, 511u, 2000u}) {
        for (unsigned i = 0; i < n; ++i) {
            const bool isMap = i % 3 == 0;
            stack.Push(nonRef<DictValue>(isMap ? static_cast<DictValue*>(map.get()) : array.get()),
                       isMap ? JsonParser::STATE_MAP : JsonParser::STATE_ARRAY);
        }
        for (unsigned i = n; i-- > 0;) {
            ASSERT_TRUE(stack.Pop(value, state));
            ASSERT_EQ(state, i % 3 == 0 ? JsonParser::STATE_MAP : JsonParser::STATE_ARRAY);
            ASSERT_EQ(value.Get(), i % 3 == 0 ? static_cast<DictValue*>(map.get()) : array.get());
        }
        EXPECT_TRUE(stack.IsEmpty());
    }
}

TEST(JsonParser, ConstantsAreTheDescribedOnes) {
    EXPECT_STREQ(JsonParser::ErrorMessageJsonIsNotAMap, "The JSON must start with a '{' character");
    // Numbers come as their text: yajl converts none.
    EXPECT_TRUE(JsonParser::CALLBACKS.yajl_integer == nullptr);
    EXPECT_TRUE(JsonParser::CALLBACKS.yajl_double == nullptr);
    EXPECT_TRUE(JsonParser::CALLBACKS.yajl_number != nullptr);
}

TEST(JsonParser, NumbersOfStates) {
    EXPECT_EQ(int{JsonParser::STATE_NONE}, 0);
    EXPECT_EQ(int{JsonParser::STATE_MAP}, 1);
    EXPECT_EQ(int{JsonParser::STATE_ARRAY}, 2);
}

TEST(JsonParserDeathTest, ProgrammingErrors) {
    RoxMempool pool("test");
    ref<Dictionary> result;
    EXPECT_DEATH(JsonParser parser(nullptr), "__null != pMempoolM");
    EXPECT_DEATH(JsonParser(&pool).ParseChunk("{}", 2), "wasParsingStarted");
    EXPECT_DEATH(JsonParser(&pool).EndParse(), "wasBeginParseCalled");
    JsonParser parser(&pool);
    parser.BeginParse(result);
    EXPECT_DEATH(parser.BeginParse(), "!wasBeginParseCalled");
    EXPECT_DEATH(parser.BeginParse(result), "!wasBeginParseCalled");
}

}  // namespace
