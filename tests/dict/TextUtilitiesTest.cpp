#include "sorn/dict/TextUtilities.h"

#include <cstdlib>

#include "DictFixture.h"

namespace {

using TextUtilitiesTest = DictFixture;

TEST_F(TextUtilitiesTest, FormatBytes) {
    struct {
        std::string bytes;
        const char* text;
    } const cases[] = {
        {"", ""},
        {std::string("\x00\xAB", 2), "00 AB "},
        {"A", "41 "},
        {std::string("\x7f\x80\xff\x0f\xf0\0", 6), "7F 80 FF 0F F0 00 "},
    };
    for (const auto& c : cases) {
        EXPECT_EQ(Str(sorn::FormatBytes(&pool, Text(c.bytes))), c.text);
        EXPECT_EQ(Str(sorn::FormatBytesFromBytestring(&pool, Bytes(c.bytes))), c.text);
    }
    EXPECT_EQ(Str(sorn::FormatBytesFromBytestring(&pool, nullptr)), "");
}

TEST_F(TextUtilitiesTest, ParseBytes) {
    struct {
        std::string text;
        std::string bytes;
    } const cases[] = {
        {"", ""},
        {"   \t\r\n", ""},
        {"1 2", "\x01\x02"},
        {"00 AB ", std::string("\0\xAB", 2)},
        {"ab", "\xAB"},
        {"zz", std::string(1, '\0')},
        {"1FF", "\xFF"},
        {"123456780", "\x80"},
        {"0x1F", "\x1F"},
        {"0X1f", "\x1F"},
        {"0x", std::string(1, '\0')},
        {"0xg", std::string(1, '\0')},
        {"00x12", std::string(1, '\0')},
        {"-1", "\xFF"},
        {"+7f", "\x7F"},
        {"-0x10", "\xF0"},
        {"-", std::string(1, '\0')},
        {"--1", std::string(1, '\0')},
        {"12G4", "\x12"},
        {"7FFFFFFFFFFFFFFF", "\xFF"},
        {"8000000000000000", "\xFF"},       // out of range: the highest number
        {"FFFFFFFFFFFFFFFFFF", "\xFF"},     // so too
        {"100000000000000000000", "\xFF"},  // so too
        {"-8000000000000000", std::string(1, '\0')},
        {"-FFFFFFFFFFFFFFFFFF", std::string(1, '\0')},  // the lowest number
        {"\t1\r\n2 \n3", "\x01\x02\x03"},
        {"1\v2\f3", "\x01\x02\x03"},
        {"\v\f", ""},
        {std::string("a\0b", 3), "\x0A"},
        {std::string("a \0 b", 5), "\x0A"},
        {"\x80\xff", std::string(1, '\0')},
    };
    for (const auto& c : cases) {
        EXPECT_EQ(Str(sorn::ParseBytes(&pool, Text(c.text))), c.bytes) << c.text;
        EXPECT_EQ(Str(sorn::ParseBytesToBytestring(&pool, Text(c.text))), c.bytes) << c.text;
    }
}

TEST_F(TextUtilitiesTest, ParseBytesReadsTokensAsStrtollDoes) {
    Random random(1);
    const std::string letters = "0123456789abcdefABCDEFxX+-g";
    for (int round = 0; round < 50'000; ++round) {
        std::string token;
        for (unsigned n = 1 + random.Below(20); n != 0; --n)
            token.push_back(letters[random.Below(letters.size())]);
        const auto expected = static_cast<char>(std::strtoll(token.c_str(), nullptr, 16));
        ASSERT_EQ(Str(sorn::ParseBytes(&pool, Text(token))), std::string(1, expected)) << token;
    }
}

TEST_F(TextUtilitiesTest, ParseBytesReversesFormatBytes) {
    std::string bytes;
    for (int i = 0; i < 2000; ++i) bytes.push_back(static_cast<char>(i * 7 + i / 256));
    EXPECT_EQ(Str(sorn::ParseBytes(&pool, sorn::FormatBytes(&pool, Text(bytes)))), bytes);
}

TEST_F(TextUtilitiesTest, ReplaceCharsWithString) {
    struct {
        std::string text;
        const char* chars;
        const char* replacement;
        const char* result;
    } const cases[] = {
        {"a.b,c", ".,", "--", "a--b--c"},
        {"a.b,c", "", "--", "a.b,c"},
        {"a.b,c", ".,", "", "abc"},
        {"", ".,", "--", ""},
        {"...", ".", "x", "xxx"},
        {std::string("a.\0b.", 5), ".", "x", "ax"},
        {"a.b", ".", "..", "a..b"},
        {"x\xC3\xA9y", "\xC3\xA9", "e", "xeey"},  // both bytes of the character
        {"x\xC3\xA8y", "\xC3\xA9", "e", "xe\xA8y"},
    };
    for (const auto& c : cases) {
        EXPECT_EQ(Str(sorn::ReplaceCharsWithString(&pool, Text(c.text), c.chars, Text(c.replacement))),
                  c.result)
            << c.text;
    }
}

TEST_F(TextUtilitiesTest, SplitString) {
    struct {
        std::string text;
        std::string delimiter;
        Strings pieces;
    } const cases[] = {
        {"one two three", " ", {"one", "two", "three"}},
        {"word", " ", {}},
        {"word ", " ", {"word", ""}},
        {" word", " ", {"", "word"}},
        {"", " ", {}},
        {",", ",", {"", ""}},
        {"a,,b", ",", {"a", "", "b"}},
        {"a::b::c", "::", {"a", "b", "c"}},
        {"aaa", "aa", {"", "a"}},
        {"aaaa", "aa", {"", "", ""}},
        {"ab", "abc", {}},
        {"abc", "abc", {"", ""}},
        {"abc", "", {}},
        {"", "", {}},
        {"a\xC3\xA9"
         "bc",
         "\xC3\xA9",
         {"a", "c"}},  // two characters on: the b goes too
        {"a\xC3\xA9\xC3\xA9"
         "b",
         "\xC3\xA9",
         {"a", "b"}},  // so does the second delimiter
        {"a\xC3\xA9", "\xC3\xA9", {"a", ""}},
        {"\xC3\xA9,\xC3\xA8", ",", {"\xC3\xA9", "\xC3\xA8"}},
        {"a\xC3\xA9"
         "b",
         "\xC3",
         {"a", "b"}},  // one character on, from its first byte
        {std::string("a\0,b", 4), ",", {std::string("a\0", 2), "b"}},
    };
    for (const auto& c : cases) {
        RoxStringArray pieces(&pool);
        sorn::SplitString(Text(c.text), Text(c.delimiter), pieces);
        EXPECT_EQ(Strs(pieces), c.pieces) << '"' << c.text << "\" by \"" << c.delimiter << '"';
    }
}

TEST_F(TextUtilitiesTest, SplitStringAddsToTheArray) {
    RoxStringArray pieces(&pool);
    pieces.Add(Text("before"));
    sorn::SplitString(Text("none"), Text(","), pieces);
    EXPECT_EQ(Strs(pieces), Strings({"before"}));
    sorn::SplitString(Text("a,b"), Text(","), pieces);
    EXPECT_EQ(Strs(pieces), Strings({"before", "a", "b"}));
}

TEST_F(TextUtilitiesTest, SplitStringEndsWhenTheArrayIsFull) {
    RoxStringArray pieces(&pool);
    sorn::SplitString(Text(std::string(65'534, ',') + "x"), Text(","), pieces);
    EXPECT_EQ(pieces.GetCount(), 65'535u);
    EXPECT_EQ(Str(pieces[65'534]), "x");
    pieces.Destroy();
    sorn::SplitString(Text(std::string(70'000, ',')), Text(","), pieces);
    EXPECT_EQ(pieces.GetCount(), 65'535u);
}

}  // namespace
