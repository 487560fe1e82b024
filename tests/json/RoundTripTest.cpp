#include <gtest/gtest.h>

#include <random>

#include "json/Support.h"
#include "sorn/dict/Dict.h"

using jsontest::Parse;
using jsontest::String;
using jsontest::Text;
using sorn::Dict;
using sorn::Dictionary;

namespace {

/// Random texts of which each is what the writer makes of it: sorted keys, its separators, quotes where it
/// puts them.
class Texts {
 public:
    explicit Texts(unsigned seed) : randomM(seed) {}

    std::string Object(unsigned depth) {
        std::string names[4];
        const unsigned n = Below(5);
        for (unsigned i = 0; i < n; ++i) names[i] = std::string(1, static_cast<char>('a' + i)) + Inside(6);
        std::string text = "{";
        for (unsigned i = 0; i < n; ++i) text += (i == 0 ? "\"" : ", \"") + names[i] + "\": " + Value(depth);
        return text + "}";
    }

 private:
    unsigned Below(unsigned n) { return static_cast<unsigned>(randomM()) % n; }

    std::string Value(unsigned depth) {
        switch (Below(depth == 0 ? 4 : 6)) {
            case 0:
                return "null";
            case 1:
                return std::to_string(static_cast<int>(randomM()));
            case 2:
                return "true";
            case 4:
                return Object(depth - 1);
            case 5:
                return Array(depth - 1);
            default:
                return "\"" + Inside(40) + "\"";
        }
    }
    std::string Array(unsigned depth) {
        std::string text = "[";
        const unsigned n = Below(4);
        for (unsigned i = 0; i < n; ++i) text += (i == 0 ? "" : ", ") + Value(depth);
        return text + "]";
    }
    /// What may stand between quotes in the form of the writer.
    std::string Inside(unsigned nMost) {
        static const char* const pieces[] = {"x",        " ",   "\\n",        "\\\"",    "\\\\ ",  "\\u00e9",
                                             "\xC3\xA9", "/",   "\\t",        "\\u0001", "\x03",   "\x1A",
                                             "\x7F",     "\\b", "word",       "12.5",    ",:{}[]", "\\f\\r",
                                             "\xFF",     "u",   "longer text"};
        std::string text;
        for (unsigned n = Below(nMost); n > 0; --n) text += pieces[Below(sizeof pieces / sizeof pieces[0])];
        return text;
    }

    std::mt19937 randomM;
};

TEST(RoundTrip, CompactTextComesBackByteForByte) {
    for (unsigned seed = 0; seed < 2000; ++seed) {
        const std::string text = Texts(seed).Object(5);
        // Names may be unsorted behind their first letters' order only if letters repeat, and they do not.
        ASSERT_EQ(Parse(text), text) << seed;
    }
}

TEST(RoundTrip, PrettyTextReadsAsTheSame) {
    for (unsigned seed = 0; seed < 500; ++seed) {
        const std::string text = Texts(seed).Object(5);
        RoxMempool pool("roundtrip");
        RoxString error;
        const ref<Dictionary> first = Dictionary::FromJson(Text(pool, text), error, &pool);
        ASSERT_NE(first.get(), nullptr);
        const ref<Dictionary> second = Dictionary::FromJson(first->ToJson(true), error, &pool);
        ASSERT_NE(second.get(), nullptr) << String(error);
        EXPECT_EQ(String(second->ToJson(false)), text);
        EXPECT_EQ(String(second->ToJson(true)), String(first->ToJson(true)));
    }
}

TEST(RoundTrip, DictComparesAndPrintsByText) {
    RoxMempool pool("roundtrip");
    RoxString error;
    const auto make = [&](const char* text) {
        return ref<Dict>(new (&pool) Dict(Dictionary::FromJson(RoxString(text), error, &pool)));
    };
    const ref<Dict> a = make(R"({"x":[1,null],"y":"2"})");
    EXPECT_EQ(String(a->ToString(false)), R"({"x": [1, null], "y": "2"})");
    EXPECT_EQ(String(a->ToString(true)),
              "{\n    \"x\": [\n        1, \n        null\n    ], \n    \"y\": \"2\"\n}");
    EXPECT_TRUE(*a == *make(R"({"y":"2","x":[1,null]})"));
    EXPECT_TRUE(*a != *make(R"({"y":2,"x":[1,null]})"));
    EXPECT_FALSE(*a == *make(R"({"y":"2"})"));
}

}  // namespace
