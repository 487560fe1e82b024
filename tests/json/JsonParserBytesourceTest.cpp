#include <gtest/gtest.h>

#include "json/JsonParserFixture.h"
#include "kelbaselib/InMemoryBytestream.h"

using jsontest::NotingSource;
using jsontest::Show;
using sorn::Dictionary;

namespace {

struct Outcome {
    std::string tree;  // empty when there were words
    std::string words;
};

Outcome Read(std::string_view text, unsigned largestRead) {
    RoxMempool pool("read");
    NotingSource source(text, largestRead);
    Outcome outcome;
    {
        RoxString error;
        const ref<Dictionary> result = Dictionary::FromJsonBytesource(&source, error, &pool);
        EXPECT_TRUE(error.FEmpty() || error.GetMempool() == &pool);
        outcome.words = jsontest::String(error);
        if (error.FEmpty()) outcome.tree = Show(result.get());
    }
    EXPECT_EQ(source.CountReleases(), 1u) << text;
    EXPECT_EQ(pool.GetUsedBytes(), 0u) << text;
    return outcome;
}

TEST(FromJsonBytesource, ReadsAndReleases) {
    std::string longText = R"({"a":")" + std::string(2000, 'x') + R"(","b":[1]})";
    for (const unsigned largestRead : {1u, 3u, 511u, 512u, 513u}) {
        EXPECT_EQ(Read(R"({"a":[1,"\u00e9",null]})", largestRead).tree, "{a:[1,'\xC3\xA9',null]}");
        EXPECT_EQ(Read(longText, largestRead).tree, "{a:'" + std::string(2000, 'x') + "',b:[1]}");
    }
}

TEST(FromJsonBytesource, AsksFor512BytesUntilTheEnd) {
    RoxMempool pool("read");
    const std::string text = R"({"a":1})" + std::string(1200 - 7, ' ');
    NotingSource source(text, 100000);
    RoxString error;
    EXPECT_EQ(Show(Dictionary::FromJsonBytesource(&source, error, &pool).get()), "{a:1}");
    // 512, 512 and 176 bytes, and the end.
    EXPECT_EQ(source.GetCapacities(), std::vector<unsigned>(4, 512));
}

TEST(FromJsonBytesource, StopsReadingAtARefusal) {
    RoxMempool pool("read");
    const std::string text = "[" + std::string(5000, ' ');
    NotingSource source(text, 100000);
    RoxString error;
    EXPECT_EQ(Dictionary::FromJsonBytesource(&source, error, &pool).get(), nullptr);
    EXPECT_FALSE(error.FEmpty());
    EXPECT_EQ(source.GetCapacities().size(), 1u);
    EXPECT_EQ(source.CountReleases(), 1u);
}

TEST(FromJsonBytesource, Failures) {
    const std::string cancelled = "parse error: client cancelled parse via callback return value\n";
    const std::string premature = "parse error: premature EOF\n";
    const struct {
        const char* text;
        std::string words;
        const char* result;
    } cases[] = {
        {"", premature, "nothing"},
        {R"({"a":)", premature, "{}"},
        {R"({"a":1,"b":["x)", premature, "{a:1,b:[]}"},
        {"[1]", cancelled, "nothing"},
        {"5", cancelled, "nothing"},
        {"{a:1}", "lexical error: invalid char in json text.\n", "{}"},
        {R"({"a":1}2)", "parse error: trailing garbage\n", "{a:1}"},
        {R"({"a":1} 2)", "parse error: trailing garbage\n", "{a:1}"},
    };
    for (const auto& c : cases) {
        for (const unsigned largestRead : {1u, 512u}) {
            RoxMempool pool("read");
            NotingSource source(c.text, largestRead);
            RoxString error("left from before");
            const ref<Dictionary> result = Dictionary::FromJsonBytesource(&source, error, &pool);
            EXPECT_EQ(jsontest::String(error), c.words) << c.text;
            EXPECT_EQ(Show(result.get()), c.result) << c.text;
            EXPECT_EQ(source.CountReleases(), 1u) << c.text;
        }
        EXPECT_EQ(Read(c.text, 512).words, c.words) << c.text;  // and nothing stays in the pool
    }
}

TEST(FromJsonBytesource, SuccessLeavesTheWordsAlone) {
    RoxMempool pool("read");
    NotingSource source("{}", 512);
    RoxString error("left from before");
    EXPECT_EQ(Show(Dictionary::FromJsonBytesource(&source, error, &pool).get()), "{}");
    EXPECT_EQ(jsontest::String(error), "left from before");
}

TEST(FromJsonBytesource, OfAStreamInMemory) {
    RoxMempool pool("read");
    auto* stream = new kelbaselib::InMemoryBytestream;
    const std::string text = R"({"type":"recording","title":"A long evening"})";
    stream->Write(text.data(), static_cast<unsigned>(text.size()));
    kelbaselib::Bytesource* const first = stream->NewSource();
    RoxString error;
    EXPECT_EQ(Show(Dictionary::FromJsonBytesource(first, error, &pool).get()),
              "{title:'A long evening',type:'recording'}");
    EXPECT_EQ(Show(Dictionary::FromJsonBytesource(stream, error, &pool).get()),
              "{title:'A long evening',type:'recording'}");
    EXPECT_TRUE(error.FEmpty());
}

}  // namespace
