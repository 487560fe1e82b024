#pragma once

#include "rox/RoxMutex.h"

/// Holds a mutex from its construction to the end of its scope.
class RoxMutexHold {
 public:
    explicit RoxMutexHold(RoxMutex& mutex) : mutexM(mutex) { mutexM.Acquire(); }
    ~RoxMutexHold() { mutexM.Release(); }
    RoxMutexHold(const RoxMutexHold&) = delete;
    RoxMutexHold& operator=(const RoxMutexHold&) = delete;

 private:
    RoxMutex& mutexM;
};
