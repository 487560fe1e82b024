// The cursor: blocks, tokens, single values, capture. Invariants for untrusted input: 1, 13.

#include <cinttypes>
#include <cstdio>
#include <random>
#include <vector>

#include "kelbaselib/InMemoryBytestream.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/model/Schema.h"
#include "sorn/typedjson/JsonBytesourceToString.h"
#include "sornschema/EveryType.h"
#include "typedjson/ReaderFixture.h"

namespace sorntest {

using namespace sorn;

class CursorReadTest : public ReaderFixture {
 protected:
    static const FieldInfo* Field(const std::string& name) {
        const StructInfo& info = sornschema::EveryType::structInfoG;
        for (int slot = 0; slot < info.nFields; ++slot) {
            const FieldInfo& field = info.vFieldInfo[slot];
            if (!field.FHole() && name == info.FieldName(field)) return &field;
        }
        ADD_FAILURE() << "no field " << name;
        return nullptr;
    }
    static std::string Rest(InputPointerBytesource& cursor) {
        std::string rest;
        for (; cursor.pCurrentM != cursor.pEndM || cursor.Refill(); ++cursor.pCurrentM)
            rest += static_cast<char>(*cursor.pCurrentM);
        return rest;
    }
};

struct TextCase {
    std::string text;
    bool isRead;
    const char* value;
    std::string rest;  // what the cursor stands before
};

const TextCase vTextsG[] = {
    {"", true, "", ""},
    {" \t\r\n", true, "", ""},
    {"abc", true, "abc", ""},
    {"  \n abc ,", true, "abc", " ,"},
    {"+1.5e-3]", true, "+1.5e-3", "]"},
    {"123", true, "123", ""},
    {"\"123\"", true, "123", ""},
    {"a_b", true, "a", "_b"},
    {"/", true, "", "/"},
    {",", true, "", ","},
    {std::string("a\0b", 3), true, "a", std::string("\0b", 2)},
    {"\xC3\xA9", true, "", "\xC3\xA9"},
    {"\"\"x", true, "", "x"},
    {"\"a b\",", true, "a b", ","},
    {"\"\xC3\xA9\x01\"", true, "\xC3\xA9\x01", ""},
    {R"("\u0041")", true, "0041", ""},
    {R"("caf\u00e9!")", true, "caf00e9!", ""},
    {R"("\"\/\\\b\f\n\r\t")", true, "\"/\\\b\f\n\r\t", ""},
    {R"("a\\")", true, "a\\", ""},
    {"\"abc", false, "", ""},
    {"\"", false, "", ""},
    {"\"abc\\", false, "", ""},
    {R"("a\q")", false, "", ""},
    {std::string("\"a\0b\"", 5), false, "", ""},
    {std::string("\"a\\\0b\"", 6), false, "", ""},
};

TEST_F(CursorReadTest, Texts) {
    for (const TextCase& each : vTextsG) {
        SCOPED_TRACE(each.text);
        WithCursors(each.text, [&](InputPointerBytesource& cursor) {
            RoxString out("untouched");
            EXPECT_EQ(JsonBytesourceToString(&pool, nullptr, cursor, out), each.isRead);
            EXPECT_EQ(out.View(), each.isRead ? each.value : "untouched");
            if (each.isRead) {
                EXPECT_EQ(Rest(cursor), each.rest);
            }
        });
    }
}

TEST_F(CursorReadTest, TextsOverTheEndOfABlock) {
    // Each byte of each token comes to be the first one of a block.
    const std::string token = R"("one \"two\" \\ \u00e9 \n end")";
    const std::string value = "one \"two\" \\ 00e9 \n end";
    for (size_t nBefore = 16384 - token.size() - 2; nBefore <= 16384 + 2; ++nBefore) {
        const std::string text = std::string(nBefore, ' ') + token + " bare-token";
        PieceSource* const source = new PieceSource(text, 100000);
        InputPointerBytesource cursor(source);
        RoxString first;
        RoxString second;
        EXPECT_TRUE(ReadString(&pool, cursor, first));
        EXPECT_TRUE(ReadString(&pool, cursor, second));
        EXPECT_EQ(first.View(), value) << nBefore;
        EXPECT_EQ(second.View(), "bare-token") << nBefore;
        source->Release();
    }
}

TEST_F(CursorReadTest, LongTexts) {
    for (size_t n : {16383u, 16384u, 16385u, 32768u, 100000u}) {
        std::string letters(n, 'x');
        for (size_t i = 0; i < n; ++i) letters[i] = static_cast<char>('a' + i % 26);
        for (const std::string& text : {letters, "\"" + letters + "\""}) {
            WithCursors(text, [&](InputPointerBytesource& cursor) {
                RoxString out;
                EXPECT_TRUE(ReadString(&pool, cursor, out));
                EXPECT_EQ(out.View(), letters);
            });
        }
    }
    // A backslash as the last byte of a block.
    const std::string text = "\"" + std::string(16382, 'x') + "\\n\"";
    WithCursors(text, [&](InputPointerBytesource& cursor) {
        RoxString out;
        EXPECT_TRUE(ReadString(&pool, cursor, out));
        EXPECT_EQ(out.View(), std::string(16382, 'x') + "\n");
    });
}

TEST_F(CursorReadTest, BlocksAreCounted) {
    const std::string text(40000, 'x');
    PieceSource* const source = new PieceSource(text, 100000);
    InputPointerBytesource cursor(source);
    EXPECT_TRUE(cursor.canRefillM);
    EXPECT_EQ(cursor.lastReadLengthM + cursor.consumedLengthM, 0u);
    const unsigned lengths[] = {16384, 16384, 7232, 0, 0};
    unsigned sum = 0;
    for (unsigned length : lengths) {
        cursor.pCurrentM = cursor.pEndM;
        EXPECT_EQ(cursor.Refill(), length != 0);
        EXPECT_EQ(cursor.lastReadLengthM, length);
        EXPECT_EQ(cursor.consumedLengthM, sum);
        EXPECT_EQ(cursor.pEndM - cursor.pCurrentM, static_cast<ptrdiff_t>(length));
        sum += length;
    }
    source->Release();
}

TEST_F(CursorReadTest, MemoryIsNotRefilled) {
    const ExactText text("  ");
    InputPointerBytesource cursor(text.Bytes(), text.Length());
    EXPECT_EQ(cursor.lastReadLengthM, 2u);
    cursor.SkipWhitespace();
    EXPECT_EQ(cursor.pCurrentM, text.Bytes() + 2);
    EXPECT_FALSE(cursor.Refill());
    EXPECT_EQ(cursor.TakenBytes(), 2u);
}

TEST_F(CursorReadTest, AMissingSourceIsAtItsEnd) {
    InputPointerBytesource cursor(static_cast<kelbaselib::Bytesource*>(nullptr));
    EXPECT_FALSE(cursor.Refill());
    EXPECT_EQ(cursor.TakenBytes(), 0u);
}

TEST_F(CursorReadTest, CaptureGetsEachByteOnce) {
    std::string text;
    for (int i = 0; text.size() < 50000; ++i) text += "\"text " + std::to_string(i) + "\"  ";
    for (size_t nBefore : {0u, 3u, 16380u, 16384u}) {
        const std::string whole = std::string(nBefore, ' ') + text + ",";
        WithCursors(whole, [&](InputPointerBytesource& cursor) {
            cursor.SkipWhitespace();
            cursor.StartCapture(&pool);
            RoxString out;
            do {
                ASSERT_TRUE(ReadString(&pool, cursor, out));
            } while (!out.FEmpty());
            kelbaselib::Bytesource* const captured = cursor.FinishCapture();
            EXPECT_EQ(RestOf(*captured), text);
            captured->Release();
            EXPECT_FALSE(cursor.isCapturingM);
        });
    }
}

TEST_F(CursorReadTest, NumbersAsTheLibraryOfCReadsThem) {
    std::vector<std::string> texts = {"",
                                      "-",
                                      "+",
                                      " 7",
                                      "\t\n\v\f\r 7",
                                      "-0",
                                      "+5",
                                      "--5",
                                      "12abc",
                                      "abc",
                                      "0x10",
                                      "010",
                                      "1e3",
                                      "1.9",
                                      ".5",
                                      "-.5e1",
                                      "inf",
                                      "nan",
                                      "1e999",
                                      "-1e999",
                                      "1e-999",
                                      "- 5",
                                      "00000000000000000000000000000000000000012",
                                      "340282366920938463463374607431768211456",
                                      "-340282366920938463463374607431768211456"};
    for (int bits : {31, 32, 33, 63, 64}) {
        for (int offset : {-1, 0, 1}) {
            const uint64_t power = bits == 64 ? 0 : uint64_t{1} << bits;
            char text[40];
            snprintf(text, sizeof text, "%" PRIu64, power + static_cast<uint64_t>(offset));
            texts.push_back(text);
            texts.push_back("-" + std::string(text));
        }
    }
    for (const char* big : {"18446744073709551616", "18446744073709551617", "-18446744073709551615",
                            "-18446744073709551616", "-18446744073709551611", "99999999999999999999"})
        texts.push_back(big);
    std::mt19937_64 random(1);
    for (int i = 0; i < 2000; ++i) {
        std::string text;
        for (uint64_t n = random() % 24; n != 0; --n)
            text += "0123456789012345678901234567890123 +-.ex"[random() % 40];
        texts.push_back(text);
    }
    for (const std::string& text : texts) {
        SCOPED_TRACE(text);
        const std::string quoted = "\"" + text + "\"";
        WithCursors(quoted, [&](InputPointerBytesource& cursor) {
            int a = 77;
            int b = 77;
            EXPECT_EQ(ReadS32(&pool, cursor, a), sscanf(text.c_str(), "%d", &b) == 1);
            EXPECT_EQ(a, b);
        });
        WithCursors(quoted, [&](InputPointerBytesource& cursor) {
            unsigned a = 77;
            unsigned b = 77;
            EXPECT_EQ(ReadU32(&pool, cursor, a), sscanf(text.c_str(), "%u", &b) == 1);
            EXPECT_EQ(a, b);
        });
        WithCursors(quoted, [&](InputPointerBytesource& cursor) {
            long long a = 77;
            long long b = 77;
            EXPECT_EQ(ReadS64(&pool, cursor, a), sscanf(text.c_str(), "%lld", &b) == 1);
            EXPECT_EQ(a, b);
        });
        WithCursors(quoted, [&](InputPointerBytesource& cursor) {
            unsigned long long a = 77;
            unsigned long long b = 77;
            EXPECT_EQ(ReadU64(&pool, cursor, a), sscanf(text.c_str(), "%llu", &b) == 1);
            EXPECT_EQ(a, b);
        });
    }
}

TEST_F(CursorReadTest, OtherValues) {
    const std::string text =
        R"(true "false" yes "" red "purple" "QUI=" "Q" "vuka:etc.9" 9 "vuka:etc.ts.5" "vuka:etc.a b")";
    WithCursors(text, [&](InputPointerBytesource& cursor) {
        bool isTrue = false;
        EXPECT_TRUE(ReadBool(&pool, cursor, isTrue));
        EXPECT_TRUE(isTrue);
        EXPECT_TRUE(ReadBool(&pool, cursor, isTrue));
        EXPECT_FALSE(isTrue);
        EXPECT_FALSE(ReadBool(&pool, cursor, isTrue));
        EXPECT_FALSE(ReadBool(&pool, cursor, isTrue));
        unsigned number = 7;
        EXPECT_TRUE(ReadEnum(&pool, cursor, Field("optionalEnum"), number));
        EXPECT_EQ(number, 1u);
        EXPECT_FALSE(ReadEnum(&pool, cursor, Field("optionalEnum"), number));
        ref<rox::ByteBuffer> bytes;
        EXPECT_TRUE(ReadBytestring(&pool, cursor, bytes));
        EXPECT_EQ(std::string(reinterpret_cast<const char*>(bytes->GetData()), bytes->GetLength()), "AB");
        EXPECT_TRUE(ReadBytestring(&pool, cursor, bytes));
        EXPECT_EQ(bytes->GetLength(), 0u);
        EXPECT_TRUE(ReadIntId(&pool, cursor, Field("optionalIntId"), number));
        EXPECT_EQ(number, 9u);
        EXPECT_FALSE(ReadIntId(&pool, cursor, Field("optionalIntId"), number));
        EXPECT_EQ(number, 9u);
        unsigned long long id = 0;
        EXPECT_TRUE(ReadLongId(&pool, cursor, Field("optionalLongId"), id));
        EXPECT_EQ(id, (2ull << 48) + 5);
        RoxString textId;
        EXPECT_TRUE(ReadStringId(&pool, cursor, Field("optionalStringId"), textId));
        EXPECT_EQ(textId.View(), "a b");
    });
}

}  // namespace sorntest
