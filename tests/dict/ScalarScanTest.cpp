#include <bit>
#include <cstdio>
#include <cstring>

#include "DictFixture.h"
#include "sorn/dict/ScalarFormat.h"

namespace {

namespace format = sorn::scalarformat;

using ScalarScanTest = DictFixture;

/// Any scan against sscanf: same verdict, and the same value or an untouched target.
template <class T, class Scan>
void ExpectAsSscanf(const std::string& text, const char* conversion, Scan scan) {
    T expected = 77;
    T scanned = 77;
    const bool fExpected = std::sscanf(text.c_str(), conversion, &expected) == 1;
    if (!fExpected) expected = 77;
    ASSERT_EQ(scan(text.c_str(), scanned), fExpected) << '"' << text << '"';
    ASSERT_EQ(std::memcmp(&scanned, &expected, sizeof(T)), 0) << '"' << text << "\" gives " << scanned;
}

void ExpectAllAsSscanf(const std::string& text) {
    ExpectAsSscanf<double>(text, "%lg", format::ScanFloat);
    ExpectAsSscanf<long long>(text, "%lld", format::ScanS64);
    ExpectAsSscanf<unsigned long long>(text, "%llu", format::ScanU64);
}

TEST_F(ScalarScanTest, ScansAsSscanf) {
    const char* const cases[] = {
        "",
        " ",
        "0",
        "-0",
        "+0",
        "12",
        " 12",
        "\t\n\v\f\r 12",
        "12abc",
        "12 34",
        "-12",
        "+12",
        "--12",
        "+-12",
        "- 12",
        "-",
        "+",
        "9223372036854775807",
        "9223372036854775808",
        "-9223372036854775808",
        "-9223372036854775809",
        "18446744073709551615",
        "18446744073709551616",
        "-1",
        "-18446744073709551615",
        "-18446744073709551616",
        "99999999999999999999999999",
        "-99999999999999999999999999",
        "00000000000000000000000000012",
        "0x10",
        "-0x10",
        "0x",
        "0xg",
        "0x.8",
        "0x1p",
        "0x1p4",
        "0x1.8p-1",
        "1e",
        "1e+",
        "1e-",
        "1e5",
        "1e5e",
        "1e+5",
        "1.e5",
        ".5",
        ".",
        "..5",
        "5.",
        "-.5",
        ".e1",
        "1.5.5",
        "e5",
        "inf",
        "INF",
        "infi",
        "infinit",
        "infinity",
        "infinityx",
        "-inf",
        "i",
        "in",
        "nan",
        "NaN",
        "-nan",
        "nan(",
        "nan(1)",
        "nan(abc)x",
        "na",
        "1e308",
        "1e309",
        "-1e309",
        "1e-307",
        "1e-310",
        "5e-324",
        "1e-400",
        "1e99999999999",
        "1e-99999999999",
        "0e99999999999",
        "2.2250738585072011e-308",
        "1,5",
        "1 e5",
        "0.1e1",
        "179769313486231580793e289",
        "1.7976931348623159e308",
        "9007199254740993",
        "0.30000000000000004",
        ("\xC2\xA0"
         "1"),
    };
    for (const char* text : cases) ExpectAllAsSscanf(text);
    for (const unsigned n : {400u, 5000u}) {
        ExpectAllAsSscanf(std::string(n, '1'));
        ExpectAllAsSscanf(std::string(n, ' ') + "-" + std::string(n, '0') + "1." + std::string(n, '0') +
                          "1e-3");
        ExpectAllAsSscanf("0." + std::string(n, '0') + "1e" + std::to_string(n));
    }
}

TEST_F(ScalarScanTest, ScansRandomTextsAsSscanf) {
    Random random(5);
    const std::string letters = " +--00123456789....eeEExXaAnNiIfFpP,\t";
    const std::string digits = "0123456789";
    for (int round = 0; round < 200'000; ++round) {
        const std::string& from = round % 4 == 0 ? digits : letters;
        std::string text = round % 8 == 0 ? "-" : "";
        for (unsigned n = random.Below(24); n != 0; --n) text.push_back(from[random.Below(from.size())]);
        ExpectAllAsSscanf(text);
        if (HasFatalFailure()) return;
    }
    for (int round = 0; round < 100'000; ++round) {
        char text[64];
        std::snprintf(text, sizeof text, "%.*g", static_cast<int>(1 + random.Below(20)),
                      std::bit_cast<double>(random.Bits()));
        ExpectAllAsSscanf(text);
        if (HasFatalFailure()) return;
    }
}

}  // namespace
