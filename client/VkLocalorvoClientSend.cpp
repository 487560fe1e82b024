#include "client/BusTypeLibrary.h"
#include "client/DeliveryOfThread.h"
#include "client/VkLocalorvoClient.h"
#include "rox/RoxFeatures.h"
#include "rox/RoxMonotonicTime.h"
#include "rox/RoxMutexHold.h"
#include "rox/RoxSpinLockHold.h"
#include "rox/RoxThread.h"
#include "sorn/dict/ByteBuffer.h"
#include "sorn/model/Schema.h"
#include "sorn/rpc/CancelWrapper.h"
#include "sorn/rpc/OrvoRpcV2.h"
#include "sorn/rpc/RequestUpdateWrapper.h"
#include "vkbus/VkBus.h"

using sorn::CancelWrapper;
using sorn::OrvoRpcWrapper;
using sorn::RequestUpdateWrapper;
using sorn::RequestWrapper;
using sorn::ResponseWrapper;
using sorn::SornObject;

namespace {

/// Most events that a sender handles after a failed send.
constexpr unsigned maxEventsAtLossG = 1000;

}  // namespace

uint32_t VkLocalorvoClient::NewRpcId() {
    RoxSpinLockHold hold(tablesLockM);
    return ++lastRpcIdM;
}

sorn::OrvoVersion VkLocalorvoClient::PickVersion() {
    return RoxFeatures::FEnabled(VK_FEATURE_LAST_SCHEMA_VERSION) ? sorn::Schema::lastSchemaVersionG
                                                                 : sorn::Schema::defaultSchemaVersionG;
}

/// Connects before it looks whether anything is to be sent at all; users count on the connection.
bool VkLocalorvoClient::SendWrapper(const ref<OrvoRpcWrapper>& wrapper) {
    if (!FConnected() && !Connect()) return false;
    if (ignoreAllM) return false;
    const Sent sent = Transmit(wrapper, GetHandles().session);
    if (sent == FAILED) HandleLoss();
    return sent == DONE;
}

/// The same for a request that is pending from before the send, since the response may be there before that
/// returns. Again when the connection stands: a loss on another thread may have ended it meanwhile.
bool VkLocalorvoClient::SendPending(const ref<RequestWrapper>& request, void* callback, void* context) {
    StoreRequest(request, callback, context);
    Sent sent = REFUSED;
    if ((FConnected() || Connect()) && !ignoreAllM) {
        sent = Transmit(request, StoreRequest(request, callback, context));
    }
    if (sent == DONE) return true;
    RemoveRequest(request->GetRpcId());
    if (sent == FAILED) HandleLoss();
    return false;
}

VkLocalorvoClient::Sent VkLocalorvoClient::Transmit(const ref<OrvoRpcWrapper>& wrapper, uint32_t session) {
    sorn::ByteBuffer text(GetMempool());
    RoxString error;
    unsigned begin = 0;
    if (!sorn::OrvoRpcV2::MarshalInPlace(wrapper, text, begin, error, GetMempool())) return REFUSED;
    const VkAesRequest record = {{text.GetLength() - begin, text.GetData() + begin}};
    Observe(true, record.orpcV2Packet.vElement, record.orpcV2Packet.count);
    return VkBusMarshalAndSend(session, VkAesRequest::idG, &record) == 0 ? DONE : FAILED;
}

/// After a send that the bus failed: handles what is there, up to the news that the connection is lost,
/// unless somebody else handles events. One who only sends would never hear of it, and never connect again.
void VkLocalorvoClient::HandleLoss() {
    if (DeliveryOfThread::FInside() || !FConnected() || !BeginPump()) return;
    constexpr int64_t atOnce = 0;
    for (unsigned n = 0; n < maxEventsAtLossG && FConnected(); ++n) {
        if (VkBusProcessOneEvent(GetHandles().connection, &atOnce) != 0) break;
    }
    EndPump();
}

/// False when another sender, or the activity, handles events. So one thread at a time does for a connection:
/// responses come in order, and nobody waits for an event that another one has handled.
bool VkLocalorvoClient::BeginPump() {
    RoxSpinLockHold hold(tablesLockM);
    if (isPumpedM || semaphoresM.stop != nullptr) return false;
    isPumpedM = true;
    return true;
}

void VkLocalorvoClient::EndPump() {
    bool isMonitoringDue = false;
    {
        RoxSpinLockHold hold(tablesLockM);
        isPumpedM = false;
        std::swap(isMonitoringDue, isMonitoringDueM);
    }
    if (isMonitoringDue) StartMonitoring();
}

ref<RequestWrapper> VkLocalorvoClient::FindRequest(uint32_t rpcId) {
    RoxSpinLockHold hold(tablesLockM);
    return requestTableM.Find(rpcId);
}

/// Gives the session that goes with it.
uint32_t VkLocalorvoClient::StoreRequest(const ref<RequestWrapper>& request, void* callback, void* context) {
    RoxSpinLockHold hold(tablesLockM);
    const uint32_t rpcId = request->GetRpcId();
    requestTableM.Store(rpcId, request);
    if (callback != nullptr) callbackTableM.Store(rpcId, callback);
    if (context != nullptr) contextTableM.Store(rpcId, context);
    return sessionM;
}

/// Removes all that was stored with a request, but for its response.
void VkLocalorvoClient::RemoveRequest(uint32_t rpcId) {
    ref<RequestWrapper> request;  // dies when the lock is no longer held
    RoxSpinLockHold hold(tablesLockM);
    request = requestTableM.Find(rpcId);
    contextTableM.Remove(rpcId);
    callbackTableM.Remove(rpcId);
    requestTableM.Remove(rpcId);
}

ref<ResponseWrapper> VkLocalorvoClient::TakeResponse(uint32_t rpcId) {
    RoxSpinLockHold hold(tablesLockM);
    ref<ResponseWrapper> response = responseTableM.Find(rpcId);
    responseTableM.Remove(rpcId);
    return response;
}

bool VkLocalorvoClient::FHasResponse(uint32_t rpcId) {
    RoxSpinLockHold hold(tablesLockM);
    return responseTableM.Find(rpcId) != nullptr;
}

bool VkLocalorvoClient::SendRequestAndForget(SornObject* object) {
    return SendWrapper(RequestWrapper::New(GetMempool(), NewRpcId(), RequestWrapper::RESPONSE_COUNT_NONE,
                                           PickVersion(), ref<SornObject>(object), nullptr));
}

bool VkLocalorvoClient::SendRequestSync(SornObject* object, ref<sorn::LazyDict>& response) {
    const uint32_t rpcId = NewRpcId();
    const ref<RequestWrapper> request =
        RequestWrapper::New(GetMempool(), rpcId, RequestWrapper::RESPONSE_COUNT_SINGLE, PickVersion(),
                            ref<SornObject>(object), nullptr);
    const bool isDone = SendPending(request, nullptr, nullptr) && WaitForResponse(rpcId);
    RemoveRequest(rpcId);  // first, so that no response comes in behind the look at it
    const ref<ResponseWrapper> wrapper = TakeResponse(rpcId);
    if (!isDone) return false;
    if (wrapper != nullptr) response = wrapper->GetBody();
    return true;
}

ref<SornObject> VkLocalorvoClient::SendRequestSync(SornObject* object) {
    ref<sorn::LazyDict> response;
    if (!SendRequestSync(object, response) || response == nullptr) return nullptr;
    return response->ToSornObjectOrError();
}

bool VkLocalorvoClient::WaitForResponse(uint32_t rpcId) {
    if (DeliveryOfThread::FInside()) return false;  // it would wait for itself
    const int64_t start = RoxMonotonicTime::Now();
    int64_t limit = waitLimitG;
    for (;;) {
        if (FMonitored()) return PollForResponse(rpcId, start);
        bool goesOn = false;
        const bool isDone = PumpForResponse(rpcId, limit, goesOn);
        if (!goesOn) return isDone;
        limit = waitLimitG - RoxMonotonicTime::ToNanoseconds(RoxMonotonicTime::Now() - start);
        if (limit <= 0) return false;
    }
}

/// Another thread delivers.
bool VkLocalorvoClient::PollForResponse(uint32_t rpcId, int64_t start) {
    while (RoxMonotonicTime::ToNanoseconds(RoxMonotonicTime::Now() - start) < waitLimitG) {
        {
            RoxMutexHold hold(clientMutexM);
            if (FHasResponse(rpcId)) return true;
        }
        RoxThread::SleepMilliseconds(pollMillisecondsG);
    }
    return false;
}

/// The caller handles one event of the bus itself, and is done with whatever that was: true, or false when
/// none came in time. But when several send at once, one of them handles events while the others look for
/// their responses, and a response to another request does not end the wait: then `goesOn`.
bool VkLocalorvoClient::PumpForResponse(uint32_t rpcId, int64_t limit, bool& goesOn) {
    if (!BeginPump()) {
        RoxThread::SleepMilliseconds(pollMillisecondsG);
        goesOn = !FHasResponse(rpcId);
        return !goesOn;
    }
    unsigned result = 0;
    const DeliveryOfThread delivery;
    if (!FHasResponse(rpcId)) {
        const uint32_t connection = GetHandles().connection;
        VkBusGetSelectFd(connection);
        result = VkBusProcessOneEvent(connection, &limit);
    }
    EndPump();
    if (FHasResponse(rpcId)) return true;
    goesOn = result == 0 && delivery.FToOther(rpcId);
    return result == 0;
}

bool VkLocalorvoClient::SendRequestAsync(SornObject* object, bool multipleResponses, Callback callback,
                                         unsigned int& rpcId) {
    return SendRequestAsyncInternal(object, multipleResponses, reinterpret_cast<void*>(callback), nullptr,
                                    rpcId);
}

bool VkLocalorvoClient::SendRequestAsync(SornObject* object, bool multipleResponses, ContextCallback callback,
                                         void* context, unsigned int& rpcId) {
    return SendRequestAsyncInternal(object, multipleResponses, reinterpret_cast<void*>(callback), context,
                                    rpcId);
}

bool VkLocalorvoClient::SendRequestAsyncInternal(SornObject* object, bool multipleResponses, void* callback,
                                                 void* context, unsigned int& rpcId) {
    const uint32_t newRpcId = NewRpcId();
    const ref<RequestWrapper> request = RequestWrapper::New(
        GetMempool(), newRpcId,
        multipleResponses ? RequestWrapper::RESPONSE_COUNT_MULTIPLE : RequestWrapper::RESPONSE_COUNT_SINGLE,
        PickVersion(), ref<SornObject>(object), nullptr);
    if (!SendPending(request, callback, context)) return false;
    rpcId = newRpcId;
    StartMonitoring();
    return true;
}

bool VkLocalorvoClient::SendUpdateRequest(unsigned int rpcId, SornObject* object) {
    if (FindRequest(rpcId) == nullptr) return false;
    return SendWrapper(RequestUpdateWrapper::New(GetMempool(), rpcId, ref<SornObject>(object), nullptr));
}

bool VkLocalorvoClient::CancelRequest(unsigned int rpcId) {
    ref<RequestWrapper> request;
    ref<ResponseWrapper> response;
    {
        RoxSpinLockHold hold(tablesLockM);
        request = requestTableM.Find(rpcId);
        if (request == nullptr || request->GetResponseCount() != RequestWrapper::RESPONSE_COUNT_MULTIPLE) {
            return false;
        }
        response = responseTableM.Find(rpcId);
        requestTableM.Remove(rpcId);
        responseTableM.Remove(rpcId);
        callbackTableM.Remove(rpcId);
        contextTableM.Remove(rpcId);
    }
    return SendWrapper(CancelWrapper::New(GetMempool(), rpcId, nullptr));
}

bool VkLocalorvoClient::FPending(unsigned int rpcId) {
    return FindRequest(rpcId) != nullptr;
}
