#include "client/BusTypeLibrary.h"
#include "client/DeliveryOfThread.h"
#include "client/EventMessage.h"
#include "client/VkLocalorvoClient.h"
#include "rox/RoxMutexHold.h"
#include "rox/RoxSpinLockHold.h"
#include "vkbus/VkBus.h"

using sorn::RequestWrapper;
using sorn::ResponseWrapper;

namespace {

/// What an event callback gives the bus for an event that it cannot take.
constexpr unsigned notHandledG = 0xFFFF;

}  // namespace

unsigned VkLocalorvoClient::OnBusEvent(uint32_t, uintptr_t word1, uintptr_t word2, void* client) {
    const ref<VkLocalorvoClient> self(static_cast<VkLocalorvoClient*>(client));
    if (self->TakeEvent(word1, word2)) return 0;
    self->Disconnect();
    return notHandledG;
}

void VkLocalorvoClient::OnBusClosed(uint32_t, uintptr_t, void* client) {
    const ref<VkLocalorvoClient> self(static_cast<VkLocalorvoClient*>(client));
    self->Disconnect();
}

/// False for any event but a response that can be decoded: pieces of responses are no more wanted than
/// others.
bool VkLocalorvoClient::TakeEvent(uintptr_t word1, uintptr_t word2) {
    if (VkMarshal_GetTypeFromSerialEvent(word2, word1) != VkAesResponse::idG) return false;
    const void* record = nullptr;
    if (VkMarshal_UnmarshalSerialEvent(busTypeLibrary, word2, word1, &record) != 0) return false;
    const auto& packet = static_cast<const VkAesResponse*>(record)->orpcV2Packet;
    Observe(false, packet.vElement, packet.count);
    if (ignoreAllM) return true;
    RoxString error;
    HandleMessage(UnmarshalEventMessage(GetMempool(), packet, word1, word2, error));
    return true;
}

/// Only responses that somebody expects matter.
void VkLocalorvoClient::HandleMessage(const ref<sorn::OrvoRpcWrapper>& message) {
    const ref<ResponseWrapper> response(dynamic_cast<ResponseWrapper*>(message.get()));
    if (response == nullptr || FindRequest(response->GetRpcId()) == nullptr) return;
    RoxMutexHold hold(clientMutexM);
    Deliver(response);
}

/// Gives a response to the callback of its request, or to who waits for it, and ends the request if it was
/// the last one.
void VkLocalorvoClient::Deliver(const ref<ResponseWrapper>& response) {
    const uint32_t rpcId = response->GetRpcId();
    const ref<sorn::LazyDict>& body = response->GetBody();
    // A response states no version as a rule.
    if (body->GetVersion().FAbsent()) body->SetVersion(PickVersion());

    ref<RequestWrapper> request;
    ref<ResponseWrapper> unread;  // dies when the lock is no longer held
    void* callback = nullptr;
    void* context = nullptr;
    bool isLast = false;
    {
        RoxSpinLockHold hold(tablesLockM);
        request = requestTableM.Find(rpcId);
        if (request == nullptr) return;  // another thread has had its response, or has cancelled it
        callback = callbackTableM.Find(rpcId);
        context = contextTableM.Find(rpcId);
        if (callback == nullptr) {
            unread = responseTableM.Find(rpcId);
            responseTableM.Store(rpcId, response);
        }
        isLast = request->GetResponseCount() != RequestWrapper::RESPONSE_COUNT_MULTIPLE ||
                 response->IsFinalResponse();
    }
    DeliveryOfThread::Note(rpcId);
    if (callback != nullptr) {
        const DeliveryOfThread::Inside inside;
        const RoxString json = body->ToJson(false);
        if (context == nullptr) {
            reinterpret_cast<Callback>(callback)(rpcId, response->IsFinalResponse(), json.Utf8());
        } else {
            reinterpret_cast<ContextCallback>(callback)(rpcId, response->IsFinalResponse(), json.Utf8(),
                                                        context);
        }
    }
    if (isLast) RemoveRequest(rpcId);
}
