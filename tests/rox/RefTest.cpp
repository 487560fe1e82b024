#include "rox/ref.h"

#include <gtest/gtest.h>

#include <type_traits>

namespace {

class Incomplete;

/// Copies, moves and destroys a ref to a class that is not known here.
struct HoldsIncomplete {
    ref<Incomplete> member;
};

class Base : public RoxCore {
 public:
    int number = 1;
};
class Derived : public Base {};

}  // namespace

static_assert(sizeof(ref<Base>) == sizeof(void*));
static_assert(std::is_convertible_v<ref<Derived>, ref<Base>>);
static_assert(!std::is_convertible_v<ref<Base>, ref<Derived>>);
static_assert(std::is_nothrow_move_constructible_v<ref<Base>>);

TEST(RefTest, NullRef) {
    ref<Base> empty;
    ref<Base> null = nullptr;
    EXPECT_FALSE(empty);
    EXPECT_EQ(nullptr, empty.get());
    EXPECT_TRUE(empty == nullptr);
    EXPECT_TRUE(empty == null);
    EXPECT_EQ(nullptr, empty.GetCore());
}

TEST(RefTest, CopiesCountAndMovesDoNot) {
    RoxMempool pool("refs");
    ref<Base> a = new (&pool) Base;
    EXPECT_EQ(1u, a->GetRefCount());
    ref<Base> b = a;
    EXPECT_EQ(2u, a->GetRefCount());
    ref<Base> c = std::move(b);
    EXPECT_EQ(2u, a->GetRefCount());
    EXPECT_TRUE(b == nullptr);
    b = c;
    EXPECT_EQ(3u, a->GetRefCount());
    b = std::move(c);
    EXPECT_EQ(2u, a->GetRefCount());
    b = a.get();
    EXPECT_EQ(2u, a->GetRefCount());
    b = nullptr;
    EXPECT_EQ(1u, a->GetRefCount());
    EXPECT_TRUE(a != nullptr);
    EXPECT_TRUE(a == a.get());
    EXPECT_EQ(1, (*a).number);
}

TEST(RefTest, FirstReferenceOnANewObject) {
    RoxMempool pool("refs");
    {
        const ref<Base> a = ref<Base>::First(new (&pool) Derived);
        EXPECT_EQ(1u, a->GetRefCount());
        const ref<Base> b = a;
        EXPECT_EQ(2u, a->GetRefCount());
        EXPECT_NE(0u, pool.GetUsedBytes());
    }
    EXPECT_EQ(0u, pool.GetUsedBytes());
}

TEST(RefTest, TakingTheCoreGivesUpTheReference) {
    RoxMempool pool("refs");
    ref<Base> a = new (&pool) Base;
    ref<Base> b = a;
    RoxCore* const held = b.TakeCore();
    EXPECT_EQ(a.GetCore(), held);
    EXPECT_TRUE(b == nullptr);
    EXPECT_EQ(2u, a->GetRefCount());
    RoxCore::DownRef(held);
    EXPECT_EQ(1u, a->GetRefCount());
    EXPECT_EQ(nullptr, b.TakeCore());
}

TEST(RefTest, AssigningItselfKeepsTheObject) {
    RoxMempool pool("refs");
    ref<Base> a = new (&pool) Base;
    ref<Base>& same = a;
    a = same;
    EXPECT_EQ(1u, a->GetRefCount());
    a = a.get();
    EXPECT_EQ(1u, a->GetRefCount());
}

TEST(RefTest, AssigningAPartOfTheOldValueIsSafe) {
    class Link : public RoxCore {
     public:
        ref<Link> next;
        int number = 0;
    };
    RoxMempool pool("refs");
    ref<Link> head = new (&pool) Link;
    head->next = new (&pool) Link;
    head->next->number = 5;
    head = head->next;
    EXPECT_EQ(5, head->number);
    head->next = new (&pool) Link;
    head->next->number = 6;
    head = std::move(head->next);
    EXPECT_EQ(6, head->number);
    EXPECT_EQ(1u, head->GetRefCount());
}

TEST(RefTest, DerivedBecomesBase) {
    RoxMempool pool("refs");
    ref<Derived> derived = new (&pool) Derived;
    ref<Base> base = derived;
    EXPECT_EQ(2u, derived->GetRefCount());
    EXPECT_TRUE(base == derived);
    ref<RoxCore> core = std::move(base);
    EXPECT_EQ(2u, derived->GetRefCount());
    EXPECT_EQ(derived.GetCore(), core.get());
}

TEST(RefTest, IncompleteClassCanBeCopiedAndDropped) {
    HoldsIncomplete a;
    HoldsIncomplete b = a;
    HoldsIncomplete c = std::move(b);
    a = c;
    EXPECT_TRUE(a.member == c.member);
    EXPECT_TRUE(a.member == nullptr);
}
