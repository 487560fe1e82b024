#include "rox/RoxSemaphoreState.h"

#include <algorithm>
#include <chrono>

#include "rox/RoxActivityRun.h"
#include "rox/RoxAssert.h"
#include "rox/RoxThread.h"

RoxSemaphoreState::RoxSemaphoreState(int count) : countM(static_cast<unsigned>(count)) {
    RoxAssert(count >= 0, "RoxInternalSemaphore: the count is negative");
}

void RoxSemaphoreState::Acquire() {
    std::unique_lock<std::mutex> lock(mutexM);
    if (countM == 0 && RoxActivityRun::FEndsHere(*this)) {
        return;
    }
    changedM.wait(lock, [this] { return countM != 0; });
    --countM;
}

bool RoxSemaphoreState::AcquireFor(long long milliseconds) {
    const std::chrono::milliseconds time(std::clamp(milliseconds, 0LL, RoxThread::longestMillisecondsG));
    std::unique_lock<std::mutex> lock(mutexM);
    if (!changedM.wait_until(lock, std::chrono::steady_clock::now() + time, [this] { return countM != 0; })) {
        return false;
    }
    --countM;
    return true;
}

void RoxSemaphoreState::Release() {
    ref<RoxSemaphoreWatcher> watcher;
    {
        std::unique_lock<std::mutex> lock(mutexM);
        watcher = watcherM;
        if (watcher == nullptr) {
            ++countM;
            changedM.notify_one();
            return;
        }
    }
    watcher->SemaphoreReleased();
}

void RoxSemaphoreState::SetWatcher(const ref<RoxSemaphoreWatcher>& watcher) {
    unsigned nReleased = 0;
    {
        std::unique_lock<std::mutex> lock(mutexM);
        RoxAssert(watcherM == nullptr, "RoxInternalSemaphore: watched already");
        watcherM = watcher;
        std::swap(nReleased, countM);
    }
    for (; nReleased > 0; --nReleased) {
        watcher->SemaphoreReleased();
    }
}
