#include "ClientBusFixture.h"

class ThreadsTest : public ClientBusTest {
 protected:
    static constexpr unsigned nThreadsG = 8;

    static std::string Body(unsigned n) { return "{\"n\":" + std::to_string(n) + "}"; }
};

TEST_F(ThreadsTest, EveryRequestIsAnsweredExactlyOnce) {
    constexpr unsigned nRounds = isSlowG ? 4 : 12;
    constexpr unsigned nSends = 12;
    Service service;
    for (unsigned round = 0; round < nRounds; ++round) {
        // From a client that is not connected and has no activity.
        VkLocalorvoClient::Destroy();
        VkLocalorvoClient::Create(&pool);
        std::deque<Answers> all;
        std::mutex mutex;
        const auto newAnswers = [&](const std::string& text) -> Answers& {
            std::lock_guard<std::mutex> hold(mutex);
            return all.emplace_back(text);
        };
        std::atomic<unsigned> nMissed{0};
        OnThreads(nThreadsG, [&](unsigned number) {
            const ref<VkLocalorvoClient> client = VkLocalorvoClient::Get();
            for (unsigned i = 0; i < nSends; ++i) {
                const std::string text = "t" + std::to_string(number) + "-" + std::to_string(i) + ";";
                unsigned rpcId = 0;
                if (!FAnswered(client, text + "sync")) ++nMissed;
                Answers& single = newAnswers(text + "single");
                Answers& more = newAnswers(text + "more");
                single.then = [&, client](unsigned, bool) {
                    unsigned id = 0;
                    EXPECT_TRUE(client->SendRequestAndForget(Object().get()));
                    EXPECT_TRUE(SendAsync(client, false, more, id));
                };
                EXPECT_TRUE(SendAsync(client, false, single, rpcId));
                Answers& stream = newAnswers(text + "stream");
                stream.then = [&stream, client](unsigned id, bool isFinal) {
                    EXPECT_TRUE(stream.n != 1 || client->CancelRequest(id));  // in its second call
                    EXPECT_FALSE(isFinal);
                };
                EXPECT_TRUE(SendAsync(client, true, stream, rpcId));
            }
        });
        EXPECT_EQ(0u, nMissed);
        const auto isStream = [](const Answers& each) { return each.wanted.ends_with("stream"); };
        for (const Answers& each : all) {
            const unsigned nWanted = isStream(each) ? 2 : 1;
            EXPECT_TRUE(WaitUntil([&] { return each.n == nWanted; })) << each.wanted << each.n;
        }
        EXPECT_TRUE(FAnswered(VkLocalorvoClient::Get()));
        VkLocalorvoClient::Destroy();
        for (const Answers& each : all) {
            EXPECT_EQ(isStream(each) ? 2u : 1u, each.n) << each.wanted;
            EXPECT_EQ(0u, each.nOthers) << each.wanted;
        }
    }
}

// The first asynchronous send while others wait by handling events themselves: it must not take an event away
// from one who goes on waiting for it.
TEST_F(ThreadsTest, TheActivityStartsBesideSendersThatWait) {
    Service service;
    const auto start = std::chrono::steady_clock::now();
    constexpr unsigned nRounds = isSlowG ? 20 : 60;
    for (unsigned round = 0; round < nRounds; ++round) {
        VkLocalorvoClient::Destroy();
        VkLocalorvoClient::Create(&pool);
        Answers answers;
        OnThreads(3, [&](unsigned number) {
            const ref<VkLocalorvoClient> client = VkLocalorvoClient::Get();
            unsigned rpcId = 0;
            if (number == 0) {
                EXPECT_TRUE(SendAsync(client, false, answers, rpcId));
            } else {
                EXPECT_TRUE(FAnswered(client));
            }
        });
        EXPECT_TRUE(WaitUntil([&] { return answers.n == 1; }));
        VkLocalorvoClient::Destroy();
    }
    // A lost event costs five seconds.
    EXPECT_GT(std::chrono::seconds(60), std::chrono::steady_clock::now() - start);
}

TEST_F(ThreadsTest, StreamsKeepTheirOrderWhoeverHandlesEvents) {
    constexpr unsigned nResponses = 200;
    Service service([](const Request& request) {
        if (request.count != "multiple") return Service::RespondByDefault(request);
        for (unsigned i = 0; i < nResponses; ++i) {
            Service::Respond(request, i == nResponses - 1, Body(i));
        }
    });
    struct Order {
        std::atomic<unsigned> n{0};
        std::atomic<unsigned> nWrong{0};

        static void OnResponse(unsigned, bool, const char* json, void* context) {
            auto* const self = static_cast<Order*>(context);
            if (json != Body(self->n)) ++self->nWrong;
            ++self->n;
        }
    };
    for (unsigned round = 0; round < (isSlowG ? 10u : 30u); ++round) {
        VkLocalorvoClient::Destroy();
        VkLocalorvoClient::Create(&pool);
        Order order;
        OnThreads(4, [&](unsigned number) {
            const ref<VkLocalorvoClient> client = VkLocalorvoClient::Get();
            unsigned rpcId = 0;
            if (number == 0) {
                EXPECT_TRUE(
                    client->SendRequestAsync(Object().get(), true, &Order::OnResponse, &order, rpcId));
            } else {
                EXPECT_TRUE(FAnswered(client));
            }
        });
        EXPECT_TRUE(WaitUntil([&] { return order.n == nResponses; })) << order.n;
        EXPECT_EQ(0u, order.nWrong);
        VkLocalorvoClient::Destroy();
    }
}

TEST_F(ThreadsTest, TheServiceComesAndGoes) {
    std::atomic<bool> isOver{false};
    std::deque<Answers> all;
    std::mutex mutex;
    std::thread services([&] {
        for (unsigned round = 0; round < (isSlowG ? 10u : 60u); ++round) {
            Service service;
            WaitUntil([&] { return service.nRequests > 50; });
        }
        isOver = true;
    });
    OnThreads(nThreadsG, [&](unsigned) {
        const ref<VkLocalorvoClient> client = VkLocalorvoClient::Get();
        while (!isOver) {
            Answers* answers = nullptr;
            {
                std::lock_guard<std::mutex> hold(mutex);
                answers = &all.emplace_back();
            }
            unsigned rpcId = 0;
            SendAsync(client, false, *answers, rpcId);
            client->SendRequestAndForget(Object().get());
            VkLocalorvoClient::Get();
        }
    });
    services.join();
    Service service;
    const ref<VkLocalorvoClient> client = VkLocalorvoClient::Get();
    Answers last;
    unsigned rpcId = 0;
    EXPECT_TRUE(WaitUntil([&] { return SendAsync(client, true, last, rpcId); }));
    EXPECT_TRUE(WaitUntil([&] { return last.n == 3; }));
    VkLocalorvoClient::Destroy();
    for (const Answers& each : all) EXPECT_GE(1u, each.n);
}
