#include "rox/RoxGenericArray.h"

#include <gtest/gtest.h>

#include <vector>

#include "rox/RoxArray.h"
#include "support/SmallStack.h"

namespace {

class Item : public RoxCore {
 public:
    explicit Item(int n) : number(n) {}
    int number;
};

std::vector<int> Numbers(const RoxArray<Item>& array) {
    std::vector<int> numbers;
    for (unsigned i = 0; i < array.GetCount(); ++i) {
        numbers.push_back(array[i] != nullptr ? array[i]->number : -1);
    }
    return numbers;
}

using Ints = std::vector<int>;

}  // namespace

TEST(GenericArrayTest, TakesSixteenBytesOnTheTarget) {
    EXPECT_EQ(sizeof(void*) == 4 ? 16u : 24u, sizeof(RoxGenericArray));
    EXPECT_EQ(sizeof(RoxGenericArray), sizeof(RoxArray<Item>));
}

TEST(GenericArrayTest, TakesOverAHeldReference) {
    RoxMempool pool("arrays");
    {
        RoxGenericArray array(&pool);
        ref<Item> item(new (&pool) Item(1));
        ref<Item> second = item;
        EXPECT_TRUE(array.AddHeld(second.TakeCore()));
        EXPECT_TRUE(array.AddHeld(nullptr));
        EXPECT_EQ(2u, item->GetRefCount());
        EXPECT_EQ(item.get(), array.At(0));
        EXPECT_EQ(nullptr, array.At(1));
        while (array.GetCount() < RoxGenericArray::maxCount) ASSERT_TRUE(array.AddHeld(nullptr));
        EXPECT_FALSE(array.AddHeld(item.get()));  // and the reference is still the caller's
        EXPECT_EQ(2u, item->GetRefCount());
        array.Destroy();
        EXPECT_EQ(1u, item->GetRefCount());
    }
    EXPECT_EQ(0u, pool.GetUsedBytes());
}

TEST(GenericArrayTest, EmptyArrayAllocatesNothing) {
    RoxMempool pool("arrays");
    RoxGenericArray array(&pool, roxMempoolUserSorn);
    EXPECT_EQ(0u, array.GetCount());
    EXPECT_TRUE(array.FEmpty());
    EXPECT_EQ(&pool, array.GetMempool());
    EXPECT_EQ(3, array.GetUser());
    EXPECT_EQ(0u, pool.GetUsedBytes());
    EXPECT_EQ(nullptr, RoxGenericArray().GetMempool());
    array.Destroy();
    EXPECT_FALSE(array.Remove(nullptr));
}

TEST(GenericArrayTest, AddTakesReferencesAndDestroyDropsThem) {
    RoxMempool pool("arrays");
    ref<Item> item = new (&pool) Item(5);
    RoxArray<Item> array(&pool, roxMempoolUserSorn);
    EXPECT_TRUE(array.Add(item));
    EXPECT_TRUE(array.Add(item.get()));
    EXPECT_TRUE(array.Add(nullptr));
    EXPECT_EQ(3u, item->GetRefCount());
    EXPECT_EQ((Ints{5, 5, -1}), Numbers(array));
    EXPECT_EQ(item.get(), array.GetData()[1]);
    array.Destroy();
    EXPECT_EQ(1u, item->GetRefCount());
    EXPECT_TRUE(array.FEmpty());
    EXPECT_TRUE(array.Add(item));  // usable again
    EXPECT_EQ((Ints{5}), Numbers(array));
}

TEST(GenericArrayTest, RemoveTakesTheFirstSlotOfThatPointer) {
    RoxMempool pool("arrays");
    RoxArray<Item> array(&pool);
    std::vector<ref<Item>> items;
    for (int i = 0; i < 4; ++i) {
        items.push_back(new (&pool) Item(i));
        array.Add(items.back());
    }
    array.Add(items[1]);
    EXPECT_TRUE(array.Remove(items[1].get()));
    EXPECT_EQ((Ints{0, 2, 3, 1}), Numbers(array));
    EXPECT_EQ(2u, items[1]->GetRefCount());
    EXPECT_TRUE(array.Remove(items[1].get()));
    EXPECT_FALSE(array.Remove(items[1].get()));
    EXPECT_EQ((Ints{0, 2, 3}), Numbers(array));
    array.RemoveAt(2);
    array.RemoveAt(0);
    EXPECT_EQ((Ints{2}), Numbers(array));
    EXPECT_EQ(1u, items[0]->GetRefCount());
    array.Set(0, items[3].get());
    EXPECT_EQ((Ints{3}), Numbers(array));
    EXPECT_EQ(1u, items[2]->GetRefCount());
    array.Set(0, items[3].get());
    EXPECT_EQ(2u, items[3]->GetRefCount());
}

TEST(GenericArrayTest, HoldsSixtyFiveThousandFiveHundredThirtyFive) {
    RoxMempool pool("arrays");
    ref<Item> item = new (&pool) Item(1);
    RoxArray<Item> array(&pool);
    for (unsigned i = 0; i < 65535; ++i) {
        ASSERT_TRUE(array.Add(item)) << i;
    }
    EXPECT_EQ(65535u, array.GetCount());
    EXPECT_EQ(65536u, item->GetRefCount());
    EXPECT_FALSE(array.Add(item));
    EXPECT_EQ(65535u, array.GetCount());
    EXPECT_EQ(65536u, item->GetRefCount());
    EXPECT_EQ(item.get(), array[65534]);
    array.RemoveAt(0);
    EXPECT_TRUE(array.Add(item));
    EXPECT_FALSE(array.Add(item));
}

TEST(GenericArrayTest, MovesWithItsPool) {
    RoxMempool one("one");
    RoxMempool two("two");
    ref<Item> item = new (&one) Item(1);
    RoxArray<Item> a(&one);
    a.Add(item);
    RoxArray<Item> b(std::move(a));
    EXPECT_EQ(0u, a.GetCount());
    EXPECT_EQ((Ints{1}), Numbers(b));
    RoxArray<Item> c(&two);
    c.Add(new (&two) Item(9));
    c = std::move(b);
    EXPECT_EQ((Ints{1}), Numbers(c));
    EXPECT_EQ(&one, c.GetMempool());
    EXPECT_EQ(0u, two.GetUsedBytes());
    EXPECT_EQ(2u, item->GetRefCount());
}

TEST(GenericArrayTest, NestedArraysDieOnASmallStack) {
    class Nest : public RoxCore {
     public:
        Nest() : array(GetMempool()) {}
        RoxGenericArray array;
    };
    RoxMempool pool("nests");
    ref<Nest> nest = new (&pool) Nest;
    for (int i = 0; i < 1000000; ++i) {
        ref<Nest> outer = new (&pool) Nest;
        outer->array.Add(nest.get());
        nest = outer;
    }
    RunOnSmallStack([&] { nest = nullptr; });
    EXPECT_EQ(0u, pool.GetUsedBytes());
}

TEST(GenericArrayDeathTest, IndexOutOfRangeAsserts) {
    RoxGenericArray array;
    EXPECT_DEATH(array.RemoveAt(0), "RoxGenericArray::RemoveAt: index out of range");
    EXPECT_DEATH(array.Set(0, nullptr), "RoxGenericArray::Set: index out of range");
}
