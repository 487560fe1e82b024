#include "rox/RoxMutex.h"

#include <gtest/gtest.h>

#include <thread>
#include <vector>

#include "DeathTestStyle.h"
#include "rox/RoxMutexHold.h"
#include "support/Watchdog.h"

namespace {

bool FFree(RoxMutex& mutex) {
    bool fFree = false;
    std::thread other([&] {
        fFree = mutex.TryAcquire();
        if (fFree) mutex.Release();
    });
    other.join();
    return fFree;
}

TEST(MutexTest, AcquireTryRelease) {
    RoxMutex mutex(452610);
    EXPECT_EQ(452610u, mutex.GetLevel());
    EXPECT_TRUE(FFree(mutex));
    mutex.Acquire();
    EXPECT_FALSE(FFree(mutex));
    mutex.Release();
    EXPECT_TRUE(mutex.TryAcquire());
    EXPECT_FALSE(FFree(mutex));
    mutex.Release();
    {
        RoxMutexHold hold(mutex);
        EXPECT_FALSE(FFree(mutex));
    }
    EXPECT_TRUE(FFree(mutex));
}

TEST(MutexTest, KeepsThreadsApart) {
    Watchdog watchdog;
    RoxMutex mutex(1);
    unsigned n = 0;
    std::vector<std::thread> threads;
    for (int i = 0; i < 8; ++i) {
        threads.emplace_back([&] {
            for (int k = 0; k < 5000; ++k) {
                RoxMutexHold hold(mutex);
                ++n;
            }
        });
    }
    for (std::thread& thread : threads) thread.join();
    EXPECT_EQ(40000u, n);
}

TEST(MutexDeathTest, WrongUseEndsTheProcess) {
    UseDeathTestStyleForThreads();
    EXPECT_DEATH(
        {
            RoxMutex mutex(17);
            mutex.Acquire();
            mutex.Acquire();
        },
        "RoxMutex of level 17: acquired: ");
    EXPECT_DEATH(
        {
            RoxMutex mutex(18);
            mutex.Release();
        },
        "RoxMutex of level 18: released: ");
    EXPECT_DEATH(
        {
            RoxMutex mutex(19);
            mutex.Acquire();
            std::thread([&] { mutex.Release(); }).join();
        },
        "RoxMutex of level 19: released: ");
}

}  // namespace
