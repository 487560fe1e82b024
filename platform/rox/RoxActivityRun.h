#pragma once

#include <atomic>

#include "rox/RoxMutex.h"
#include "rox/RoxSemaphoreState.h"
#include "rox/RoxSemaphoreWatcher.h"
#include "rox/RoxThread.h"
#include "rox/ref.h"

struct sd_event;
class RoxActivity;
class RoxFd;

/// The life of one activity on its thread. It lies on the general heap and outlives the activity: its thread
/// holds it, and so does the semaphore `stop`, whose watcher it is.
class RoxActivityRun : public RoxSemaphoreWatcher {
 public:
    /// Holds the activity until the run ends. The semaphores may be null.
    RoxActivityRun(RoxActivity* activity, const ref<RoxSemaphoreState>& stop,
                   const ref<RoxSemaphoreState>& stopped, const ref<RoxSemaphoreState>& started);
    ~RoxActivityRun() override;

    /// Of the calling thread; null where no activity runs.
    static RoxActivityRun* Current();
    /// Whether the semaphore is the one by which the activity on the calling thread tells that it has ended.
    static bool FEndsHere(const RoxSemaphoreState& semaphore);
    /// Ends all activities and waits until they have ended, but not for the one on the calling thread.
    static void EndAll();

    /// Starts the thread. Once.
    void Start();
    /// As RoxActivity::Done.
    void End();
    /// As RoxActivity::SetPriority.
    void SetPriority(RoxThread::Priority priority);
    /// `stop` was released.
    void SemaphoreReleased() override;

    // On the run's own thread:
    RoxActivity* GetActivity() const;
    sd_event* GetEvent() const { return pEventM; }
    /// No listener is called any more.
    bool FEnding() const { return fEndM.load(std::memory_order_acquire); }
    void Enlist(RoxFd* fd);
    void Delist(RoxFd* fd);

    /// The next one of its creation scope.
    ref<RoxActivityRun> nextCreatedM;

 private:
    static void ThreadMain(void* run);
    void Run();
    void OpenLoop();
    void Loop();
    void CloseLoop();
    void TellEnd();
    void Enter();
    void Leave();
    void Check(int result, const char* what) const;

    ref<RoxActivity> activityM;
    ref<RoxSemaphoreState> stopM;  // until the start, which makes this its watcher
    const ref<RoxSemaphoreState> stoppedM;
    const ref<RoxSemaphoreState> startedM;
    RoxThread::Priority priorityM = RoxThread::PRIORITY_NORMAL;
    sd_event* pEventM = nullptr;
    RoxFd* pFirstFdM = nullptr;
    std::atomic<bool> fEndM{false};

    RoxMutex mutexM{1};  // guards the rest
    int wakeFdM = -1;    // readable when another thread has set fEndM; only while the loop runs
    bool fEndedM = false;
    unsigned nAskedM = 0;     // releases of `stop`
    unsigned nAnsweredM = 0;  // releases of `stopped`

    // Place in the list of all that run.
    RoxActivityRun* pNextM = nullptr;
    RoxActivityRun** ppThisM = nullptr;
};
