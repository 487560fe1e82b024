#include "rox/RoxTime.h"

#include <gtest/gtest.h>

TEST(TimeTest, DebugStringAsInterval) {
    struct Case {
        int64_t nanoseconds;
        const char* text;
    };
    const Case vCase[] = {
        {0, "0 ns"},
        {1, "1 ns"},
        {-1, "-1 ns"},
        {999, "999 ns"},
        {1000, "1.000 us"},
        {-1001, "-1.001 us"},
        {999999, "999.999 us"},
        {1000000, "1.000000 ms"},
        {12345678, "12.345678 ms"},
        {999999999, "999.999999 ms"},
        {1000000000, "1.000000000 s"},
        {5000000000, "5.000000000 s"},
        {86400000000001, "86400.000000001 s"},
        {INT64_MAX, "9223372036.854775807 s"},
        {INT64_MIN, "-9223372036.854775808 s"},
    };
    for (const Case& c : vCase) {
        EXPECT_STREQ(c.text, RoxTime(c.nanoseconds).DebugStringAsInterval().Utf8());
    }
}

TEST(TimeTest, Value) {
    EXPECT_EQ(0, RoxTime().GetNanoseconds());
    EXPECT_EQ(-5, RoxTime(-5).GetNanoseconds());
    EXPECT_TRUE(RoxTime(5) == RoxTime(5));
    EXPECT_FALSE(RoxTime(5) == RoxTime(6));
}
