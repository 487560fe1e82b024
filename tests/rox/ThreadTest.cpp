#include "rox/RoxThread.h"

#include <gtest/gtest.h>
#include <pthread.h>
#include <sys/resource.h>
#include <unistd.h>

#include <atomic>
#include <chrono>
#include <csignal>
#include <limits>
#include <string>
#include <thread>

#include "rox/RoxInternalSemaphore.h"
#include "support/Watchdog.h"

namespace {

struct Seen {
    RoxInternalSemaphore done{0};
    std::string name;
    sigset_t mask;
    int nice = 0;
    RoxThread::Priority priority = RoxThread::PRIORITY_NORMAL;
};

void Look(void* context) {
    auto* seen = static_cast<Seen*>(context);
    char name[32];
    pthread_getname_np(pthread_self(), name, sizeof name);
    seen->name = name;
    pthread_sigmask(SIG_SETMASK, nullptr, &seen->mask);
    RoxThread::SetPriority(seen->priority);
    seen->nice = getpriority(PRIO_PROCESS, static_cast<id_t>(gettid()));
    seen->done.Release();
}

TEST(ThreadTest, HasItsName) {
    Watchdog watchdog;
    static const char* const cases[][2] = {
        {"", ""},
        {"short", "short"},
        {"123456789012345", "123456789012345"},
        {"1234567890123456", "123456789012345"},
        {"WDKMonitoringActivity", "WDKMonitoringAc"},
    };
    for (const auto& each : cases) {
        Seen seen;
        RoxThread::Start(each[0], Look, &seen);
        seen.done.Acquire();
        EXPECT_EQ(each[1], seen.name);
    }
}

TEST(ThreadTest, BlocksSignalsButThoseOfItsOwnFaults) {
    Watchdog watchdog;
    sigset_t before;
    pthread_sigmask(SIG_SETMASK, nullptr, &before);
    Seen seen;
    RoxThread::Start("signals", Look, &seen);
    seen.done.Acquire();
    for (int signal :
         {SIGHUP, SIGINT, SIGQUIT, SIGPIPE, SIGALRM, SIGTERM, SIGUSR1, SIGCHLD, SIGWINCH, SIGIO}) {
        EXPECT_EQ(1, sigismember(&seen.mask, signal)) << signal;
    }
    for (int signal : {SIGSEGV, SIGBUS, SIGFPE, SIGILL}) {
        EXPECT_EQ(0, sigismember(&seen.mask, signal)) << signal;
    }
    sigset_t after;
    pthread_sigmask(SIG_SETMASK, nullptr, &after);
    for (int signal = 1; signal < 32; ++signal) {
        EXPECT_EQ(sigismember(&before, signal), sigismember(&after, signal)) << signal;
    }
}

TEST(ThreadTest, Priorities) {
    Watchdog watchdog;
    EXPECT_EQ(2, RoxThread::PRIORITY_NORMAL);
    const int own = getpriority(PRIO_PROCESS, static_cast<id_t>(getpid()));
    int last = 20;
    for (RoxThread::Priority priority :
         {RoxThread::PRIORITY_IDLE, RoxThread::PRIORITY_LOW, RoxThread::PRIORITY_NORMAL}) {
        Seen seen;
        seen.priority = priority;
        RoxThread::Start("priority", Look, &seen);
        seen.done.Acquire();
        EXPECT_LE(seen.nice, last);
        EXPECT_GE(seen.nice, own);
        last = seen.nice;
    }
    EXPECT_EQ(own, last);
    EXPECT_EQ(own, getpriority(PRIO_PROCESS, static_cast<id_t>(getpid())));
}

TEST(ThreadTest, SleepsAtLeastSoLong) {
    for (long long milliseconds : {1LL, 20LL, 1001LL}) {
        const auto begin = std::chrono::steady_clock::now();
        RoxThread::SleepMilliseconds(milliseconds);
        EXPECT_GE(std::chrono::steady_clock::now() - begin, std::chrono::milliseconds(milliseconds));
    }
}

TEST(ThreadTest, DoesNotSleepWithoutATime) {
    Watchdog watchdog;
    for (long long milliseconds : {0LL, -1LL, std::numeric_limits<long long>::min()}) {
        RoxThread::SleepMilliseconds(milliseconds);
    }
}

TEST(ThreadTest, SignalsDoNotShortenASleep) {
    static std::atomic<unsigned> nSignalsG;
    nSignalsG = 0;
    struct sigaction action {};
    action.sa_handler = [](int) { ++nSignalsG; };
    struct sigaction before {};
    sigaction(SIGUSR1, &action, &before);
    std::atomic<bool> fDone{false};
    std::thread sleeper([&] {
        const auto begin = std::chrono::steady_clock::now();
        RoxThread::SleepMilliseconds(100);
        EXPECT_GE(std::chrono::steady_clock::now() - begin, std::chrono::milliseconds(100));
        fDone = true;
    });
    while (!fDone) {
        pthread_kill(sleeper.native_handle(), SIGUSR1);
        std::this_thread::sleep_for(std::chrono::milliseconds(5));
    }
    sleeper.join();
    EXPECT_GT(nSignalsG, 0u);
    sigaction(SIGUSR1, &before, nullptr);
}

}  // namespace
