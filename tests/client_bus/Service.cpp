#include "Service.h"

#include <gtest/gtest.h>

#include "client/BusTypeLibrary.h"
#include "vkbus/VkBus.h"

namespace {

std::string HeaderOf(const std::string& text, const std::string& name) {
    const size_t at = text.find("\r\n" + name + ": ");
    if (at == std::string::npos) return "";
    const size_t begin = at + name.size() + 4;
    return text.substr(begin, text.find("\r\n", begin) - begin);
}

Request Read(uint32_t session, const BusSequence<uint8_t>& packet) {
    const std::string text(reinterpret_cast<const char*>(packet.vElement), packet.count);
    return {session, HeaderOf(text, "Type"), static_cast<uint32_t>(std::stoul(HeaderOf(text, "RpcId"))),
            HeaderOf(text, "ResponseCount"), text.substr(text.find("\r\n\r\n") + 4)};
}

}  // namespace

Service::Service(OnRequest onRequest)
    : onRequestM(onRequest ? std::move(onRequest) : OnRequest(&RespondByDefault)) {
    EXPECT_EQ(0u, VkBusListen(busTypeLibrary, VkAesQueryProtocol::idG, VkAesQueryProtocol::checksumG, nullptr,
                              &OnEvent, nullptr, this, &listenerM));
    threadM = std::thread([this] {
        constexpr int64_t limit = 60'000'000'000;
        for (unsigned result = 0; result == VK_BUS_DONE || result == VK_BUS_TIMED_OUT;) {
            result = VkBusProcessOneEvent(listenerM, &limit);
        }
    });
}

void Service::Stop() {
    if (!threadM.joinable()) return;
    VkBusCloseConnection(listenerM);
    threadM.join();
}

unsigned Service::OnEvent(uint32_t session, uintptr_t word1, uintptr_t word2, void* service) {
    auto* const self = static_cast<Service*>(service);
    if (VkMarshal_GetTypeFromSerialEvent(word2, word1) == VkAesHello::idG) {
        ++self->nHellos;
        return 0;
    }
    const void* record = nullptr;
    EXPECT_EQ(0u, VkMarshal_UnmarshalSerialEvent(busTypeLibrary, word2, word1, &record));
    const Request request = Read(session, static_cast<const VkAesRequest*>(record)->orpcV2Packet);
    ++(request.kind == "cancel" ? self->nCancels : self->nRequests);
    self->onRequestM(request);
    return 0;
}

std::string Service::ResponseText(uint32_t rpcId, bool isFinal, const std::string& body) {
    const std::string headers = std::string("IsFinal: ") + (isFinal ? "true" : "false") +
                                "\r\nRpcId: " + std::to_string(rpcId) + "\r\nType: response\r\n\r\n";
    return "ORPC/2 " + std::to_string(headers.size()) + " " + std::to_string(body.size()) + "\r\n" + headers +
           body;
}

void Service::SendText(uint32_t session, const std::string& text) {
    const VkAesResponse record = {
        {static_cast<uint32_t>(text.size()), reinterpret_cast<const uint8_t*>(text.data())}};
    VkBusMarshalAndSend(session, VkAesResponse::idG, &record);
}

void Service::Respond(const Request& request, bool isFinal, const std::string& body) {
    SendText(request.session, ResponseText(request.rpcId, isFinal, body));
}

void Service::RespondByDefault(const Request& request) {
    if (request.kind == "cancel" || request.count == "none") return;
    if (request.count == "multiple") {
        Respond(request, false, request.body);
        Respond(request, false, request.body);
    }
    Respond(request, true, request.body);
}
