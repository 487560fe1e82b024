#include "sorn/model/DateTime.h"

#include <gtest/gtest.h>

#include <limits>
#include <random>
#include <string>
#include <type_traits>

#include "model/LibcMoment.h"
#include "rox/RoxMempool.h"
#include "sorn/model/ScalarText.h"

namespace sorn {
namespace {

using namespace sorntest;

static_assert(std::is_trivially_copyable_v<DateTime> && sizeof(DateTime) == 8);

constexpr int64_t firstOf2038G = 2145916800000;  // 24837 days of 86400000 milliseconds

std::string Print(int64_t milliseconds) {
    char text[scalartext::maxMomentBytesG];
    return std::string(text, DateTime(milliseconds).FormatTo(text));
}

int64_t Parse(const std::string& text) {
    return DateTime::Parse(RoxString::FromUtf8Bytes(nullptr, static_cast<unsigned>(text.size()), text.data()))
        .milliseconds;
}

/// What the C library reads, counted by years and months, and clamped; 0 for what it refuses.
int64_t ParseWithLibc(const std::string& text) {
    const auto parts = ReadWithLibc(text, {"%F %T", "%FT%T"});
    if (!parts) return 0;
    return parts->tm_year >= 138 ? firstOf2038G : SecondsByCounting(*parts) * 1000;
}

TEST(DateTime, ZeroIsTheFirstMomentOf1970) {
    EXPECT_EQ(DateTime::ZERO.milliseconds, 0);
    EXPECT_EQ(DateTime().milliseconds, 0);
    EXPECT_TRUE(DateTime(5) == DateTime(5));
    EXPECT_TRUE(DateTime(5) != DateTime(6));
    EXPECT_TRUE(DateTime(int64_t{1} << 32) != DateTime(0));
    EXPECT_STREQ(DateTime::ZERO.ToString().Utf8(), "1970-01-01 00:00:00");
}

TEST(DateTime, Prints) {
    const struct {
        int64_t milliseconds;
        const char* text;
    } cases[] = {
        {0, "1970-01-01 00:00:00"},
        {999, "1970-01-01 00:00:00"},  // milliseconds are dropped
        {1000, "1970-01-01 00:00:01"},
        {-1, "1970-01-01 00:00:00"},  // towards zero
        {-1000, "1969-12-31 23:59:59"},
        {951827696789, "2000-02-29 12:34:56"},  // 11016 * 86400 + 45296 seconds
        {2145916799999, "2037-12-31 23:59:59"},
        {firstOf2038G, "2038-01-01 00:00:00"},
        {2147483647000, "2038-01-19 03:14:07"},  // the last second of 32 bits, and the next
        {2147483648000, "2038-01-19 03:14:08"},
        {-2147483649000, "1901-12-13 20:45:51"},
        {253402300799999, "9999-12-31 23:59:59"},  // 2932897 * 86400 - 1 seconds
        {253402300800000, "10000-01-01 00:00:00"},
    };
    for (const auto& each : cases) {
        EXPECT_EQ(Print(each.milliseconds), each.text) << each.milliseconds;
        EXPECT_STREQ(DateTime(each.milliseconds).ToString().Utf8(), each.text);
    }
}

TEST(DateTime, PrintsTheWholeRange) {
    EXPECT_EQ(Print(std::numeric_limits<int64_t>::max()), "292278994-08-17 07:12:55");
    EXPECT_EQ(Print(std::numeric_limits<int64_t>::min()), "-292275055-05-16 16:47:05");  // the longest text
}

TEST(DateTime, Parses) {
    const struct {
        const char* text;
        int64_t milliseconds;
    } cases[] = {
        {"1970-01-01 00:00:00", 0},
        {"1970-01-01 00:00:01", 1000},
        {"1970-01-01T00:00:01", 1000},
        {"1969-12-31 23:59:59", -1000},
        {"2000-02-29 12:34:56", 951827696000},
        {"2000-02-29T12:34:56", 951827696000},
        {"1900-03-01 00:00:00", -2203891200000},   // -25508 days
        {"0001-01-01T00:00:00", -62135596800000},  // -719162 days
        {"1970-1-2 3:4:5", 97445000},              // one digit each: 86400 + 11045
        {"1970-1-2T3:4:5", 97445000},
        {" 1970- 1- 2 3: 4: 5", 97445000},
        {"1970-01-02   03:04:05", 97445000},  // a blank of the format takes any white space, and none
        {"1970-01-02\t\n03:04:05", 97445000},
        {"1970-01-0203:04:05", 97445000},
        {"1970-01-02T 3:04:05", 97445000},
        {"1970-01-01 23:59:60", 86400000},
        {"1970-01-01 23:59:61", 86401000},
        {"1970-02-30 00:00:00", 5184000000},  // 60 days
    };
    for (const auto& each : cases) {
        EXPECT_EQ(Parse(each.text), each.milliseconds) << each.text;
        EXPECT_EQ(ParseWithLibc(each.text), each.milliseconds) << each.text;
    }
}

TEST(DateTime, ClampsTheYearsFrom2038) {
    EXPECT_EQ(DateTime::clampMillisecondsG, firstOf2038G);
    const struct {
        const char* text;
        int64_t milliseconds;
    } cases[] = {
        {"2037-12-31 23:59:59", firstOf2038G - 1000}, {"2037-12-31T23:59:59", firstOf2038G - 1000},
        {"2037-12-31 23:59:60", firstOf2038G},  // still of 2037, and not clamped
        {"2037-12-31 23:59:61", firstOf2038G + 1000}, {"2038-01-01 00:00:00", firstOf2038G},
        {"2038-01-01 00:00:01", firstOf2038G},        {"2040-06-15 12:00:00", firstOf2038G},
        {"2040-06-15T12:00:00", firstOf2038G},        {"9999-12-31 23:59:59", firstOf2038G},
    };
    for (const auto& each : cases) EXPECT_EQ(Parse(each.text), each.milliseconds) << each.text;
}

TEST(DateTime, PrintsABlankForTheTForm) {
    EXPECT_STREQ(DateTime::Parse("2000-02-29T12:34:56").ToString().Utf8(), "2000-02-29 12:34:56");
}

TEST(DateTime, RefusesTheRest) {
    for (const char* text : {"",
                             " ",
                             "2000-02-29",
                             "12:34:56",
                             "2000-02-29 12:34",
                             "2000-02-29 12:34:56 ",
                             "2000-02-29 12:34:56Z",
                             "2000-02-29T12:34:56Z",
                             "2000-02-29 12:34:56.789",
                             "2000-02-29t12:34:56",
                             "2000-02-29 T12:34:56",
                             "2000-02-29TT12:34:56",
                             "2000-02-29 24:00:00",
                             "2000-02-29 23:60:00",
                             "2000-02-29 23:59:62",
                             "2000-02-32 00:00:00",
                             "2000-00-01 00:00:00",
                             "2000-13-01 00:00:00",
                             "20000-01-01 00:00:00",
                             "-200-01-01 00:00:00",
                             "2040-01-01 00:00:00x",
                             "2040-01-01",
                             "951827696",
                             "invalid"}) {
        EXPECT_EQ(Parse(text), 0) << text;
    }
    EXPECT_EQ(Parse(std::string("2000-02-29 12:34:56\0", 20)), 0);
    EXPECT_EQ(Parse(std::string("2000-02-29\0T12:34:56", 20)), 0);
    EXPECT_EQ(Parse(std::string("2000-02-29\00012:34:56", 19)), 0);
}

TEST(DateTime, PrintsIntoThePool) {
    RoxMempool pool("moment");
    EXPECT_EQ(DateTime(1).ToString(&pool).GetMempool(), &pool);
    EXPECT_EQ(DateTime(1).ToString().GetMempool(), nullptr);
}

TEST(DateTime, NowIsTheSystemsClock) {
    const int64_t before = int64_t{std::time(nullptr)} * 1000;
    const int64_t now = DateTime::Now().milliseconds;
    const int64_t after = (int64_t{std::time(nullptr)} + 1) * 1000;
    EXPECT_LE(before - 1000, now);  // time() may lag by a tick
    EXPECT_LE(now, after + 1000);
}

TEST(DateTime, NowHasMilliseconds) {
    bool fFraction = false;
    for (int i = 0; i < 1000 && !fFraction; ++i) {
        const int64_t start = DateTime::Now().milliseconds;
        while (DateTime::Now().milliseconds == start) {
        }
        fFraction = DateTime::Now().milliseconds % 1000 != 0;
    }
    EXPECT_TRUE(fFraction);
}

TEST(DateTime, AgreesWithTheCLibraryTo2037) {
    std::mt19937 random(20371231);
    for (int64_t day = 0; day <= 24836; ++day) {
        const int64_t seconds = day * 86400 + static_cast<int64_t>(random() % 86400);
        const std::string text = FormatWithLibc(seconds, "%F %T");
        ASSERT_EQ(Print(seconds * 1000 + static_cast<int64_t>(random() % 1000)), text);
        ASSERT_EQ(Parse(text), seconds * 1000) << text;
        const std::string other = FormatWithLibc(seconds, "%FT%T");
        ASSERT_EQ(Parse(other), seconds * 1000) << other;
        auto parts = ReadWithLibc(text, {"%F %T"});
        ASSERT_TRUE(parts);
        ASSERT_EQ(::timegm(&*parts), seconds);
    }
}

TEST(DateTime, AgreesWithTheCLibraryOnEveryCountOfMilliseconds) {
    std::mt19937_64 random(1970);
    for (int i = 0; i < 200000; ++i) {
        int64_t milliseconds = static_cast<int64_t>(random() >> (random() % 40));
        if (random() % 2 == 0) milliseconds = -milliseconds;
        if (!fWideTime) milliseconds %= 2147483648000;
        ASSERT_EQ(Print(milliseconds), FormatWithLibc(milliseconds / 1000, "%F %T")) << milliseconds;
    }
}

TEST(DateTime, AgreesWithTheCLibraryOnMalformedTexts) {
    for (const char* text :
         {"2000-02-29 12:34:56", "2000-02-29T12:34:56", "1970-1-2 3:4:5", "2037-12-31 23:59:60",
          "2038-01-01T00:00:00", " 1999- 2-31   1: 2: 3", "1970-01-0203:04:05", ""}) {
        ForEachNeighbour(text, [](const std::string& changed) {
            ASSERT_EQ(Parse(changed), ParseWithLibc(changed)) << changed;
        });
    }
    ForEachNeighbour("1999-12-31 23:59:59", [](const std::string& changed) {
        ForEachNeighbour(changed, [](const std::string& twice) {
            ASSERT_EQ(Parse(twice), ParseWithLibc(twice)) << twice;
        });
    });
}

}  // namespace
}  // namespace sorn
