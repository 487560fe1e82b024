#include "service/BusEnd.h"

#include "client/BusTypeLibrary.h"
#include "vkbus/VkBus.h"

namespace sorn::service {

namespace {

constexpr unsigned handledG = 0;
constexpr unsigned notHandledG = 0xFFFF;  // ends the session

}  // namespace

BusEnd::~BusEnd() {
    if (listenerM != 0) VkBusCloseConnection(listenerM);
}

bool BusEnd::Listen(const std::string& address, std::string& words) {
    if (!address.empty()) VkBusSetAddress(address.c_str());
    addressM = VkBusGetAddress();
    const unsigned result =
        VkBusListen(busTypeLibrary, VkAesQueryProtocol::idG, VkAesQueryProtocol::checksumG, nullptr, &Event,
                    &Closed, this, &listenerM);
    if (result != VK_BUS_DONE) words = addressM + ": " + VkBusResultText(result);
    return result == VK_BUS_DONE;
}

int BusEnd::GetSelectFd() const {
    return VkBusGetSelectFd(listenerM);
}

void BusEnd::ProcessOne() {
    VkBusProcessOneEvent(listenerM, nullptr);
}

void BusEnd::Send(uint32_t session, std::string_view message) {
    const VkAesResponse record = {
        {static_cast<uint32_t>(message.size()), reinterpret_cast<const uint8_t*>(message.data())}};
    VkBusMarshalAndSend(session, VkAesResponse::idG, &record);
}

unsigned BusEnd::Event(uint32_t session, uintptr_t word1, uintptr_t word2, void* self) {
    const unsigned id = VkMarshal_GetTypeFromSerialEvent(word2, word1);
    if (id == VkAesHello::idG) return handledG;  // the partner's number says nothing here
    const void* record = nullptr;
    if (id != VkAesRequest::idG ||
        VkMarshal_UnmarshalSerialEvent(busTypeLibrary, word2, word1, &record) != VK_BUS_DONE) {
        return notHandledG;
    }
    const BusSequence<uint8_t>& packet = static_cast<const VkAesRequest*>(record)->orpcV2Packet;
    static_cast<BusEnd*>(self)->onMessageM(session,
                                           {reinterpret_cast<const char*>(packet.vElement), packet.count});
    return handledG;
}

void BusEnd::Closed(uint32_t session, uintptr_t, void* self) {
    static_cast<BusEnd*>(self)->onEndM(session);
}

}  // namespace sorn::service
