#include "sorn/dict/ScalarFormat.h"

#include <bit>
#include <clocale>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <limits>

#include "DictFixture.h"
#include "sorn/dict/Dict.h"

namespace {

using sorn::Dict;
namespace format = sorn::scalarformat;

using ScalarFormatTest = DictFixture;

std::string Printed(double value) {
    char text[100];
    std::snprintf(text, sizeof text, "%1.8g", value);
    std::string result = text;
    if (result.find('.') == std::string::npos) result += ".0";
    return result;
}

TEST_F(ScalarFormatTest, Bool) {
    EXPECT_EQ(Str(Dict::FormatBool(&pool, true)), "true");
    EXPECT_EQ(Str(Dict::FormatBool(&pool, false)), "false");
    EXPECT_TRUE(Dict::ParseBool(&pool, Text("true")));
    for (const char* text : {"false", "True", "TRUE", "true ", " true", "1", "", "truetrue"}) {
        EXPECT_FALSE(Dict::ParseBool(&pool, Text(text))) << text;
    }
    EXPECT_FALSE(Dict::ParseBool(&pool, Text(std::string_view("true\0", 5))));
}

TEST_F(ScalarFormatTest, FormatsWholeNumbers) {
    EXPECT_EQ(Str(Dict::FormatS32(&pool, 0)), "0");
    EXPECT_EQ(Str(Dict::FormatS32(&pool, -1)), "-1");
    EXPECT_EQ(Str(Dict::FormatS32(&pool, 2147483647)), "2147483647");
    EXPECT_EQ(Str(Dict::FormatS32(&pool, -2147483647 - 1)), "-2147483648");
    EXPECT_EQ(Str(Dict::FormatS64(&pool, INT64_MAX)), "9223372036854775807");
    EXPECT_EQ(Str(Dict::FormatS64(&pool, INT64_MIN)), "-9223372036854775808");
    EXPECT_EQ(Str(Dict::FormatU32(&pool, 4294967295u)), "4294967295");
    EXPECT_EQ(Str(Dict::FormatU64(&pool, UINT64_MAX)), "18446744073709551615");
    EXPECT_EQ(Dict::FormatU64(&pool, 10).GetMempool(), &pool);
}

TEST_F(ScalarFormatTest, FormatsFloats) {
    struct {
        double value;
        const char* text;
    } const cases[] = {
        {0.0, "0.0"},
        {-0.0, "-0.0"},
        {5.0, "5.0"},
        {0.5, "0.5"},
        {-1.25, "-1.25"},
        {100000000.0, "1e+08.0"},
        {99999999.0, "99999999.0"},
        {1e20, "1e+20.0"},
        {1.5e20, "1.5e+20"},
        {1e-5, "1e-05.0"},
        {0.0001, "0.0001"},
        {3.14159265358979, "3.1415927"},
        {123456789.0, "1.2345679e+08"},
        {0.1 + 0.2, "0.3"},
        {HUGE_VAL, "inf.0"},
        {-HUGE_VAL, "-inf.0"},
        {1.7976931348623157e308, "1.7976931e+308"},
        {5e-324, "4.9406565e-324"},
    };
    for (const auto& c : cases) EXPECT_EQ(Str(Dict::FormatFloat(&pool, c.value)), c.text);
}

TEST_F(ScalarFormatTest, FormatsFloatsAsPrintf) {
    Random random(3);
    const auto expectSame = [this](double value) {
        ASSERT_EQ(Str(Dict::FormatFloat(&pool, value)), Printed(value)) << std::bit_cast<uint64_t>(value);
    };
    for (const double value : {std::nan(""), -std::nan(""), HUGE_VAL, -HUGE_VAL}) expectSame(value);
    for (int round = 0; round < 100'000; ++round) {
        expectSame(std::bit_cast<double>(random.Bits()));
        expectSame(static_cast<double>(static_cast<int64_t>(random.Bits()) >> random.Below(64)) / 1024);
        expectSame(std::ldexp(random.Below(1000), static_cast<int>(random.Below(60)) - 30));
        // Halves at the ninth digit, where the rule of rounding shows.
        expectSame(random.Below(200'000'000) + 0.5);
    }
}

TEST_F(ScalarFormatTest, ParsesS64) {
    struct {
        std::string text;
        long long value;
    } const cases[] = {
        {"0", 0},
        {"-5", -5},
        {"007", 7},
        {"+5", 0},
        {"-", 0},
        {"--5", 0},
        {"-+5", 0},
        {"- 5", 0},
        {"", 0},
        {"5 ", 0},
        {" 5", 0},
        {"5x", 0},
        {"0x10", 0},
        {"5.0", 0},
        {std::string("5\0", 2), 0},
        {"9223372036854775807", INT64_MAX},
        {"9223372036854775808", INT64_MAX},
        {"99999999999999999999999", INT64_MAX},
        {"-9223372036854775808", INT64_MIN},
        {"-9223372036854775809", INT64_MIN},
        {"-99999999999999999999999", INT64_MIN},
        {"99999999999999999999999x", 0},
        {"18446744073709551616", INT64_MAX},  // 2^64
        {"18446744073709551617", INT64_MAX},
    };
    for (const auto& c : cases) EXPECT_EQ(Dict::ParseS64(&pool, Text(c.text)), c.value) << c.text;
}

TEST_F(ScalarFormatTest, ParsesS32) {
    struct {
        const char* text;
        int value;
    } const cases[] = {
        {"7", 7},
        {"-7", -7},
        {"2147483647", 2147483647},
        {"2147483648", 0},
        {"-2147483648", -2147483647 - 1},
        {"-2147483649", 0},
        {"4294967297", 0},
        {"99999999999999999999", 0},
        {"+7", 0},
        {"7 ", 0},
        {"", 0},
    };
    for (const auto& c : cases) EXPECT_EQ(Dict::ParseS32(&pool, Text(c.text)), c.value) << c.text;
}

TEST_F(ScalarFormatTest, ParsesU64) {
    struct {
        const char* text;
        unsigned long long value;
    } const cases[] = {
        {"", 0},
        {"0", 0},
        {"00012", 12},
        {"12a", 0},
        {"a", 0},
        {"-1", 0},
        {"+1", 0},
        {" 1", 0},
        {"1 ", 0},
        {"18446744073709551615", UINT64_MAX},
        {"18446744073709551616", 0},  // 2^64
        {"18446744073709551620", 4},
        {"184467440737095516160", 0},
        {"100000000000000000000", 7766279631452241920ull},  // 10^20 - 5 * 2^64
    };
    for (const auto& c : cases) EXPECT_EQ(Dict::ParseU64(&pool, c.text), c.value) << c.text;
}

TEST_F(ScalarFormatTest, ParsesU32) {
    EXPECT_EQ(Dict::ParseU32(&pool, "4294967295"), 4294967295u);
    EXPECT_EQ(Dict::ParseU32(&pool, "4294967296"), 0u);
    EXPECT_EQ(Dict::ParseU32(&pool, "18446744073709551620"), 4u);  // the 64-bit number wraps first
    EXPECT_EQ(Dict::ParseU32(&pool, "12x"), 0u);
    EXPECT_EQ(Dict::ParseU32(&pool, ""), 0u);
}

constexpr unsigned long long Id(unsigned long long code, unsigned long long number) {
    return code << 48 | number;
}

TEST_F(ScalarFormatTest, LongIds) {
    struct {
        unsigned long long value;
        const char* text;
    } const cases[] = {
        {0, "0"},
        {Id(0, 281474976710655), "281474976710655"},
        {Id(1, 0), "rs.0"},
        {Id(2, 7), "ts.7"},
        {Id(3, 9), "bs.9"},
        {Id(5, 1), "tms.ep.1"},
        {Id(6, 12), "tms.sh.12"},
        {Id(7, 3), "tms.mv.3"},
        {Id(8, 4), "tms.sp.4"},
        {Id(9, 5), "vp.5"},
        {Id(10, 6), "dlna.6"},
        {Id(16384, 1), "vod.1"},
        {Id(16384, 281474976710655), "vod.281474976710655"},
    };
    for (const auto& c : cases) {
        EXPECT_EQ(Str(Dict::FormatLongId(&pool, c.value)), c.text);
        EXPECT_EQ(Dict::ParseLongId(&pool, c.text), c.value) << c.text;
    }
    EXPECT_EQ(Str(Dict::FormatLongId(&pool, Id(4, 0))), "xxx.0");
    EXPECT_EQ(Str(Dict::FormatLongId(&pool, Id(65535, 281474976710655))), "xxx.281474976710655");
}

TEST_F(ScalarFormatTest, ParsesOddLongIds) {
    struct {
        const char* text;
        unsigned long long value;
    } const cases[] = {
        {"", 0},
        {"xxx.0", 0},
        {"xxx.5", 0},
        {".5", 0},
        {"ts.", Id(2, 0)},
        {"ts.x", Id(2, 0)},
        {"ts", 0},
        {"TS.7", 0},
        {"t.7", 0},
        {"tss.7", 0},
        {"tms.7", 0},
        {"tms.sh", 0},
        {"a.ts.7", 0},
        {"ts.7.7", 0},
        {"tms.ep.1.2", 0},
        {"ts.-7", Id(2, 0)},
        {"ts.281474976710656", Id(3, 0)},  // 2^48 is carried into the code
        {"18446744073709551615", UINT64_MAX},
        {"12x", 0},
    };
    for (const auto& c : cases) EXPECT_EQ(Dict::ParseLongId(&pool, c.text), c.value) << c.text;
}

TEST_F(ScalarFormatTest, ParsesFloats) {
    struct {
        const char* text;
        double value;
    } const cases[] = {
        {"0", 0},
        {"1.5", 1.5},
        {" \t\n\v\f\r-2.5xyz", -2.5},
        {"+3", 3},
        {".5", 0.5},
        {"5.", 5},
        {"-.5e1", -5},
        {"1e3", 1000},
        {"1E+3", 1000},
        {"1e-3", 0.001},
        {"1.5.5", 1.5},
        {"12abc", 12},
        {"1e3e3", 1000},
        {"0x10", 16},
        {"-0x1.8p1", -3},
        {"", 0},
        {" ", 0},
        {"abc", 0},
        {".", 0},
        {"-", 0},
        {"+-1", 0},
        {".e5", 0},
        {"e5", 0},
        {"- 1", 0},
        {"1,5", 1},
        {"inf", HUGE_VAL},
        {"-Infinity", -HUGE_VAL},
        {"1e400", HUGE_VAL},
        {"-1e400", -HUGE_VAL},
        {"1e-400", 0},
        {"0.1", 0.1},
        {"123456789012345678901234567890", 1.2345678901234568e29},
    };
    for (const auto& c : cases) EXPECT_EQ(Dict::ParseFloat(&pool, Text(c.text)), c.value) << c.text;
    EXPECT_TRUE(std::isnan(Dict::ParseFloat(&pool, Text("nan"))));
    EXPECT_TRUE(std::signbit(Dict::ParseFloat(&pool, Text("-0"))));
}

TEST_F(ScalarFormatTest, FloatsComeBackToEightDigits) {
    Random random(4);
    for (int round = 0; round < 20'000; ++round) {
        const double value = random.Below(100'000'000) / 10'000.0;
        ASSERT_EQ(Dict::ParseFloat(&pool, Dict::FormatFloat(&pool, value)), value);
    }
}

/// A German locale for the process, built for one test with the host's localedef.
class GermanLocale {
 public:
    GermanLocale() {
        if (mkdtemp(folderM) == nullptr) return;
        const std::string build =
            "localedef -i de_DE -f UTF-8 --no-archive " + std::string(folderM) + "/de_DE.UTF-8 2>/dev/null";
        if (std::system(build.c_str()) != 0) return;
        setenv("LOCPATH", folderM, 1);
        setM = std::setlocale(LC_ALL, "de_DE.UTF-8") != nullptr;
    }
    ~GermanLocale() {
        std::setlocale(LC_ALL, "C");
        unsetenv("LOCPATH");
        std::filesystem::remove_all(folderM);
    }
    bool FSet() const { return setM; }

 private:
    char folderM[32] = "/tmp/sorn_locale_XXXXXX";
    bool setM = false;
};

TEST_F(ScalarFormatTest, TheLocaleOfTheProcessDoesNotCount) {
    if (!std::filesystem::exists("/usr/share/i18n/locales/de_DE"))
        GTEST_SKIP() << "no source of a locale here";
    const GermanLocale locale;
    if (!locale.FSet()) GTEST_SKIP() << "the German locale could not be built or set";
    ASSERT_EQ(Printed(0.5), "0,5.0") << "the C library must print a comma for the test to mean anything";
    EXPECT_EQ(Str(Dict::FormatFloat(&pool, 0.5)), "0.5");
    struct {
        const char* text;
        double value;
    } const cases[] = {
        {"2.5", 2.5}, {"2,5", 2}, {"0x1.8", 1.5}, {"1e-400", 0}, {"1e", 1}, {"-0.25e2x", -25},
    };
    for (const auto& c : cases) EXPECT_EQ(Dict::ParseFloat(&pool, Text(c.text)), c.value) << c.text;
    EXPECT_EQ(Printed(0.5), "0,5.0") << "the process must have its locale still";
}

TEST_F(ScalarFormatTest, WritersStayWithinTheirBuffer) {
    const auto length = [](auto write, auto value) {
        char text[format::maxTextBytesG];
        return write(value, text) - text;
    };
    EXPECT_EQ(length(format::WriteFloat, -1.2345678e-300), 15);
    EXPECT_EQ(length(format::WriteFloat, -1e-300), 9);
    EXPECT_EQ(length(format::WriteLongId, uint64_t{Id(5, 281474976710655)}), 22);
}

}  // namespace
