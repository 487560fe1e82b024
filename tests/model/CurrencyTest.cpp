#include "sorn/model/Currency.h"

#include <gtest/gtest.h>

#include <cstring>
#include <string>
#include <type_traits>

#include "rox/RoxMempool.h"

namespace sorn {
namespace {

static_assert(std::is_trivially_copyable_v<Currency> && sizeof(Currency) == 8);

bool FAllZero(const Currency& value) {
    const char zeros[8] = {};
    return std::memcmp(&value, zeros, 8) == 0;
}

TEST(Currency, DefaultIsAllZero) {
    EXPECT_TRUE(FAllZero(Currency()));
    EXPECT_TRUE(FAllZero(Currency::INVALID));
}

TEST(Currency, TakesACodeOfThreeBytes) {
    const Currency value(100, "USD");
    EXPECT_EQ(value.amount, 100);
    EXPECT_EQ(std::memcmp(value.code, "USD", 4), 0);
    EXPECT_EQ(Currency(-5, "x y").amount, -5);
}

TEST(Currency, AnyOtherCodeLosesTheAmountToo) {
    for (const char* code : {"", "U", "US", "USDX", "US Dollar"}) {
        EXPECT_TRUE(FAllZero(Currency(100, code))) << code;
    }
    EXPECT_TRUE(FAllZero(Currency(100, nullptr)));
}

TEST(Currency, InitReplacesAll) {
    Currency value(100, "USD");
    value.Init(-7, "EUR");
    EXPECT_TRUE(value == Currency(-7, "EUR"));
    value.Init(8, "EURO");
    EXPECT_TRUE(FAllZero(value));
    value.Init(8, "EUR");
    value.Init(9, nullptr);
    EXPECT_TRUE(FAllZero(value));
}

TEST(Currency, AssignmentCopiesAll) {
    Currency value;
    value = Currency(100, "USD");
    EXPECT_EQ(value.amount, 100);
    EXPECT_STREQ(value.code, "USD");
}

TEST(Currency, ComparesAllEightBytes) {
    EXPECT_TRUE(Currency(100, "USD") == Currency(100, "USD"));
    EXPECT_TRUE(Currency(100, "USD") != Currency(101, "USD"));
    EXPECT_TRUE(Currency(100, "USD") != Currency(100, "USE"));
    EXPECT_TRUE(Currency(100, "USD") != Currency(100, "uSD"));
    Currency other(100, "USD");
    other.code[3] = 'x';
    EXPECT_TRUE(other != Currency(100, "USD"));
    EXPECT_FALSE(other == Currency(100, "USD"));
}

TEST(Currency, Prints) {
    const struct {
        Currency value;
        const char* text;
    } cases[] = {
        {Currency(100, "USD"), "USD.100"},
        {Currency(0, "USD"), "USD.0"},
        {Currency(-100, "USD"), "USD.-100"},
        {Currency(2147483647, "EUR"), "EUR.2147483647"},
        {Currency(-2147483647 - 1, "EUR"), "EUR.-2147483648"},
        {Currency(100, "USDX"), "invalid"},
        {Currency(), "invalid"},
    };
    for (const auto& each : cases) {
        EXPECT_STREQ(each.value.ToString().Utf8(), each.text);
        char text[Currency::maxTextBytesG];
        EXPECT_EQ(std::string(text, each.value.FormatTo(text)), each.text);
    }
}

TEST(Currency, PrintsTheCodeThatIsThere) {
    Currency value;
    value.amount = -2147483647 - 1;
    std::memcpy(value.code, "EURO", 4);  // no NUL: the longest text
    char text[Currency::maxTextBytesG];
    EXPECT_EQ(std::string(text, value.FormatTo(text)), "EURO.-2147483648");
    std::memcpy(value.code, "E\0R", 4);
    EXPECT_STREQ(value.ToString().Utf8(), "E.-2147483648");
    std::memcpy(value.code, "\0UR", 4);
    EXPECT_STREQ(value.ToString().Utf8(), "invalid");
}

TEST(Currency, PrintsIntoThePool) {
    RoxMempool pool("currency");
    EXPECT_EQ(Currency(1, "USD").ToString(&pool).GetMempool(), &pool);
    EXPECT_EQ(Currency(1, "USD").ToString().GetMempool(), nullptr);
}

TEST(Currency, Parses) {
    const struct {
        const char* text;
        Currency value;
    } cases[] = {
        {"USD.100", Currency(100, "USD")},
        {"USD.0", Currency(0, "USD")},
        {"USD.007", Currency(7, "USD")},
        {"...1", Currency()},
        {"....1", Currency(1, "...")},  // the code is any three bytes
        {"1 -.1", Currency(1, "1 -")},
        {"USD.2147483647", Currency(2147483647, "USD")},
        {"USD.2147483648", Currency(2147483647, "USD")},  // as a 32-bit strtol
        {"USD.99999999999999999999", Currency(2147483647, "USD")},
    };
    for (const auto& each : cases) EXPECT_TRUE(Currency::Parse(each.text) == each.value) << each.text;
}

TEST(Currency, RefusesTheRest) {
    for (const char* text :
         {"", "USD", "USD.", "USD.1x", "USD.x", "USD.-100", "USD.+1", "USD. 1", "USD.1 ", "USD.1.0", "US.100",
          "USDX.100", "USD-100", "invalid", "U.D100", "100", ".100"}) {
        EXPECT_TRUE(FAllZero(Currency::Parse(text))) << text;
    }
}

TEST(Currency, NulBytesAreNoEnd) {
    EXPECT_TRUE(FAllZero(Currency::Parse(RoxString::FromUtf8Bytes(nullptr, 6, "USD.1\0"))));
    EXPECT_TRUE(FAllZero(Currency::Parse(RoxString::FromUtf8Bytes(nullptr, 5, "U\0D.1"))));
}

TEST(Currency, WhatIsNotNegativeComesBack) {
    for (const int amount : {0, 1, 100, 2147483647}) {
        const Currency value(amount, "GBP");
        EXPECT_TRUE(Currency::Parse(value.ToString()) == value) << amount;
    }
    EXPECT_TRUE(Currency::Parse(Currency::INVALID.ToString()) == Currency::INVALID);
}

}  // namespace
}  // namespace sorn
