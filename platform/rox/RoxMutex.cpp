#include "rox/RoxMutex.h"

#include <cerrno>
#include <cstring>

#include "rox/RoxAssert.h"

namespace {

void AssertDone(int error, const char* what, RoxLockLevel level) {
    if (error != 0) {
        RoxAssertFail("RoxMutex of level %u: %s: %s", unsigned{level}, what, strerror(error));
    }
}

}  // namespace

RoxMutex::~RoxMutex() {
    AssertDone(pthread_mutex_destroy(&mutexM), "destroyed", levelM);
}

void RoxMutex::Acquire() {
    AssertDone(pthread_mutex_lock(&mutexM), "acquired", levelM);
}

bool RoxMutex::TryAcquire() {
    const int error = pthread_mutex_trylock(&mutexM);
    if (error != EBUSY) {
        AssertDone(error, "tried", levelM);
    }
    return error == 0;
}

void RoxMutex::Release() {
    AssertDone(pthread_mutex_unlock(&mutexM), "released", levelM);
}
