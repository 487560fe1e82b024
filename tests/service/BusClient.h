#pragma once

#include <gtest/gtest.h>

#include <deque>
#include <string>

#include "Messages.h"
#include "client/BusTypeLibrary.h"
#include "vkbus/VkBus.h"

namespace sorntest {

/// Nanoseconds after which nothing will come any more: who waits that long has failed.
inline constexpr int64_t patienceG = 60'000'000'000;

/// A session with the service on the address that is set. One thread.
class BusClient {
 public:
    BusClient() {
        EXPECT_EQ(VkBusOpenNamedConnection(busTypeLibrary, "test", &connectionM), VK_BUS_DONE);
        EXPECT_EQ(VkBusOpenSession(connectionM, VkAesQueryProtocol::idG, VkAesQueryProtocol::checksumG,
                                   &Event, &Closed, this, 0, &sessionM),
                  VK_BUS_DONE);
        const VkAesHello hello = {0};
        EXPECT_EQ(VkBusMarshalAndSend(sessionM, VkAesHello::idG, &hello), VK_BUS_DONE);
    }
    ~BusClient() { VkBusCloseConnection(connectionM); }
    BusClient(const BusClient&) = delete;
    BusClient& operator=(const BusClient&) = delete;

    unsigned Send(const std::string& message) {
        const VkAesRequest record = {
            {static_cast<uint32_t>(message.size()), reinterpret_cast<const uint8_t*>(message.data())}};
        return VkBusMarshalAndSend(sessionM, VkAesRequest::idG, &record);
    }
    unsigned Send(const RequestText& request) { return Send(request.Message()); }
    /// The next message; an empty one, and a failure, when none comes.
    ResponseText Next() {
        while (queueM.empty()) {
            const int64_t limit = patienceG;
            if (fClosedM || VkBusProcessOneEvent(connectionM, &limit) != VK_BUS_DONE) break;
        }
        EXPECT_FALSE(queueM.empty()) << "nothing came";
        if (queueM.empty()) return ResponseText("");
        ResponseText response(queueM.front());
        queueM.pop_front();
        return response;
    }
    ResponseText Ask(const RequestText& request) {
        EXPECT_EQ(Send(request), VK_BUS_DONE);
        return Next();
    }
    /// Waits until the service has ended the session; false when it does not.
    bool FEnded() {
        const int64_t limit = patienceG;
        while (!fClosedM && VkBusProcessOneEvent(connectionM, &limit) == VK_BUS_DONE) {
        }
        return fClosedM;
    }

 private:
    static unsigned Event(uint32_t, uintptr_t word1, uintptr_t word2, void* self) {
        const void* record = nullptr;
        if (VkMarshal_GetTypeFromSerialEvent(word2, word1) != VkAesResponse::idG ||
            VkMarshal_UnmarshalSerialEvent(busTypeLibrary, word2, word1, &record) != VK_BUS_DONE) {
            return 0xFFFF;
        }
        const BusSequence<uint8_t>& packet = static_cast<const VkAesResponse*>(record)->orpcV2Packet;
        static_cast<BusClient*>(self)->queueM.emplace_back(reinterpret_cast<const char*>(packet.vElement),
                                                           packet.count);
        return 0;
    }
    static void Closed(uint32_t, uintptr_t, void* self) { static_cast<BusClient*>(self)->fClosedM = true; }

    uint32_t connectionM = 0;
    uint32_t sessionM = 0;
    bool fClosedM = false;
    std::deque<std::string> queueM;
};

}  // namespace sorntest
