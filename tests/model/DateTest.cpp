#include "sorn/model/Date.h"

#include <gtest/gtest.h>

#include <random>
#include <string>
#include <type_traits>

#include "model/LibcMoment.h"
#include "rox/RoxMempool.h"
#include "sorn/model/ScalarText.h"

namespace sorn {
namespace {

using namespace sorntest;

static_assert(std::is_trivially_copyable_v<Date> && sizeof(Date) == 4);

std::string Print(int32_t days) {
    char text[scalartext::maxMomentBytesG];
    return std::string(text, Date(days).FormatTo(text));
}

int32_t Parse(const std::string& text) {
    return Date::Parse(RoxString::FromUtf8Bytes(nullptr, static_cast<unsigned>(text.size()), text.data()))
        .days;
}

/// What the C library reads, counted by years and months; 0 for what it refuses.
int64_t ParseWithLibc(const std::string& text) {
    const auto parts = ReadWithLibc(text, {"%F"});
    return parts ? DaysByCounting(parts->tm_year + 1900, parts->tm_mon + 1, parts->tm_mday) : 0;
}

TEST(Date, ZeroIsTheFirstDayOf1970) {
    EXPECT_EQ(Date::ZERO.days, 0);
    EXPECT_EQ(Date().days, 0);
    EXPECT_TRUE(Date(5) == Date(5));
    EXPECT_TRUE(Date(5) != Date(6));
    EXPECT_STREQ(Date::ZERO.ToString().Utf8(), "1970-01-01");
}

struct DateCase {
    int32_t days;
    const char* text;
};

// Days between, by the calendar: 365 a year and one for each leap year.
const DateCase dateCasesG[] = {
    {0, "1970-01-01"},       {1, "1970-01-02"},       {-1, "1969-12-31"},
    {31, "1970-02-01"},      {365, "1971-01-01"},     {789, "1972-02-29"},  // 2 * 365 + 31 + 28
    {790, "1972-03-01"},     {10957, "2000-01-01"},                         // 30 * 365 + 7
    {11016, "2000-02-29"},                                                  // 59 days on
    {11017, "2000-03-01"},   {24836, "2037-12-31"},                         // 68 * 365 + 17 - 1
    {24837, "2038-01-01"},   {47540, "2100-02-28"},                         // 130 * 365 + 32 + 58
    {47541, "2100-03-01"},                                                  // 2100 is no leap year
    {-25509, "1900-02-28"},  {-25508, "1900-03-01"},  {-135081, "1600-02-29"},
    {2932896, "9999-12-31"}, {-354285, "1000-01-01"},
};

TEST(Date, PrintsAndParses) {
    for (const DateCase& each : dateCasesG) {
        EXPECT_EQ(Parse(each.text), each.days) << each.text;
        EXPECT_EQ(Print(each.days), each.text);
        EXPECT_STREQ(Date(each.days).ToString().Utf8(), each.text);
    }
}

TEST(Date, PrintsYearsWithoutPadding) {
    EXPECT_EQ(Print(-719162), "1-01-01");  // 0001-01-01 of the proleptic calendar
    EXPECT_EQ(Print(-719528), "0-01-01");
    EXPECT_EQ(Print(-719529), "-1-12-31");
    EXPECT_EQ(Print(2932897), "10000-01-01");
    EXPECT_EQ(Print(2147483647), "5881580-07-11");
    EXPECT_EQ(Print(-2147483647 - 1), "-5877641-06-23");
}

TEST(Date, ParsesWhatStrptimeTakes) {
    const struct {
        const char* text;
        int32_t days;
    } cases[] = {
        {"1970-1-2", 1},                               // one digit
        {" 1970- 1- 2", 1},                            // blanks before each number
        {"   1970-01-02", 1},    {"\t1970-01-02", 1},  // any white space before the first
        {"0001-01-01", -719162}, {"1-1-1", -719162},
        {"0000-01-01", -719528}, {"2037-02-30", 24532},  // the 30th day from 2037-02-01 (24503) is 2037-03-02
        {"2036-02-30", 24166},                           // in a leap year 2036-03-01
        {"1970-02-31", 61},      {"1970-04-31", 120},
    };
    for (const auto& each : cases) {
        EXPECT_EQ(Parse(each.text), each.days) << each.text;
        EXPECT_EQ(ParseWithLibc(each.text), each.days) << each.text;
    }
}

TEST(Date, RefusesTheRest) {
    for (const char* text : {"",
                             " ",
                             "2037",
                             "2037-12",
                             "2037-12-",
                             "2037-12-31 ",
                             "2037-12-31x",
                             "2037-12-310",
                             "2037-12-32",
                             "2037-12-00",
                             "2037-00-31",
                             "2037-13-31",
                             "12037-12-31",
                             "-2037-12-31",
                             "+2037-12-31",
                             "2037/12/31",
                             "20371231",
                             "2037 -12-31",
                             "2037-12-31T00:00:00",
                             "invalid"}) {
        EXPECT_EQ(Parse(text), 0) << text;
    }
    EXPECT_EQ(Parse(std::string("2037-12-31\0", 11)), 0);
    EXPECT_EQ(Parse(std::string("2037-12\0-31", 11)), 0);
}

TEST(Date, PrintsIntoThePool) {
    RoxMempool pool("date");
    EXPECT_EQ(Date(1).ToString(&pool).GetMempool(), &pool);
    EXPECT_EQ(Date(1).ToString().GetMempool(), nullptr);
}

TEST(Date, AgreesWithTheCLibraryOnEveryDayTo2037) {
    for (int32_t days = 0; days <= 24836; ++days) {
        const std::string text = FormatWithLibc(int64_t{days} * 86400, "%F");
        ASSERT_EQ(Print(days), text);
        ASSERT_EQ(Parse(text), days) << text;
        auto parts = ReadWithLibc(text, {"%F"});
        ASSERT_TRUE(parts);
        ASSERT_EQ(::timegm(&*parts) / 86400, days);
    }
}

TEST(Date, AgreesWithCountingInEveryYearOfFourDigits) {
    for (int year = 0; year <= 9999; ++year) {
        char text[32];
        for (const auto& [month, day] :
             {std::pair{1, 1}, {2, 28}, {2, 29}, {2, 30}, {3, 1}, {7, 31}, {12, 31}}) {
            std::snprintf(text, sizeof text, "%04d-%02d-%02d", year, month, day);
            ASSERT_EQ(Parse(text), DaysByCounting(year, month, day)) << text;
        }
        std::snprintf(text, sizeof text, "%d-10-09", year);
        ASSERT_EQ(Print(static_cast<int32_t>(DaysByCounting(year, 10, 9))), text);
    }
}

TEST(Date, AgreesWithTheCLibraryOnEveryCountOfDays) {
    std::mt19937 random(19700101);
    for (int i = 0; i < 200000; ++i) {
        int32_t days = static_cast<int32_t>(random());
        if (!fWideTime) days %= 24855;  // 2147483647 seconds
        ASSERT_EQ(Print(days), FormatWithLibc(int64_t{days} * 86400, "%F")) << days;
    }
}

TEST(Date, AgreesWithTheCLibraryOnMalformedTexts) {
    for (const char* text :
         {"2037-12-31", "1970-1-2", " 1999- 2-29", "0000-01-01", "2004-02-29", "999-9-9", ""}) {
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
