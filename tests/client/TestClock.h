#pragma once

#include <cstdint>
#include <functional>
#include <vector>

/// The process's monotonic clock in this program: the test moves it, and so do sleeps, which take no time.
struct TestClock {
    /// A clean start.
    static void Reset();
    static void Advance(int64_t nanoseconds);
    static int64_t Now();

    /// The milliseconds of each sleep since the start.
    static std::vector<long long> Sleeps();
    /// Called after each sleep, on the sleeping thread, with the number of sleeps so far.
    static void OnSleep(std::function<void(size_t nSleeps)> call);
    static void Sleep(long long milliseconds);
};
