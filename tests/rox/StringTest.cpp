#include "rox/RoxString.h"

#include <gtest/gtest.h>

#include <cstdint>
#include <memory>
#include <string>
#include <thread>
#include <vector>

#include "rox/RoxMempool.h"
#include "rox/RoxStringRepN.h"

namespace {

RoxString Bytes(const std::string& text) {
    return RoxString::FromUtf8Bytes(nullptr, static_cast<unsigned>(text.size()), text.data());
}

std::string Text(const RoxString& s) {
    return std::string(s.Utf8(), s.NByte());
}

}  // namespace

TEST(StringTest, EmptyStrings) {
    RoxMempool pool("strings");
    for (const RoxString& s : {RoxString(), RoxString(""), RoxString(static_cast<const char*>(nullptr)),
                               RoxString(&pool, ""), RoxString::FromUtf8Bytes(&pool, 0, "x"),
                               RoxString::FromRepN(nullptr), RoxString::Format("%s", "")}) {
        EXPECT_TRUE(s.FEmpty());
        EXPECT_EQ(0u, s.NByte());
        EXPECT_STREQ("", s.Utf8());
        EXPECT_EQ(nullptr, s.GetRepN());
        EXPECT_EQ(RoxString(), s);
        EXPECT_TRUE(s == "");
        EXPECT_TRUE(s.FEqual(static_cast<const char*>(nullptr)));
    }
    EXPECT_EQ(0u, pool.GetUsedBytes());
}

TEST(StringTest, TextLivesInItsPool) {
    RoxMempool pool("strings");
    {
        RoxString s(&pool, "recording");
        EXPECT_EQ(&pool, s.GetMempool());
        EXPECT_STREQ("recording", s.Utf8());
        EXPECT_EQ(9u, s.NByte());
        EXPECT_FALSE(s.FEmpty());
        size_t one = pool.GetUsedBytes();
        EXPECT_GE(one, 10u);
        RoxString copy = s;
        EXPECT_EQ(s.GetRepN(), copy.GetRepN());
        EXPECT_EQ(s.Utf8(), copy.Utf8());
        EXPECT_EQ(one, pool.GetUsedBytes());
        s = "offer";  // in the same pool
        EXPECT_EQ(&pool, s.GetMempool());
        EXPECT_STREQ("recording", copy.Utf8());
        RoxString onHeap("recording");
        EXPECT_EQ(nullptr, onHeap.GetMempool());
        EXPECT_EQ(copy, onHeap);
    }
    EXPECT_EQ(0u, pool.GetUsedBytes());
}

TEST(StringTest, AllocatesOnceAndTightly) {
    RoxMempool pool("strings");
    RoxString s(&pool, "abc");
    // Pool, three 32-bit words, four bytes of text: 24 bytes on a 64-bit host, 20 on a 32-bit one.
    EXPECT_GE(pool.GetUsedBytes(), sizeof(void*) == 8 ? 24u : 20u);
    EXPECT_LE(pool.GetUsedBytes(), 40u);  // with a redzone, if there is one
}

TEST(StringTest, EqualityIsByteForByte) {
    struct Case {
        std::string a, b;
        bool equal;
    };
    const Case vCase[] = {
        {"", "", true},
        {"a", "a", true},
        {"a", "b", false},
        {"a", "ab", false},
        {"ab", "a", false},
        {std::string("a\0b", 3), std::string("a\0b", 3), true},
        {std::string("a\0b", 3), std::string("a\0c", 3), false},
        {std::string("a\0b", 3), "a", false},
        {"\xC3\xA9", "e\xCC\x81", false},
    };
    for (const Case& c : vCase) {
        EXPECT_EQ(c.equal, Bytes(c.a) == Bytes(c.b)) << c.a << "|" << c.b;
        EXPECT_EQ(!c.equal, Bytes(c.a) != Bytes(c.b));
        EXPECT_EQ(c.equal, Bytes(c.a).FEqual(Bytes(c.b)));
    }
    EXPECT_TRUE(RoxString("abc") == "abc");
    EXPECT_TRUE(RoxString("abc") != "abd");
    EXPECT_TRUE(RoxString("abc").FEqual("abc"));
    EXPECT_FALSE(RoxString("abc").FEqual("ab"));
    EXPECT_FALSE(Bytes(std::string("ab\0c", 4)).FEqual("ab"));  // the NUL inside counts
}

TEST(StringTest, NulBytesInsideAreKept) {
    RoxString s = Bytes(std::string("a\0b", 3));
    EXPECT_EQ(3u, s.NByte());
    EXPECT_EQ(std::string("a\0b", 3), Text(s));
    EXPECT_EQ(0, s.Utf8()[3]);
}

TEST(StringTest, FromUtf8BytesTakesThisStringsPool) {
    RoxMempool pool("strings");
    RoxString s(&pool, "x");
    EXPECT_EQ(&pool, s.FromUtf8Bytes(2, "abc").GetMempool());
    EXPECT_EQ("ab", s.FromUtf8Bytes(2, "abc"));
    EXPECT_EQ(nullptr, RoxString().FromUtf8Bytes(2, "abc").GetMempool());
    EXPECT_EQ("x", s);
}

TEST(StringTest, RepresentationIsShared) {
    RoxMempool pool("strings");
    {
        RoxStringRepN* rep = nullptr;
        RoxString second;
        {
            RoxString first(&pool, "shared");
            rep = first.GetRepN();
            second = RoxString::FromRepN(rep);
            RoxString third(rep);
            EXPECT_EQ(rep, third.GetRepN());
        }
        EXPECT_STREQ("shared", second.Utf8());
        EXPECT_EQ(rep, second.GetRepN());
        RoxString moved = std::move(second);
        EXPECT_TRUE(second.FEmpty());
        EXPECT_EQ(rep, moved.GetRepN());
        second = std::move(moved);
        EXPECT_EQ(rep, second.GetRepN());
        RoxString& same = second;
        second = same;
        EXPECT_STREQ("shared", second.Utf8());
    }
    EXPECT_EQ(0u, pool.GetUsedBytes());
}

TEST(StringTest, AssigningOwnBytesIsSafe) {
    RoxMempool pool("strings");
    RoxString s(&pool, "some longer text");
    s = s.Utf8() + 5;
    EXPECT_STREQ("longer text", s.Utf8());
    s = static_cast<const char*>(nullptr);
    EXPECT_TRUE(s.FEmpty());
}

TEST(StringTest, Format) {
    RoxMempool pool("strings");
    EXPECT_EQ("7 of 0x0A, ten", RoxString::Format("%d of 0x%02X, %s", 7, 10, "ten"));
    EXPECT_EQ(nullptr, RoxString::Format("x").GetMempool());
    EXPECT_EQ(&pool, RoxString::Format(&pool, "%c", 'x').GetMempool());
    EXPECT_EQ("x", RoxString::Format(&pool, "%c", 'x'));
}

TEST(StringTest, FormatAtTheEdgesOfTheLocalBuffer) {
    for (size_t n : {1u, 510u, 511u, 512u, 513u, 1000u, 100000u}) {
        std::string text(n, 'y');
        text[0] = 'x';
        EXPECT_EQ(text, Text(RoxString::Format("%s", text.c_str()))) << n;
        EXPECT_EQ(text + "!", Text(RoxString::Format("%s!", text.c_str()))) << n;
    }
}

TEST(StringTest, FormatAndSetMayReadItself) {
    RoxMempool pool("strings");
    RoxString s(&pool, "cause");
    s.FormatAndSet("%s%s", s.Utf8(), ". Unable to go on.");
    EXPECT_STREQ("cause. Unable to go on.", s.Utf8());
    EXPECT_EQ(&pool, s.GetMempool());
    s.FormatAndSet("<%s|%s>", strstr(s.Utf8(), "Unable"), s.Utf8());
    EXPECT_STREQ("<Unable to go on.|cause. Unable to go on.>", s.Utf8());
    RoxString grown(&pool, "z");
    for (int i = 0; i < 11; ++i) {
        grown.FormatAndSet("%s%s", grown.Utf8(), grown.Utf8());  // beyond the local buffer too
    }
    EXPECT_EQ(std::string(2048, 'z'), Text(grown));
    RoxString appended;
    for (char c : {'a', 'b', 'c'}) {
        appended.FormatAndSet("%s%c", appended.Utf8(), c);
    }
    EXPECT_STREQ("abc", appended.Utf8());
    appended.FormatAndSet("%s", "");
    EXPECT_TRUE(appended.FEmpty());
}

TEST(StringTest, CopyIsUntouchedByFormatAndSet) {
    RoxString s("one");
    RoxString copy = s;
    s.FormatAndSet("%s two", s.Utf8());
    EXPECT_STREQ("one", copy.Utf8());
    EXPECT_STREQ("one two", s.Utf8());
}

TEST(StringTest, Trim) {
    struct Case {
        const char* text;
        const char* trimmed;
    };
    const Case vCase[] = {
        {"", ""},           {" ", ""},   {" \t\n\v\f\r ", ""},   {"a", "a"},
        {" a", "a"},        {"a ", "a"}, {"\r\n a b \t", "a b"}, {"\xC2\xA0x", "\xC2\xA0x"},
        {"\x1Fx", "\x1Fx"},
    };
    for (const Case& c : vCase) {
        EXPECT_STREQ(c.trimmed, RoxString(c.text).Trim().Utf8()) << c.text;
    }
    RoxString whole("a b");
    EXPECT_EQ(whole.GetRepN(), whole.Trim().GetRepN());
}

TEST(StringTest, LeftRightMiddle) {
    RoxMempool pool("strings");
    RoxString s(&pool, "one two three");
    RoxStringPos start;
    RoxStringPos two;
    ASSERT_TRUE(s.FindString("two", two));
    RoxStringPos behind = s.AdvancePos(two, 3);
    RoxStringPos past = s.AdvancePos(start, 4000000000u);
    EXPECT_STREQ("one ", s.Left(two).Utf8());
    EXPECT_STREQ("two three", s.Right(two).Utf8());
    EXPECT_STREQ("two", s.Middle(two, behind).Utf8());
    EXPECT_STREQ("", s.Middle(behind, two).Utf8());
    EXPECT_STREQ("", s.Middle(two, two).Utf8());
    EXPECT_STREQ("", s.Left(start).Utf8());
    EXPECT_STREQ("", s.Right(past).Utf8());
    EXPECT_STREQ(" three", s.Middle(behind, past).Utf8());
    EXPECT_EQ(s.GetRepN(), s.Right(start).GetRepN());
    EXPECT_EQ(s.GetRepN(), s.Left(past).GetRepN());
    EXPECT_EQ(s.GetRepN(), s.Middle(start, past).GetRepN());
    EXPECT_EQ(&pool, s.Left(two).GetMempool());
}

TEST(StringTest, PositionOfALongerStringStopsAtTheEnd) {
    RoxString longer("0123456789");
    RoxString shorter("abc");
    RoxStringPos seven = longer.GetCharacterPos(7);
    EXPECT_STREQ("abc", shorter.Left(seven).Utf8());
    EXPECT_STREQ("", shorter.Right(seven).Utf8());
    EXPECT_STREQ("", shorter.Middle(seven, longer.GetCharacterPos(9)).Utf8());
    EXPECT_STREQ("bc", shorter.Middle(longer.GetCharacterPos(1), seven).Utf8());
    EXPECT_EQ(shorter.GetCharacterPos(3), shorter.AdvancePos(seven, 0));
    EXPECT_EQ(shorter.GetCharacterPos(3), shorter.AdvancePos(seven, 5));
    EXPECT_STREQ("", RoxString().Left(seven).Utf8());
    EXPECT_STREQ("", RoxString().Right(seven).Utf8());
}

TEST(StringTest, FindString) {
    struct Case {
        const char* text;
        const char* wanted;
        bool found;
        const char* rest;
    };
    const Case vCase[] = {
        {"a b c", " ", true, " b c"}, {"abcabc", "bc", true, "bcabc"}, {"aaab", "aab", true, "aab"},
        {"abc", "abc", true, "abc"},  {"abc", "abcd", false, ""},      {"abc", "x", false, ""},
        {"", "x", false, ""},         {"abc", "", true, "abc"},        {"", "", true, ""},
    };
    for (const Case& c : vCase) {
        RoxString s(c.text);
        RoxStringPos pos = RoxString("0123456789").GetCharacterPos(9);
        RoxStringPos before = pos;
        EXPECT_EQ(c.found, s.FindString(c.wanted, pos)) << c.text << "|" << c.wanted;
        EXPECT_TRUE(c.found || pos == before);
        EXPECT_STREQ(c.rest, c.found ? s.Right(pos).Utf8() : "");
        RoxStringPos again;
        EXPECT_EQ(c.found, s.FindString(RoxString(c.wanted), again));
        EXPECT_STREQ(c.rest, c.found ? s.Right(again).Utf8() : "");
    }
    RoxStringPos pos;
    RoxString withNul = Bytes(std::string("a\0bc", 4));
    EXPECT_TRUE(withNul.FindString("c", pos));
    EXPECT_STREQ("c", withNul.Right(pos).Utf8());
}

TEST(StringTest, PositionsCountCharacters) {
    struct Case {
        const char* what;
        std::string text;
        std::vector<unsigned> vOffset;  // of characters 0, 1, ... and of the end
    };
    const Case vCase[] = {
        {"ASCII", "abc", {0, 1, 2, 3}},
        {"two bytes", "a\xC3\xA9z", {0, 1, 3, 4}},
        {"three bytes", "\xE2\x82\xAC.", {0, 3, 4}},
        {"four bytes", "\xF0\x9F\x98\x80.", {0, 4, 5}},
        {"lone continuation", "\x80\xBF", {0, 1, 2}},
        {"cut short at the end", "a\xE2\x82", {0, 1, 2, 3}},
        {"cut short before ASCII", "\xE2\x82x", {0, 1, 2, 3}},
        {"overlong two", "\xC0\x80", {0, 1, 2}},
        {"overlong three", "\xE0\x9F\xBF", {0, 1, 2, 3}},
        {"first of three", "\xE0\xA0\x80", {0, 3}},
        {"last before the surrogates", "\xED\x9F\xBF", {0, 3}},
        {"surrogate", "\xED\xA0\x80", {0, 1, 2, 3}},
        {"overlong four", "\xF0\x8F\xBF\xBF", {0, 1, 2, 3, 4}},
        {"first of four", "\xF0\x90\x80\x80", {0, 4}},
        {"last of all", "\xF4\x8F\xBF\xBF", {0, 4}},
        {"above all", "\xF4\x90\x80\x80", {0, 1, 2, 3, 4}},
        {"bytes of no use", "\xF5\xFE\xFF", {0, 1, 2, 3}},
        {"NUL", std::string("a\0\xC3\xA9", 4), {0, 1, 2, 4}},
    };
    for (const Case& c : vCase) {
        RoxString s = Bytes(c.text);
        RoxStringPos stepped;
        for (unsigned i = 0; i < c.vOffset.size(); ++i) {
            EXPECT_EQ(c.vOffset[i], s.Left(s.GetCharacterPos(i)).NByte()) << c.what << " " << i;
            EXPECT_EQ(s.GetCharacterPos(i), stepped) << c.what << " " << i;
            stepped = s.AdvancePos(stepped, 1);
        }
        EXPECT_EQ(c.text.size(), s.Left(s.GetCharacterPos(1000)).NByte()) << c.what;
    }
}

TEST(StringTest, CopiesOnManyThreads) {
    RoxMempool pool("strings");
    for (int round = 0; round < 20; ++round) {
        RoxString shared(&pool, "read by all");
        std::vector<std::thread> threads;
        for (int i = 0; i < 4; ++i) {
            threads.emplace_back([mine = shared]() mutable {
                uint32_t hash = mine.GetRepN()->GetHash();
                for (int k = 0; k < 2000; ++k) {
                    RoxString copy = mine;
                    RoxString other = copy;
                    ASSERT_EQ(hash, other.GetRepN()->GetHash());
                }
                mine = RoxString();
            });
        }
        shared = RoxString();
        for (std::thread& thread : threads) {
            thread.join();
        }
    }
    EXPECT_EQ(0u, pool.GetUsedBytes());
}

#if SIZE_MAX == UINT32_MAX
TEST(StringDeathTest, TextThatFillsTheAddressSpaceIsRefused) {
    // 16 bytes of header and the NUL: from 2^32 - 17 on, the sum would wrap to a small block.
    RoxMempool pool("strings");
    EXPECT_DEATH(RoxStringRepN::New(nullptr, 0xFFFFFFEF),
                 "out of memory: pool \\(general heap\\), text of 4294967279 bytes");
    EXPECT_DEATH(RoxStringRepN::New(&pool, 0xFFFFFFF0),
                 "out of memory: pool strings, text of 4294967280 bytes");
    EXPECT_DEATH(RoxStringRepN::Resize(RoxStringRepN::New(&pool, 1), 0xFFFFFFFF),
                 "out of memory: pool strings, text of 4294967295 bytes");
    volatile uint32_t longest = 0xFFFFFFEE;  // volatile: the compiler would warn of the size
    EXPECT_DEATH(RoxStringRepN::New(&pool, longest), "out of memory: pool strings, 4294967295 bytes");
}
#endif
