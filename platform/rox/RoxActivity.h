#pragma once

#include <cstdint>

#include "rox/RoxCore.h"
#include "rox/RoxCoreSemaphore.h"
#include "rox/RoxInitInfo.h"
#include "rox/RoxString.h"
#include "rox/RoxThread.h"
#include "rox/ref.h"

class RoxActivityRun;

/// A unit of work with a thread and an event loop of its own. A derived class says what happens at the start
/// and at the end; between the two the loop calls the listeners of the descriptors (RoxFd) that it watches.
///
///     creating thread          RoxActivity::CreationScopePrivate scope;
///                              new (pool) MyActivity(...);            // the runtime holds it
///     scope closes             the thread starts
///     on the thread            ActivityStart, `started` is released, listeners ..., ActivityStop
///     `stop` released, Done    no listener is called after the one that runs
///     at the end               descriptors are cleared, the runtime drops its reference, `stopped` is
///     released
///
/// The pool of an activity, and what its ActivityStop and destructor need, have to live until `stopped` could
/// be acquired on another thread, or RoxInitInfo::StopAll has returned. The semaphores themselves need not.
class RoxActivity : public RoxCore {
 public:
    /// Lives around the creation of activities, on one thread; they start when it ends, in the order of their
    /// creation, so that all constructors have finished. Scopes may be nested.
    class CreationScopePrivate {
     public:
        CreationScopePrivate();
        ~CreationScopePrivate();
        CreationScopePrivate(const CreationScopePrivate&) = delete;
        CreationScopePrivate& operator=(const CreationScopePrivate&) = delete;

     private:
        friend class RoxActivity;
        void Add(const ref<RoxActivityRun>& run);

        CreationScopePrivate* pOuterM;
        ref<RoxActivityRun> firstM;
        ref<RoxActivityRun>* pEndM;
    };

    /// The module of activities: one that uses them depends on it. Its stop ends all activities that still
    /// run and waits until they have ended, but not for the caller's own.
    static RoxInitInfo initInfo;

    /// The activity on whose thread the caller is; null on other threads.
    static RoxActivity* Current();

    /// Ends the activity: no listener is called after the one that runs. Any thread, any time, any number of
    /// times.
    void Done();
    /// In the constructor, or later on the activity's own thread. NORMAL is the default.
    void SetPriority(RoxThread::Priority priority);

    const RoxString& GetName() const { return nameM; }
    RoxInitInfo* GetInitInfo() const { return pInitInfoM; }

 protected:
    /// Only inside a CreationScopePrivate. `module` is what the activity belongs to, or null. Each
    /// semaphore may be null.
    ///
    /// Releasing `stop` ends the activity; it belongs to this activity alone. Each release is answered by one
    /// of `stopped`: when the activity has ended; but at once if it has already, and at once on the
    /// activity's own thread, which goes on and ends when the listener returns. So nobody who releases `stop`
    /// and acquires `stopped` waits for himself. An activity that ends by itself releases `stopped` for the
    /// first to ask. `reserved` is not used.
    RoxActivity(const char* name, RoxInitInfo* module, const ref<RoxCoreSemaphore>& stop,
                const ref<RoxCoreSemaphore>& stopped, const ref<RoxCoreSemaphore>& reserved,
                const ref<RoxCoreSemaphore>& started);
    ~RoxActivity() override;

 public:
    // The order of the virtual operations is that of the platform's table. All are called on the activity's
    // thread.
    void* VkCastHelper(const void* classTag) override;
    /// The first and the last call on the thread. Do nothing here.
    virtual void ActivityStart();
    virtual void ActivityStop();
    // What an activity will need, for a runtime that plans with it; this one does not ask. Times in
    // milliseconds; 0 says nothing.
    virtual int64_t IdleTimeoutHint();
    virtual unsigned CallMeCountHint();
    virtual unsigned FdCountHint();
    virtual unsigned SemaphoreCountHint();
    virtual unsigned TimerCountHint();
    virtual int64_t BlockedTimeoutHint();
    virtual int64_t FrozenTimeoutHint();
    /// Around each call of a listener. Do nothing here.
    virtual void BeforeCallbacksRun();
    virtual void AfterCallbacksRun();

    static const char classTagG;

 private:
    RoxString nameM;
    RoxInitInfo* pInitInfoM;
    ref<RoxActivityRun> runM;
};
