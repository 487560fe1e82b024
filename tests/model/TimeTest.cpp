#include "sorn/model/Time.h"

#include <gtest/gtest.h>

#include <string>
#include <type_traits>

#include "model/LibcMoment.h"
#include "rox/RoxMempool.h"
#include "sorn/model/ScalarText.h"

namespace sorn {
namespace {

using namespace sorntest;

static_assert(std::is_trivially_copyable_v<Time> && sizeof(Time) == 4);

std::string Print(int32_t milliseconds) {
    char text[scalartext::maxMomentBytesG];
    return std::string(text, Time(milliseconds).FormatTo(text));
}

int32_t Parse(const std::string& text) {
    return Time::Parse(RoxString::FromUtf8Bytes(nullptr, static_cast<unsigned>(text.size()), text.data()))
        .milliseconds;
}

int64_t ParseWithLibc(const std::string& text) {
    auto parts = ReadWithLibc(text, {"%T"});
    return parts ? int64_t{::timegm(&*parts)} * 1000 : 0;
}

TEST(Time, ZeroIsMidnight) {
    EXPECT_EQ(Time::ZERO.milliseconds, 0);
    EXPECT_EQ(Time().milliseconds, 0);
    EXPECT_TRUE(Time(5) == Time(5));
    EXPECT_TRUE(Time(5) != Time(6));
    EXPECT_STREQ(Time::ZERO.ToString().Utf8(), "00:00:00");
}

TEST(Time, Prints) {
    const struct {
        int32_t milliseconds;
        const char* text;
    } cases[] = {
        {0, "00:00:00"},
        {999, "00:00:00"},  // milliseconds are dropped
        {1000, "00:00:01"},
        {45296789, "12:34:56"},  // 45296 = (12 * 60 + 34) * 60 + 56
        {86399999, "23:59:59"},
        {86400000, "00:00:00"},  // the next day
        {-1, "00:00:00"},        // dropped towards zero
        {-999, "00:00:00"},
        {-1000, "23:59:59"},
        {2147483647, "20:31:23"},       // 2147483 = 24 * 86400 + 73883
        {-2147483647 - 1, "03:28:37"},  // 86400 - 73883 = 12517
    };
    for (const auto& each : cases) {
        EXPECT_EQ(Print(each.milliseconds), each.text) << each.milliseconds;
        EXPECT_STREQ(Time(each.milliseconds).ToString().Utf8(), each.text);
        EXPECT_EQ(FormatWithLibc(each.milliseconds / 1000, "%T"), each.text);
    }
}

TEST(Time, Parses) {
    const struct {
        const char* text;
        int32_t milliseconds;
    } cases[] = {
        {"00:00:00", 0},     {"00:00:01", 1000},      {"12:34:56", 45296000},  {"23:59:59", 86399000},
        {"1:2:3", 3723000},  {" 1: 2: 3", 3723000},   {"23:59:60", 86400000},  {"23:59:61", 86401000},
        {"00:00:60", 60000}, {"  01:02:03", 3723000}, {"\t01:02:03", 3723000},
    };
    for (const auto& each : cases) {
        EXPECT_EQ(Parse(each.text), each.milliseconds) << each.text;
        EXPECT_EQ(ParseWithLibc(each.text), each.milliseconds) << each.text;
    }
}

TEST(Time, RefusesTheRest) {
    for (const char* text : {"", " ", "25:00:00", "24:00:00", "23:60:00", "23:59:62", "23:59",
                             "23:59:", "12:34:56 ", "12:34:56x", "12:34:567", "-1:00:00", "+1:00:00",
                             "12-34-56", "123456", "12:34:56.789", "1970-01-01 12:34:56", "invalid"}) {
        EXPECT_EQ(Parse(text), 0) << text;
    }
    EXPECT_EQ(Parse(std::string("12:34:56\0", 9)), 0);
    EXPECT_EQ(Parse(std::string("12:34\0:56", 9)), 0);
}

TEST(Time, PrintsIntoThePool) {
    RoxMempool pool("time");
    EXPECT_EQ(Time(1).ToString(&pool).GetMempool(), &pool);
    EXPECT_EQ(Time(1).ToString().GetMempool(), nullptr);
}

TEST(Time, AgreesWithTheCLibraryOnEverySecondOfTheDay) {
    for (int32_t second = 0; second < 86400; ++second) {
        const std::string text = FormatWithLibc(second, "%T");
        ASSERT_EQ(Print(second * 1000 + second % 1000), text);
        ASSERT_EQ(Parse(text), second * 1000) << text;
    }
}

TEST(Time, AgreesWithTheCLibraryOnMalformedTexts) {
    for (const char* text : {"23:59:59", "1:2:3", " 0: 9:60", "19:00:00", ""}) {
        ForEachNeighbour(text, [](const std::string& changed) {
            ASSERT_EQ(Parse(changed), ParseWithLibc(changed)) << changed;
            ForEachNeighbour(changed, [](const std::string& twice) {
                ASSERT_EQ(Parse(twice), ParseWithLibc(twice)) << twice;
            });
        });
    }
}

}  // namespace
}  // namespace sorn
