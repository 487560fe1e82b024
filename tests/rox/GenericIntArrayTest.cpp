#include "rox/RoxGenericIntArray.h"

#include <gtest/gtest.h>

#include <cstring>
#include <vector>

#include "rox/RoxMempool.h"

namespace {

/// Reads by the rule that generic code uses: at the data pointer's place or behind it, by the flag.
uint64_t Read(const RoxGenericIntArray& array, unsigned i) {
    uint64_t value = 0;
    memcpy(&value, array.At(i), static_cast<size_t>(array.GetElementSize()));
    return value;
}

bool FInside(const RoxGenericIntArray& array, const void* p) {
    const char* begin = reinterpret_cast<const char*>(&array);
    const char* at = static_cast<const char*>(p);
    return at >= begin && at < begin + sizeof(array);
}

uint64_t Pattern(unsigned i, int elementSize) {
    uint64_t value = (i + 1) * 0x9E3779B97F4A7C15;
    return elementSize == 8 ? value : value & ((uint64_t{1} << (8 * elementSize)) - 1);
}

}  // namespace

TEST(GenericIntArrayTest, CountLiesAtItsOffset) {
    RoxGenericIntArray array(4);
    for (uint32_t i = 1; i <= 300; ++i) {
        array.Add(&i);
        uint16_t count = 0;
        memcpy(&count, reinterpret_cast<const char*>(&array) + RoxGenericIntArray::CountOffset(),
               sizeof count);
        EXPECT_EQ(count, i);
    }
}

TEST(GenericIntArrayTest, TakesSixteenBytesOnTheTarget) {
    EXPECT_EQ(sizeof(void*) == 4 ? 16u : 24u, sizeof(RoxGenericIntArray));
}

TEST(GenericIntArrayTest, FewElementsLieInTheDataPointersWord) {
    struct Case {
        int elementSize;
        unsigned nInline64;
        unsigned nInline32;
    };
    const Case vCase[] = {{1, 8, 4}, {2, 4, 2}, {3, 2, 1}, {4, 2, 1}, {8, 1, 0}, {9, 0, 0}, {1000, 0, 0}};
    for (const Case& c : vCase) {
        RoxMempool pool("ints");
        RoxGenericIntArray array(c.elementSize, &pool, roxMempoolUserSorn);
        EXPECT_EQ(c.elementSize, array.GetElementSize());
        unsigned nInline = sizeof(void*) == 8 ? c.nInline64 : c.nInline32;
        std::vector<unsigned char> element(static_cast<size_t>(c.elementSize), 0x5A);
        for (unsigned i = 0; i < nInline; ++i) {
            EXPECT_TRUE(array.Add(element.data()));
            EXPECT_FALSE(array.FExternal()) << c.elementSize;
            EXPECT_TRUE(FInside(array, array.At(i)));
            EXPECT_EQ(0u, pool.GetUsedBytes());
        }
        EXPECT_TRUE(array.Add(element.data()));
        EXPECT_TRUE(array.FExternal()) << c.elementSize;
        EXPECT_FALSE(FInside(array, array.At(0)));
        EXPECT_GT(pool.GetUsedBytes(), 0u);
        EXPECT_EQ(nInline + 1, array.GetCount());
        for (unsigned i = 0; i <= nInline; ++i) {
            EXPECT_EQ(0, memcmp(element.data(), array.At(i), element.size()));
        }
        array.Destroy();
        EXPECT_FALSE(array.FExternal());
        EXPECT_EQ(0u, array.GetCount());
        EXPECT_EQ(0u, pool.GetUsedBytes());
    }
}

TEST(GenericIntArrayTest, KeepsElementsOfEverySize) {
    for (int elementSize : {1, 4, 8}) {
        RoxMempool pool("ints");
        RoxGenericIntArray array(elementSize, &pool, roxMempoolUserSorn);
        for (unsigned i = 0; i < 1000; ++i) {
            uint64_t value = Pattern(i, elementSize);
            ASSERT_TRUE(array.Add(&value));
            ASSERT_EQ(value, Read(array, i));
        }
        uint64_t changed = Pattern(5000, elementSize);
        array.Set(500, &changed);
        for (unsigned i = 0; i < 1000; ++i) {
            EXPECT_EQ(Pattern(i == 500 ? 5000 : i, elementSize), Read(array, i)) << elementSize << " " << i;
        }
    }
}

TEST(GenericIntArrayTest, NoPoolIsTheGeneralHeap) {
    RoxGenericIntArray array(4);
    for (uint32_t i = 0; i < 100; ++i) {
        array.Add(&i);
    }
    EXPECT_EQ(99u, Read(array, 99));
    EXPECT_EQ(nullptr, array.GetMempool());
    EXPECT_EQ(0, array.GetUser());
}

TEST(GenericIntArrayTest, HoldsSixtyFiveThousandFiveHundredThirtyFive) {
    for (int elementSize : {1, 8}) {
        RoxMempool pool("ints");
        RoxGenericIntArray array(elementSize, &pool, roxMempoolUserSorn);
        for (unsigned i = 0; i < 65535; ++i) {
            uint64_t value = Pattern(i, elementSize);
            ASSERT_TRUE(array.Add(&value)) << i;
        }
        size_t used = pool.GetUsedBytes();
        uint64_t value = 1;
        EXPECT_FALSE(array.Add(&value));
        EXPECT_EQ(65535u, array.GetCount());
        EXPECT_EQ(used, pool.GetUsedBytes());
        for (unsigned i : {0u, 1u, 32767u, 32768u, 65534u}) {
            EXPECT_EQ(Pattern(i, elementSize), Read(array, i));
        }
    }
}

TEST(GenericIntArrayTest, ElementOfTheArrayItselfCanBeAdded) {
    RoxMempool pool("ints");
    RoxGenericIntArray array(4, &pool, roxMempoolUserSorn);
    uint32_t first = 0xABCD1234;
    array.Add(&first);
    for (unsigned i = 1; i < 100; ++i) {
        ASSERT_TRUE(array.Add(array.At(i - 1)));  // across every growth
    }
    for (unsigned i = 0; i < 100; ++i) {
        ASSERT_EQ(0xABCD1234, Read(array, i));
    }
    array.Set(3, array.At(4));
    EXPECT_EQ(0xABCD1234, Read(array, 3));
}

TEST(GenericIntArrayTest, MovesInlineAndExternal) {
    RoxMempool pool("ints");
    for (unsigned n : {1u, 50u}) {
        RoxGenericIntArray a(1, &pool, roxMempoolUserSorn);
        for (unsigned i = 0; i < n; ++i) {
            a.Add(&i);
        }
        RoxGenericIntArray b(std::move(a));
        EXPECT_EQ(0u, a.GetCount());
        EXPECT_FALSE(a.FExternal());
        ASSERT_EQ(n, b.GetCount());
        RoxGenericIntArray c(8, nullptr, 0);
        uint64_t other = 5;
        c.Add(&other);
        c.Add(&other);
        c = std::move(b);
        ASSERT_EQ(n, c.GetCount());
        EXPECT_EQ(1, c.GetElementSize());
        EXPECT_EQ(n - 1, Read(c, n - 1));
    }
    EXPECT_EQ(0u, pool.GetUsedBytes());
}

TEST(GenericIntArrayDeathTest, MisuseAsserts) {
    RoxGenericIntArray array(4);
    uint32_t value = 1;
    EXPECT_DEATH(array.Set(0, &value), "RoxGenericIntArray::Set: index out of range");
    EXPECT_DEATH(RoxGenericIntArray(0), "RoxGenericIntArray: element size out of range");
    EXPECT_DEATH(RoxGenericIntArray(32768), "RoxGenericIntArray: element size out of range");
}
