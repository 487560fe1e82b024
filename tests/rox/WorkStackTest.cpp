#include "rox/RoxWorkStack.h"

#include <gtest/gtest.h>

namespace {

struct Frame {
    unsigned number;
    void* pointer;
};

}  // namespace

TEST(WorkStackTest, FirstFramesCostNoAllocation) {
    RoxMempool pool("stack");
    RoxWorkStack<Frame, 4> stack(&pool);
    EXPECT_TRUE(stack.FEmpty());
    for (unsigned i = 0; i < 4; ++i) {
        stack.Push({i, nullptr});
    }
    EXPECT_EQ(0u, pool.GetUsedBytes());
    stack.Push({4, nullptr});
    EXPECT_GT(pool.GetUsedBytes(), 0u);
    for (unsigned i = 0; i < 5; ++i) {
        EXPECT_EQ(i, stack[i].number);
    }
}

TEST(WorkStackTest, LastInFirstOut) {
    for (RoxMempool* p : {static_cast<RoxMempool*>(nullptr), new RoxMempool("stack")}) {
        {
            RoxWorkStack<Frame, 1> stack(p);
            for (unsigned i = 0; i < 1000000; ++i) {
                stack.Push({i, &stack});
                ASSERT_EQ(i, stack.Top().number);
            }
            EXPECT_EQ(1000000u, stack.Size());
            stack.Top().number = 5;
            const RoxWorkStack<Frame, 1>& read = stack;
            EXPECT_EQ(5u, read.Top().number);
            EXPECT_EQ(123456u, read[123456].number);
            stack[999999].number = 999999;
            for (unsigned i = 1000000; i-- > 0;) {
                ASSERT_EQ(i, stack.Top().number);
                stack.Pop();
            }
            EXPECT_TRUE(stack.FEmpty());
        }
        EXPECT_TRUE(p == nullptr || p->GetUsedBytes() == 0);
        delete p;
    }
}

TEST(WorkStackTest, FrameOfTheStackItselfCanBePushed) {
    RoxMempool pool("stack");
    RoxWorkStack<Frame, 2> stack(&pool);
    stack.Push({42, nullptr});
    for (int i = 0; i < 1000; ++i) {
        stack.Push(stack[0]);  // across every growth
    }
    for (size_t i = 0; i < stack.Size(); ++i) {
        ASSERT_EQ(42u, stack[i].number);
    }
}
