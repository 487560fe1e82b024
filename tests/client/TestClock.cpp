#include "TestClock.h"

#include <mutex>

#include "rox/RoxMonotonicTime.h"
#include "rox/RoxThread.h"

namespace {

std::mutex mutexG;
int64_t nowG = 0;
std::vector<long long> sleepsG;
std::function<void(size_t)> onSleepG;

// Not 0, so that a time that counts from 0 shows.
constexpr int64_t startG = 77'000'000'000'000;

}  // namespace

void TestClock::Reset() {
    std::lock_guard<std::mutex> hold(mutexG);
    nowG = startG;
    sleepsG.clear();
    onSleepG = nullptr;
}

void TestClock::Advance(int64_t nanoseconds) {
    std::lock_guard<std::mutex> hold(mutexG);
    nowG += nanoseconds;
}

int64_t TestClock::Now() {
    std::lock_guard<std::mutex> hold(mutexG);
    return nowG;
}

std::vector<long long> TestClock::Sleeps() {
    std::lock_guard<std::mutex> hold(mutexG);
    return sleepsG;
}

void TestClock::OnSleep(std::function<void(size_t)> call) {
    std::lock_guard<std::mutex> hold(mutexG);
    onSleepG = std::move(call);
}

void TestClock::Sleep(long long milliseconds) {
    std::function<void(size_t)> call;
    size_t nSleeps = 0;
    {
        std::lock_guard<std::mutex> hold(mutexG);
        nowG += milliseconds * 1'000'000;
        sleepsG.push_back(milliseconds);
        nSleeps = sleepsG.size();
        call = onSleepG;
    }
    if (call) call(nSleeps);
}

// In place of the platform's: a program's own definitions go before those of shared objects.
int64_t RoxMonotonicTime::Read() const {
    return TestClock::Now();
}

void RoxThread::SleepMilliseconds(long long milliseconds) {
    TestClock::Sleep(milliseconds);
}
