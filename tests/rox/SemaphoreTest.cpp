#include <gtest/gtest.h>
#include <pthread.h>

#include <atomic>
#include <chrono>
#include <csignal>
#include <limits>
#include <memory>
#include <thread>
#include <vector>

#include "DeathTestStyle.h"
#include "rox/RoxCoreSemaphore.h"
#include "rox/RoxInternalSemaphore.h"
#include "rox/RoxMempool.h"
#include "rox/ref.h"
#include "support/Watchdog.h"

namespace {

TEST(SemaphoreTest, CountsFromTheStart) {
    for (int count : {0, 1, 3}) {
        RoxInternalSemaphore semaphore(count);
        for (int i = 0; i < count; ++i) {
            EXPECT_TRUE(semaphore.TryAcquire()) << count;
        }
        EXPECT_FALSE(semaphore.TryAcquire()) << count;
        semaphore.Release();
        semaphore.Release();
        semaphore.Acquire();
        EXPECT_TRUE(semaphore.AcquireFor(0)) << count;
        EXPECT_FALSE(semaphore.AcquireFor(-1)) << count;
    }
}

TEST(SemaphoreTest, AcquireForWaitsAsLongAsItSays) {
    RoxInternalSemaphore semaphore(0);
    const auto begin = std::chrono::steady_clock::now();
    EXPECT_FALSE(semaphore.AcquireFor(30));
    EXPECT_GE(std::chrono::steady_clock::now() - begin, std::chrono::milliseconds(30));
}

TEST(SemaphoreTest, AcquireForEndsWithTheRelease) {
    Watchdog watchdog;
    for (long long limit : {1000000000LL, std::numeric_limits<long long>::max()}) {
        RoxInternalSemaphore semaphore(0);
        std::thread other([&] { semaphore.Release(); });
        EXPECT_TRUE(semaphore.AcquireFor(limit));
        other.join();
    }
}

// Four threads give, four take; what was given is taken, and no more.
TEST(SemaphoreTest, EightThreads) {
    Watchdog watchdog;
    constexpr unsigned nEach = 5000;
    RoxInternalSemaphore semaphore(0);
    std::atomic<unsigned> nTaken{0};
    std::vector<std::thread> threads;
    for (int i = 0; i < 4; ++i) {
        threads.emplace_back([&] {
            for (unsigned k = 0; k < nEach; ++k) semaphore.Release();
        });
        threads.emplace_back([&] {
            for (unsigned k = 0; k < nEach; ++k) {
                semaphore.Acquire();
                ++nTaken;
            }
        });
    }
    for (std::thread& thread : threads) thread.join();
    EXPECT_EQ(4 * nEach, nTaken);
    EXPECT_FALSE(semaphore.TryAcquire());
}

// The sum has no lock of its own: a semaphore handed round orders what its holders do.
TEST(SemaphoreTest, ARingOfEightThreads) {
    Watchdog watchdog;
    constexpr unsigned nThreads = 8;
    constexpr unsigned nRounds = 500;
    std::vector<std::unique_ptr<RoxInternalSemaphore>> turns;
    for (unsigned i = 0; i < nThreads; ++i)
        turns.push_back(std::make_unique<RoxInternalSemaphore>(i == 0 ? 1 : 0));
    std::vector<unsigned> order;
    std::vector<std::thread> threads;
    for (unsigned i = 0; i < nThreads; ++i) {
        threads.emplace_back([&, i] {
            for (unsigned round = 0; round < nRounds; ++round) {
                turns[i]->Acquire();
                order.push_back(i);
                turns[(i + 1) % nThreads]->Release();
            }
        });
    }
    for (std::thread& thread : threads) thread.join();
    ASSERT_EQ(nThreads * nRounds, order.size());
    for (unsigned i = 0; i < order.size(); ++i) ASSERT_EQ(i % nThreads, order[i]);
}

// Whoever acquired may end the semaphore although the releasing thread may not have come back yet.
TEST(SemaphoreTest, MayEndAsSoonAsItIsAcquired) {
    Watchdog watchdog;
    RoxInternalSemaphore handOver(0);
    std::atomic<RoxCoreSemaphore*> pending{nullptr};
    constexpr unsigned nRounds = 2000;
    std::thread releaser([&] {
        for (unsigned round = 0; round < nRounds; ++round) {
            handOver.Acquire();
            pending.load()->Release();
        }
    });
    for (unsigned round = 0; round < nRounds; ++round) {
        RoxMempool pool("semaphores");
        ref<RoxCoreSemaphore> semaphore(new (&pool) RoxCoreSemaphore(0));
        pending = semaphore.get();
        handOver.Release();
        semaphore->Acquire();
        semaphore = nullptr;
        EXPECT_EQ(0u, pool.GetUsedBytes());
    }
    releaser.join();
}

// A handler without SA_RESTART: what waits below sees EINTR.
TEST(SemaphoreTest, SignalsDoNotEndAWait) {
    Watchdog watchdog;
    static std::atomic<unsigned> nSignalsG;
    nSignalsG = 0;
    struct sigaction action {};
    action.sa_handler = [](int) { ++nSignalsG; };
    struct sigaction before {};
    sigaction(SIGUSR1, &action, &before);
    RoxInternalSemaphore semaphore(0);
    std::atomic<bool> fAcquired{false};
    std::thread waiter([&] {
        semaphore.Acquire();
        fAcquired = true;
    });
    while (nSignalsG < 5) {
        pthread_kill(waiter.native_handle(), SIGUSR1);
        std::this_thread::sleep_for(std::chrono::milliseconds(2));
        EXPECT_FALSE(fAcquired);
    }
    semaphore.Release();
    waiter.join();
    EXPECT_FALSE(semaphore.TryAcquire());
    sigaction(SIGUSR1, &before, nullptr);
}

TEST(SemaphoreDeathTest, NegativeCount) {
    UseDeathTestStyleForThreads();
    EXPECT_DEATH(RoxInternalSemaphore semaphore(-1), "the count is negative");
}

}  // namespace
