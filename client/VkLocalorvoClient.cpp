#include "client/VkLocalorvoClient.h"

#include "client/BusTypeLibrary.h"
#include "client/ClientLockLevel.h"
#include "client/DeliveryOfThread.h"
#include "client/MonitoringActivity.h"
#include "rox/RoxMonotonicTime.h"
#include "rox/RoxMutexHold.h"
#include "rox/RoxSpinLockHold.h"
#include "rox/RoxWorkStack.h"
#include "sorn/model/InternedString.h"
#include "sorn/rpc/CancelWrapper.h"
#include "vkbus/LqxIpc.h"
#include "vkbus/VkBus.h"

using sorn::CancelWrapper;

namespace {

VkLocalorvoClient* singletonG = nullptr;  // with a reference
RoxSpinLock singletonLockG(ClientLockLevel::singletonG);

RoxInitInfo* const vDependenciesG[] = {&RoxActivity::initInfo, &LqxIpc::initInfo};

/// The client whose lifecycle this thread holds.
thread_local const VkLocalorvoClient* lifecycleOwnerG = nullptr;

}  // namespace

std::atomic<VkLocalorvoClient::Observer> VkLocalorvoClient::observerG{nullptr};

RoxInitInfo VkLocalorvoClient::initInfo("VkLocalorvoClient", &VkLocalorvoClient::Create,
                                        &VkLocalorvoClient::Destroy, 2, vDependenciesG, 0, nullptr);

/// Connecting and disconnecting is one thread's work at a time. A thread that comes here while it is at it,
/// out of a bus that calls back at once, has nothing to do.
class VkLocalorvoClient::Lifecycle {
 public:
    explicit Lifecycle(VkLocalorvoClient& client)
        : clientM(client), isNestedM(lifecycleOwnerG == &client), pOuterM(lifecycleOwnerG) {
        if (isNestedM) return;
        client.lifecycleMutexM.Acquire();
        lifecycleOwnerG = &client;
    }
    ~Lifecycle() {
        if (isNestedM) return;
        lifecycleOwnerG = pOuterM;
        clientM.lifecycleMutexM.Release();
    }
    Lifecycle(const Lifecycle&) = delete;
    Lifecycle& operator=(const Lifecycle&) = delete;

    bool FNested() const { return isNestedM; }
    static bool FHeldHere(const VkLocalorvoClient* client) { return lifecycleOwnerG == client; }

 private:
    VkLocalorvoClient& clientM;
    bool isNestedM;
    const VkLocalorvoClient* pOuterM;
};

VkLocalorvoClient::VkLocalorvoClient()
    : requestTableM(GetMempool(), 10, roxMempoolUserSorn),
      responseTableM(GetMempool(), 10, roxMempoolUserSorn),
      callbackTableM(GetMempool(), 10, roxMempoolUserSorn),
      contextTableM(GetMempool(), 10, roxMempoolUserSorn),
      clientMutexM(ClientLockLevel::clientG),
      tablesLockM(ClientLockLevel::tablesG),
      lifecycleMutexM(ClientLockLevel::lifecycleG) {}

VkLocalorvoClient::~VkLocalorvoClient() = default;

unsigned VkLocalorvoClient::Create(RoxMempool* pool) {
    RoxSpinLockHold hold(singletonLockG);
    if (singletonG != nullptr) return 0;
    singletonG = new (pool) VkLocalorvoClient;
    singletonG->UpRef();
    return 0;
}

void VkLocalorvoClient::Destroy() {
    sorn::DestroyGlobalSornHashTable();
    VkLocalorvoClient* client = nullptr;
    {
        RoxSpinLockHold hold(singletonLockG);
        std::swap(client, singletonG);
    }
    if (client == nullptr) return;
    client->End();
    RoxCore::DownRef(client);
}

void VkLocalorvoClient::End() {
    {
        RoxSpinLockHold hold(tablesLockM);
        isEndedM = true;
    }
    Disconnect();
    // A sender that handled events itself may be in a callback still.
    if (!DeliveryOfThread::FInside()) RoxMutexHold hold(clientMutexM);
}

ref<VkLocalorvoClient> VkLocalorvoClient::Get() {
    ref<VkLocalorvoClient> client;
    {
        RoxSpinLockHold hold(singletonLockG);
        client = ref<VkLocalorvoClient>(singletonG);
    }
    if (client != nullptr && !client->FConnected()) client->Connect();
    return client;
}

void VkLocalorvoClient::SetObserver(Observer observer) {
    observerG = observer;
}

void VkLocalorvoClient::Observe(bool isSent, const void* bytes, unsigned nBytes) {
    if (const Observer observer = observerG) observer(isSent, static_cast<const char*>(bytes), nBytes);
}

VkLocalorvoClient::Handles VkLocalorvoClient::GetHandles() {
    RoxSpinLockHold hold(tablesLockM);
    return {connectionM, sessionM};
}

void VkLocalorvoClient::SetHandles(uint32_t connection, uint32_t session) {
    RoxSpinLockHold hold(tablesLockM);
    connectionM = connection;
    sessionM = session;
}

bool VkLocalorvoClient::FConnected() {
    const Handles handles = GetHandles();
    return handles.connection != 0 && handles.session != 0;
}

bool VkLocalorvoClient::FEnded() {
    RoxSpinLockHold hold(tablesLockM);
    return isEndedM;
}

bool VkLocalorvoClient::Connect() {
    Semaphores semaphores;
    {
        Lifecycle lifecycle(*this);
        if (lifecycle.FNested()) return false;
        if (FConnected()) return true;
        if (FEnded()) return false;
        const int64_t start = RoxMonotonicTime::Now();
        if (TryConnect()) return true;
        semaphores = StopMonitoring();
        CancelPending(1, start);
        Close();
    }
    AwaitEnd(semaphores);
    return false;
}

/// One attempt. Nobody else knows the connection before it has a session, so nobody handles its events: the
/// bus calls nothing back here.
bool VkLocalorvoClient::TryConnect() {
    uint32_t connection = 0;
    uint32_t session = 0;
    if (VkBusOpenNamedConnection(busTypeLibrary, "VkLocalorvoClient", &connection) != 0) return false;
    if (VkBusOpenSession(connection, VkAesQueryProtocol::idG, VkAesQueryProtocol::checksumG, &OnBusEvent,
                         &OnBusClosed, this, 0, &session) != 0) {
        VkBusCloseConnection(connection);
        return false;
    }
    const VkAesHello hello = {0};
    const bool isGreeted = VkBusMarshalAndSend(session, VkAesHello::idG, &hello) == 0;
    SetHandles(connection, session);  // others may send from now on
    return isGreeted;
}

void VkLocalorvoClient::Disconnect() {
    if (Lifecycle::FHeldHere(this)) return;
    for (;;) {
        // Not under the lifecycle's lock: the activity may be on its way here.
        AwaitEnd(StopMonitoring());
        Lifecycle lifecycle(*this);
        if (FMonitored()) continue;  // again, by another thread
        CancelPending(0, RoxMonotonicTime::Now());
        Close();
        return;
    }
}

/// Sends a cancel for every request that is pending now, whatever comes of it, and removes the request.
/// Without a connection each makes attempts to get one, which would again cancel all that is pending if they
/// fail; so all of that is one loop, which gives up after maxConnectAttemptsG attempts in a row, nAttempts of
/// them made before, and when teardownLimitG has passed since `start`.
void VkLocalorvoClient::CancelPending(unsigned nAttempts, int64_t start) {
    RoxWorkStack<uint32_t, 16> pending(GetMempool());
    {
        RoxSpinLockHold hold(tablesLockM);
        for (_RoxHashTableIter iter(requestTableM); iter.FCurrent(); iter.Next()) {
            pending.Push(requestTableM.KeyOf(iter));
        }
    }
    const auto isLate = [start] {
        return RoxMonotonicTime::ToNanoseconds(RoxMonotonicTime::Now() - start) >= teardownLimitG;
    };
    for (size_t i = 0; i < pending.Size() && !isLate(); ++i) {
        const uint32_t rpcId = pending[i];
        if (FindRequest(rpcId) == nullptr) continue;  // it has ended by itself
        while (!FConnected()) {
            if (nAttempts == maxConnectAttemptsG || isLate()) return;
            ++nAttempts;
            TryConnect();
        }
        nAttempts = 0;
        if (!ignoreAllM) Transmit(CancelWrapper::New(GetMempool(), rpcId, nullptr), GetHandles().session);
        RemoveRequest(rpcId);
    }
}

/// What the tables held dies when the lock is no longer held.
void VkLocalorvoClient::ClearTables() {
    RoxWorkStack<RoxCore*, 16> dying(GetMempool());
    {
        RoxSpinLockHold hold(tablesLockM);
        const auto keep = [&dying](auto& table) {
            for (_RoxHashTableIter iter(table); iter.FCurrent(); iter.Next()) {
                auto* const value = table.ValueOf(iter).get();
                value->UpRef();
                dying.Push(value);
            }
            table.Clear();
        };
        keep(requestTableM);
        keep(responseTableM);
        callbackTableM.Clear();
        contextTableM.Clear();
    }
    for (; !dying.FEmpty(); dying.Pop()) RoxCore::DownRef(dying.Top());
}

/// Forgets the handles before it clears the tables: what a sender stores afterwards is not sent on them.
void VkLocalorvoClient::Close() {
    const Handles handles = GetHandles();
    SetHandles(0, 0);
    ClearTables();
    MonitoringActivity::EndWatchOfThread();
    if (handles.session != 0) VkBusCloseSession(handles.session);
    if (handles.connection != 0) VkBusCloseConnection(handles.connection);
}

bool VkLocalorvoClient::FMonitored() {
    RoxSpinLockHold hold(tablesLockM);
    return semaphoresM.stop != nullptr;
}

/// Not without a connection, which may be lost again by now, and the request with it. An activity belongs to
/// the connection that stands when it is made.
void VkLocalorvoClient::StartMonitoring() {
    if (FMonitored()) return;
    Semaphores made{ref<RoxCoreSemaphore>(new (GetMempool()) RoxCoreSemaphore(0)),
                    ref<RoxCoreSemaphore>(new (GetMempool()) RoxCoreSemaphore(0)),
                    ref<RoxCoreSemaphore>(new (GetMempool()) RoxCoreSemaphore(0))};
    {
        Lifecycle lifecycle(*this);
        if (!FConnected()) return;
        {
            RoxSpinLockHold hold(tablesLockM);
            isMonitoringDueM = isPumpedM;
            if (isPumpedM || semaphoresM.stop != nullptr) return;
            semaphoresM = made;
        }
        RoxActivity::CreationScopePrivate scope;
        new (GetMempool())
            MonitoringActivity(ref<VkLocalorvoClient>(this), made.stop, made.stopped, made.started);
    }
    made.started->Acquire();
}

/// Asks the activity to end, if there is one; the caller waits for that with what this gives.
VkLocalorvoClient::Semaphores VkLocalorvoClient::StopMonitoring() {
    Semaphores taken;
    {
        RoxSpinLockHold hold(tablesLockM);
        std::swap(taken, semaphoresM);
        isMonitoringDueM = false;
    }
    if (taken.stop != nullptr) taken.stop->Release();
    return taken;
}

/// Waits until the activity has ended, if there was one; but not in a callback, which may be what the
/// activity waits for: it ends by itself then.
void VkLocalorvoClient::AwaitEnd(const Semaphores& semaphores) {
    if (semaphores.stopped != nullptr && !DeliveryOfThread::FInside()) semaphores.stopped->Acquire();
}
