#pragma once

#include <pthread.h>

#include "rox/RoxLockLevel.h"

/// Lock for sections that may wait. Not recursive: a thread that acquires what it holds, or releases what it
/// does not hold, ends the process through RoxAssertFail.
class RoxMutex {
 public:
    explicit RoxMutex(RoxLockLevel level) : levelM(level) {}
    ~RoxMutex();
    RoxMutex(const RoxMutex&) = delete;
    RoxMutex& operator=(const RoxMutex&) = delete;

    void Acquire();
    /// True when the lock was free and is now the caller's.
    bool TryAcquire();
    void Release();
    RoxLockLevel GetLevel() const { return levelM; }

 private:
    pthread_mutex_t mutexM = PTHREAD_ERRORCHECK_MUTEX_INITIALIZER_NP;
    RoxLockLevel levelM;
};
