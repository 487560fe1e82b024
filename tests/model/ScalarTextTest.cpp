#include "sorn/model/ScalarText.h"

#include <gtest/gtest.h>

#include <cinttypes>
#include <cstdio>
#include <limits>
#include <random>
#include <string>

namespace sorn::scalartext {
namespace {

template <class Number>
std::string Written(char* (*write)(Number, char*), Number value) {
    char text[24];
    return std::string(text, write(value, text));
}

TEST(ScalarText, WritesSignedNumbers) {
    const struct {
        int64_t value;
        const char* text;
    } cases[] = {
        {0, "0"},
        {9, "9"},
        {10, "10"},
        {-1, "-1"},
        {-10, "-10"},
        {std::numeric_limits<int64_t>::max(), "9223372036854775807"},
        {std::numeric_limits<int64_t>::min(), "-9223372036854775808"},
    };
    for (const auto& each : cases) EXPECT_EQ(Written(WriteDecimal, each.value), each.text);
}

TEST(ScalarText, WritesUnsignedNumbers) {
    const struct {
        uint64_t value;
        const char* text;
    } cases[] = {
        {0, "0"},
        {99, "99"},
        {100, "100"},
        {4294967296, "4294967296"},
        {std::numeric_limits<uint64_t>::max(), "18446744073709551615"},
    };
    for (const auto& each : cases) EXPECT_EQ(Written(WriteUnsigned, each.value), each.text);
}

TEST(ScalarText, WritesAsPrintfDoes) {
    std::mt19937_64 random(64);
    char text[24];
    for (int i = 0; i < 100000; ++i) {
        const uint64_t value = random() >> (random() % 64);
        std::snprintf(text, sizeof text, "%" PRIu64, value);
        ASSERT_EQ(Written(WriteUnsigned, value), text);
        std::snprintf(text, sizeof text, "%" PRId64, static_cast<int64_t>(value));
        ASSERT_EQ(Written(WriteDecimal, static_cast<int64_t>(value)), text);
    }
}

TEST(ScalarText, ReadsDigitsUpToWhatIsNone) {
    const struct {
        const char* text;
        bool fRead;
        int32_t value;
        const char* rest;
    } cases[] = {
        {"7", true, 7, ""},
        {"0", true, 0, ""},
        {"0012x", true, 12, "x"},
        {"7-2", true, 7, "-2"},
        {"2147483646", true, 2147483646, ""},
        {"2147483647", true, 2147483647, ""},
        {"2147483648", true, 2147483647, ""},
        {"4294967297", true, 2147483647, ""},
        {"18446744073709551617.", true, 2147483647, "."},
        {"", false, -5, ""},
        {"-7", false, -5, "-7"},
        {" 7", false, -5, " 7"},
        {"/", false, -5, "/"},  // the bytes beside the digits
        {":", false, -5, ":"},
    };
    for (const auto& each : cases) {
        const std::string text = each.text;
        const char* p = text.data();
        int32_t value = -5;
        EXPECT_EQ(ReadDecimal(p, text.data() + text.size(), value), each.fRead) << text;
        EXPECT_EQ(value, each.value) << text;
        EXPECT_EQ(std::string(p, text.data() + text.size()), each.rest) << text;
    }
}

TEST(ScalarText, ReadingStopsAtTheEndGiven) {
    const char text[] = "1234";
    const char* p = text;
    int32_t value = 0;
    EXPECT_TRUE(ReadDecimal(p, text + 2, value));
    EXPECT_EQ(value, 12);
    EXPECT_EQ(p, text + 2);
}

}  // namespace
}  // namespace sorn::scalartext
