#include <gtest/gtest.h>

#include <atomic>
#include <memory>
#include <thread>

#include "TestActivity.h"

namespace {

/// An activity that watches one descriptor.
class ActivityStopTest : public ActivityFixture {
 protected:
    /// With a listener that is called as soon as the activity runs.
    void RunWith(std::function<void()> onReady) {
        listener = std::make_unique<FunctionListener>([this, onReady] {
            script.trace.Add("ready");
            eventFd.Clear();
            onReady();
        });
        script.start = [this] {
            fd->SetFd(eventFd.Get(), RoxFd::eventReadableG);
            fd->SetListener(listener.get());
        };
        script.destroyed = [this] { destroyed.Release(); };
        eventFd.Set();
        Run();
    }
    void StopHere() {
        semaphores.Stop();
        script.trace.Add("went-on");
    }
    bool FAnotherStopped() { return semaphores.stopped->TryAcquire(); }

    ref<RoxFd> fd{new (&pool) RoxFd};
    std::unique_ptr<FunctionListener> listener;
    RoxInternalSemaphore destroyed{0};
};

TEST_F(ActivityStopTest, ByDoneInAListener) {
    RunWith([] {
        RoxActivity::Current()->Done();
        RoxActivity::Current()->Done();
    });
    semaphores.stopped->Acquire();
    EXPECT_EQ("start ready stop destroyed", script.trace.Get());
    EXPECT_FALSE(FAnotherStopped());
}

TEST_F(ActivityStopTest, ByDoneAtTheStart) {
    script.start = [] { RoxActivity::Current()->Done(); };
    Run();
    semaphores.stopped->Acquire();
    EXPECT_EQ("start stop destroyed", script.trace.Get());
}

TEST_F(ActivityStopTest, ByDoneBeforeTheStart) {
    {
        RoxActivity::CreationScopePrivate scope;
        (new (&pool) TestActivity(script, semaphores))->Done();
    }
    semaphores.started->Acquire();
    semaphores.stopped->Acquire();
    EXPECT_EQ("start stop destroyed", script.trace.Get());
}

TEST_F(ActivityStopTest, ByDoneOnAnotherThread) {
    RoxActivity* activity = nullptr;
    RoxInternalSemaphore known(0);
    RunWith([&] {
        activity = RoxActivity::Current();
        known.Release();
    });
    known.Acquire();
    activity->Done();
    semaphores.stopped->Acquire();
    EXPECT_EQ("start ready stop destroyed", script.trace.Get());
}

// An activity that ended by itself leaves its semaphores as they are; who asks it to stop afterwards gets the
// answer.
TEST_F(ActivityStopTest, AfterDone) {
    RunWith([] { RoxActivity::Current()->Done(); });
    destroyed.Acquire();
    semaphores.Stop();
    EXPECT_FALSE(FAnotherStopped());
}

TEST_F(ActivityStopTest, BeforeTheScopeCloses) {
    {
        RoxActivity::CreationScopePrivate scope;
        new (&pool) TestActivity(script, semaphores);
        semaphores.stop->Release();
    }
    semaphores.started->Acquire();
    semaphores.stopped->Acquire();
    EXPECT_EQ("start stop destroyed", script.trace.Get());
    EXPECT_FALSE(FAnotherStopped());
}

// The answer comes at once, the listener goes on, and no other listener is called after it.
TEST_F(ActivityStopTest, OnTheOwnThreadInAListener) {
    EventFd otherEventFd;
    otherEventFd.Set();
    FunctionListener otherListener([&] { script.trace.Add("called-after-stop"); });
    const ref<RoxFd> other(new (&pool) RoxFd);
    RunWith([&] {
        EXPECT_TRUE(other->SetFd(otherEventFd.Get(), RoxFd::eventReadableG));
        other->SetListener(&otherListener);
        eventFd.Set();
        StopHere();
    });
    destroyed.Acquire();
    RoxInitInfo::StartAll(nullptr);
    RoxInitInfo::StopAll();
    EXPECT_EQ("start ready went-on stop destroyed", script.trace.Get());
    EXPECT_FALSE(FAnotherStopped());
}

TEST_F(ActivityStopTest, OnTheOwnThreadAtTheStart) {
    script.start = [&] { StopHere(); };
    script.destroyed = [&] { destroyed.Release(); };
    Run();
    destroyed.Acquire();
    EXPECT_EQ("start went-on stop destroyed", script.trace.Get());
    EXPECT_FALSE(FAnotherStopped());
}

TEST_F(ActivityStopTest, OnTheOwnThreadAtTheStop) {
    script.stop = [&] { StopHere(); };
    script.start = [] { RoxActivity::Current()->Done(); };
    script.destroyed = [&] { destroyed.Release(); };
    Run();
    destroyed.Acquire();
    EXPECT_EQ("start stop went-on destroyed", script.trace.Get());
}

TEST_F(ActivityStopTest, OnTheOwnThreadInTheDestructor) {
    script.destroyed = [&] {
        StopHere();
        destroyed.Release();
    };
    script.start = [] { RoxActivity::Current()->Done(); };
    Run();
    destroyed.Acquire();
    EXPECT_EQ("start stop destroyed went-on", script.trace.Get());
}

TEST_F(ActivityStopTest, OnTheOwnThreadTwice) {
    RunWith([&] {
        StopHere();
        StopHere();
    });
    destroyed.Acquire();
    EXPECT_EQ("start ready went-on went-on stop destroyed", script.trace.Get());
}

// As a client does that loses its connection in a callback: it lets go of the semaphores while the activity
// runs.
TEST_F(ActivityStopTest, OnTheOwnThreadAndTheSemaphoresGo) {
    RoxInternalSemaphore running(0);
    RunWith([&] {
        running.Acquire();
        semaphores.Stop();
        semaphores.stop = semaphores.stopped = semaphores.started = nullptr;
        script.trace.Add("let-go");
    });
    running.Release();
    destroyed.Acquire();
    EXPECT_EQ("start ready let-go stop destroyed", script.trace.Get());
}

// And starts another activity before its callback returns.
TEST_F(ActivityStopTest, OnTheOwnThreadAndAnotherStarts) {
    Script nextScript;
    Semaphores next(&pool);
    RunWith([&] {
        semaphores.Stop();
        {
            RoxActivity::CreationScopePrivate scope;
            new (&pool) TestActivity(nextScript, next);
        }
        next.started->Acquire();
        script.trace.Add("next-started");
    });
    destroyed.Acquire();
    EXPECT_EQ("start ready next-started stop destroyed", script.trace.Get());
    EXPECT_EQ("start", nextScript.trace.Get());
    next.Stop();
}

TEST_F(ActivityStopTest, TwiceFromOtherThreads) {
    Run();
    std::thread first([&] { semaphores.Stop(); });
    std::thread second([&] { semaphores.Stop(); });
    first.join();
    second.join();
    EXPECT_EQ("start stop destroyed", script.trace.Get());
    EXPECT_FALSE(FAnotherStopped());
    semaphores.Stop();
    semaphores.Stop();
    EXPECT_FALSE(FAnotherStopped());
}

// The other thread's stop came first and waits for this listener; the listener's own stop must not wait for
// itself.
TEST_F(ActivityStopTest, OnTheOwnThreadWhileAnotherThreadWaits) {
    RoxInternalSemaphore inListener(0);
    RoxInternalSemaphore asked(0);
    RunWith([&] {
        inListener.Release();
        asked.Acquire();
        StopHere();
    });
    inListener.Acquire();
    semaphores.stop->Release();
    asked.Release();
    semaphores.stopped->Acquire();
    destroyed.Acquire();
    EXPECT_EQ("start ready went-on stop destroyed", script.trace.Get());
}

// A stop from outside waits until the listener has returned and the activity is gone.
TEST_F(ActivityStopTest, FromAnotherThreadDuringAListener) {
    RoxInternalSemaphore inListener(0);
    RoxInternalSemaphore goOn(0);
    RunWith([&] {
        inListener.Release();
        goOn.Acquire();
    });
    inListener.Acquire();
    semaphores.stop->Release();
    EXPECT_FALSE(semaphores.stopped->AcquireFor(20));
    goOn.Release();
    semaphores.stopped->Acquire();
    EXPECT_EQ("start ready stop destroyed", script.trace.Get());
}

// The pool, with the activity and the semaphores in it, may end as soon as `stopped` is acquired.
TEST_F(ActivityStopTest, ThePoolMayEndRightAfter) {
    for (int round = 0; round < 300; ++round) {
        Script ownScript;
        RoxMempool ownPool("short-lived");
        Semaphores own(&ownPool);
        {
            RoxActivity::CreationScopePrivate scope;
            new (&ownPool) TestActivity(ownScript, own);
        }
        own.Stop();
        own.stop = own.stopped = own.started = nullptr;
        ASSERT_EQ(0u, ownPool.GetUsedBytes());
    }
}

TEST_F(ActivityStopTest, AllMomentsOfTwoThreads) {
    for (int round = 0; round < 300; ++round) {
        Script ownScript;
        EventFd ownEventFd;
        ownEventFd.Set();
        Semaphores own(&pool);
        RoxInternalSemaphore gone(0);
        const ref<RoxFd> ownFd(new (&pool) RoxFd);
        FunctionListener ownListener([&] { own.Stop(); });
        ownScript.start = [&] {
            ownFd->SetFd(ownEventFd.Get(), RoxFd::eventReadableG);
            ownFd->SetListener(&ownListener);
        };
        ownScript.destroyed = [&] { gone.Release(); };
        {
            RoxActivity::CreationScopePrivate scope;
            new (&pool) TestActivity(ownScript, own);
        }
        own.started->Acquire();
        own.Stop();
        gone.Acquire();
        RoxInitInfo::StartAll(nullptr);
        RoxInitInfo::StopAll();
        ASSERT_EQ("start stop destroyed", ownScript.trace.Get());
    }
}

}  // namespace
