#pragma once

#include "rox/RoxCore.h"

/// Somebody who is told of a semaphore's releases.
class RoxSemaphoreWatcher : public RoxCore {
 public:
    /// Once for each release, on the thread that releases; no lock is held.
    virtual void SemaphoreReleased() = 0;

 protected:
    RoxSemaphoreWatcher() = default;
};
