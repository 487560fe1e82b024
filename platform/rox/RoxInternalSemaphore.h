#pragma once

#include "rox/RoxSemaphoreState.h"
#include "rox/ref.h"

/// Counting semaphore. Any thread. It may be destroyed as soon as nobody will call it again: a Release whose
/// effect another thread has seen does not touch it any more.
class RoxInternalSemaphore {
 public:
    /// `count` acquires go through without a release. Not negative.
    explicit RoxInternalSemaphore(int count) : stateM(new RoxSemaphoreState(count)) {}
    RoxInternalSemaphore(const RoxInternalSemaphore&) = delete;
    RoxInternalSemaphore& operator=(const RoxInternalSemaphore&) = delete;

    /// Waits until the count is above 0 and takes 1 from it. On an activity's own thread, of the semaphore by
    /// which that activity tells that it has ended: does not wait, and takes 1 only if there is one.
    void Acquire() { stateM->Acquire(); }
    /// Acquires if that needs no waiting, and says whether it did.
    bool TryAcquire() { return stateM->AcquireFor(0); }
    /// Waits at most so long; true when acquired.
    bool AcquireFor(long long milliseconds) { return stateM->AcquireFor(milliseconds); }
    /// Adds 1 to the count and wakes one who waits. If an activity takes the semaphore as its order to stop,
    /// that is told instead.
    void Release() {
        const ref<RoxSemaphoreState> state = stateM;
        state->Release();
    }

    /// For the runtime.
    const ref<RoxSemaphoreState>& GetState() const { return stateM; }

 private:
    ref<RoxSemaphoreState> stateM;
};
