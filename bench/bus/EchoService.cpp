#include "bus/EchoService.h"

#include <cstdio>
#include <cstdlib>

#include "client/BusTypeLibrary.h"
#include "client/EventMessage.h"
#include "sorn/dict/ByteBuffer.h"
#include "sorn/lazy/LazyDict.h"
#include "sorn/rpc/OrvoRpcV2.h"
#include "sorn/rpc/RequestWrapper.h"
#include "sorn/rpc/ResponseWrapper.h"
#include "vkbus/VkBus.h"

namespace bench {

namespace {

using sorn::OrvoRpcV2;
using sorn::RequestWrapper;

constexpr char changeG[] = "{\"type\":\"recordingList\",\"isTop\":true}";

void Send(RoxMempool* pool, uint32_t session, const ref<sorn::OrvoRpcWrapper>& response) {
    sorn::ByteBuffer text(pool);
    RoxString error;
    unsigned begin = 0;
    if (!OrvoRpcV2::MarshalInPlace(response, text, begin, error, pool)) return;
    const VkAesResponse record = {{text.GetLength() - begin, text.GetData() + begin}};
    VkBusMarshalAndSend(session, VkAesResponse::idG, &record);
}

void Require(bool isTrue, const char* words) {
    if (isTrue) return;
    std::fprintf(stderr, "%s\n", words);
    std::exit(1);
}

}  // namespace

EchoService::EchoService(const std::string& address) : poolM("service") {
    VkBusSetAddress(address.c_str());
    const unsigned result =
        VkBusListen(busTypeLibrary, VkAesQueryProtocol::idG, VkAesQueryProtocol::checksumG, nullptr, &OnEvent,
                    &OnClosed, this, &listenerM);
    Require(result == 0, VkBusResultText(result));
    threadM = std::thread([this] { Run(); });
}

EchoService::~EchoService() {
    isStoppedM = true;
    threadM.join();
    VkBusCloseConnection(listenerM);
}

void EchoService::Run() {
    constexpr int64_t lookNanosecondsG = 20'000'000;
    while (!isStoppedM) VkBusProcessOneEvent(listenerM, &lookNanosecondsG);
}

void EchoService::Change() {
    const std::lock_guard<std::mutex> lock(mutexM);
    const ref<sorn::LazyDict> body = sorn::LazyDict::FromJsonString(&poolM, changeG, 0);
    for (const Stream& stream : vStreamsM) {
        Send(&poolM, stream.session, sorn::ResponseWrapper::New(&poolM, stream.rpcId, false, body, nullptr));
    }
}

unsigned EchoService::OnEvent(uint32_t session, uintptr_t word1, uintptr_t word2, void* self) {
    if (VkMarshal_GetTypeFromSerialEvent(word2, word1) != VkAesRequest::idG) return 0;  // the hello
    const void* record = nullptr;
    if (VkMarshal_UnmarshalSerialEvent(busTypeLibrary, word2, word1, &record) != 0) return 1;
    auto& service = *static_cast<EchoService*>(self);
    RoxString error;
    service.Take(session,
                 UnmarshalEventMessage(&service.poolM, static_cast<const VkAesRequest*>(record)->orpcV2Packet,
                                       word1, word2, error));
    return 0;
}

void EchoService::OnClosed(uint32_t session, uintptr_t, void* self) {
    auto* const service = static_cast<EchoService*>(self);
    const std::lock_guard<std::mutex> lock(service->mutexM);
    std::erase_if(service->vStreamsM, [session](const Stream& stream) { return stream.session == session; });
}

void EchoService::Take(uint32_t session, const ref<sorn::OrvoRpcWrapper>& message) {
    const auto* const request = dynamic_cast<RequestWrapper*>(message.get());
    if (request == nullptr) return;
    if (request->GetResponseCount() == RequestWrapper::RESPONSE_COUNT_MULTIPLE) {
        const std::lock_guard<std::mutex> lock(mutexM);
        vStreamsM.push_back({session, request->GetRpcId()});
    } else {
        Send(&poolM, session,
             sorn::ResponseWrapper::New(&poolM, request->GetRpcId(), true, request->GetBody(), nullptr));
    }
}

}  // namespace bench
