#include <gtest/gtest.h>

#include "json/JsonParserFixture.h"

using namespace std::string_literals;
using jsontest::ParseWhole;
using jsontest::Show;
using sorn::Dictionary;

// The parser by hand and the event-driven one, side by side: where they agree, and where they do not.

namespace {

/// What the parser by hand makes of a text, "error" when it refuses.
std::string ParseByHand(const std::string& text) {
    RoxMempool pool("hand");
    const jsontest::ExactBytes bytes(text);
    RoxString error;
    const ref<Dictionary> result = Dictionary::FromJson(bytes.Begin(), bytes.Size(), error, &pool);
    return result == nullptr ? "error" : Show(result.get());
}

std::string ParseEvents(const std::string& text) {
    const std::string shown = ParseWhole(text);
    return shown.substr(0, 7) == "error: " ? "error" : shown;
}

struct Case {
    std::string text;
    std::string byHand;
    std::string byEvents;
};

TEST(JsonParserComparison, WhereTheyAgree) {
    const Case cases[] = {
        {"{}", "{}", ""},
        {" \t\r\n{ } ", "{}", ""},
        {R"({"a": 1, "b": "x", "c": true, "d": null})", "{a:1,b:'x',c:true,d:null}", ""},
        {R"({"a": [1, [2, {"b": -1.5e+3}], []]})", "{a:[1,[2,{b:-1.5e+3}],[]]}", ""},
        {R"({"a": "\"\\\/\b\f\n\r\t"})", "{a:'\"\\/\b\f\n\r\t'}", ""},
        {"{\"\xC3\xA9\": \"\xE2\x82\xAC\"}", "{\xC3\xA9:'\xE2\x82\xAC'}", ""},
        {"", "error", ""},
        {"[1]", "error", ""},
        {"5", "error", ""},
        {"{", "error", ""},
        {R"({"a")", "error", ""},
        {R"({"a":})", "error", ""},
        {R"({"a":"x)", "error", ""},
        {R"({"a":[1,]})", "error", ""},
        {R"({"a":1]})", "error", ""},
        {R"({"a" 1})", "error", ""},
        {R"({"a":1} x)", "error", ""},
        {R"({"a":1} ")", "error", ""},
        {R"({"a":"\q"})", "error", ""},
        {R"({"a":1 /* no */})", "error", ""},
        {"{\"a\":\"x\0y\"}"s, "error", ""},
    };
    for (const Case& c : cases) {
        EXPECT_EQ(ParseByHand(c.text), c.byHand) << c.text;
        EXPECT_EQ(ParseEvents(c.text), c.byHand) << c.text;
    }
}

TEST(JsonParserComparison, WhereTheyDoNot) {
    const Case cases[] = {
        {R"({a:1})", "{a:1}", "error"},
        {R"({"a":word})", "{a:word}", "error"},
        {R"({"a":0x10,"b":+1})", "{a:0x10,b:+1}", "error"},
        {R"({"a":1,})", "{a:1}", "error"},
        {R"({"a":1,"a":2})", "error", "{a:1,a:2}"},
        {R"({"a":"\u00e9"})", R"({a:'\u00e9'})", "{a:'\xC3\xA9'}"},
        {R"({"a":"\uZZ"})", R"({a:'\uZZ'})", "error"},
        {"{\"a\":\"\xFF\"}", "{a:'\xFF'}", "error"},
        {"{\"a\":\"x\ny\"}", "{a:'x\ny'}", "error"},
        {"{\"a\":1}\f", "error", "{a:1}"},
    };
    for (const Case& c : cases) {
        EXPECT_EQ(ParseByHand(c.text), c.byHand) << c.text;
        EXPECT_EQ(ParseEvents(c.text), c.byEvents) << c.text;
    }
}

}  // namespace
