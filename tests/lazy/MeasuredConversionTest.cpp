#include <cstdio>
#include <string>
#include <vector>

#include "convert/ConvertFixture.h"
#include "lazy/TextSource.h"
#include "rox/RoxFeatures.h"
#include "rox/RoxLogger.h"
#include "sorn/dict/Dict.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/lazy/LazyDict.h"

namespace sorntest {

using namespace sorn;

/// The log lines of conversions to objects.
class MeasuredConversionTest : public ConvertFixture {
 protected:
    struct Line {
        int facility;
        int priority;
        std::string tag;
        std::string message;
    };
    void SetUp() override {
        RoxLogger::SetSink(
            [](void* context, int facility, int priority, const char* tag, const char* message) {
                static_cast<MeasuredConversionTest*>(context)->lines.push_back(
                    {facility, priority, tag, message});
            },
            this);
    }
    void TearDown() override {
        RoxLogger::SetSink(nullptr, nullptr);
        RoxFeatures::SetEnabled(VK_FEATURE_TYPED_JSON, false);
        ConvertFixture::TearDown();
    }
    /// The lines of one conversion of the text, from memory or as a stream.
    const std::vector<Line>& LinesOf(const std::string& text, bool isStream, bool isTyped) {
        lines.clear();
        RoxFeatures::SetEnabled(VK_FEATURE_TYPED_JSON, isTyped);
        const ref<LazyDict> lazy = isStream ? LazyDict::FromBytesource(&pool, new TextSource(counts, text), 0)
                                            : LazyDict::FromJsonString(&pool, RoxString(text.c_str()), 0);
        lazy->ToSornObjectOrError();
        return lines;
    }

    /// The end of a line.
    struct Figures {
        bool isGood;
        int used[2];
        int highWater[2];
        std::string unit;
    };
    static Figures FiguresOf(const std::string& text) {
        Figures figures{};
        char unit[4] = "";
        double elapsed = -1;
        int n = 0;
        std::sscanf(text.c_str(), "usedBytes (%d/%d) highWater (%d/%d) elapsedTime %lf %3s%n",
                    &figures.used[0], &figures.used[1], &figures.highWater[0], &figures.highWater[1],
                    &elapsed, unit, &n);
        figures.isGood = n > 0 && static_cast<size_t>(n) == text.size() && elapsed >= 0;
        figures.unit = unit;
        return figures;
    }

    TextSource::Counts counts;
    std::vector<Line> lines;
};

TEST_F(MeasuredConversionTest, OneLineForEachConversionOfTheOneStruct) {
    const std::string text = R"({"type": "channelMapConfigInstructions", "resultToken": {"a": "b"}})";
    ASSERT_EQ(text.size(), 67u);
    struct Row {
        bool isStream;
        bool isTyped;
        const char* begin;
    };
    const Row rows[] = {
        {false, false, "ToSornObject old REP_JSON <channelMapConfigInstructions> 0 convert "},
        {false, true, "ToSornObject new REP_JSON <channelMapConfigInstructions> 67 convert "},
        {true, false, "ToSornObject old REP_BYTESOURCE <channelMapConfigInstructions> 0 convert "},
        {true, true, "ToSornObject new REP_BYTESOURCE <channelMapConfigInstructions> 67 convert "},
    };
    for (const Row& row : rows) {
        ASSERT_EQ(LinesOf(text, row.isStream, row.isTyped).size(), 1u) << row.begin;
        const std::string begin = row.begin;
        EXPECT_EQ(lines[0].facility, 0);
        EXPECT_EQ(lines[0].priority, 6);
        EXPECT_EQ(lines[0].tag, "LazyDict");
        EXPECT_EQ(lines[0].message.substr(0, begin.size()), begin);
        const Figures figures = FiguresOf(lines[0].message.substr(begin.size()));
        EXPECT_TRUE(figures.isGood) << lines[0].message;
        const std::string& unit = figures.unit;
        EXPECT_TRUE(unit == "ns" || unit == "us" || unit == "ms" || unit == "s") << lines[0].message;
    }
}

TEST_F(MeasuredConversionTest, TheFiguresAreThousandsOfBytesOfThePool) {
    // A body of 100,000 bytes stands in the pool before, and the object's text of as many behind.
    const std::string text = R"({"type": "channelMapConfigInstructions", "resultToken": {"a": ")" +
                             std::string(100'000, 'x') + "\"}}";
    for (const bool isTyped : {false, true}) {
        ASSERT_EQ(LinesOf(text, false, isTyped).size(), 1u);
        const std::string& message = lines[0].message;
        const Figures figures = FiguresOf(message.substr(message.find("usedBytes")));
        ASSERT_TRUE(figures.isGood) << message;
        const auto [before, after] = figures.used;
        EXPECT_GE(before, 100);
        EXPECT_LE(before, 130);
        EXPECT_GE(after - before, 100);
        EXPECT_LE(after - before, 130);
        EXPECT_GE(figures.highWater[0], before);
        EXPECT_GE(figures.highWater[1], after);
    }
}

TEST_F(MeasuredConversionTest, NoLineForAnythingElse) {
    const char* const texts[] = {
        R"({"type": "account", "accountId": "vuka:an.5"})",                   // another struct
        R"({"type": "channelMapConfigInstructionsGet", "bodyId": "x"})",      // a longer name
        R"({"type": "channelMapConfigInstructions", "resultToken": "x"})",    // refused
        R"({"type": "channelMapConfigInstructions", "resultToken": {"a": )",  // does not parse
        "{",
    };
    for (const char* text : texts) {
        for (const bool isStream : {false, true}) {
            for (const bool isTyped : {false, true}) {
                EXPECT_TRUE(LinesOf(text, isStream, isTyped).empty()) << text;
            }
        }
    }
    lines.clear();
    const ref<SornObject> object =
        Object(R"({"type": "channelMapConfigInstructions", "resultToken": {"a": "b"}})");
    LazyDict::FromSornObject(&pool, object, 0)->ToSornObjectOrError();
    LazyDict::FromDictionary(&pool, Context().SornObjectToDictionary(object.get(), 0), 0)
        ->ToSornObjectOrError();
    LazyDict::FromBytestring(&pool, LazyDict::FromSornObject(&pool, object, 0)->ToProtobuf(), 0)
        ->ToSornObjectOrError();
    EXPECT_TRUE(lines.empty());
}

}  // namespace sorntest
