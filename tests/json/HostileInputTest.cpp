#include <gtest/gtest.h>

#include <random>

#include "json/Support.h"

using jsontest::Parse;

// Each input lies in a block of exactly its size: under AddressSanitizer a read outside it is a report. Each
// parse gives a dictionary whose text parses again to the same, or words and an empty pool. The numbers are
// those of docs/security.md.

namespace {

const std::string recordG =
    R"({"type": "recording", "recordingId": "tsn:recording.12", "title": "Ein \"Titel\" \u00e9 mit L\u00E4nge\n", )"
    R"("channel": {"number": "7-1", "callSign": "ABCD", "hd": true}, "duration": 1800, "credits": [{"role": "actor", )"
    R"("first": "Ada", "last": "Beispiel"}, {"role": "director"}, null, []], "size": "5000000000", "rating": 12.5, )"
    "\"path\": \"C:\\\\a\\/b\", \"raw\": \"\xC3\xA9\x03\x1A\", empty: \"\", \"list\": [1, -2, +3.5e-1, abc], "
    "}";

void Check(const std::string& text) {
    const std::string first = Parse(text);
    ASSERT_FALSE(first.empty());
    if (first[0] == '{') {
        ASSERT_EQ(Parse(first), first) << text;
    } else {
        ASSERT_EQ(first.substr(0, 7), "error: ") << text;
        ASSERT_GT(first.size(), 7u) << text;
    }
}

// What the others damage is good itself.
TEST(HostileInput, TheRecordItself) {
    const std::string text = Parse(recordG);
    EXPECT_EQ(text[0], '{') << text;
}

// 1: no read behind the end. 9: a refusal leaves nothing behind.
TEST(HostileInput, CutAtEveryByte) {
    for (size_t n = 0; n < recordG.size(); ++n) {
        const std::string text = recordG.substr(0, n);
        ASSERT_EQ(Parse(text).substr(0, 7), "error: ") << text;
    }
}

// 1 and 9.
TEST(HostileInput, EveryBitFlipped) {
    for (size_t i = 0; i < recordG.size(); ++i) {
        for (unsigned bit = 0; bit < 8; ++bit) {
            std::string text = recordG;
            text[i] = static_cast<char>(static_cast<unsigned char>(text[i]) ^ (1u << bit));
            Check(text);
        }
    }
}

// 1 and 9.
TEST(HostileInput, EveryByteTakenOutOrDoubled) {
    for (size_t i = 0; i < recordG.size(); ++i) {
        Check(recordG.substr(0, i) + recordG.substr(i + 1));
        Check(recordG.substr(0, i + 1) + recordG.substr(i));
    }
}

// 1, 2 (texts too short for what they open) and 9.
TEST(HostileInput, ShortTextsOfSyntaxBytes) {
    const char bytes[] = {'{', '}', '[', ']', '"', '\\', ':', ',', 'u', ' ', '\0', 'a'};
    constexpr unsigned nBytes = sizeof bytes;
    for (unsigned number = 0; number < nBytes * nBytes * nBytes * nBytes; ++number) {
        std::string text = "{a:";
        for (unsigned rest = number, i = 0; i < 4; ++i, rest /= nBytes) text += bytes[rest % nBytes];
        const std::string result = Parse(text);
        ASSERT_TRUE(result[0] == '{' || result.substr(0, 7) == "error: ") << text;
    }
}

}  // namespace
