#include <gtest/gtest.h>

#include <atomic>
#include <cstring>
#include <functional>
#include <mutex>
#include <thread>
#include <vector>

#include "Random.h"
#include "rox/RoxMempool.h"

namespace {

size_t Held(const RoxMempool& pool) {
    return pool.GetUsedBytes() + pool.GetUnusedBytes();
}

std::vector<void*> AllocMany(RoxMempool& pool, size_t n, size_t bytes) {
    std::vector<void*> blocks;
    for (size_t i = 0; i < n; ++i) {
        blocks.push_back(pool.Malloc(bytes));
        memset(blocks.back(), static_cast<int>(i & 0x7F), bytes);
    }
    return blocks;
}

void FreeAll(RoxMempool& pool, const std::vector<void*>& blocks) {
    for (void* p : blocks) {
        pool.Free(p);
    }
}

void OnThread(const std::function<void()>& work) {
    std::thread(work).join();
}

}  // namespace

TEST(MempoolThreadsTest, BlocksFreedElsewhereComeBackToTheOwner) {
    RoxMempool pool("remote");
    std::vector<void*> blocks = AllocMany(pool, 20000, 48);
    size_t used = pool.GetUsedBytes();
    size_t held = Held(pool);
    for (int round = 0; round < 5; ++round) {
        OnThread([&] { FreeAll(pool, blocks); });
        EXPECT_EQ(0u, pool.GetUsedBytes());
        blocks = AllocMany(pool, 20000, 48);
        EXPECT_EQ(used, pool.GetUsedBytes());
        EXPECT_EQ(held, Held(pool)) << "round " << round;
    }
    EXPECT_EQ(used, pool.GetUsedBytesHighWater());
    FreeAll(pool, blocks);
}

TEST(MempoolThreadsTest, BlocksOfOtherThreadsMayBeFreedByTheOwner) {
    RoxMempool pool("foreign");
    void* own = pool.Malloc(64);  // this thread is the owner from here on
    size_t one = pool.GetUsedBytes();
    std::vector<void*> blocks;
    OnThread([&] {
        blocks = AllocMany(pool, 10000, 64);
        blocks.push_back(pool.Malloc(100000));
    });
    size_t used = pool.GetUsedBytes();
    EXPECT_GE(used, 10001 * one + 100000);
    EXPECT_EQ(used, pool.GetUsedBytesHighWater());
    FreeAll(pool, blocks);
    EXPECT_EQ(one, pool.GetUsedBytes());
    pool.Free(own);
    EXPECT_EQ(0u, pool.GetUsedBytes());
    EXPECT_EQ(used, pool.GetHighWaterUsedBytes());
}

TEST(MempoolThreadsTest, HighWaterCountsAllThreadsTogether) {
    RoxMempool pool("sum");
    std::vector<void*> mine = AllocMany(pool, 100, 64);
    size_t hundred = pool.GetUsedBytes();
    std::vector<void*> others;
    OnThread([&] { others = AllocMany(pool, 50, 64); });
    EXPECT_EQ(hundred + hundred / 2, pool.GetUsedBytesHighWater());
    OnThread([&] { FreeAll(pool, others); });
    FreeAll(pool, mine);
    mine = AllocMany(pool, 140, 64);
    EXPECT_EQ(hundred + hundred / 2, pool.GetUsedBytesHighWater());
    OnThread([&] { others = AllocMany(pool, 20, 64); });
    EXPECT_EQ(hundred / 100 * 160, pool.GetUsedBytesHighWater());
    FreeAll(pool, mine);
    FreeAll(pool, others);
    EXPECT_EQ(0u, pool.GetUsedBytes());
}

TEST(MempoolThreadsTest, ThreadThatEndedLeavesThePoolToTheNext) {
    RoxMempool pool("adopted");
    size_t held = 0;
    for (int round = 0; round < 3; ++round) {
        OnThread([&] { FreeAll(pool, AllocMany(pool, 20000, 48)); });
        // What one thread left is what the next one takes: nothing more comes from the system.
        EXPECT_TRUE(round == 0 || held == Held(pool)) << "round " << round;
        held = Held(pool);
    }
    FreeAll(pool, AllocMany(pool, 20000, 48));
    EXPECT_EQ(held, Held(pool));
    // This thread lives on as the owner, so another one gets memory of its own.
    OnThread([&] { FreeAll(pool, AllocMany(pool, 20000, 48)); });
    EXPECT_GE(Held(pool), held + 20000 * 48);
    EXPECT_EQ(0u, pool.GetUsedBytes());
}

TEST(MempoolThreadsTest, BlocksOfAnEndedOwnerAreFreedFromAnywhere) {
    RoxMempool pool("orphans");
    std::vector<void*> blocks;
    OnThread([&] { blocks = AllocMany(pool, 20000, 32); });
    size_t held = Held(pool);
    FreeAll(pool, blocks);
    EXPECT_EQ(0u, pool.GetUsedBytes());
    FreeAll(pool, AllocMany(pool, 20000, 32));
    EXPECT_EQ(held, Held(pool));
}

namespace {

/// Allocates and frees in the destructors of the thread's own data, after the pool took note of the thread's
/// end.
struct LateUser {
    RoxMempool* pPool = nullptr;
    void* pBlock = nullptr;
    ~LateUser() {
        pPool->Free(pBlock);
        std::vector<void*> blocks = AllocMany(*pPool, 1000, 40);
        FreeAll(*pPool, blocks);
    }
};

}  // namespace

TEST(MempoolThreadsTest, PoolServesThreadsThatAreEnding) {
    RoxMempool pool("late");
    for (int i = 0; i < 3; ++i) {
        OnThread([&] {
            static thread_local LateUser userG;  // made before the pool's note, so destroyed after it
            userG.pPool = &pool;
            userG.pBlock = pool.Malloc(100);
        });
        EXPECT_EQ(0u, pool.GetUsedBytes());
    }
    FreeAll(pool, AllocMany(pool, 1000, 40));
    EXPECT_EQ(0u, pool.GetUsedBytes());
}

TEST(MempoolThreadsTest, StressWithBlocksChangingHands) {
    struct Slot {
        std::mutex mutex;
        unsigned char* p = nullptr;
        size_t n = 0;
    };
    constexpr unsigned nThreads = 4;
    constexpr unsigned nSteps = 30000;
    RoxMempool pool("stress");
    std::vector<Slot> slots(256);
    std::atomic<unsigned> nWrong{0};
    auto work = [&](unsigned seed) {
        Random random(seed);
        for (unsigned step = 0; step < nSteps; ++step) {
            size_t n = random() % 50 == 0 ? 1 + random() % 60000 : 1 + random() % 300;
            unsigned char* p = static_cast<unsigned char*>(pool.Malloc(n));
            memset(p, static_cast<int>(n & 0xFF), n);
            Slot& slot = slots[random() % slots.size()];
            {
                std::lock_guard<std::mutex> hold(slot.mutex);
                std::swap(slot.p, p);
                std::swap(slot.n, n);
            }
            if (p == nullptr) {
                continue;
            }
            nWrong += p[0] != (n & 0xFF) || p[n - 1] != (n & 0xFF) || p[n / 2] != (n & 0xFF) ? 1 : 0;
            if (random() % 8 == 0) {
                p = static_cast<unsigned char*>(pool.Realloc(p, n + 100));
                nWrong += p[0] != (n & 0xFF) || p[n - 1] != (n & 0xFF) ? 1 : 0;
            }
            pool.Free(p);
        }
    };
    // Two generations of threads, so that ownership changes too.
    for (unsigned generation = 0; generation < 2; ++generation) {
        std::vector<std::thread> threads;
        for (unsigned i = 0; i < nThreads; ++i) {
            threads.emplace_back(work, generation * 10 + i);
        }
        for (std::thread& thread : threads) {
            thread.join();
        }
    }
    EXPECT_EQ(0u, nWrong);
    for (Slot& slot : slots) {
        pool.Free(slot.p);
    }
    EXPECT_EQ(0u, pool.GetUsedBytes());
    EXPECT_GT(pool.GetUsedBytesHighWater(), 0u);
}
