#include "rox/RoxStringArray.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <string>
#include <vector>

#include "Random.h"
#include "rox/RoxMempool.h"
#include "support/SmallStack.h"

namespace {

using Texts = std::vector<std::string>;

Texts ToTexts(const RoxStringArray& array) {
    Texts texts;
    for (unsigned i = 0; i < array.GetCount(); ++i) {
        texts.emplace_back(array[i].Utf8(), array[i].NByte());
    }
    return texts;
}

void AddAll(RoxStringArray& array, const Texts& texts) {
    for (const std::string& text : texts) {
        ASSERT_TRUE(array.Add(
            RoxString::FromUtf8Bytes(array.GetMempool(), static_cast<unsigned>(text.size()), text.data())));
    }
}

unsigned nComparesG = 0;
int CompareCounting(const RoxString* a, const RoxString* b) {
    ++nComparesG;
    return RoxStringArray::CompareBytes(a, b);
}
int CompareDescending(const RoxString* a, const RoxString* b) {
    return strcmp(b->Utf8(), a->Utf8());
}
int CompareNonsense(const RoxString*, const RoxString*) {
    static Random random(1);
    return static_cast<int>(random() % 3) - 1;
}

}  // namespace

TEST(StringArrayTest, AddTakesOver) {
    RoxMempool pool("strings");
    RoxStringArray array(&pool);
    for (unsigned i = 0; i < RoxStringArray::maxCount; ++i) {
        RoxString text = RoxString::Format(&pool, "%u", i);
        const RoxStringRepN* const rep = text.GetRepN();
        ASSERT_TRUE(array.Add(std::move(text)));
        ASSERT_TRUE(text.FEmpty());
        ASSERT_EQ(array[i].GetRepN(), rep);
    }
    RoxString more(&pool, "more");
    EXPECT_FALSE(array.Add(std::move(more)));
    EXPECT_EQ(array.GetCount(), RoxStringArray::maxCount);
    EXPECT_STREQ(more.Utf8(), "more") << "a full array leaves the text where it is";
}

TEST(StringArrayTest, TakesSixteenBytesOnTheTarget) {
    EXPECT_EQ(sizeof(void*) == 4 ? 16u : 24u, sizeof(RoxStringArray));
}

TEST(StringArrayTest, AddSetDestroy) {
    RoxMempool pool("texts");
    {
        RoxStringArray array(&pool);
        EXPECT_EQ(0u, pool.GetUsedBytes());
        AddAll(array, {"one", "", "three"});
        EXPECT_EQ((Texts{"one", "", "three"}), ToTexts(array));
        array.Set(1, RoxString("two"));
        EXPECT_STREQ("two", array.At(1).Utf8());
        EXPECT_EQ(&array.At(2), array.GetData() + 2);
        array.Destroy();
        EXPECT_TRUE(array.FEmpty());
        EXPECT_EQ(0u, pool.GetUsedBytes());
        AddAll(array, {"again"});
        EXPECT_EQ((Texts{"again"}), ToTexts(array));
        EXPECT_EQ(0u, RoxStringArray().GetCount());
    }
    EXPECT_EQ(0u, pool.GetUsedBytes());
}

TEST(StringArrayTest, ElementOfTheArrayItselfCanBeAdded) {
    RoxStringArray array;
    array.Add(RoxString("self"));
    for (unsigned i = 0; i < 100; ++i) {
        ASSERT_TRUE(array.Add(array[0]));  // across every growth
    }
    EXPECT_EQ(Texts(101, "self"), ToTexts(array));
}

TEST(StringArrayTest, RemoveTakesARun) {
    struct Case {
        unsigned first, count;
        Texts left;
    };
    const Case vCase[] = {
        {0, 0, {"a", "b", "c", "d"}}, {0, 1, {"b", "c", "d"}},
        {1, 2, {"a", "d"}},           {3, 1, {"a", "b", "c"}},
        {2, 99, {"a", "b"}},          {0, 4, {}},
        {4, 1, {"a", "b", "c", "d"}}, {99, 99, {"a", "b", "c", "d"}},
        {1, 4294967295u, {"a"}},
    };
    for (const Case& c : vCase) {
        RoxMempool pool("texts");
        {
            RoxStringArray array(&pool);
            AddAll(array, {"a", "b", "c", "d"});
            array.Remove(c.first, c.count);
            EXPECT_EQ(c.left, ToTexts(array)) << c.first << " " << c.count;
            AddAll(array, {"e"});
            EXPECT_STREQ("e", array[array.GetCount() - 1].Utf8());
        }
        EXPECT_EQ(0u, pool.GetUsedBytes());
    }
}

TEST(StringArrayTest, Sort) {
    const Texts vCase[] = {
        {},
        {"a"},
        {"b", "a"},
        {"a", "a", "a"},
        {"b", "", "ab", "a", "B", "\xC3\xA9", "abc"},
        {"z", "y", "x", "w", "v", "u", "t"},
    };
    for (const Texts& texts : vCase) {
        RoxMempool pool("texts");
        RoxStringArray array(&pool);
        AddAll(array, texts);
        Texts sorted = texts;
        std::sort(sorted.begin(), sorted.end());
        array.Sort(&RoxStringArray::CompareBytes);
        EXPECT_EQ(sorted, ToTexts(array));
        std::reverse(sorted.begin(), sorted.end());
        array.Sort(&CompareDescending);
        EXPECT_EQ(sorted, ToTexts(array));
    }
}

TEST(StringArrayTest, CompareBytesKnowsNulAndHighBytes) {
    struct Case {
        std::string a, b;
        int sign;
    };
    const Case vCase[] = {
        {"", "", 0},      {"", "a", -1}, {"a", "ab", -1}, {"b", "ab", 1}, {"a", std::string("a\0", 2), -1},
        {"z", "\xC3", -1}};
    for (const Case& c : vCase) {
        RoxString a = RoxString::FromUtf8Bytes(nullptr, static_cast<unsigned>(c.a.size()), c.a.data());
        RoxString b = RoxString::FromUtf8Bytes(nullptr, static_cast<unsigned>(c.b.size()), c.b.data());
        int answer = RoxStringArray::CompareBytes(&a, &b);
        EXPECT_EQ(c.sign, (answer > 0) - (answer < 0)) << c.a << "|" << c.b;
    }
}

TEST(StringArrayTest, SortIsNeverQuadraticNorDeep) {
    constexpr unsigned n = 65535;
    for (const char* order : {"ascending", "descending", "equal", "random"}) {
        RoxMempool pool("texts");
        RoxStringArray array(&pool);
        Random random(7);
        Texts texts;
        for (unsigned i = 0; i < n; ++i) {
            unsigned number = order[0] == 'a'   ? i
                              : order[0] == 'd' ? n - i
                              : order[0] == 'e' ? 0
                                                : random() % n;
            char text[16];
            snprintf(text, sizeof(text), "%08u", number);
            texts.push_back(text);
        }
        AddAll(array, texts);
        nComparesG = 0;
        RunOnSmallStack([&] { array.Sort(&CompareCounting); });
        std::sort(texts.begin(), texts.end());
        EXPECT_EQ(texts, ToTexts(array)) << order;
        EXPECT_LT(nComparesG, 3u * n * 16) << order;  // 2^16 > n
    }
}

TEST(StringArrayTest, SenselessComparisonStaysInBounds) {
    RoxMempool pool("texts");
    {
        RoxStringArray array(&pool);
        Texts texts;
        for (int i = 0; i < 5000; ++i) {
            texts.push_back(std::to_string(i));
        }
        AddAll(array, texts);
        array.Sort(&CompareNonsense);
        Texts after = ToTexts(array);
        std::sort(after.begin(), after.end());
        std::sort(texts.begin(), texts.end());
        EXPECT_EQ(texts, after);  // all there, in whatever order
    }
    EXPECT_EQ(0u, pool.GetUsedBytes());
}

TEST(StringArrayTest, HoldsSixtyFiveThousandFiveHundredThirtyFive) {
    RoxMempool pool("texts");
    RoxString text(&pool, "x");
    RoxStringArray array(&pool);
    for (unsigned i = 0; i < 65535; ++i) {
        ASSERT_TRUE(array.Add(text)) << i;
    }
    EXPECT_FALSE(array.Add(text));
    EXPECT_EQ(65535u, array.GetCount());
    EXPECT_STREQ("x", array[65534].Utf8());
    array.Remove(0, 1);
    EXPECT_TRUE(array.Add(text));
    EXPECT_FALSE(array.Add(text));
}

TEST(StringArrayTest, MovesWithItsPool) {
    RoxMempool pool("texts");
    {
        RoxStringArray a(&pool);
        AddAll(a, {"x", "y"});
        a.SetDebugLockOwner(7);
        RoxStringArray b(std::move(a));
        EXPECT_EQ(0u, a.GetCount());
        RoxStringArray c;
        c.Add(RoxString("old"));
        c = std::move(b);
        EXPECT_EQ((Texts{"x", "y"}), ToTexts(c));
        EXPECT_EQ(&pool, c.GetMempool());
        EXPECT_EQ(7u, c.GetDebugLockOwner());
        c.SetDebugLockOwner(0);
        EXPECT_EQ(0u, c.GetDebugLockOwner());
    }
    EXPECT_EQ(0u, pool.GetUsedBytes());
}

TEST(StringArrayDeathTest, IndexOutOfRangeAsserts) {
    RoxStringArray array;
    EXPECT_DEATH(array.Set(0, RoxString()), "RoxStringArray::Set: index out of range");
}
