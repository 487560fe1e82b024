#include "sorn/model/ChannelNumber.h"

#include <gtest/gtest.h>

#include <string>
#include <type_traits>

#include "rox/RoxMempool.h"

namespace sorn {
namespace {

static_assert(std::is_trivially_copyable_v<ChannelNumber> && sizeof(ChannelNumber) == 8);

TEST(ChannelNumber, Constructors) {
    EXPECT_EQ(ChannelNumber().number, -2);
    EXPECT_EQ(ChannelNumber().subNumber, -2);
    EXPECT_EQ(ChannelNumber(7).number, 7);
    EXPECT_EQ(ChannelNumber(7).subNumber, -2);
    EXPECT_EQ(ChannelNumber(7, 2).number, 7);
    EXPECT_EQ(ChannelNumber(7, 2).subNumber, 2);
    EXPECT_EQ(ChannelNumber::INVALID.number, -2);
    EXPECT_EQ(ChannelNumber::INVALID.subNumber, -2);
}

TEST(ChannelNumber, AssignmentCopiesBoth) {
    ChannelNumber a;
    a = ChannelNumber(7, 2);
    EXPECT_EQ(a.number, 7);
    EXPECT_EQ(a.subNumber, 2);
}

TEST(ChannelNumber, ComparesBothMembers) {
    EXPECT_TRUE(ChannelNumber(7, 2) == ChannelNumber(7, 2));
    EXPECT_FALSE(ChannelNumber(7, 2) == ChannelNumber(7, 3));
    EXPECT_FALSE(ChannelNumber(7, 2) == ChannelNumber(8, 2));
    EXPECT_TRUE(ChannelNumber(7, 2) != ChannelNumber(7));
    EXPECT_FALSE(ChannelNumber() != ChannelNumber::INVALID);
}

TEST(ChannelNumber, Prints) {
    const struct {
        ChannelNumber value;
        const char* text;
    } cases[] = {
        {{7, 2}, "7-2"},
        {7, "7"},
        {0, "0"},
        {{0, 0}, "0-0"},
        {{-2, -2}, "invalid"},
        {{-2, 3}, "-2-3"},
        {{-2, -3}, "-2--3"},
        {-1, "-1"},
        {{7, -1}, "7--1"},
        {2147483647, "2147483647"},
        {{-2147483647 - 1, -2147483647 - 1}, "-2147483648--2147483648"},  // the longest text
    };
    for (const auto& each : cases) {
        EXPECT_STREQ(each.value.ToString().Utf8(), each.text);
        char text[ChannelNumber::maxTextBytesG];
        EXPECT_EQ(std::string(text, each.value.FormatTo(text)), each.text);
    }
}

TEST(ChannelNumber, PrintsIntoThePool) {
    RoxMempool pool("channel");
    EXPECT_EQ(ChannelNumber(7, 2).ToString(&pool).GetMempool(), &pool);
    EXPECT_EQ(ChannelNumber(7, 2).ToString().GetMempool(), nullptr);
}

TEST(ChannelNumber, Parses) {
    const struct {
        const char* text;
        ChannelNumber value;
    } cases[] = {
        {"7", 7},
        {"7-2", {7, 2}},
        {"0", 0},
        {"0-0", {0, 0}},
        {"007-002", {7, 2}},
        {"2147483647", 2147483647},
        {"2147483647-2147483647", {2147483647, 2147483647}},
        {"2147483648", 2147483647},  // as a 32-bit strtol
        {"99999999999999999999999-1", {2147483647, 1}},
    };
    for (const auto& each : cases) {
        const ChannelNumber value = ChannelNumber::Parse(each.text);
        EXPECT_EQ(value.number, each.value.number) << each.text;
        EXPECT_EQ(value.subNumber, each.value.subNumber) << each.text;
    }
}

TEST(ChannelNumber, RefusesTheRest) {
    for (const char* text :
         {"",   "invalid", "-2", "-2-3", "-",    "7-",   "7--2", "7-2-", "7-2-1", "7-2x",
          "7x", "x7",      " 7", "7 ",   "7 -2", "7- 2", "+7",   "7-+2", "7.2",   "\xD9\xA7"}) {
        EXPECT_EQ(ChannelNumber::Parse(text), ChannelNumber::INVALID) << text;
    }
}

TEST(ChannelNumber, NulByteIsNoEnd) {
    EXPECT_EQ(ChannelNumber::Parse(RoxString::FromUtf8Bytes(nullptr, 2, "7\0")), ChannelNumber::INVALID);
    EXPECT_EQ(ChannelNumber::Parse(RoxString::FromUtf8Bytes(nullptr, 4, "7-2\0")), ChannelNumber::INVALID);
}

TEST(ChannelNumber, WhatIsNotNegativeComesBack) {
    const ChannelNumber values[] = {0, {7, 0}, {13, 1}, 999, {2147483647, 2147483647}, {}};
    for (const ChannelNumber& value : values) {
        EXPECT_EQ(ChannelNumber::Parse(value.ToString()), value) << value.ToString().Utf8();
    }
}

}  // namespace
}  // namespace sorn
