#include "rox/RoxActivity.h"

#include <fcntl.h>
#include <sys/resource.h>

#include <atomic>
#include <csignal>
#include <cstring>
#include <filesystem>
#include <set>
#include <thread>
#include <vector>

#include "TestActivity.h"
#include "rox/VkCast.h"

namespace {

class ActivityTest : public ActivityFixture {};
class ActivityDeathTest : public ActivityFixture {};

unsigned CountIn(const char* folder) {
    unsigned n = 0;
    for ([[maybe_unused]] const auto& entry : std::filesystem::directory_iterator(folder)) ++n;
    return n;
}

TEST_F(ActivityTest, FromStartToEnd) {
    Run();
    EXPECT_EQ("start", script.trace.Get());
    EXPECT_FALSE(semaphores.stopped->TryAcquire());
    semaphores.Stop();
    EXPECT_EQ("start stop destroyed", script.trace.Get());
    EXPECT_FALSE(semaphores.stop->TryAcquire());
    EXPECT_FALSE(semaphores.stopped->TryAcquire());
    EXPECT_FALSE(semaphores.started->TryAcquire());
}

TEST_F(ActivityTest, StartsWhenTheScopeCloses) {
    {
        RoxActivity::CreationScopePrivate scope;
        { const ref<TestActivity> activity(new (&pool) TestActivity(script, semaphores)); }
        EXPECT_FALSE(semaphores.started->AcquireFor(20));
        EXPECT_EQ("", script.trace.Get());
    }
    semaphores.started->Acquire();
    EXPECT_EQ("start", script.trace.Get());
    semaphores.Stop();
}

TEST_F(ActivityTest, ScopesAreNested) {
    Script outerScript;
    Semaphores outer(&pool);
    {
        RoxActivity::CreationScopePrivate outerScope;
        new (&pool) TestActivity(outerScript, outer);
        Run();
        EXPECT_EQ("", outerScript.trace.Get());
    }
    outer.started->Acquire();
    outer.Stop();
    semaphores.Stop();
}

TEST_F(ActivityTest, SeveralInOneScope) {
    Semaphores second(&pool);
    Script secondScript;
    {
        RoxActivity::CreationScopePrivate scope;
        new (&pool) TestActivity(script, semaphores);
        new (&pool) TestActivity(secondScript, second);
    }
    second.started->Acquire();
    semaphores.started->Acquire();
    second.Stop();
    EXPECT_EQ("start stop destroyed", secondScript.trace.Get());
    EXPECT_EQ("start", script.trace.Get());
    semaphores.Stop();
}

// The order of the table of virtual operations: two destructors, VkCastHelper, then the activity's own.
TEST_F(ActivityTest, SlotsOfVirtualOperations) {
    const auto slot = [](auto operation) {
        uintptr_t words[2];
        static_assert(sizeof operation == sizeof words);
        memcpy(words, &operation, sizeof words);
        // Offset in the table; one of the two words has a mark in its lowest bit.
        return (words[0] & ~uintptr_t{1}) / sizeof(void*);
    };
    EXPECT_EQ(2u, slot(&RoxActivity::VkCastHelper));
    EXPECT_EQ(3u, slot(&RoxActivity::ActivityStart));
    EXPECT_EQ(4u, slot(&RoxActivity::ActivityStop));
    EXPECT_EQ(5u, slot(&RoxActivity::IdleTimeoutHint));
    EXPECT_EQ(6u, slot(&RoxActivity::CallMeCountHint));
    EXPECT_EQ(7u, slot(&RoxActivity::FdCountHint));
    EXPECT_EQ(8u, slot(&RoxActivity::SemaphoreCountHint));
    EXPECT_EQ(9u, slot(&RoxActivity::TimerCountHint));
    EXPECT_EQ(10u, slot(&RoxActivity::BlockedTimeoutHint));
    EXPECT_EQ(11u, slot(&RoxActivity::FrozenTimeoutHint));
    EXPECT_EQ(12u, slot(&RoxActivity::BeforeCallbacksRun));
    EXPECT_EQ(13u, slot(&RoxActivity::AfterCallbacksRun));
}

TEST_F(ActivityTest, HasAThreadOfItsOwn) {
    EXPECT_EQ(nullptr, RoxActivity::Current());
    RoxActivity* current = nullptr;
    std::thread::id startThread;
    std::thread::id stopThread;
    std::thread::id endThread;
    char name[32] = "";
    sigset_t mask;
    script.start = [&] {
        current = RoxActivity::Current();
        startThread = std::this_thread::get_id();
        pthread_getname_np(pthread_self(), name, sizeof name);
        pthread_sigmask(SIG_SETMASK, nullptr, &mask);
    };
    script.stop = [&] {
        EXPECT_EQ(current, RoxActivity::Current());
        stopThread = std::this_thread::get_id();
    };
    script.destroyed = [&] { endThread = std::this_thread::get_id(); };
    ref<TestActivity> activity;
    {
        RoxActivity::CreationScopePrivate scope;
        activity = new (&pool) TestActivity(script, semaphores, "WDKMonitoringActivity");
    }
    EXPECT_STREQ("WDKMonitoringActivity", activity->GetName().Utf8());
    EXPECT_EQ(nullptr, activity->GetInitInfo());
    EXPECT_EQ(activity.get(), VkCast<RoxActivity>(activity.get()));
    TestActivity* address = activity.get();
    activity = nullptr;
    semaphores.Stop();
    EXPECT_EQ(address, current);
    EXPECT_NE(std::this_thread::get_id(), startThread);
    EXPECT_EQ(startThread, stopThread);
    EXPECT_EQ(startThread, endThread);
    EXPECT_STREQ("WDKMonitoringAc", name);
    EXPECT_EQ(1, sigismember(&mask, SIGTERM));
    EXPECT_EQ(1, sigismember(&mask, SIGPIPE));
    EXPECT_EQ(nullptr, RoxActivity::Current());
}

TEST_F(ActivityTest, TheRuntimeHoldsItUntilItEnds) {
    ref<TestActivity> activity;
    {
        RoxActivity::CreationScopePrivate scope;
        activity = new (&pool) TestActivity(script, semaphores);
    }
    EXPECT_EQ(2u, activity->GetRefCount());
    semaphores.Stop();
    EXPECT_EQ("start stop", script.trace.Get());
    EXPECT_EQ(1u, activity->GetRefCount());
    activity->Done();
    activity = nullptr;
    EXPECT_EQ("start stop destroyed", script.trace.Get());
}

TEST_F(ActivityTest, SemaphoresMayBeNull) {
    RoxInternalSemaphore destroyed(0);
    script.start = [] { RoxActivity::Current()->Done(); };
    script.destroyed = [&] { destroyed.Release(); };
    semaphores.stop = semaphores.stopped = semaphores.started = nullptr;
    {
        RoxActivity::CreationScopePrivate scope;
        new (&pool) TestActivity(script, semaphores);
    }
    destroyed.Acquire();
    EXPECT_EQ("start stop destroyed", script.trace.Get());
}

TEST_F(ActivityTest, HintsSayNothing) {
    ref<TestActivity> activity;
    {
        RoxActivity::CreationScopePrivate scope;
        activity = new (&pool) TestActivity(script, semaphores);
    }
    EXPECT_EQ(0, activity->IdleTimeoutHint());
    EXPECT_EQ(0u, activity->CallMeCountHint());
    EXPECT_EQ(0u, activity->FdCountHint());
    EXPECT_EQ(0u, activity->SemaphoreCountHint());
    EXPECT_EQ(0u, activity->TimerCountHint());
    EXPECT_EQ(0, activity->BlockedTimeoutHint());
    EXPECT_EQ(0, activity->FrozenTimeoutHint());
    activity = nullptr;
    semaphores.Stop();
}

TEST_F(ActivityTest, PrioritiesAreOfTheThread) {
    const int own = getpriority(PRIO_PROCESS, static_cast<id_t>(getpid()));
    int before = 0;
    int after = 0;
    script.start = [&] {
        before = getpriority(PRIO_PROCESS, static_cast<id_t>(gettid()));
        RoxActivity::Current()->SetPriority(RoxThread::PRIORITY_IDLE);
        after = getpriority(PRIO_PROCESS, static_cast<id_t>(gettid()));
    };
    {
        RoxActivity::CreationScopePrivate scope;
        (new (&pool) TestActivity(script, semaphores))->SetPriority(RoxThread::PRIORITY_LOW);
    }
    semaphores.Stop();
    EXPECT_EQ(std::min(own + 10, 19), before);
    EXPECT_EQ(19, after);
    EXPECT_EQ(own, getpriority(PRIO_PROCESS, static_cast<id_t>(getpid())));
}

TEST_F(ActivityTest, DescriptorsCloseOnExec) {
    const auto descriptors = [] {
        std::set<int> all;
        for (const auto& entry : std::filesystem::directory_iterator("/proc/self/fd")) {
            all.insert(std::stoi(entry.path().filename()));
        }
        return all;
    };
    const std::set<int> before = descriptors();
    Run();
    unsigned nNew = 0;
    for (int fd : descriptors()) {
        const int flags = fcntl(fd, F_GETFD);
        if (before.count(fd) == 0 && flags >= 0) {
            EXPECT_NE(0, flags & FD_CLOEXEC) << fd;
            ++nNew;
        }
    }
    EXPECT_GT(nNew, 0u);
    semaphores.Stop();
    EXPECT_EQ(before, descriptors());
}

TEST_F(ActivityTest, AThousandOneAfterTheOther) {
    Run();
    semaphores.Stop();
    semaphores = Semaphores(&pool);
    const unsigned nDescriptors = CountIn("/proc/self/fd");
    const unsigned nThreads = CountIn("/proc/self/task");
    const size_t nBytes = pool.GetUsedBytes();
    for (int i = 0; i < 1000; ++i) {
        Run();
        semaphores.Stop();
        semaphores = Semaphores(&pool);
        ASSERT_EQ(nDescriptors, CountIn("/proc/self/fd"));
        ASSERT_EQ(nBytes, pool.GetUsedBytes());
    }
    // A thread is gone some moments after it has told so; the watchdog ends a wait for one that never is.
    while (CountIn("/proc/self/task") > nThreads) {
        std::this_thread::yield();
    }
}

TEST_F(ActivityTest, AHundredAtOnce) {
    std::vector<Semaphores> all;
    {
        RoxActivity::CreationScopePrivate scope;
        for (int i = 0; i < 100; ++i) {
            all.emplace_back(&pool);
            new (&pool) TestActivity(script, all.back());
        }
    }
    for (Semaphores& each : all) each.started->Acquire();
    for (Semaphores& each : all) each.stop->Release();
    for (Semaphores& each : all) each.stopped->Acquire();
}

TEST_F(ActivityTest, TheModuleEndsWhatStillRuns) {
    std::atomic<unsigned> nDestroyed{0};
    script.destroyed = [&] { ++nDestroyed; };
    EXPECT_EQ(0u, RoxInitInfo::StartAll(nullptr));
    EXPECT_TRUE(RoxActivity::initInfo.FRunning());
    std::vector<Semaphores> all;
    {
        RoxActivity::CreationScopePrivate scope;
        for (int i = 0; i < 20; ++i) {
            all.emplace_back(&pool);
            new (&pool) TestActivity(script, all.back());
        }
    }
    RoxInitInfo::StopAll();
    EXPECT_EQ(20u, nDestroyed);
    for (Semaphores& each : all) {
        EXPECT_TRUE(each.started->TryAcquire());
        EXPECT_TRUE(each.stopped->TryAcquire());
        EXPECT_FALSE(each.stopped->TryAcquire());
    }
}

TEST_F(ActivityTest, TheModuleDoesNotWaitForTheCallersOwnActivity) {
    Script otherScript;
    Semaphores other(&pool);
    {
        RoxActivity::CreationScopePrivate scope;
        new (&pool) TestActivity(otherScript, other);
    }
    EXPECT_EQ(0u, RoxInitInfo::StartAll(nullptr));
    script.start = [&] {
        RoxInitInfo::StopAll();
        script.trace.Add("other:");
        script.trace.Add(otherScript.trace.Get());
    };
    Run();
    semaphores.stopped->Acquire();
    EXPECT_EQ("start other: start stop destroyed stop destroyed", script.trace.Get());
}

TEST_F(ActivityDeathTest, OutsideOfAScope) {
    EXPECT_DEATH(new (&pool) TestActivity(script, semaphores, "lost"),
                 "lost: created outside of a CreationScopePrivate");
}

TEST_F(ActivityDeathTest, OneStopForTwo) {
    EXPECT_DEATH(
        {
            RoxActivity::CreationScopePrivate scope;
            new (&pool) TestActivity(script, semaphores);
            new (&pool) TestActivity(script, semaphores);
        },
        "watched already");
}

TEST_F(ActivityDeathTest, StopAndStoppedAreOne) {
    semaphores.stopped = semaphores.stop;
    EXPECT_DEATH(
        {
            RoxActivity::CreationScopePrivate scope;
            new (&pool) TestActivity(script, semaphores);
        },
        "`stop` is another one too");
}

/// Ends the process while an activity waits, or works.
void ExitMeanwhile(bool fBusy) {
    static RoxMempool* poolG = new RoxMempool("never ends");
    static Script* scriptG = new Script;
    static EventFd* eventFdG = new EventFd;
    static FunctionListener* listenerG = new FunctionListener([] {});
    static ref<RoxFd>* fdG = new ref<RoxFd>(new RoxFd);
    scriptG->start = [] {
        (*fdG)->SetListener(listenerG);
        (*fdG)->SetFd(eventFdG->Get(), RoxFd::eventReadableG);
    };
    if (fBusy) eventFdG->Set();
    Semaphores semaphores(poolG);
    {
        RoxActivity::CreationScopePrivate scope;
        new (poolG) TestActivity(*scriptG, semaphores);
    }
    semaphores.started->Acquire();
    exit(0);
}

TEST_F(ActivityDeathTest, TheProcessEndsMeanwhile) {
    EXPECT_EXIT(ExitMeanwhile(false), testing::ExitedWithCode(0), "");
    EXPECT_EXIT(ExitMeanwhile(true), testing::ExitedWithCode(0), "");
}

}  // namespace
