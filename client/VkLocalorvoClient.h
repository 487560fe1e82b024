#pragma once

#include <atomic>
#include <cstdint>

#include "rox/RoxCore.h"
#include "rox/RoxCoreSemaphore.h"
#include "rox/RoxHashIntToCore.h"
#include "rox/RoxHashIntToPointer.h"
#include "rox/RoxInitInfo.h"
#include "rox/RoxMutex.h"
#include "rox/RoxSpinLock.h"
#include "rox/RoxString.h"
#include "rox/ref.h"
#include "sorn/lazy/LazyDict.h"
#include "sorn/model/SornObject.h"
#include "sorn/rpc/OrvoRpcWrapper.h"
#include "sorn/rpc/RequestWrapper.h"
#include "sorn/rpc/ResponseWrapper.h"

/// The process's one client of the local service: sends records as requests, and gives the responses to
/// whoever waits or to callbacks.
///
/// It has no thread as long as nobody asks for callbacks: a synchronous sender handles the events of the bus
/// itself. The first successful asynchronous send starts an activity that does. It connects when it is got or
/// sends, and again after a loss; creating it connects nothing.
///
/// All operations may be called from any thread and from callbacks, but that a callback cannot wait for a
/// response: SendRequestSync is false there. A lost connection ends all exchanges, and nobody is told.
/// Nothing is logged.
class VkLocalorvoClient : public RoxCore {
 public:
    /// What a callback gets: the number of the request, whether it was the last response, and the body as
    /// JSON text, which is valid only during the call. It runs on the thread that handles the event.
    using Callback = void (*)(unsigned int rpcId, bool isFinal, const char* json);
    using ContextCallback = void (*)(unsigned int rpcId, bool isFinal, const char* json, void* context);

    /// As a module of the process: Create, Destroy, after the activities and the bus.
    static RoxInitInfo initInfo;

    /// Makes the client in the pool, which must outlive it, unless there is one. Always 0.
    static unsigned Create(RoxMempool* pool);
    /// Ends the table of shared names (DestroyGlobalSornHashTable) in any case, and the client if there is
    /// one: cancels what is pending and disconnects. The object sends nothing any more for whoever still
    /// holds it. No callback runs afterwards, but one that this is called from, or that has ended the
    /// connection itself, goes on, and so does its thread: the pool must outlive that, too, which the stop of
    /// the activities' module (RoxInitInfo::StopAll) waits for.
    static void Destroy();
    /// The client; null before Create. Connects if it is not connected; whether that worked does not show.
    static ref<VkLocalorvoClient> Get();

    /// Sends and receives nothing from now on, for the rest of the object's life.
    void IgnoreAllRequests() { ignoreAllM = true; }

    // Sending. The object is borrowed and not null; the request holds a reference of its own. A request
    // states the default schema version, or the last one with the feature VK_FEATURE_LAST_SCHEMA_VERSION. Its
    // number is the last one's plus 1, from 1 on, and is spent when the send fails. False when the message
    // was not handed to the bus: no connection, or too large.

    /// No response is expected; one that comes is dropped.
    bool SendRequestAndForget(sorn::SornObject* object);
    /// Waits up to 5 seconds for the one response, after connecting where that is needed, for which a service
    /// that takes a connection and never answers may take as long each time it is tried. True does not
    /// promise one: look at `response`, too, which is as it was when what came in the wait was something
    /// else. A response that comes later is dropped.
    bool SendRequestSync(sorn::SornObject* object, ref<sorn::LazyDict>& response);
    /// The same; the response as an object, of type "error" when it does not convert. Null without a
    /// response.
    ref<sorn::SornObject> SendRequestSync(sorn::SornObject* object);
    /// Gives one response or, with `multipleResponses`, all up to a final one to the callback, which may run
    /// before the send returns. `rpcId` is the number for updates and the cancel; it is as it was on failure.
    /// There is no time limit. A null callback keeps the request pending and drops nothing.
    bool SendRequestAsync(sorn::SornObject* object, bool multipleResponses, Callback callback,
                          unsigned int& rpcId);
    /// The same; a null context makes the call the one without.
    bool SendRequestAsync(sorn::SornObject* object, bool multipleResponses, ContextCallback callback,
                          void* context, unsigned int& rpcId);
    /// Both of them: the callback is the one with a context if that is not null.
    bool SendRequestAsyncInternal(sorn::SornObject* object, bool multipleResponses, void* callback,
                                  void* context, unsigned int& rpcId);
    /// A new query for a pending request; false, too, when none has that number. States no version.
    bool SendUpdateRequest(unsigned int rpcId, sorn::SornObject* object);
    /// Ends a pending request that has many responses; false, and nothing is sent, for any other. The
    /// callback is not called for what comes later, whether the send worked or not; but another thread that
    /// has a response in hand already may still call it.
    bool CancelRequest(unsigned int rpcId);
    /// Whether a response of that number would still find its request. The way to see that a lost connection
    /// has ended an exchange.
    bool FPending(unsigned int rpcId);

    /// Is told of every message, on the thread that sends it or handles its event: the bytes as they go to
    /// the bus or came from it, valid during the call. For programs that show what passes; null, as at the
    /// start, for nobody. To be set while the client is not used.
    using Observer = void (*)(bool isSent, const char* bytes, unsigned nBytes);
    static void SetObserver(Observer observer);

    /// Milliseconds between two looks of a waiter at what another thread receives.
    static constexpr long long pollMillisecondsG = 50;
    /// Nanoseconds that a synchronous sender waits.
    static constexpr int64_t waitLimitG = 5'000'000'000;
    /// Attempts in a row to connect for the sake of telling a cancel; then pending requests are dropped.
    static constexpr unsigned maxConnectAttemptsG = 1000;
    /// Nanoseconds after which a teardown tells no more cancels and makes no more attempts: a service that
    /// takes a connection and then neither answers nor reads holds up each for seconds.
    static constexpr int64_t teardownLimitG = 10'000'000'000;

    ~VkLocalorvoClient() override;

 private:
    friend class MonitoringActivity;
    friend struct VkLocalorvoClientProbe;  // of the tests

    /// The three semaphores of the monitoring activity: all or none.
    struct Semaphores {
        ref<RoxCoreSemaphore> stop;
        ref<RoxCoreSemaphore> stopped;
        ref<RoxCoreSemaphore> started;
    };
    /// What came of a message: the bus has it, it was not to be sent, or the bus failed.
    enum Sent { DONE, REFUSED, FAILED };
    struct Handles {
        uint32_t connection;
        uint32_t session;
    };
    class Lifecycle;

    VkLocalorvoClient();

    // Lifecycle.
    void End();
    bool Connect();
    void Disconnect();
    bool TryConnect();
    void CancelPending(unsigned nAttempts, int64_t start);
    void ClearTables();
    void Close();
    void StartMonitoring();
    Semaphores StopMonitoring();
    static void AwaitEnd(const Semaphores& semaphores);
    bool FMonitored();
    Handles GetHandles();
    bool FConnected();
    bool FEnded();
    void SetHandles(uint32_t connection, uint32_t session);

    static void Observe(bool isSent, const void* bytes, unsigned nBytes);

    // Sending.
    uint32_t NewRpcId();
    static sorn::OrvoVersion PickVersion();
    bool SendWrapper(const ref<sorn::OrvoRpcWrapper>& wrapper);
    bool SendPending(const ref<sorn::RequestWrapper>& request, void* callback, void* context);
    Sent Transmit(const ref<sorn::OrvoRpcWrapper>& wrapper, uint32_t session);
    void HandleLoss();
    bool BeginPump();
    void EndPump();
    bool WaitForResponse(uint32_t rpcId);
    bool PollForResponse(uint32_t rpcId, int64_t start);
    bool PumpForResponse(uint32_t rpcId, int64_t limit, bool& goesOn);
    bool FHasResponse(uint32_t rpcId);
    ref<sorn::ResponseWrapper> TakeResponse(uint32_t rpcId);
    ref<sorn::RequestWrapper> FindRequest(uint32_t rpcId);
    uint32_t StoreRequest(const ref<sorn::RequestWrapper>& request, void* callback, void* context);
    void RemoveRequest(uint32_t rpcId);

    // The way back.
    static unsigned OnBusEvent(uint32_t session, uintptr_t word1, uintptr_t word2, void* client);
    static void OnBusClosed(uint32_t session, uintptr_t reason, void* client);
    bool TakeEvent(uintptr_t word1, uintptr_t word2);
    void HandleMessage(const ref<sorn::OrvoRpcWrapper>& message);
    void Deliver(const ref<sorn::ResponseWrapper>& response);

    static std::atomic<Observer> observerG;

    uint32_t connectionM = 0;
    uint32_t sessionM = 0;
    uint32_t lastRpcIdM = 0;
    RoxHashIntToCore<sorn::RequestWrapper> requestTableM;    // that still expect a response
    RoxHashIntToCore<sorn::ResponseWrapper> responseTableM;  // that wait for a synchronous sender
    RoxHashIntToPointer<void> callbackTableM;                // of asynchronous requests
    RoxHashIntToPointer<void> contextTableM;                 // of those that have one
    Semaphores semaphoresM;
    RoxMutex clientMutexM;  // of the receiving side: held while a callback runs
    std::atomic<bool> ignoreAllM{false};
    bool isEndedM = false;          // by Destroy: connects no more
    bool isPumpedM = false;         // a sender handles events, and nobody else
    bool isMonitoringDueM = false;  // as soon as it has done so

    // The members above but the mutex are the leaf lock's, which is never held across an operation of the bus
    // or a callback. The lifecycle's lock is held across connecting and disconnecting, never while waiting
    // for the activity, and never where the bus calls back.
    RoxSpinLock tablesLockM;
    RoxMutex lifecycleMutexM;
};
