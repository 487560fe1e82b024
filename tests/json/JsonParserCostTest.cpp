#include <dlfcn.h>
#include <gtest/gtest.h>
#include <yajl/yajl_parse.h>

#include "json/JsonParserFixture.h"
#include "support/SmallStack.h"

using jsontest::Cut;
using jsontest::NotingSource;
using jsontest::Pieces;
using sorn::Dictionary;
using sorn::JsonParser;

namespace {

size_t nFedG = 0;         // bytes that yajl was given in this parse
size_t tokenEndG = 0;     // where the one long token of the text ends, which begins almost at once
uint64_t nLookedAtG = 0;  // bytes that yajl looked at until it had that token

}  // namespace

/// Stands before yajl's own: with each feed, yajl looks at all of an unfinished token again.
extern "C" yajl_status yajl_parse(yajl_handle handle, const unsigned char* text, size_t length) {
    using Function = yajl_status (*)(yajl_handle, const unsigned char*, size_t);
    static const Function theirs = reinterpret_cast<Function>(dlsym(RTLD_NEXT, "yajl_parse"));
    const bool isInToken = nFedG < tokenEndG;
    nFedG += length;
    if (isInToken) nLookedAtG += nFedG;
    return theirs(handle, text, length);
}

namespace {

constexpr size_t longG = 4u << 20;

/// Feeds pieces of n bytes and gives the value under "k" of the dictionary, or the words.
std::string ParseLong(const std::string& text, size_t n, size_t tokenEnd) {
    nFedG = 0;
    tokenEndG = tokenEnd;
    nLookedAtG = 0;
    RoxMempool pool("long");
    ref<Dictionary> result;
    JsonParser parser(&pool);
    parser.BeginParse(result);
    bool isGood = true;
    for (size_t i = 0; i < text.size() && isGood; i += n) {
        isGood = parser.ParseChunk(text.data() + i, std::min(n, text.size() - i));
    }
    if (!isGood || !parser.EndParse()) return std::string("error: ") + parser.GetErrorMessage();
    return jsontest::String(result->GetString("k"));
}

// With h bytes at yajl, h - 1 wait; the next one makes yajl look at 2 h - 1 and at 2 h bytes: 4 h for h bytes
// gained, and once more for the last ones. The rest is for what stands before the token.
constexpr size_t MostLookedAt(size_t nToken) {
    return 6 * nToken + 1000;
}

TEST(JsonParserCost, ALongTokenIsLookedAtABoundedNumberOfTimesPerByte) {
    const std::string plain(longG, 'x');
    std::string escaped;
    std::string meaning;
    while (escaped.size() < longG) {
        escaped += R"(\u00e9\\word\")";
        meaning += "\xC3\xA9\\word\"";
    }
    const std::string number = "1" + std::string(longG, '0');
    const struct {
        const char* what;
        std::string text;
        const std::string& value;
    } cases[] = {
        {"string", R"({"k":")" + plain + R"("})", plain},
        {"string with escapes", R"({"k":")" + escaped + R"("})", meaning},
        {"number", R"({"k":)" + number + "}", number},
    };
    for (const auto& c : cases) {
        for (const size_t n : {size_t{1}, size_t{7}, size_t{512}, size_t{65536}, longG * 2}) {
            EXPECT_TRUE(ParseLong(c.text, n, c.text.size() - 1) == c.value) << c.what << " by " << n;
            EXPECT_LE(nLookedAtG, MostLookedAt(c.text.size())) << c.what << " by " << n;
            EXPECT_GE(nFedG, c.text.size()) << c.what << " by " << n;
        }
    }
}

TEST(JsonParserCost, ALongKey) {
    const std::string key(longG, 'k');
    for (const size_t n : {size_t{1}, size_t{512}}) {
        EXPECT_EQ(ParseLong(R"({")" + key + R"(":1,"k":"here"})", n, longG + 3), "here");
        EXPECT_LE(nLookedAtG, MostLookedAt(longG));
    }
}

TEST(JsonParserCost, AnUnfinishedLongStringIsRefused) {
    for (const size_t n : {size_t{1}, size_t{512}}) {
        EXPECT_EQ(ParseLong(R"({"k":")" + std::string(longG, 'x'), n, longG),
                  "error: parse error: premature EOF\n");
        EXPECT_LE(nLookedAtG, MostLookedAt(longG));
    }
}

// What is wrong inside of a string may be told late, but what stands outside of strings is told by its chunk.
TEST(JsonParserCost, RefusalsInsideOfALongString) {
    const std::string text = R"({"k":")" + std::string(1000, 'x') + "\x01" + std::string(5000, 'x') + R"("})";
    for (const size_t n : {size_t{1}, size_t{512}, text.size()}) {
        EXPECT_EQ(ParseLong(text, n, text.size()),
                  "error: lexical error: invalid character inside string.\n");
        EXPECT_LE(nFedG, 3000 + n) << n;
    }
}

TEST(JsonParserCost, OutsideOfTokensAllIsFedAtOnce) {
    RoxMempool pool("test");
    ref<Dictionary> result;
    JsonParser parser(&pool);
    parser.BeginParse(result);
    nFedG = 0;
    const std::string text = R"({"a":[1,"two",{"b":null}],"c":false})";
    size_t nFed = 0;
    bool fInString = false;
    for (const char c : text) {
        EXPECT_TRUE(parser.ParseChunk(&c, 1));
        ++nFed;
        if (c == '"') fInString = !fInString;
        const bool isBetween = !fInString && std::string("{}[]:,\"").find(c) != std::string::npos;
        if (isBetween) {
            EXPECT_EQ(nFedG, nFed) << text.substr(0, nFed);
        }
    }
    EXPECT_TRUE(parser.EndParse());
}

/// The text of a nest of maps or arrays, without its end.
std::string Nest(const char* level, size_t nBytes) {
    std::string text = R"({"k":)";
    while (text.size() < nBytes) text += level;
    return text;
}

#if defined(__SANITIZE_ADDRESS__)
// A pool under the sanitizer marks the whole of yajl's stack again with every 128 levels.
constexpr size_t bodyG = 1u << 20;
constexpr unsigned nLevelsG = 100000;
#else
constexpr size_t bodyG = 5u << 20;
constexpr unsigned nLevelsG = 1000000;
#endif

TEST(JsonParserCost, NestsWithoutEndAreRefused) {
    for (const char* level : {"[", R"({"a":)", R"([{"":)"}) {
        const std::string text = Nest(level, bodyG);
        RunOnSmallStack([&] {
            RoxMempool pool("deep");
            NotingSource source(text, 512);
            {
                RoxString error;
                const ref<Dictionary> result = Dictionary::FromJsonBytesource(&source, error, &pool);
                EXPECT_EQ(jsontest::String(error), "parse error: premature EOF\n");
                EXPECT_NE(result.get(), nullptr);
            }
            EXPECT_EQ(pool.GetUsedBytes(), 0u);
        });
    }
}

TEST(JsonParserCost, NestsAreReadAndWritten) {
    std::string text;
    std::string end;
    for (unsigned i = 0; i < nLevelsG / 2; ++i) text += R"({"a": [)";
    text += "1";
    for (unsigned i = 0; i < nLevelsG / 2; ++i) text += "]}";
    for (const size_t n : {size_t{1}, size_t{512}, text.size()}) {
        RunOnSmallStack([&] {
            RoxMempool pool("deep");
            {
                ref<Dictionary> result;
                JsonParser parser(&pool);
                parser.BeginParse(result);
                for (const std::string_view piece : Cut(text, n)) {
                    ASSERT_TRUE(parser.ParseChunk(piece.data(), piece.size()));
                }
                ASSERT_TRUE(parser.EndParse());
                EXPECT_TRUE(result->ToJson(false) == jsontest::Text(pool, text));
            }
            EXPECT_EQ(pool.GetUsedBytes(), 0u);
        });
    }
}

// The runtime's containers hold 65,535.
TEST(JsonParserCost, FullContainersRefuse) {
    const struct {
        const char* begin;
        const char* element;
        const char* end;
        const char* words;
    } cases[] = {
        {R"({"k":[)", "0", "]}", "Too many elements in an array"},
        {R"({"k":[)", "[]", "]}", "Too many elements in an array"},
        {R"({"k":[)", "{}", "]}", "Too many elements in an array"},
        {"{", R"("k":"x")", "}", "Too many values of a name"},
        {"{", R"("k":{})", "}", "Too many values of a name"},
        {"{", R"("k":[null])", "}", "Too many values of a name"},
    };
    for (const auto& c : cases) {
        for (const unsigned n : {65535u, 65536u}) {
            std::string text = c.begin;
            for (unsigned i = 0; i < n; ++i) text.append(i > 0 ? "," : "").append(c.element);
            text += c.end;
            RoxMempool pool("full");
            {
                NotingSource source(text, 512);
                RoxString error;
                const ref<Dictionary> result = Dictionary::FromJsonBytesource(&source, error, &pool);
                EXPECT_EQ(jsontest::String(error), n == 65535 ? "" : c.words) << c.begin << c.element;
                ASSERT_NE(result.get(), nullptr);
                const ref<sorn::ArrayValue> array = result->GetArray("k");
                const bool isArray = std::string_view(c.end) == "]}";
                EXPECT_EQ(isArray ? array->CountValues() : result->CountValues("k"), 65535u);
                EXPECT_EQ(source.CountReleases(), 1u);
            }
            EXPECT_EQ(pool.GetUsedBytes(), 0u);
        }
    }
}

TEST(JsonParserCost, TheWordsOfAFullContainerStay) {
    std::string text = R"({"k":[0)";
    for (unsigned i = 0; i < 65536; ++i) text += ",0";
    RoxMempool pool("full");
    ref<Dictionary> result;
    JsonParser parser(&pool);
    parser.BeginParse(result);
    EXPECT_FALSE(parser.ParseChunk(text.data(), text.size()));
    EXPECT_STREQ(parser.GetErrorMessage(), "Too many elements in an array");
    EXPECT_FALSE(parser.ParseChunk("]}", 2));
    EXPECT_FALSE(parser.EndParse());
    EXPECT_STREQ(parser.GetErrorMessage(), "Too many elements in an array");
}

// All memory but the nodes of open containers is the pool's: 64 KiB and so many times the input.
TEST(JsonParserCost, MemoryOfThePool) {
    std::string records = "{\"list\": [";
    for (unsigned i = 0; i < 20000; ++i) {
        records += i > 0 ? ", " : "";
        records += R"({"type": "recording", "recordingId": "tsn:recording.)" + std::to_string(100000 + i) +
                   R"(", "title": "A title of the usual length", "duration": 1800, "hdtv": true})";
    }
    records += "]}";
    std::string emptyObjects = "{";
    for (unsigned i = 0; i < 15; ++i) {
        emptyObjects += i > 0 ? "," : "";
        emptyObjects += '"' + std::string(1, static_cast<char>('a' + i)) + "\":[{}";
        for (unsigned k = 1; k < 65535; ++k) emptyObjects += ",{}";
        emptyObjects += "]";
    }
    emptyObjects += "}";
    const struct {
        const char* what;
        std::string text;
        size_t factor;
    } cases[] = {
        {"records", records, 8},
        {"a long string", R"({"k":")" + std::string(longG, 'x') + R"("})", 8},
        {"empty objects", emptyObjects, 64},
    };
    for (const auto& c : cases) {
        RoxMempool pool("memory");
        NotingSource source(c.text, 512);
        RoxString error;
        const ref<Dictionary> result = Dictionary::FromJsonBytesource(&source, error, &pool);
        EXPECT_TRUE(error.FEmpty()) << c.what;
        EXPECT_LE(pool.GetUsedBytesHighWater(), 65536 + c.factor * c.text.size()) << c.what;
        RecordProperty(c.what, std::to_string(static_cast<double>(pool.GetUsedBytesHighWater()) /
                                              static_cast<double>(c.text.size())));
    }
}

}  // namespace
