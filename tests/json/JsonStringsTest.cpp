#include "sorn/json/Json.h"

#include <gtest/gtest.h>

#include "json/Support.h"
#include "sorn/json/TextScan.h"

using namespace std::string_literals;
using jsontest::ExactBytes;
using jsontest::String;
using sorn::ByteBuffer;
using sorn::InputPointer;
using sorn::Json;

namespace {

std::string Write(std::string_view text, bool onlyIfNeeded) {
    RoxMempool pool("strings");
    const RoxString string = jsontest::Text(pool, text);
    ByteBuffer buffer(&pool);
    Json::StringToJson(string, onlyIfNeeded, buffer);
    jsontest::StringSink sink;
    Json::StringToJson(string, onlyIfNeeded, sink);
    EXPECT_EQ(String(buffer), sink.GetText());
    return String(buffer);
}

struct WriteCase {
    std::string text;
    std::string quoted;
    std::string onlyIfNeeded;
};

TEST(JsonStrings, Write) {
    const WriteCase cases[] = {
        {"", R"("")", ""},
        {"abc-1", R"("abc-1")", "abc-1"},
        {"AZaz09", R"("AZaz09")", "AZaz09"},
        {"-", R"("-")", "-"},
        {"a.b", R"("a.b")", R"("a.b")"},
        {"a b", R"("a b")", R"("a b")"},
        {"a_b", R"("a_b")", R"("a_b")"},
        {"+1", R"("+1")", R"("+1")"},
        {"[]", R"("[]")", R"("[]")"},
        {"/", R"("/")", R"("/")"},
        {"\x03", "\"\x03\"", "\"\x03\""},
        {"\x1A", "\"\x1A\"", "\"\x1A\""},
        {"\x01", R"("\u0001")", R"("\u0001")"},
        {"\x02", R"("\u0002")", R"("\u0002")"},
        {"\x1F", R"("\u001F")", R"("\u001F")"},
        {"\x0B", R"("\u000B")", R"("\u000B")"},
        {"\x1B", R"("\u001B")", R"("\u001B")"},
        {"\x7F", "\"\x7F\"", "\"\x7F\""},
        {"\b\t\n\f\r", R"("\b\t\n\f\r")", R"("\b\t\n\f\r")"},
        {"\"", R"("\"")", R"("\"")"},
        {"\\", R"("\\")", R"("\\")"},
        {"\\u", R"("\u")", R"("\u")"},
        {"\\\\u", R"("\\\u")", R"("\\\u")"},
        {"\\\\", R"("\\\\")", R"("\\\\")"},
        {"\\U", R"("\\U")", R"("\\U")"},
        {"a\\u00e9z", R"("a\u00e9z")", R"("a\u00e9z")"},
        {"\xC3\xA9", "\"\xC3\xA9\"", "\"\xC3\xA9\""},
        {"\xFF\x80", "\"\xFF\x80\"", "\"\xFF\x80\""},
        {"a\0b"s, R"("a\u0000b")", R"(a\u0000b)"},  // the decision stops at the NUL, the writing does not
        {"a\0.\""s, R"("a\u0000.\"")", R"(a\u0000.\")"},
        {"a.\0b"s, R"("a.\u0000b")", R"("a.\u0000b")"},
        {"\0"s, R"("\u0000")", R"(\u0000)"},
    };
    for (const WriteCase& c : cases) {
        EXPECT_EQ(Write(c.text, false), c.quoted);
        EXPECT_EQ(Write(c.text, true), c.onlyIfNeeded);
    }
}

/// The rule of the bytes again, one byte after the other.
std::string EscapedOneByOne(const std::string& text) {
    static const char digits[] = "0123456789ABCDEF";
    std::string out;
    for (size_t i = 0; i < text.size(); ++i) {
        const unsigned char c = static_cast<unsigned char>(text[i]);
        if (c == '\b') {
            out += "\\b";
        } else if (c == '\t') {
            out += "\\t";
        } else if (c == '\n') {
            out += "\\n";
        } else if (c == '\f') {
            out += "\\f";
        } else if (c == '\r') {
            out += "\\r";
        } else if (c < 0x20 && c != 3 && c != 0x1A) {
            out += "\\u00";
            out += digits[c / 16];
            out += digits[c % 16];
        } else if (c == '"') {
            out += "\\\"";
        } else if (c == '\\') {
            out += i + 1 < text.size() && text[i + 1] == 'u' ? "\\" : "\\\\";
        } else {
            out += text[i];
        }
    }
    return out;
}

TEST(JsonStrings, EveryByteAtEveryPlaceOfABlock) {
    for (unsigned c = 0; c < 256; ++c) {
        for (size_t n : {1u, 7u, 8u, 9u, 15u, 16u, 17u, 31u, 33u, 40u}) {
            for (size_t place = 0; place<n; place += n> 20 ? 5 : 1) {
                std::string text(n, 'x');
                text[place] = static_cast<char>(c);
                ASSERT_EQ(Write(text, false), "\"" + EscapedOneByOne(text) + "\"")
                    << c << " " << n << " " << place;
            }
        }
    }
}

TEST(JsonStrings, LongTexts) {
    // Around the sizes of the pieces and windows, with the backslash and its 'u' on both sides of a border.
    for (size_t n :
         {126u, 127u, 128u, 129u, 255u, 256u, 257u, 1023u, 1024u, 1025u, 4095u, 4096u, 4097u, 100000u}) {
        const std::string plain(n, 'p');
        ASSERT_EQ(Write(plain, true), plain);
        ASSERT_EQ(Write(plain, false), "\"" + plain + "\"");
        const std::string controls(n, '\x01');
        ASSERT_EQ(Write(controls, false), "\"" + EscapedOneByOne(controls) + "\"");
        for (size_t back = 1; back <= 3; ++back) {
            std::string text(n + 40, 'x');
            text[n - back] = '\\';
            text[n - back + 1] = 'u';
            ASSERT_EQ(Write(text, false), "\"" + EscapedOneByOne(text) + "\"") << n << " " << back;
        }
    }
}

TEST(JsonStrings, SinkGetsPiecesOfBoundedSize) {
    RoxMempool pool("strings");
    const RoxString text = jsontest::Text(pool, std::string(100000, '\x01'));
    jsontest::StringSink sink;
    Json::StringToJson(text, false, sink);
    EXPECT_EQ(sink.GetText().size(), 600002u);
    EXPECT_LE(sink.GetLargestWrite(), 4096u);
}

TEST(JsonStrings, EscapedCharToChar) {
    const std::string escapes = "\"/\\bfnrt";
    const std::string values = "\"/\\\b\f\n\r\t";
    for (int c = 0; c < 256; ++c) {
        char out = '#';
        const size_t i = c == 0 ? std::string::npos : escapes.find(static_cast<char>(c));
        if (i == std::string::npos) {
            EXPECT_FALSE(Json::EscapedCharToChar(static_cast<char>(c), out)) << c;
            EXPECT_EQ(out, '#');
        } else {
            EXPECT_TRUE(Json::EscapedCharToChar(static_cast<char>(c), out)) << c;
            EXPECT_EQ(out, values[i]);
        }
    }
}

struct ReadCase {
    std::string input;
    bool success;
    std::string text;
    int behind;  // where the cursor stands
};

TEST(JsonStrings, Read) {
    const ReadCase cases[] = {
        {"", true, "", 0},
        {" \t\r\n", true, "", 4},
        {"abc", true, "abc", 3},
        {" abc ", true, "abc", 4},
        {"a:b", true, "a", 1},
        {",", true, "", 0},
        {"+1.5e-3,", true, "+1.5e-3", 7},
        {"a_b", true, "a", 1},
        {"a\x80", true, "a", 1},
        {"\x80", true, "", 0},
        {"\v1", true, "", 0},
        {"\f1", true, "", 0},
        {"a\0b"s, true, "a", 1},
        {R"("")", true, "", 2},
        {R"("abc"x)", true, "abc", 5},
        {R"( "a b")", true, "a b", 6},
        {"\"abc", true, "abc", 5},  // one behind the end
        {"\"", true, "", 2},
        {R"("a\u00e9")", true, R"(a\u00e9)", 9},
        {R"("\u")", true, R"(\u)", 4},
        {R"("\u"")", true, R"(\u)", 4},
        {R"("\u\"")", true, R"(\u")", 6},
        {R"("\\u")", true, R"(\u)", 5},
        {R"("\/")", true, "/", 4},
        {R"("\"\\\b\f\n\r\t")", true, "\"\\\b\f\n\r\t", 16},
        {R"("\"abc)", true, "\"abc", 7},
        {"\"\x01\n\xC3\xA9\x7F\"", true, "\x01\n\xC3\xA9\x7F", 7},
        {R"("\q")", false, "", 0},
        {R"("\U0041")", false, "", 0},
        {"\"a\0b\""s, false, "", 0},
        {"\"\\\0\""s, false, "", 0},
        {"\"\\n\0\""s, false, "", 0},
        {"\"abc\\", false, "", 0},
        {"\"\\", false, "", 0},
    };
    for (const ReadCase& c : cases) {
        RoxMempool pool("strings");
        const ExactBytes bytes(c.input);
        InputPointer cursor{bytes.Begin(), bytes.End()};
        RoxString out("before");
        ASSERT_EQ(Json::JsonToString(&pool, cursor, out), c.success) << c.input;
        EXPECT_EQ(String(out), c.success ? c.text : "before") << c.input;
        if (c.success) {
            EXPECT_EQ(cursor.pCurrentM - bytes.Begin(), c.behind) << c.input;
        }
        if (c.success && !out.FEmpty()) {
            EXPECT_EQ(out.GetMempool(), &pool);
        }
    }
}

TEST(JsonStrings, ReadBehindTheEndStaysThere) {
    RoxMempool pool("strings");
    const ExactBytes bytes("\"abc");
    InputPointer cursor{bytes.Begin(), bytes.End()};
    RoxString out;
    ASSERT_TRUE(Json::JsonToString(&pool, cursor, out));
    ASSERT_TRUE(Json::JsonToString(&pool, cursor, out));
    EXPECT_TRUE(out.FEmpty());
    EXPECT_TRUE(cursor.FAtEnd());
}

TEST(JsonStrings, ReadFindsEveryStopAtEveryPlace) {
    for (size_t n = 0; n < 40; ++n) {
        const std::string text(n, 'x');
        EXPECT_EQ(jsontest::Parse("{\"a\":\"" + text + "\"}"), "{\"a\": \"" + text + "\"}");
        EXPECT_EQ(jsontest::Parse("{\"a\":\"" + text + "\\n\"}"), "{\"a\": \"" + text + "\\n\"}");
        EXPECT_EQ(jsontest::Parse("{\"a\":\"" + text + "\0\"}"s),
                  "error: Can't parse scalar field for Object field a Failed to parse value for key a");
    }
}

TEST(JsonStrings, ScansAgreeWithAWalk) {
    // Every byte value before and behind the stop: no carry of a word-wide test may hide or invent one.
    for (unsigned a = 0; a < 256; ++a) {
        for (unsigned b = 0; b < 256; ++b) {
            std::string text(13, 'x');
            text[3] = static_cast<char>(a);
            text[4] = static_cast<char>(b);
            const ExactBytes bytes(text);
            const unsigned char* walk = bytes.Begin();
            while (walk < bytes.End() && *walk != '"' && *walk != '\\' && *walk != 0) ++walk;
            ASSERT_EQ(sorn::textscan::FindStringStop(bytes.Begin(), bytes.End()), walk) << a << " " << b;
            ASSERT_EQ(Write(text, false), "\"" + EscapedOneByOne(text) + "\"") << a << " " << b;
        }
    }
}

TEST(JsonStrings, ReadAndWriteAgain) {
    // The texts that come back as they were, and those that do not.
    const std::pair<std::string, std::string> cases[] = {
        {R"("a\u00e9")", R"("a\u00e9")"}, {R"("\/")", R"("/")"},
        {R"("\\u0041")", R"("\u0041")"},  {R"("\"\\\b\f\n\r\t")", R"("\"\\\b\f\n\r\t")"},
        {"\"\x01\"", R"("\u0001")"},      {"\"\xC3\xA9\"", "\"\xC3\xA9\""},
    };
    for (const auto& [input, output] : cases) {
        RoxMempool pool("strings");
        InputPointer cursor{reinterpret_cast<const unsigned char*>(input.data()),
                            reinterpret_cast<const unsigned char*>(input.data() + input.size())};
        RoxString text;
        ASSERT_TRUE(Json::JsonToString(&pool, cursor, text));
        EXPECT_EQ(Write(text.View(), false), output);
    }
}

/// Each run of bytes from `run`, at all short lengths, ends at each byte that is not in `inside`, and at the
/// end of the block.
void ExpectRunsEnd(const unsigned char* (*find)(const unsigned char*, const unsigned char*),
                   const std::string& inside, const std::string& run) {
    for (unsigned n = 0; n < 70; ++n) {
        std::string text;
        for (unsigned i = 0; i < n; ++i) text += run[(i * 7 + n) % run.size()];
        const ExactBytes alone(text);
        ASSERT_EQ(find(alone.Begin(), alone.End()), alone.End()) << n;
        for (unsigned byte = 0; byte < 256; ++byte) {
            if (inside.find(static_cast<char>(byte)) != std::string::npos) continue;
            for (const unsigned nBehind : {0u, 1u, 20u}) {
                const ExactBytes bytes(text + static_cast<char>(byte) + std::string(nBehind, run[0]));
                ASSERT_EQ(find(bytes.Begin(), bytes.End()), bytes.Begin() + n) << n << " " << byte;
            }
        }
    }
}

TEST(JsonStrings, RunsOfWhiteSpaceOfAnyLength) {
    const std::string white = " \t\n\r";
    ExpectRunsEnd(&sorn::textscan::SkipWhitespace, white, " ");
    ExpectRunsEnd(&sorn::textscan::SkipWhitespace, white, white);
    const unsigned char bytes[2] = {' ', ' '};
    EXPECT_EQ(sorn::textscan::SkipWhitespace(bytes + 1, bytes), bytes + 1);
}

TEST(JsonStrings, RunsThatNeedNoQuotesOfAnyLength) {
    const std::string bare = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789-";
    ExpectRunsEnd(&sorn::textscan::FindBareEnd, bare, bare);
}

}  // namespace
