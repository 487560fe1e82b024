#pragma once

#include <condition_variable>
#include <mutex>

#include "rox/RoxSemaphoreWatcher.h"
#include "rox/ref.h"

/// What a semaphore is made of. It lies on the general heap and is counted apart from the semaphore, so that
/// a thread may release a semaphore and another, which waited for that, may end it and its pool right away.
class RoxSemaphoreState : public RoxCore {
 public:
    explicit RoxSemaphoreState(int count);

    void Acquire();
    bool AcquireFor(long long milliseconds);
    void Release();

    /// From now on releases go to the watcher and are not counted. It is told at once of those that were.
    /// Only one watcher in the life of a semaphore.
    void SetWatcher(const ref<RoxSemaphoreWatcher>& watcher);

 private:
    std::mutex mutexM;
    std::condition_variable changedM;
    unsigned countM;
    ref<RoxSemaphoreWatcher> watcherM;
};
