#include <gtest/gtest.h>

#include <random>

#include "json/JsonParserFixture.h"

using jsontest::Cut;
using jsontest::ParsePieces;
using jsontest::ParseWhole;
using jsontest::Pieces;

// The same answer and the same tree, or the same words, however a text is cut.

namespace {

const std::string textsG[] = {
    R"({"a":1})",
    R"( {"a":{"b":[1,{"c":2}]},"d":3} )",
    R"({"key":"value with a few words","n":-12.5e+3})",
    R"({"a":"\"\\\u00e9\ud83d\ude00\n\/ and then more"})",
    "{\"a\":\"\xC3\xA9\xE2\x82\xAC\xF0\x9F\x98\x80\xC3\xA9\xE2\x82\xAC\"}",
    R"({"a":[true,false,null,"","x",[],{}]})",
    R"({"long key\twith escapes":1234567890123,"a":0})",
    R"({"a":1,"a":2,"a":"\\"})",
    R"({"a":"bad escape in here \q and more"})",
    "{\"a\":\"invalid bytes in here \xC3 and more\"}",
    "{\"a\":\"control byte in here \x02 and more\"}",
    R"({"a":12345.,"b":1})",
    R"({"a":truX})",
    R"({"a":"b"} "unfinished string behind)",
    R"({"a":"b"} 123)",
    R"({"a":"the end is missing)",
    R"({"a":"\\\\\\\\\\\"\\)",
    R"({"a":"\u00)",
    R"([1,2])",
    R"("text at the top")",
    R"({"a":1}})",
    "",
};

TEST(JsonParserSplits, InTwo) {
    for (const std::string& text : textsG) {
        const std::string whole = ParseWhole(text);
        const std::string_view view(text);
        for (size_t i = 0; i <= view.size(); ++i) {
            ASSERT_EQ(ParsePieces({view.substr(0, i), view.substr(i)}), whole) << text << " at " << i;
        }
    }
}

TEST(JsonParserSplits, InThree) {
    for (const std::string& text : textsG) {
        const std::string whole = ParseWhole(text);
        const std::string_view view(text);
        for (size_t i = 0; i <= view.size(); ++i) {
            for (size_t k = i; k <= view.size(); ++k) {
                ASSERT_EQ(ParsePieces({view.substr(0, i), view.substr(i, k - i), view.substr(k)}), whole)
                    << text << " at " << i << " and " << k;
            }
        }
    }
}

TEST(JsonParserSplits, InEqualPieces) {
    for (const std::string& text : textsG) {
        const std::string whole = ParseWhole(text);
        for (size_t n = 1; n < 20; ++n) {
            ASSERT_EQ(ParsePieces(Cut(text, n)), whole) << text << " by " << n;
        }
    }
}

// A number at the top is refused with its first digit, so that the words may be others than those about the
// whole, but never the answer.
TEST(JsonParserSplits, NumbersAtTheTop) {
    for (const std::string text : {"5", "-17.25e3", "5.x", "1e", "12 {}", "0123"}) {
        ASSERT_EQ(ParseWhole(text).substr(0, 7), "error: ") << text;
        for (size_t i = 0; i <= text.size(); ++i) {
            const std::string_view view(text);
            ASSERT_EQ(ParsePieces({view.substr(0, i), view.substr(i)}).substr(0, 7), "error: ") << text;
        }
    }
}

/// Random values as text, and as what is to come out of them.
class Writer {
 public:
    explicit Writer(uint32_t seed) : randomM(seed) {}

    void WriteMap(unsigned depth) {
        Both("{");
        const unsigned n = Below(5);
        for (unsigned i = 0; i < n; ++i) {
            if (i > 0) Both(",");
            WriteSpace();
            textM += '"';
            // In ascending order, which is the order in which they are shown.
            Both(std::string(1, static_cast<char>('a' + i)));
            textM += '"';
            WriteSpace();
            Both(":");
            WriteValue(depth);
        }
        Both("}");
    }
    const std::string& GetText() const { return textM; }
    const std::string& GetShown() const { return shownM; }

 private:
    unsigned Below(unsigned n) { return static_cast<unsigned>(randomM() % n); }
    void Both(const std::string& text) {
        textM += text;
        shownM += text;
    }
    void WriteSpace() { textM += std::string(Below(3), " \n\t\r"[Below(4)]); }
    void WriteValue(unsigned depth) {
        WriteSpace();
        switch (Below(depth > 0 ? 7 : 5)) {
            case 0:
                Both("null");
                break;
            case 1:
                Both(Below(2) == 0 ? "true" : "false");
                break;
            case 2:
                Both((Below(2) == 0 ? "-" : "") + std::to_string(1 + Below(1000000)) + "." +
                     std::string(1 + Below(40), '7') + "e" + std::to_string(Below(99)));
                break;
            case 3:
            case 4:
                WriteString();
                break;
            case 5:
                WriteMap(depth - 1);
                break;
            case 6:
                WriteArray(depth - 1);
                break;
        }
        WriteSpace();
    }
    void WriteArray(unsigned depth) {
        Both("[");
        const unsigned n = Below(5);
        for (unsigned i = 0; i < n; ++i) {
            if (i > 0) Both(",");
            WriteValue(depth);
        }
        Both("]");
    }
    void WriteString() {
        static const struct {
            const char* text;
            const char* meaning;
        } vPart[] = {
            {"word", "word"},         {" ", " "},           {"\\n", "\n"},
            {"\\\"", "\""},           {"\\\\", "\\"},       {"\\u00E9", "\xC3\xA9"},
            {"\xC3\xA9", "\xC3\xA9"}, {"{[:,]}", "{[:,]}"}, {"\\uD83D\\uDE00", "\xF0\x9F\x98\x80"},
        };
        textM += '"';
        shownM += '\'';
        for (unsigned n = Below(30); n > 0; --n) {
            const auto& part = vPart[Below(9)];
            textM += part.text;
            shownM += part.meaning;
        }
        textM += '"';
        shownM += '\'';
    }

    std::minstd_rand randomM;
    std::string textM;
    std::string shownM;
};

TEST(JsonParserSplits, RandomTextsInRandomPieces) {
    for (uint32_t seed = 1; seed <= 400; ++seed) {
        Writer writer(seed);
        writer.WriteMap(5);
        const std::string_view text(writer.GetText());
        ASSERT_EQ(ParseWhole(text), writer.GetShown()) << text;
        std::minstd_rand random(seed);
        for (const unsigned largest : {2u, 7u, 30u, 200u}) {
            Pieces pieces;
            for (size_t i = 0; i < text.size();) {
                const size_t n = random() % largest;
                pieces.push_back(text.substr(i, n));
                i += n;
            }
            ASSERT_EQ(ParsePieces(pieces), writer.GetShown()) << text << " up to " << largest;
        }
    }
}

}  // namespace
