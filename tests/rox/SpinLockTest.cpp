#include "rox/RoxSpinLock.h"

#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <thread>
#include <vector>

#include "rox/RoxSpinLockHold.h"

TEST(SpinLockTest, AcquireTryRelease) {
    RoxSpinLock lock(2);
    EXPECT_EQ(2u, lock.GetLevel());
    lock.Acquire();
    EXPECT_FALSE(lock.TryAcquire());
    lock.Release();
    EXPECT_TRUE(lock.TryAcquire());
    lock.Release();
    {
        RoxSpinLockHold hold(lock);
        EXPECT_FALSE(lock.TryAcquire());
    }
    EXPECT_TRUE(lock.TryAcquire());
}

TEST(SpinLockTest, KeepsThreadsApart) {
    RoxSpinLock lock(2);
    unsigned n = 0;
    std::vector<std::thread> threads;
    for (int i = 0; i < 4; ++i) {
        threads.emplace_back([&] {
            for (int k = 0; k < 20000; ++k) {
                RoxSpinLockHold hold(lock);
                ++n;
            }
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    EXPECT_EQ(80000u, n);
}

TEST(SpinLockTest, WaitsForALongHolder) {
    RoxSpinLock lock(2);
    std::atomic<bool> fEntered{false};
    lock.Acquire();
    std::thread waiter([&] {
        RoxSpinLockHold hold(lock);
        fEntered = true;
    });
    std::this_thread::sleep_for(std::chrono::milliseconds(20));
    EXPECT_FALSE(fEntered);
    lock.Release();
    waiter.join();
    EXPECT_TRUE(fEntered);
}
