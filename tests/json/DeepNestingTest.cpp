#include <gtest/gtest.h>

#include "json/Support.h"
#include "sorn/json/InputPointer.h"
#include "support/SmallStack.h"

using jsontest::String;
using jsontest::Text;
using sorn::Dictionary;

namespace {

constexpr unsigned nLevelsG = 1000000;

/// {"a": [{"a": [ ... ]}]} with that many levels of the two together.
std::string DeepText(unsigned nLevels) {
    std::string text;
    for (unsigned i = 0; i < nLevels; ++i) text += i % 2 == 0 ? "{\"a\": " : "[";
    text += "1";
    for (unsigned i = nLevels; i-- > 0;) text += i % 2 == 0 ? "}" : "]";
    return text;
}

TEST(DeepNesting, ParsePrintDestroy) {
    const std::string text = DeepText(nLevelsG);
    RunOnSmallStack([&] {
        RoxMempool pool("deep");
        {
            RoxString error;
            ref<Dictionary> dictionary = Dictionary::FromJson(Text(pool, text), error, &pool);
            ASSERT_NE(dictionary.get(), nullptr) << String(error);
            EXPECT_TRUE(dictionary->ToJson(false) == Text(pool, text));
            jsontest::StringSink sink;
            dictionary->ToJson(sink, sorn::JsonFormat(false));
            EXPECT_TRUE(sink.GetText() == text);
        }
        EXPECT_EQ(pool.GetUsedBytes(), 0u);
    });
}

TEST(DeepNesting, PrettyAtModestDepth) {
    constexpr unsigned nLevels = 1000;
    // With n levels, each opening and closing line has its indentation.
    size_t expected = 1;
    for (unsigned level = 0; level < nLevels; ++level) {
        const bool isDictionary = level % 2 == 0;
        expected += isDictionary ? 2 + 5 : 2;             // brackets, name
        expected += 2;                                    // two line feeds
        expected += 4 * (level + 1) + 4 * size_t{level};  // what is inside, and the closing bracket
    }
    RunOnSmallStack([&] {
        RoxMempool pool("deep");
        RoxString error;
        const ref<Dictionary> dictionary = Dictionary::FromJson(Text(pool, DeepText(nLevels)), error, &pool);
        ASSERT_NE(dictionary.get(), nullptr);
        const RoxString pretty = dictionary->ToJson(true);
        EXPECT_EQ(pretty.NByte(), expected);
        const ref<Dictionary> again = Dictionary::FromJson(pretty, error, &pool);
        ASSERT_NE(again.get(), nullptr);
        EXPECT_EQ(String(again->ToJson(false)), DeepText(nLevels));
    });
}

TEST(DeepNesting, WordsOfAFailureInTheInnermost) {
    RunOnSmallStack([] {
        RoxMempool pool("deep");
        std::string text;
        for (unsigned i = 0; i < nLevelsG; ++i) text += i % 2 == 0 ? "{\"k\":" : "[";
        RoxString error;
        ASSERT_EQ(Dictionary::FromJson(Text(pool, text), error, &pool).get(), nullptr);
        std::string expected = "Empty scalar value for Array element.";
        for (unsigned i = nLevelsG; i-- > 0;) {
            expected +=
                i % 2 == 0 ? " Failed to parse value for key k" : " Failed to parse an array element.";
        }
        EXPECT_TRUE(String(error) == expected);
        error = RoxString();
        EXPECT_EQ(pool.GetUsedBytes(), 0u);
    });
}

TEST(DeepNesting, OnlyArraysAsAnElement) {
    RunOnSmallStack([] {
        RoxMempool pool("deep");
        const std::string text = std::string(nLevelsG, '[') + std::string(nLevelsG, ']');
        const ref<sorn::ArrayValue> array(new (&pool) sorn::ArrayValue(&pool));
        RoxString error;
        sorn::InputPointer cursor{reinterpret_cast<const unsigned char*>(text.data()),
                                  reinterpret_cast<const unsigned char*>(text.data() + text.size())};
        ASSERT_TRUE(array->FromJson(cursor, error));
        EXPECT_TRUE(cursor.FAtEnd());
        EXPECT_TRUE(array->ToJson(false) == Text(pool, text));
    });
}

}  // namespace
