#pragma once

#include <gtest/gtest.h>
#include <sys/eventfd.h>
#include <unistd.h>

#include <functional>
#include <mutex>
#include <string>

#include "DeathTestStyle.h"
#include "rox/RoxActivity.h"
#include "rox/RoxFd.h"
#include "rox/RoxListenerInterface.h"
#include "rox/RoxMempool.h"
#include "support/Watchdog.h"

/// Words of several threads in the order in which they came.
class Trace {
 public:
    void Add(const std::string& word) {
        std::lock_guard<std::mutex> lock(mutexM);
        wordsM += (wordsM.empty() ? "" : " ") + word;
    }
    std::string Get() {
        std::lock_guard<std::mutex> lock(mutexM);
        return wordsM;
    }

 private:
    std::mutex mutexM;
    std::string wordsM;
};

/// A descriptor that is readable whenever it was told to be.
class EventFd {
 public:
    EventFd() : fdM(eventfd(0, EFD_CLOEXEC | EFD_NONBLOCK)) {}
    EventFd(const EventFd&) = delete;
    EventFd& operator=(const EventFd&) = delete;
    ~EventFd() { close(fdM); }

    int Get() const { return fdM; }
    void Set() { eventfd_write(fdM, 1); }
    void Clear() {
        eventfd_t value = 0;
        eventfd_read(fdM, &value);
    }

 private:
    int fdM;
};

/// Calls a function of the test.
class FunctionListener : public RoxListenerInterface<RoxFdEvent> {
 public:
    explicit FunctionListener(std::function<void()> function)
        : RoxListenerInterface(&Forward), functionM(std::move(function)) {}

 private:
    static void Forward(RoxListenerInterface* self) { static_cast<FunctionListener*>(self)->functionM(); }

    std::function<void()> functionM;
};

/// The semaphores of one activity.
struct Semaphores {
    explicit Semaphores(RoxMempool* pool)
        : stop(new (pool) RoxCoreSemaphore(0)),
          stopped(new (pool) RoxCoreSemaphore(0)),
          started(new (pool) RoxCoreSemaphore(0)) {}

    void Stop() {
        stop->Release();
        stopped->Acquire();
    }

    ref<RoxCoreSemaphore> stop, stopped, started;
};

/// What a test wants to happen in its activity. It outlives the activity.
struct Script {
    Trace trace;
    std::function<void()> start = [] {};
    std::function<void()> stop = [] {};
    std::function<void()> destroyed = [] {};
};

class TestActivity : public RoxActivity {
 public:
    TestActivity(Script& script, const Semaphores& semaphores, const char* name = "TestActivity")
        : RoxActivity(name, nullptr, semaphores.stop, semaphores.stopped, nullptr, semaphores.started),
          scriptM(script) {}
    ~TestActivity() override {
        scriptM.trace.Add("destroyed");
        scriptM.destroyed();
    }

    void ActivityStart() override {
        scriptM.trace.Add("start");
        scriptM.start();
    }
    void ActivityStop() override {
        scriptM.trace.Add("stop");
        scriptM.stop();
    }

 private:
    Script& scriptM;
};

/// A pool, a script and semaphores, and the watchdog over all of it. No activity is left when a test ends.
class ActivityFixture : public ::testing::Test {
 protected:
    ActivityFixture() { UseDeathTestStyleForThreads(); }
    ~ActivityFixture() override {
        RoxInitInfo::StartAll(nullptr);
        RoxInitInfo::StopAll();
    }

    /// Returns when the activity runs.
    void Run() {
        {
            RoxActivity::CreationScopePrivate scope;
            new (&pool) TestActivity(script, semaphores);
        }
        semaphores.started->Acquire();
    }

    Watchdog watchdog;
    RoxMempool pool{"activities"};
    Script script;
    Semaphores semaphores{&pool};
    EventFd eventFd;
};
