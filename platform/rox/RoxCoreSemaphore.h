#pragma once

#include "rox/RoxCore.h"
#include "rox/RoxInternalSemaphore.h"

/// A semaphore that is counted as objects are: see RoxInternalSemaphore.
class RoxCoreSemaphore : public RoxCore {
 public:
    explicit RoxCoreSemaphore(int count) : semaphoreM(count) {}

    void Acquire() { semaphoreM.Acquire(); }
    bool TryAcquire() { return semaphoreM.TryAcquire(); }
    bool AcquireFor(long long milliseconds) { return semaphoreM.AcquireFor(milliseconds); }
    void Release() { semaphoreM.Release(); }
    RoxInternalSemaphore& GetInternal() { return semaphoreM; }

 private:
    RoxInternalSemaphore semaphoreM;
};
