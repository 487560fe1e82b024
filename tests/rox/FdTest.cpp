#include "rox/RoxFd.h"

#include <fcntl.h>
#include <sys/resource.h>
#include <sys/socket.h>

#include <atomic>
#include <memory>
#include <thread>

#include "TestActivity.h"

namespace {

/// Each test says what the activity does at its start; `finish` ends it.
class FdTest : public ActivityFixture {
 protected:
    FdTest() { eventFd.Set(); }

    void Finish() { RoxActivity::Current()->Done(); }
    void RunToTheEnd() {
        Run();
        semaphores.stopped->Acquire();
    }
    bool Watch(RoxFd& watched, const EventFd& event) {
        return watched.SetFd(event.Get(), RoxFd::eventReadableG);
    }

    ref<RoxFd> fd{new (&pool) RoxFd};
};

class FdDeathTest : public FdTest {};

TEST_F(FdTest, CallsTheListenerUntilItIsReadEmpty) {
    unsigned nCalls = 0;
    FunctionListener listener([&] {
        if (++nCalls == 3) {
            eventFd.Clear();
            Finish();
        }
    });
    script.start = [&] {
        fd->SetListener(&listener);
        EXPECT_EQ(-1, fd->GetFd());
        EXPECT_TRUE(Watch(*fd, eventFd));
        EXPECT_EQ(eventFd.Get(), fd->GetFd());
    };
    RunToTheEnd();
    EXPECT_EQ(3u, nCalls);
}

TEST_F(FdTest, IsSilentUntilThereIsSomethingToRead) {
    eventFd.Clear();
    std::atomic<unsigned> nCalls{0};
    FunctionListener listener([&] {
        ++nCalls;
        Finish();
    });
    script.start = [&] {
        Watch(*fd, eventFd);
        fd->SetListener(&listener);
    };
    Run();
    EXPECT_FALSE(semaphores.stopped->AcquireFor(20));
    EXPECT_EQ(0u, nCalls);
    eventFd.Set();
    semaphores.stopped->Acquire();
    EXPECT_EQ(1u, nCalls);
}

TEST_F(FdTest, IsReadyWhenTheOtherEndIsGone) {
    int ends[2];
    ASSERT_EQ(0, socketpair(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0, ends));
    FunctionListener listener([&] { Finish(); });
    script.start = [&] {
        fd->SetFd(ends[0], RoxFd::eventReadableG);
        fd->SetListener(&listener);
    };
    Run();
    close(ends[1]);
    semaphores.stopped->Acquire();
    close(ends[0]);
}

/// Counts the rounds of callbacks too.
class CountingActivity : public TestActivity {
 public:
    using TestActivity::TestActivity;
    void BeforeCallbacksRun() override { ++nBefore; }
    void AfterCallbacksRun() override { EXPECT_EQ(++nAfter, nBefore); }

    unsigned nBefore = 0;
    unsigned nAfter = 0;
};

TEST_F(FdTest, CallsAreBracketed) {
    ref<CountingActivity> activity;
    unsigned nCalls = 0;
    FunctionListener listener([&] {
        EXPECT_EQ(activity->nAfter + 1, activity->nBefore);
        if (++nCalls == 5) Finish();
    });
    script.start = [&] {
        Watch(*fd, eventFd);
        fd->SetListener(&listener);
    };
    {
        RoxActivity::CreationScopePrivate scope;
        activity = new (&pool) CountingActivity(script, semaphores);
    }
    semaphores.stopped->Acquire();
    EXPECT_EQ(5u, nCalls);
    EXPECT_GE(activity->nBefore, 5u);
    EXPECT_EQ(activity->nAfter, activity->nBefore);
}

/// Ends when the loop is about to call a listener.
class HastyActivity : public TestActivity {
 public:
    using TestActivity::TestActivity;
    void BeforeCallbacksRun() override { Done(); }
};

TEST_F(FdTest, NoCallOnceTheActivityEnds) {
    FunctionListener listener([&] { script.trace.Add("called"); });
    script.start = [&] {
        Watch(*fd, eventFd);
        fd->SetListener(&listener);
    };
    {
        RoxActivity::CreationScopePrivate scope;
        new (&pool) HastyActivity(script, semaphores);
    }
    semaphores.stopped->Acquire();
    EXPECT_EQ("start stop destroyed", script.trace.Get());
}

// Two descriptors are ready; whichever is called first silences the other.
TEST_F(FdTest, ClearedByAnotherListenerWhileReady) {
    enum Way { CLEAR_LISTENER, CLEAR_FD, DESTROY };
    for (Way way : {CLEAR_LISTENER, CLEAR_FD, DESTROY}) {
        SCOPED_TRACE(way);
        semaphores = Semaphores(&pool);
        EventFd lateFd;
        EventFd events[2];
        ref<RoxFd> fds[2] = {new (&pool) RoxFd, new (&pool) RoxFd};
        unsigned nCalls = 0;
        const auto onReady = [&](unsigned own) {
            ++nCalls;
            events[own].Clear();
            ref<RoxFd>& other = fds[1 - own];
            if (way == CLEAR_LISTENER) other->ClearListener();
            if (way == CLEAR_FD) other->ClearFd();
            if (way == DESTROY) other = nullptr;
            lateFd.Set();
        };
        FunctionListener listeners[2] = {FunctionListener([&] { onReady(0); }),
                                         FunctionListener([&] { onReady(1); })};
        // Ready later than both, so that the other one would have been called by then; twice, for the order
        // in which the loop takes those that are ready together is not known.
        unsigned nLate = 0;
        FunctionListener late([&] {
            if (++nLate == 2) Finish();
        });
        script.start = [&] {
            for (unsigned i = 0; i < 2; ++i) {
                Watch(*fds[i], events[i]);
                fds[i]->SetListener(&listeners[i]);
                events[i].Set();
            }
            Watch(*fd, lateFd);
            fd->SetListener(&late);
        };
        script.stop = [&] {
            for (ref<RoxFd>& each : fds) each = nullptr;
        };
        RunToTheEnd();
        EXPECT_EQ(1u, nCalls);
    }
}

TEST_F(FdTest, AListenerMayClearItself) {
    enum Way { CLEAR_LISTENER, CLEAR_FD, DESTROY };
    for (Way way : {CLEAR_LISTENER, CLEAR_FD, DESTROY}) {
        SCOPED_TRACE(way);
        semaphores = Semaphores(&pool);
        EventFd lateFd;
        ref<RoxFd> other(new (&pool) RoxFd);
        unsigned nCalls = 0;
        FunctionListener listener([&] {
            ++nCalls;
            if (way == CLEAR_LISTENER) other->ClearListener();
            if (way == CLEAR_FD) other->ClearFd();
            if (way == DESTROY) other = nullptr;
            lateFd.Set();
        });
        unsigned nLate = 0;
        FunctionListener late([&] {
            if (++nLate == 2) Finish();
        });
        script.start = [&] {
            Watch(*other, eventFd);
            other->SetListener(&listener);
            Watch(*fd, lateFd);
            fd->SetListener(&late);
        };
        script.stop = [&] { other = nullptr; };
        RunToTheEnd();
        EXPECT_EQ(1u, nCalls);
    }
}

TEST_F(FdTest, AnotherListenerTakesThePlace) {
    FunctionListener second([&] {
        script.trace.Add("second");
        Finish();
    });
    FunctionListener first([&] {
        script.trace.Add("first");
        fd->SetListener(&second);
    });
    script.start = [&] {
        Watch(*fd, eventFd);
        fd->SetListener(&first);
    };
    RunToTheEnd();
    EXPECT_EQ("start first second stop destroyed", script.trace.Get());
}

TEST_F(FdTest, AnotherDescriptorTakesThePlace) {
    EventFd second;
    FunctionListener listener([&] {
        if (fd->GetFd() == second.Get()) {
            Finish();
            return;
        }
        EXPECT_TRUE(Watch(*fd, second));
        second.Set();
    });
    script.start = [&] {
        Watch(*fd, eventFd);
        fd->SetListener(&listener);
    };
    RunToTheEnd();
    EXPECT_EQ(-1, fd->GetFd());
}

TEST_F(FdTest, WhatCannotBeWatched) {
    FunctionListener listener([&] { script.trace.Add("called"); });
    script.start = [&] {
        fd->SetListener(&listener);
        EXPECT_FALSE(fd->SetFd(-1, RoxFd::eventReadableG));
        EXPECT_FALSE(fd->SetFd(1000000, RoxFd::eventReadableG));
        const int file = open("/etc/passwd", O_RDONLY | O_CLOEXEC);
        EXPECT_FALSE(fd->SetFd(file, RoxFd::eventReadableG));
        close(file);
        EXPECT_EQ(-1, fd->GetFd());
        const ref<RoxFd> first(new (&pool) RoxFd);
        FunctionListener firstListener([] {});
        first->SetListener(&firstListener);
        EXPECT_TRUE(Watch(*first, eventFd));
        EXPECT_FALSE(Watch(*fd, eventFd));
        first->ClearFd();
        first->ClearFd();
        EXPECT_TRUE(Watch(*fd, eventFd));
        EXPECT_FALSE(fd->SetFd(-1, RoxFd::eventReadableG));
        EXPECT_EQ(-1, fd->GetFd());
        Finish();
    };
    RunToTheEnd();
    EXPECT_EQ("start stop destroyed", script.trace.Get());
}

TEST_F(FdTest, DescriptorsAbove1024) {
    rlimit before{};
    getrlimit(RLIMIT_NOFILE, &before);
    rlimit raised = before;
    raised.rlim_cur = std::min<rlim_t>(4096, before.rlim_max);
    ASSERT_EQ(0, setrlimit(RLIMIT_NOFILE, &raised));
    const int high = fcntl(eventFd.Get(), F_DUPFD_CLOEXEC, 2000);
    ASSERT_GE(high, 2000);
    FunctionListener listener([&] { Finish(); });
    script.start = [&] {
        EXPECT_TRUE(fd->SetFd(high, RoxFd::eventReadableG));
        fd->SetListener(&listener);
    };
    RunToTheEnd();
    close(high);
    setrlimit(RLIMIT_NOFILE, &before);
}

// What the activity watches is let go when it ends, and may be watched by the next one.
TEST_F(FdTest, OutlivesItsActivity) {
    for (int round = 0; round < 2; ++round) {
        semaphores = Semaphores(&pool);
        FunctionListener listener([&] { Finish(); });
        script.start = [&] {
            EXPECT_TRUE(Watch(*fd, eventFd));
            fd->SetListener(&listener);
        };
        RunToTheEnd();
        EXPECT_EQ(-1, fd->GetFd());
        fd->ClearListener();
        fd->ClearFd();
    }
}

TEST_F(FdTest, ClosedBeforeItIsCleared) {
    FunctionListener listener([&] { script.trace.Add("called"); });
    script.start = [&] {
        const int closed = eventfd(0, EFD_CLOEXEC);
        fd->SetFd(closed, RoxFd::eventReadableG);
        fd->SetListener(&listener);
        close(closed);
        fd->ClearListener();
        fd->ClearFd();
        Finish();
    };
    RunToTheEnd();
    EXPECT_EQ("start stop destroyed", script.trace.Get());
}

TEST_F(FdTest, ClosedBeforeItHasAListener) {
    FunctionListener listener([&] { script.trace.Add("called"); });
    script.start = [&] {
        const int closed = eventfd(0, EFD_CLOEXEC);
        EXPECT_TRUE(fd->SetFd(closed, RoxFd::eventReadableG));
        close(closed);
        fd->SetListener(&listener);
        EXPECT_EQ(-1, fd->GetFd());
        Finish();
    };
    RunToTheEnd();
    EXPECT_EQ("start stop destroyed", script.trace.Get());
}

TEST_F(FdDeathTest, WrongUseEndsTheProcess) {
    EXPECT_DEATH(Watch(*fd, eventFd), "SetFd outside of an activity's thread");
    EXPECT_DEATH(fd->SetFd(eventFd.Get(), 1), "for reading only");
    const auto watch = [&] {
        script.start = [&] { Watch(*fd, eventFd); };
        Run();
    };
    EXPECT_DEATH(
        {
            watch();
            fd->ClearFd();
        },
        "changed outside of its activity's thread");
    EXPECT_DEATH(
        {
            watch();
            fd->ClearListener();
        },
        "changed outside of its activity's thread");
    EXPECT_DEATH(
        {
            watch();
            fd = nullptr;
        },
        "changed outside of its activity's thread");
}

}  // namespace
