#include <gtest/gtest.h>

#include <vector>

#include "rox/RoxMempool.h"
#include "rox/RoxMempoolPoison.h"

namespace {

using roxmempool::FPoisoned;
using roxmempool::fPoisoning;

class MempoolPoisonTest : public testing::Test {
 protected:
    void SetUp() override {
        if (!fPoisoning) {
            GTEST_SKIP() << "not built with AddressSanitizer";
        }
    }
    RoxMempool poolM{"poisoned"};
};

constexpr size_t vSize[] = {1, 7, 8, 9, 24, 100, 1000, 5000, 16000, 16384, 20000, 100000};

}  // namespace

TEST_F(MempoolPoisonTest, OnlyTheRequestedBytesMayBeTouched) {
    for (size_t n : vSize) {
        char* p = static_cast<char*>(poolM.Malloc(n));
        for (size_t i = 0; i < n; ++i) {
            ASSERT_FALSE(FPoisoned(p + i)) << n << " at " << i;
        }
        // A redzone of at least 16 bytes.
        for (size_t i = n; i < n + 16; ++i) {
            ASSERT_TRUE(FPoisoned(p + i)) << n << " at " << i;
        }
    }
}

TEST_F(MempoolPoisonTest, FreedBlocksArePoisoned) {
    for (size_t n : vSize) {
        char* p = static_cast<char*>(poolM.Malloc(n));
        poolM.Free(p);
        for (size_t i = 0; i < n; ++i) {
            ASSERT_TRUE(FPoisoned(p + i)) << n << " at " << i;
        }
    }
}

TEST_F(MempoolPoisonTest, NeighboursAreSeparatedByARedzone) {
    std::vector<char*> blocks;
    for (int i = 0; i < 100; ++i) {
        blocks.push_back(static_cast<char*>(poolM.Malloc(24)));
    }
    for (char* p : blocks) {
        EXPECT_TRUE(FPoisoned(p + 24));
        EXPECT_TRUE(FPoisoned(p + 39));
    }
}

TEST_F(MempoolPoisonTest, ReallocMovesTheLimit) {
    char* p = static_cast<char*>(poolM.Malloc(20));
    p = static_cast<char*>(poolM.Realloc(p, 22));
    EXPECT_FALSE(FPoisoned(p + 21));
    EXPECT_TRUE(FPoisoned(p + 22));
    p = static_cast<char*>(poolM.Realloc(p, 17));
    EXPECT_FALSE(FPoisoned(p + 16));
    EXPECT_TRUE(FPoisoned(p + 17));
    p = static_cast<char*>(poolM.Realloc(p, 50000));
    EXPECT_FALSE(FPoisoned(p + 49999));
    EXPECT_TRUE(FPoisoned(p + 50000));
}

TEST_F(MempoolPoisonTest, SecondFreeAsserts) {
    void* p = poolM.Malloc(20);
    void* empty = poolM.Malloc(0);
    poolM.Free(empty);
    poolM.Free(p);
    EXPECT_DEATH(poolM.Free(p), "pool poisoned: a block is freed twice");
}
