#include <gtest/gtest.h>
#include <malloc.h>

#include "BusFixture.h"

namespace {

class Close : public BusTest {};

TEST_F(Close, HandlesThatAreNotOpen) {
    const VkAesHello hello = {0};
    uint32_t session = 0;
    for (const uint32_t handle : {0u, 1u, 0x7FFFFFFFu, 0xFFFFFFFFu}) {
        EXPECT_EQ(VK_BUS_NO_HANDLE, VkBusMarshalAndSend(handle, VkAesHello::idG, &hello));
        EXPECT_EQ(-1, VkBusGetSelectFd(handle));
        EXPECT_EQ(VK_BUS_NO_HANDLE, VkBusProcessOneEvent(handle, nullptr));
        EXPECT_EQ(VK_BUS_NO_HANDLE, VkBusCloseSession(handle));
        EXPECT_EQ(VK_BUS_NO_HANDLE, VkBusCloseConnection(handle));
        EXPECT_EQ(VK_BUS_NO_HANDLE,
                  VkBusOpenSession(handle, VkAesQueryProtocol::idG, VkAesQueryProtocol::checksumG, nullptr,
                                   nullptr, nullptr, 0, &session));
    }
}

TEST_F(Close, Twice) {
    Service service;
    Client client;
    EXPECT_EQ(VK_BUS_NO_HANDLE, VkBusCloseSession(client.connection)) << "a connection is no session";
    EXPECT_EQ(VK_BUS_NO_HANDLE, VkBusCloseConnection(client.session));
    EXPECT_EQ(VK_BUS_NO_HANDLE,
              VkBusOpenSession(service.listener, VkAesQueryProtocol::idG, VkAesQueryProtocol::checksumG,
                               nullptr, nullptr, nullptr, 0, &client.session))
        << "a listener is no connection";
    EXPECT_EQ(VK_BUS_DONE, VkBusCloseSession(client.session));
    EXPECT_EQ(VK_BUS_NO_HANDLE, VkBusCloseSession(client.session));
    EXPECT_EQ(VK_BUS_LOST, client.Process());
    EXPECT_EQ(VK_BUS_DONE, VkBusCloseConnection(client.connection));
    EXPECT_EQ(VK_BUS_NO_HANDLE, VkBusCloseConnection(client.connection));
    EXPECT_EQ(VK_BUS_NO_HANDLE, client.Process());
    EXPECT_EQ(0u, client.nClosed) << "who closes is not told";
}

TEST_F(Close, ConnectionTakesTheSessionAlong) {
    Service service;
    Client client;
    EXPECT_EQ(VK_BUS_DONE, VkBusCloseConnection(client.connection));
    EXPECT_EQ(VK_BUS_NO_HANDLE, client.Request("x"));
    EXPECT_EQ(VK_BUS_NO_HANDLE, VkBusCloseSession(client.session));
    EXPECT_TRUE(WaitUntil([&] { return service.nClosed == 1; }));
    EXPECT_EQ(uintptr_t{VK_BUS_LOST}, service.lastReason);
}

TEST_F(Close, ConnectionWithoutASession) {
    Service service;
    uint32_t connection = 0;
    ASSERT_EQ(VK_BUS_DONE, VkBusOpenNamedConnection(busTypeLibrary, "tester", &connection));
    const int64_t limit = 1;
    EXPECT_EQ(VK_BUS_TIMED_OUT, VkBusProcessOneEvent(connection, &limit));
    EXPECT_EQ(VK_BUS_DONE, VkBusProcessOneEvent(connection, nullptr));
    EXPECT_EQ(VK_BUS_DONE, VkBusCloseConnection(connection));
}

TEST_F(Close, WhatWasSentBeforeArrives) {
    for (int round = 0; round < 50; ++round) {
        std::atomic<unsigned> nRequests{0};
        Service service([&](const SeenEvent& event) {
            nRequests += event.id == VkAesRequest::idG;
            return 0u;
        });
        {
            Client client;
            for (int i = 0; i < 10; ++i) {
                ASSERT_EQ(VK_BUS_DONE, client.Request("x"));
            }
        }
        ASSERT_TRUE(WaitUntil([&] { return service.nClosed == 1; }));
        ASSERT_EQ(10u, nRequests);
    }
}

TEST_F(Close, SessionInsideItsEventCallback) {
    Service service;
    Client client;
    client.onEvent = [&](const SeenEvent& event) {
        EXPECT_EQ(VK_BUS_DONE, VkBusCloseSession(event.session));
        EXPECT_EQ("x", event.Packet()) << "the record lives until the callback returns";
        return 0xFFFFu;
    };
    ASSERT_EQ(VK_BUS_DONE, client.Request("x"));
    EXPECT_EQ(VK_BUS_LOST, client.Process());
    EXPECT_EQ(0u, client.nClosed);
}

TEST_F(Close, ConnectionInsideItsEventCallback) {
    Service service;
    Client client;
    client.onEvent = [&](const SeenEvent& event) {
        EXPECT_EQ(VK_BUS_DONE, VkBusCloseSession(event.session));
        EXPECT_EQ(VK_BUS_DONE, VkBusCloseConnection(client.connection));
        EXPECT_EQ("x", event.Packet());
        return 0u;
    };
    ASSERT_EQ(VK_BUS_DONE, client.Request("x"));
    EXPECT_NE(VK_BUS_DONE, client.Process());
    EXPECT_EQ(0u, client.nClosed);
    EXPECT_EQ(VK_BUS_NO_HANDLE, client.Process());
}

TEST_F(Close, ConnectionInsideItsCloseCallback) {
    Service service;
    Client client;
    client.onClose = [&] {
        VkBusCloseSession(client.session);
        EXPECT_EQ(VK_BUS_DONE, VkBusCloseConnection(client.connection));
    };
    EXPECT_EQ("x", client.RoundTrip("x"));
    service.Stop();
    EXPECT_EQ(VK_BUS_LOST, client.Process());
    EXPECT_EQ(1u, client.nClosed);
    EXPECT_EQ(VK_BUS_NO_HANDLE, client.Process());
}

TEST_F(Close, SessionOfTheServiceInsideItsCallback) {
    Service service([](const SeenEvent& event) {
        return event.id == VkAesRequest::idG ? VkBusCloseSession(event.session) : 0u;
    });
    Client client;
    ASSERT_EQ(VK_BUS_DONE, client.Request("x"));
    EXPECT_EQ(VK_BUS_LOST, client.Process());
    EXPECT_EQ(1u, client.nClosed);
    EXPECT_EQ(VK_BUS_DONE, Client().openResult);
    EXPECT_TRUE(WaitUntil([&] { return service.nClosed == 1; })) << "only of the second session";
}

TEST_F(Close, ListenerInsideItsCallback) {
    Service service(
        [&](const SeenEvent& event) { return event.id == VkAesRequest::idG ? VkBusCloseAll(), 0u : 0u; });
    uint32_t connection = 0;
    {
        Client client;
        ASSERT_EQ(VK_BUS_DONE, client.Request("x"));
        EXPECT_NE(VK_BUS_DONE, client.Process());
    }
    EXPECT_TRUE(WaitUntil([&] {
        return VkBusOpenNamedConnection(busTypeLibrary, "tester", &connection) == VK_BUS_NO_SERVICE;
    }));
}

TEST_F(Close, ResponsesBeforeTheEndAreDelivered) {
    for (int round = 0; round < 50; ++round) {
        Service service([](const SeenEvent& event) {
            if (event.id == VkAesRequest::idG) {
                for (const char* text : {"1", "2", "3"}) {
                    EXPECT_EQ(VK_BUS_DONE, SendPacket(event.session, VkAesResponse::idG, text));
                }
                return 1u;
            }
            return 0u;
        });
        Client client;
        ASSERT_EQ(VK_BUS_DONE, client.Request("x"));
        for (int i = 0; i < 3; ++i) {
            ASSERT_EQ(VK_BUS_DONE, client.Process());
        }
        EXPECT_EQ(VK_BUS_LOST, client.Process());
        EXPECT_EQ(std::vector<std::string>({"1", "2", "3"}), client.packets);
        EXPECT_EQ(1u, client.nClosed);
    }
}

TEST_F(Close, ConnectionOnAnotherThreadWakesTheWaitingOne) {
    for (int round = 0; round < 20; ++round) {
        Service service;
        Client client;
        std::thread closer([&] { EXPECT_EQ(VK_BUS_DONE, VkBusCloseConnection(client.connection)); });
        EXPECT_NE(VK_BUS_DONE, client.Process());
        closer.join();
        EXPECT_EQ(0u, client.nClosed);
    }
}

TEST_F(Close, SessionOnAnotherThreadWakesTheWaitingOne) {
    Service service;
    Client client;
    std::thread closer([&] { EXPECT_EQ(VK_BUS_DONE, VkBusCloseSession(client.session)); });
    EXPECT_EQ(VK_BUS_LOST, client.Process());
    closer.join();
    EXPECT_EQ(0u, client.nClosed);
}

TEST_F(Close, OpeningOnAnotherThread) {
    // Nobody processes the listener, so the opening waits until its connection goes.
    uint32_t listener = 0;
    ASSERT_EQ(VK_BUS_DONE, VkBusListen(busTypeLibrary, VkAesQueryProtocol::idG, VkAesQueryProtocol::checksumG,
                                       nullptr, nullptr, nullptr, nullptr, &listener));
    uint32_t connection = 0;
    ASSERT_EQ(VK_BUS_DONE, VkBusOpenNamedConnection(busTypeLibrary, "tester", &connection));
    std::thread opener([&] {
        uint32_t session = 0;
        EXPECT_NE(VK_BUS_DONE,
                  VkBusOpenSession(connection, VkAesQueryProtocol::idG, VkAesQueryProtocol::checksumG,
                                   nullptr, nullptr, nullptr, 0, &session));
    });
    EXPECT_EQ(VK_BUS_DONE, VkBusCloseConnection(connection));
    opener.join();
}

TEST_F(Close, OpeningEndsWhenNobodyAnswers) {
    uint32_t listener = 0;
    ASSERT_EQ(VK_BUS_DONE, VkBusListen(busTypeLibrary, VkAesQueryProtocol::idG, VkAesQueryProtocol::checksumG,
                                       nullptr, nullptr, nullptr, nullptr, &listener));
    const auto start = std::chrono::steady_clock::now();
    EXPECT_EQ(VK_BUS_TIMED_OUT, Client().openResult);
    EXPECT_GE(std::chrono::steady_clock::now() - start, std::chrono::nanoseconds(vkBusOpeningLimitG));
}

TEST_F(Close, NothingGrowsWithReconnects) {
    Service service;
    const size_t nDescriptors = CountInProc("fd");
    size_t nHeapBytes = 0;
    for (unsigned round = 1; round <= 1100; ++round) {
        {
            Client client;
            ASSERT_EQ("x", client.RoundTrip("x"));
        }
        ASSERT_TRUE(WaitUntil([&] { return service.nClosed == round; }));
        if (round == 100) {
            nHeapBytes = mallinfo2().uordblks;
        }
    }
    EXPECT_EQ(nDescriptors, CountInProc("fd"));
    EXPECT_LT(mallinfo2().uordblks, nHeapBytes + 64 * 1000) << "64 bytes each would be too many";
}

}  // namespace
