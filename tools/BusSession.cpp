#include "tools/BusSession.h"

#include <chrono>
#include <utility>

#include "client/BusTypeLibrary.h"
#include "sorn/dict/ByteBuffer.h"
#include "sorn/rpc/OrvoRpcV2.h"
#include "tools/Trace.h"
#include "vkbus/VkBus.h"

namespace sorn::tools {

namespace {
constexpr int64_t waitLimitG = 5'000'000'000;  // nanoseconds

int64_t Now() {
    return std::chrono::nanoseconds(std::chrono::steady_clock::now().time_since_epoch()).count();
}
}  // namespace

BusSession::~BusSession() {
    if (sessionM != 0) VkBusCloseSession(sessionM);
    if (connectionM != 0) VkBusCloseConnection(connectionM);
}

bool BusSession::Open(std::string& words) {
    unsigned result = VkBusOpenNamedConnection(busTypeLibrary, "sorn", &connectionM);
    if (result == 0) {
        result = VkBusOpenSession(connectionM, VkAesQueryProtocol::idG, VkAesQueryProtocol::checksumG,
                                  &OnEvent, &OnClosed, this, 0, &sessionM);
    }
    const VkAesHello hello = {0};
    if (result == 0) result = VkBusMarshalAndSend(sessionM, VkAesHello::idG, &hello);
    if (result != 0) words = VkBusResultText(result);
    return result == 0;
}

unsigned BusSession::OnEvent(uint32_t, uintptr_t word1, uintptr_t word2, void* self) {
    auto* const session = static_cast<BusSession*>(self);
    const void* record = nullptr;
    if (VkMarshal_GetTypeFromSerialEvent(word2, word1) != VkAesResponse::idG ||
        VkMarshal_UnmarshalSerialEvent(busTypeLibrary, word2, word1, &record) != 0) {
        return 1;
    }
    const auto& packet = static_cast<const VkAesResponse*>(record)->orpcV2Packet;
    const auto* const bytes = reinterpret_cast<const char*>(packet.vElement);
    if (session->isTracedM) TraceMessage(false, bytes, packet.count);
    RoxString error;
    const ref<OrvoRpcWrapper> message = OrvoRpcV2::UnmarshalFromString(
        session->poolM, RoxString::FromUtf8Bytes(session->poolM, packet.count, bytes), false, error);
    session->responseM = ref<ResponseWrapper>(dynamic_cast<ResponseWrapper*>(message.get()));
    return 0;
}

void BusSession::OnClosed(uint32_t, uintptr_t, void* self) {
    static_cast<BusSession*>(self)->sessionM = 0;
}

ref<ResponseWrapper> BusSession::Exchange(const ref<OrvoRpcWrapper>& message, std::string& words) {
    ByteBuffer text(poolM);
    RoxString error;
    if (!OrvoRpcV2::MarshalToString(message, text, error, poolM, false)) {
        words = error.Utf8();
        return nullptr;
    }
    if (isTracedM) TraceMessage(true, reinterpret_cast<const char*>(text.GetData()), text.GetLength());
    const VkAesRequest record = {{text.GetLength(), text.GetData()}};
    const int64_t deadline = Now() + waitLimitG;
    responseM = nullptr;
    unsigned result = VkBusMarshalAndSend(sessionM, VkAesRequest::idG, &record);
    if (result == 0) result = WaitFor(message->GetRpcId(), deadline);
    if (result == 0) return responseM;
    words = VkBusResultText(result);
    VkBusCloseSession(std::exchange(sessionM, 0));
    return nullptr;
}

unsigned BusSession::WaitFor(uint32_t rpcId, int64_t deadline) {
    while (responseM == nullptr || responseM->GetRpcId() != rpcId) {
        const int64_t limit = deadline - Now();
        if (limit <= 0) return VK_BUS_TIMED_OUT;
        const unsigned result = VkBusProcessOneEvent(connectionM, &limit);
        if (result != VK_BUS_DONE) return result;
    }
    return VK_BUS_DONE;
}

}  // namespace sorn::tools
