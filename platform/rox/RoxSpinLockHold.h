#pragma once

#include "rox/RoxSpinLock.h"

/// Holds a spin lock from its construction to the end of its scope.
class RoxSpinLockHold {
 public:
    explicit RoxSpinLockHold(RoxSpinLock& lock) : lockM(lock) { lockM.Acquire(); }
    ~RoxSpinLockHold() { lockM.Release(); }
    RoxSpinLockHold(const RoxSpinLockHold&) = delete;
    RoxSpinLockHold& operator=(const RoxSpinLockHold&) = delete;

 private:
    RoxSpinLock& lockM;
};
