#include "rox/RoxMonotonicTime.h"

#include <gtest/gtest.h>

#include <chrono>
#include <thread>

namespace {

TEST(MonotonicTimeTest, NeverGoesBack) {
    int64_t last = RoxMonotonicTime::Now();
    for (unsigned i = 0; i < 10000; ++i) {
        const int64_t now = i % 2 == 0 ? RoxMonotonicTime::Now() : RoxMonotonicTime::cpuG.Read();
        ASSERT_GE(now, last);
        last = now;
    }
}

// Readings of the other clock outside and inside of ours bound the interval whatever the load.
TEST(MonotonicTimeTest, KeepsTheRate) {
    using Clock = std::chrono::steady_clock;
    const Clock::time_point outerBegin = Clock::now();
    const int64_t begin = RoxMonotonicTime::Now();
    const Clock::time_point innerBegin = Clock::now();
    std::this_thread::sleep_for(std::chrono::milliseconds(50));
    const Clock::time_point innerEnd = Clock::now();
    const int64_t end = RoxMonotonicTime::Now();
    const Clock::time_point outerEnd = Clock::now();

    const std::chrono::nanoseconds interval(RoxMonotonicTime::ToNanoseconds(end - begin));
    const std::chrono::microseconds tolerance(50);
    EXPECT_GE(interval + tolerance, innerEnd - innerBegin);
    EXPECT_LE(interval - tolerance, outerEnd - outerBegin);
    EXPECT_GE(interval, std::chrono::milliseconds(49));
}

TEST(MonotonicTimeTest, TheTwoFormsOfTheRateAgree) {
    const double nanosecondsPerTock = RoxMonotonicTime::nanosecondsPer2N20Tock / 1048576.0;
    EXPECT_NEAR(1e9, nanosecondsPerTock * static_cast<double>(RoxMonotonicTime::tocksPerSecond), 1e4);
}

// By the length of a tock that this clock has, the nanosecond; the product with 2 to the 20th passes 64 bits
// from the fifth hour on.
TEST(MonotonicTimeTest, ToNanosecondsDoesNotOverflow) {
    const uint64_t second = RoxMonotonicTime::tocksPerSecond;
    const uint64_t century = uint64_t{36524} * 86400;
    for (uint64_t seconds : {uint64_t{0}, uint64_t{1}, uint64_t{17592}, uint64_t{17593}, century}) {
        const int64_t tocks = static_cast<int64_t>(seconds * second);
        const int64_t nanoseconds = static_cast<int64_t>(seconds * 1000000000);
        EXPECT_EQ(nanoseconds, RoxMonotonicTime::ToNanoseconds(tocks));
        EXPECT_EQ(-nanoseconds, RoxMonotonicTime::ToNanoseconds(-tocks));
    }
    if (RoxMonotonicTime::nanosecondsPer2N20Tock == 1048576) {
        for (int64_t tocks : {int64_t{1}, int64_t{1048575}, int64_t{1048577}, INT64_MAX, -INT64_MAX}) {
            EXPECT_EQ(tocks, RoxMonotonicTime::ToNanoseconds(tocks));
        }
    }
}

}  // namespace
