#include <malloc.h>

#include "ClientBusFixture.h"
#include "client/BusTypeLibrary.h"

// What a service may do to a client.

class ServiceTest : public ClientBusTest {};

TEST_F(ServiceTest, AnswersOfAllKinds) {
    Service service;
    const ref<VkLocalorvoClient> client = VkLocalorvoClient::Get();
    EXPECT_TRUE(WaitUntil([&] { return service.nHellos == 1; }));
    EXPECT_TRUE(client->SendRequestAndForget(Object().get()));
    EXPECT_TRUE(FAnswered(client));
    Answers single("one");
    Answers stream("many");
    unsigned rpcId = 0;
    EXPECT_TRUE(SendAsync(client, false, single, rpcId));
    EXPECT_EQ(3u, rpcId);
    EXPECT_TRUE(SendAsync(client, true, stream, rpcId));
    EXPECT_TRUE(WaitUntil([&] { return single.n == 1 && stream.n == 3; }));
    EXPECT_EQ(1u, stream.nFinal);
    EXPECT_EQ(0u, single.nOthers + stream.nOthers);
    EXPECT_TRUE(FAnswered(client));  // beside the activity
    EXPECT_EQ(1u, service.nHellos);
}

/// Bodies below and above the size from which they keep the bytes that came in.
TEST_F(ServiceTest, BodiesOutliveTheConnection) {
    std::vector<ref<sorn::LazyDict>> bodies;
    std::vector<std::string> texts;
    {
        Service service;
        const ref<VkLocalorvoClient> client = VkLocalorvoClient::Get();
        for (const size_t n : {100u, 60'000u, 70'000u, 5'000'000u}) {
            texts.emplace_back(n, 'x');
            bodies.emplace_back();
            ASSERT_TRUE(client->SendRequestSync(Object(texts.back()).get(), bodies.back()));
            ASSERT_NE(nullptr, bodies.back());
        }
    }
    VkLocalorvoClient::Destroy();
    VkBusCloseAll();
    for (size_t i = 0; i < bodies.size(); ++i) {
        // The object has no code; the number of none has no name.
        const std::string wanted =
            "{\"code\": \"INVALID_VALUE:0\", \"text\": \"" + texts[i] + "\", \"type\": \"error\"}";
        const RoxString json = bodies[i]->ToJson(false);
        EXPECT_TRUE(json.View() == wanted) << json.View().substr(0, 100);
    }
}

/// A few bytes of response with a lot behind them, which nobody reads: the bodies hold no more than they are.
TEST_F(ServiceTest, WhatStandsBehindAResponseIsNotHeld) {
    constexpr size_t nBehind = 4 << 20;
    Service service([](const Request& request) {
        Service::SendText(request.session, Service::ResponseText(request.rpcId, true, request.body) +
                                               std::string(nBehind, '\n'));
    });
    const ref<VkLocalorvoClient> client = VkLocalorvoClient::Get();
    std::vector<ref<sorn::LazyDict>> bodies(20);
    const size_t nBefore = mallinfo2().uordblks + mallinfo2().hblkhd;
    const size_t nPoolBefore = pool.GetUsedBytes();
    for (ref<sorn::LazyDict>& each : bodies) {
        ASSERT_TRUE(client->SendRequestSync(Object().get(), each));
        ASSERT_NE(nullptr, each);
    }
    EXPECT_LT(pool.GetUsedBytes() - nPoolBefore, nBehind);
    service.Stop();  // it had some in hand
    EXPECT_LT(mallinfo2().uordblks + mallinfo2().hblkhd, nBefore + 8 * nBehind);
}

/// Each replaces the one before, for which nobody came.
TEST_F(ServiceTest, LargeResponsesThatNobodyReads) {
    Service service;
    const ref<VkLocalorvoClient> client = VkLocalorvoClient::Get();
    unsigned rpcId = 0;
    VkLocalorvoClient::Callback none = nullptr;
    EXPECT_TRUE(client->SendRequestAsync(Object(std::string(100'000, 'x')).get(), true, none, rpcId));
    EXPECT_TRUE(WaitUntil([&] { return !client->FPending(rpcId); }));
    EXPECT_TRUE(FAnswered(client));
}

TEST_F(ServiceTest, NobodyListens) {
    const ref<VkLocalorvoClient> client = VkLocalorvoClient::Get();
    ASSERT_NE(nullptr, client);
    unsigned rpcId = 7;
    Answers answers;
    EXPECT_FALSE(client->SendRequestAndForget(Object().get()));
    EXPECT_FALSE(FAnswered(client));
    EXPECT_FALSE(SendAsync(client, true, answers, rpcId));
    EXPECT_EQ(7u, rpcId);
    Service service;
    EXPECT_TRUE(FAnswered(client));
}

TEST_F(ServiceTest, AnotherProtocolThere) {
    uint32_t listener = 0;
    ASSERT_EQ(0u, VkBusListen(busTypeLibrary, VkAesQueryProtocol::idG, VkAesQueryProtocol::checksumG + 1,
                              nullptr, nullptr, nullptr, nullptr, &listener));
    std::thread thread([&] {
        constexpr int64_t limit = 60'000'000'000;
        while (VkBusProcessOneEvent(listener, &limit) == VK_BUS_DONE) {
        }
    });
    EXPECT_FALSE(VkLocalorvoClient::Get()->SendRequestAndForget(Object().get()));
    EXPECT_FALSE(FAnswered(VkLocalorvoClient::Get()));
    VkBusCloseConnection(listener);
    thread.join();
}

TEST_F(ServiceTest, StoppedAndStartedAgainForOneWhoWaits) {
    const ref<VkLocalorvoClient> client = VkLocalorvoClient::Get();
    for (int round = 0; round < 20; ++round) {
        Service service;
        // The first send after the loss may be what shows it.
        EXPECT_TRUE(FAnswered(client) || FAnswered(client));
        EXPECT_TRUE(FAnswered(client));
        EXPECT_EQ(1u, service.nHellos);
    }
}

TEST_F(ServiceTest, StoppedAndStartedAgainForOneWhoOnlyForgets) {
    const ref<VkLocalorvoClient> client = VkLocalorvoClient::Get();
    for (int round = 0; round < 20; ++round) {
        Service service;
        EXPECT_TRUE(client->SendRequestAndForget(Object().get()) ||
                    client->SendRequestAndForget(Object().get()));
        EXPECT_TRUE(WaitUntil([&] { return service.nRequests == 1; }));
    }
}

TEST_F(ServiceTest, StoppedAndStartedAgainWithTheActivity) {
    const ref<VkLocalorvoClient> client = VkLocalorvoClient::Get();
    for (int round = 0; round < 20; ++round) {
        Service service;
        Answers answers;
        unsigned rpcId = 0;
        EXPECT_TRUE(WaitUntil([&] { return SendAsync(client, true, answers, rpcId); }));
        EXPECT_TRUE(WaitUntil([&] { return answers.nFinal == 1; }));
        EXPECT_EQ(3u, answers.n);
    }
}

TEST_F(ServiceTest, StopsWhileOneWaits) {
    std::unique_ptr<Service> service;
    std::atomic<bool> isAsked{false};
    service = std::make_unique<Service>([&](const Request&) { isAsked = true; });
    const ref<VkLocalorvoClient> client = VkLocalorvoClient::Get();
    std::thread stopper([&] {
        EXPECT_TRUE(WaitUntil([&] { return isAsked.load(); }));
        service->Stop();
    });
    EXPECT_FALSE(FAnswered(client));
    stopper.join();
    service = nullptr;
    service = std::make_unique<Service>();
    EXPECT_TRUE(FAnswered(client) || FAnswered(client));
}

TEST_F(ServiceTest, NeverAnswers) {
    Service service([](const Request&) {});
    const ref<VkLocalorvoClient> client = VkLocalorvoClient::Get();
    for (const bool isMonitored : {false, true}) {
        Answers answers;
        unsigned rpcId = 0;
        EXPECT_TRUE(!isMonitored || SendAsync(client, true, answers, rpcId));
        const auto start = std::chrono::steady_clock::now();
        EXPECT_FALSE(FAnswered(client));
        EXPECT_LE(std::chrono::seconds(5), std::chrono::steady_clock::now() - start);
        EXPECT_TRUE(client->SendRequestAndForget(Object().get()));  // the connection stands
        EXPECT_TRUE(!isMonitored || client->CancelRequest(rpcId));
    }
    EXPECT_TRUE(WaitUntil([&] { return service.nCancels == 1 && service.nRequests == 5; }));
    EXPECT_EQ(1u, service.nHellos);
}

TEST_F(ServiceTest, AnswersGarbage) {
    const std::string body = "{\"type\":\"error\"}";
    const std::string cases[] = {
        "",
        "garbage",
        "ORPC/2 4294967295 4294967295\r\n",
        std::string(1'000'000, '\r'),
        Service::ResponseText(1, true, body).substr(0, 40),
        "ORPC/2 20 0\r\nType: request\r\n\r\n\r\n\r\n",
    };
    Service service([&](const Request& request) {
        for (const std::string& each : cases) Service::SendText(request.session, each);
        Service::RespondByDefault(request);
    });
    const ref<VkLocalorvoClient> client = VkLocalorvoClient::Get();
    Answers answers;
    unsigned rpcId = 0;
    EXPECT_TRUE(SendAsync(client, true, answers, rpcId));
    EXPECT_TRUE(WaitUntil([&] { return answers.n == 3; }));
    EXPECT_TRUE(FAnswered(client));
}

TEST_F(ServiceTest, SendsAPieceOfAResponse) {
    Service service([](const Request& request) {
        if (request.kind == "cancel") return;
        const VkAesResponseChunk chunk = {request.rpcId, true, {0, nullptr}};
        VkBusMarshalAndSend(request.session, VkAesResponseChunk::idG, &chunk);
    });
    const ref<VkLocalorvoClient> client = VkLocalorvoClient::Get();
    for (unsigned round = 1; round <= 5; ++round) {
        EXPECT_FALSE(FAnswered(client));
        EXPECT_TRUE(WaitUntil([&] { return service.nHellos == round; }));  // each on a session of its own
    }
}

TEST_F(ServiceTest, Floods) {
    constexpr unsigned nResponses = isSlowG ? 1000 : 10'000;
    Service service([](const Request& request) {
        if (request.kind == "cancel") return;
        if (request.count != "multiple") return Service::RespondByDefault(request);
        for (unsigned i = 0; i < nResponses; ++i) {
            Service::SendText(request.session, Service::ResponseText(4711, true, "{}"));
            Service::Respond(request, i == nResponses - 1, "{\"n\":" + std::to_string(i) + "}");
        }
    });
    const ref<VkLocalorvoClient> client = VkLocalorvoClient::Get();
    Answers answers;
    unsigned rpcId = 0;
    EXPECT_TRUE(SendAsync(client, true, answers, rpcId));
    EXPECT_TRUE(WaitUntil([&] { return answers.nFinal == 1; }));
    EXPECT_EQ(nResponses, answers.n);
    EXPECT_TRUE(FAnswered(client));
}

TEST_F(ServiceTest, AnswersWithFiveMebibytes) {
    const std::string large(5 * 1024 * 1024 - 100, 'x');
    Service service([&](const Request& request) {
        Service::Respond(request, true, "{\"type\":\"error\",\"text\":\"" + large + "\"}");
    });
    ref<sorn::LazyDict> response;
    EXPECT_TRUE(VkLocalorvoClient::Get()->SendRequestSync(Object().get(), response));
    ASSERT_NE(nullptr, response);
    EXPECT_LT(large.size(), response->ToJson(false).NByte());
}
