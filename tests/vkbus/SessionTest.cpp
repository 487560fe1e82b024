#include <gtest/gtest.h>

#include "BusFixture.h"

namespace {

class Session : public BusTest {};

TEST_F(Session, RequestAndResponse) {
    Service service;
    Client client;
    ASSERT_EQ(VK_BUS_DONE, client.openResult);
    EXPECT_NE(0u, client.connection);
    EXPECT_NE(0u, client.session);
    EXPECT_EQ("tester", service.LastName());
    EXPECT_EQ("", client.RoundTrip(""));
    EXPECT_EQ("hello", client.RoundTrip("hello"));
    EXPECT_EQ(std::string("\0\n\xFF", 3), client.RoundTrip(std::string("\0\n\xFF", 3)));
    EXPECT_EQ(3u, client.nEvents);
    EXPECT_EQ(1u, service.nAccepted);
}

TEST_F(Session, ManyEventsKeepTheirOrder) {
    Service service;
    Client client;
    for (int i = 0; i < 500; ++i) {
        ASSERT_EQ(VK_BUS_DONE, client.Request(std::to_string(i)));
    }
    for (unsigned i = 0; i < 500; ++i) {
        ASSERT_EQ(VK_BUS_DONE, client.Process());
        ASSERT_EQ(i + 1, client.packets.size()) << "one event each";
        ASSERT_EQ(std::to_string(i), client.packets.back());
    }
}

TEST_F(Session, NobodyListens) {
    uint32_t connection = 77;
    EXPECT_EQ(VK_BUS_NO_SERVICE, VkBusOpenNamedConnection(busTypeLibrary, "tester", &connection));
    EXPECT_EQ(77u, connection);
}

TEST_F(Session, RefusedForOtherProtocolOrChecksum) {
    Service service;
    Terms terms;
    terms.checksum += 1;
    EXPECT_EQ(VK_BUS_REFUSED, Client(terms).openResult);
    // The protocol must be in the client's own library, too.
    terms = {};
    terms.protocol = VkAesHello::idG;
    EXPECT_EQ(VK_BUS_BAD_TYPE, Client(terms).openResult);
    EXPECT_EQ(0u, service.nAccepted);
    EXPECT_EQ("still there", Client().RoundTrip("still there"));
}

TEST_F(Session, RefusedByTheAcceptCallback) {
    Service service;
    service.onAccept = [](uint32_t) { return 1u; };
    Client client;
    EXPECT_EQ(VK_BUS_REFUSED, client.openResult);
    EXPECT_EQ(0u, client.session);
    EXPECT_EQ(0u, client.nClosed) << "a session that never was cannot end";
    EXPECT_EQ(VK_BUS_LOST, client.Process());
    EXPECT_EQ(0u, service.nClosed);
    EXPECT_TRUE(WaitUntil([&] {
        return VkBusMarshalAndSend(service.lastSession, VkAesResponse::idG, nullptr) == VK_BUS_NO_HANDLE;
    }));
}

TEST_F(Session, AcceptCallbackMayCloseTheSession) {
    Service service;
    service.onAccept = [](uint32_t session) { return VkBusCloseSession(session); };
    EXPECT_EQ(VK_BUS_LOST, Client().openResult);
    EXPECT_EQ(0u, service.nClosed);
}

TEST_F(Session, OneForEachConnection) {
    Service service;
    Client client;
    uint32_t second = 77;
    EXPECT_EQ(VK_BUS_NOT_ALLOWED,
              VkBusOpenSession(client.connection, VkAesQueryProtocol::idG, VkAesQueryProtocol::checksumG,
                               nullptr, nullptr, nullptr, 0, &second));
    EXPECT_EQ(77u, second);
    EXPECT_EQ("x", client.RoundTrip("x"));
}

TEST_F(Session, SendsOnlyWhatTheProtocolAllows) {
    Service service;
    Client client({}, false);
    const VkAesHello hello = {0};
    EXPECT_EQ(VK_BUS_NOT_ALLOWED, client.Request("before the hello"));
    EXPECT_EQ(VK_BUS_NOT_ALLOWED, SendPacket(client.session, VkAesResponse::idG, "a response"));
    EXPECT_EQ(VK_BUS_NOT_ALLOWED, VkBusMarshalAndSend(client.session, 0, &hello));
    EXPECT_EQ(VK_BUS_DONE, VkBusMarshalAndSend(client.session, VkAesHello::idG, &hello));
    EXPECT_EQ(VK_BUS_NOT_ALLOWED, VkBusMarshalAndSend(client.session, VkAesHello::idG, &hello));
    EXPECT_EQ("fine", client.RoundTrip("fine"));
    // The other end is held to its own direction.
    EXPECT_EQ(VK_BUS_NOT_ALLOWED, SendPacket(service.lastSession, VkAesRequest::idG, "a request"));
    EXPECT_EQ(2u, service.nEvents);
}

TEST_F(Session, ServiceCannotSpeakBeforeTheHello) {
    Service service;
    Client client({}, false);
    EXPECT_EQ(VK_BUS_NOT_ALLOWED, SendPacket(service.lastSession, VkAesResponse::idG, "early"));
}

TEST_F(Session, ChunksPass) {
    Service service([](const SeenEvent& event) -> unsigned {
        if (event.id == VkAesHello::idG) {
            EXPECT_EQ(4711u, event.As<VkAesHello>().partnerId);
            const uint8_t bytes[] = {1, 2, 3};
            const VkAesResponseChunk chunk = {0xFFFFFFFF, true, {3, bytes}};
            return VkBusMarshalAndSend(event.session, VkAesResponseChunk::idG, &chunk);
        }
        return 0;
    });
    Client client({}, false);
    client.onEvent = [](const SeenEvent& event) {
        EXPECT_EQ(VkAesResponseChunk::idG, event.id);
        const auto& chunk = event.As<VkAesResponseChunk>();
        EXPECT_EQ(0xFFFFFFFFu, chunk.rpcId);
        EXPECT_TRUE(chunk.lastChunk);
        EXPECT_EQ(3u, chunk.orpcV2Chunk.count);
        EXPECT_EQ(3, chunk.orpcV2Chunk.vElement[2]);
        return 0u;
    };
    const VkAesHello hello = {4711};
    ASSERT_EQ(VK_BUS_DONE, VkBusMarshalAndSend(client.session, VkAesHello::idG, &hello));
    EXPECT_EQ(VK_BUS_DONE, client.Process());
    EXPECT_EQ(1u, client.nEvents);
}

TEST_F(Session, TimeLimits) {
    Service service;
    Client client;
    const auto start = std::chrono::steady_clock::now();
    EXPECT_EQ(VK_BUS_TIMED_OUT, client.Process(30'000'000));
    EXPECT_GE(std::chrono::steady_clock::now() - start, std::chrono::milliseconds(30));
    EXPECT_EQ(VK_BUS_TIMED_OUT, client.Process(1));
    EXPECT_EQ(VK_BUS_TIMED_OUT, client.Process(0));
    EXPECT_EQ(VK_BUS_TIMED_OUT, client.Process(-5));
    EXPECT_EQ(VK_BUS_DONE, VkBusProcessOneEvent(client.connection, nullptr)) << "nothing to do is no failure";
    ASSERT_EQ(VK_BUS_DONE, client.Request("x"));
    EXPECT_EQ(VK_BUS_DONE, client.Process(INT64_MAX));
    EXPECT_EQ(1u, client.nEvents);
}

TEST_F(Session, SelectDescriptorTellsWhenThereIsSomethingToDo) {
    Service service;
    Client client;
    const int fd = VkBusGetSelectFd(client.connection);
    ASSERT_GE(fd, 0);
    while (FReadable(fd, 0)) {  // what the opening left
        ASSERT_EQ(VK_BUS_DONE, VkBusProcessOneEvent(client.connection, nullptr));
    }
    EXPECT_EQ(0u, client.nEvents);
    for (unsigned round = 1; round <= 20; ++round) {
        ASSERT_EQ(VK_BUS_DONE, client.Request("x"));
        while (client.nEvents < round) {
            ASSERT_TRUE(FReadable(fd, 60'000));
            ASSERT_EQ(VK_BUS_DONE, VkBusProcessOneEvent(client.connection, nullptr));
        }
        EXPECT_FALSE(FReadable(fd, 0));
        EXPECT_EQ(fd, VkBusGetSelectFd(client.connection));
    }
    service.Stop();
    ASSERT_TRUE(FReadable(fd, 60'000));
    while (VkBusProcessOneEvent(client.connection, nullptr) == VK_BUS_DONE) {
    }
    EXPECT_EQ(1u, client.nClosed);
    EXPECT_EQ(uintptr_t{VK_BUS_LOST}, client.reason);
    EXPECT_TRUE(FReadable(fd, 0)) << "a watcher is told again that it is over";
}

TEST_F(Session, ListenerInALoopOfItsOwn) {
    uint32_t listener = 0;
    static std::atomic<unsigned> nEvents;
    static std::atomic<unsigned> nClosed;
    nEvents = nClosed = 0;
    ASSERT_EQ(VK_BUS_DONE, VkBusListen(
                               busTypeLibrary, VkAesQueryProtocol::idG, VkAesQueryProtocol::checksumG,
                               nullptr, [](uint32_t, uintptr_t, uintptr_t, void*) { return ++nEvents * 0; },
                               [](uint32_t, uintptr_t, void*) { ++nClosed; }, nullptr, &listener));
    const int fd = VkBusGetSelectFd(listener);
    EXPECT_FALSE(FReadable(fd, 0));
    EXPECT_EQ(VK_BUS_DONE, VkBusProcessOneEvent(listener, nullptr));
    std::atomic<bool> stop{false};
    std::thread loop([&] {
        while (!stop) {
            if (FReadable(fd, 10)) {
                EXPECT_EQ(VK_BUS_DONE, VkBusProcessOneEvent(listener, nullptr));
            }
        }
    });
    {
        Client client;
        EXPECT_EQ(VK_BUS_DONE, client.openResult);
        for (int i = 0; i < 9; ++i) {
            EXPECT_EQ(VK_BUS_DONE, client.Request("x"));
        }
    }
    Client other;
    EXPECT_EQ(VK_BUS_DONE, other.openResult);
    // Nine requests and two hellos.
    EXPECT_TRUE(WaitUntil([] { return nEvents == 11 && nClosed == 1; }));
    stop = true;
    loop.join();
}

TEST_F(Session, WordsAreOfTheRunningCallbackOnly) {
    static uintptr_t word1;
    static uintptr_t word2;
    Service service;
    uint32_t connection = 0;
    uint32_t session = 0;
    const void* record = &record;
    ASSERT_EQ(VK_BUS_DONE, VkBusOpenNamedConnection(busTypeLibrary, "tester", &connection));
    ASSERT_EQ(
        VK_BUS_DONE,
        VkBusOpenSession(
            connection, VkAesQueryProtocol::idG, VkAesQueryProtocol::checksumG,
            [](uint32_t, uintptr_t first, uintptr_t second, void*) {
                word1 = first;
                word2 = second;
                const void* found = nullptr;
                EXPECT_EQ(VkAesResponse::idG, VkMarshal_GetTypeFromSerialEvent(second, first));
                EXPECT_EQ(0u, VkMarshal_GetTypeFromSerialEvent(second, first + 8));
                EXPECT_EQ(0u, VkMarshal_GetTypeFromSerialEvent(second + 1, first));
                static const VkBusTypeLibrary other = busTypeLibrary;
                EXPECT_NE(VK_BUS_DONE, VkMarshal_UnmarshalSerialEvent(other, second, first, &found));
                EXPECT_EQ(nullptr, found);
                std::thread([=] { EXPECT_EQ(0u, VkMarshal_GetTypeFromSerialEvent(second, first)); }).join();
                return 0u;
            },
            nullptr, nullptr, 0, &session));
    const VkAesHello hello = {0};
    ASSERT_EQ(VK_BUS_DONE, VkBusMarshalAndSend(session, VkAesHello::idG, &hello));
    ASSERT_EQ(VK_BUS_DONE, SendPacket(session, VkAesRequest::idG, "x"));
    ASSERT_EQ(VK_BUS_DONE, VkBusProcessOneEvent(connection, &patienceG));
    ASSERT_NE(0u, word1);
    EXPECT_EQ(0u, VkMarshal_GetTypeFromSerialEvent(word2, word1));
    EXPECT_NE(VK_BUS_DONE, VkMarshal_UnmarshalSerialEvent(busTypeLibrary, word2, word1, &record));
    EXPECT_EQ(&record, record);
}

TEST_F(Session, ProcessingInsideACallback) {
    Service service;
    Client client;
    std::string inner;
    client.onEvent = [&](const SeenEvent& outer) {
        client.onEvent = nullptr;
        inner = client.RoundTrip("inner");
        EXPECT_EQ("outer", outer.Packet()) << "the outer record lives on";
        return 0u;
    };
    ASSERT_EQ(VK_BUS_DONE, client.Request("outer"));
    EXPECT_EQ(VK_BUS_DONE, client.Process());
    EXPECT_EQ("inner", inner);
}

TEST_F(Session, UnhandledEventEndsTheSessionOfAClient) {
    Service service;
    Client client;
    client.onEvent = [](const SeenEvent&) { return 0xFFFFu; };
    ASSERT_EQ(VK_BUS_DONE, client.Request("x"));
    client.Process();
    EXPECT_EQ(VK_BUS_LOST, client.Process());
    EXPECT_EQ(1u, client.nClosed);
    EXPECT_EQ(uintptr_t{VK_BUS_BAD_EVENT}, client.reason);
    EXPECT_EQ(VK_BUS_NO_HANDLE, client.Request("x"));
    EXPECT_EQ(1u, client.nEvents);
}

TEST_F(Session, UnhandledEventEndsTheSessionOfAService) {
    Service service([](const SeenEvent& event) { return event.id == VkAesRequest::idG ? 0xFFFFu : 0; });
    Client client;
    ASSERT_EQ(VK_BUS_DONE, client.Request("x"));
    EXPECT_EQ(VK_BUS_LOST, client.Process());
    EXPECT_EQ(1u, client.nClosed);
    EXPECT_EQ(uintptr_t{VK_BUS_LOST}, client.reason);
    EXPECT_TRUE(WaitUntil([&] { return service.nClosed == 1; }));
    EXPECT_EQ(uintptr_t{VK_BUS_BAD_EVENT}, service.lastReason);
    EXPECT_EQ(VK_BUS_DONE, Client().openResult) << "the listener lives on";
}

TEST_F(Session, ResultTexts) {
    for (unsigned result = VK_BUS_DONE; result <= VK_BUS_SYSTEM; ++result) {
        EXPECT_STRNE("unknown result", VkBusResultText(result)) << result;
    }
    EXPECT_STREQ("unknown result", VkBusResultText(VK_BUS_SYSTEM + 1));
    EXPECT_STREQ("address in use", VkBusResultText(VK_BUS_ADDRESS_IN_USE));
}

}  // namespace
