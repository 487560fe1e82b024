#include "rox/RoxThread.h"

#include <pthread.h>
#include <sched.h>
#include <sys/resource.h>
#include <time.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <csignal>
#include <cstdio>
#include <cstring>

#include "rox/RoxAssert.h"
#include "rox/RoxMempool.h"

namespace {

constexpr unsigned nNameBytes = 16;  // the system's limit, NUL included

struct ThreadStart {
    void (*main)(void* context);
    void* context;
    char name[nNameBytes];
};

void* RunThread(void* argument) {
    const ThreadStart start = *static_cast<ThreadStart*>(argument);
    RoxMempool::FreeIn(nullptr, argument);
    pthread_setname_np(pthread_self(), start.name);
    start.main(start.context);
    return nullptr;
}

/// All signals but those by which the system tells of a thread's own fault, which must not be lost.
sigset_t SignalsToBlock() {
    sigset_t signals;
    sigfillset(&signals);
    for (int fault : {SIGSEGV, SIGBUS, SIGFPE, SIGILL, SIGTRAP, SIGSYS, SIGABRT}) {
        sigdelset(&signals, fault);
    }
    return signals;
}

}  // namespace

void RoxThread::Start(const char* name, void (*main)(void* context), void* context) {
    auto* start = static_cast<ThreadStart*>(RoxMempool::CallocIn(nullptr, sizeof(ThreadStart)));
    start->main = main;
    start->context = context;
    snprintf(start->name, nNameBytes, "%s", name);

    pthread_attr_t attributes;
    pthread_attr_init(&attributes);
    pthread_attr_setdetachstate(&attributes, PTHREAD_CREATE_DETACHED);
    // A new thread has its creator's mask from its first instruction on.
    const sigset_t blocked = SignalsToBlock();
    sigset_t before;
    pthread_sigmask(SIG_BLOCK, &blocked, &before);
    pthread_t thread;
    const int error = pthread_create(&thread, &attributes, RunThread, start);
    pthread_sigmask(SIG_SETMASK, &before, nullptr);
    pthread_attr_destroy(&attributes);
    if (error != 0) {
        RoxAssertFail("RoxThread %s: %s", name, strerror(error));
    }
}

void RoxThread::SetPriority(Priority priority) {
    constexpr int vNice[] = {19, 10, 0, -5};  // beside the process's own
    static_assert(PRIORITY_HIGH + 1 == sizeof vNice / sizeof vNice[0]);
    RoxAssert(priority >= PRIORITY_IDLE && priority <= PRIORITY_HIGH, "RoxThread: no such priority");
    // To the system a "process" is a thread here, and the process's number that of its first one. It may
    // refuse.
    const int nice = getpriority(PRIO_PROCESS, static_cast<id_t>(getpid())) + vNice[priority];
    setpriority(PRIO_PROCESS, static_cast<id_t>(gettid()), nice);
}

void RoxThread::SleepMilliseconds(long long milliseconds) {
    if (milliseconds <= 0) {
        return;
    }
    timespec end{};
    clock_gettime(CLOCK_MONOTONIC, &end);
    milliseconds = std::min(milliseconds, longestMillisecondsG);
    const long nanoseconds = end.tv_nsec + static_cast<long>(milliseconds % 1000) * 1000000;
    end.tv_sec += static_cast<time_t>(milliseconds / 1000) + nanoseconds / 1000000000;
    end.tv_nsec = nanoseconds % 1000000000;
    while (clock_nanosleep(CLOCK_MONOTONIC, TIMER_ABSTIME, &end, nullptr) == EINTR) {
    }
}
