#include "ClientBusFixture.h"

class TeardownTest : public ClientBusTest {};
using TeardownDeathTest = TeardownTest;

TEST_F(TeardownTest, FromACallback) {
    Service service;
    for (int round = 0; round < 50; ++round) {
        VkLocalorvoClient::Create(&pool);
        Answers answers;
        answers.then = [](unsigned, bool) { VkLocalorvoClient::Destroy(); };
        unsigned rpcId = 0;
        EXPECT_TRUE(SendAsync(VkLocalorvoClient::Get(), true, answers, rpcId));
        EXPECT_TRUE(WaitUntil([&] { return answers.n == 1; }));
        EXPECT_EQ(nullptr, VkLocalorvoClient::Get());
    }
}

TEST_F(TeardownTest, FromAnotherThreadWhileCallbacksRun) {
    Service service([](const Request& request) {
        for (int i = 0; i < 20; ++i) Service::Respond(request, false, request.body);
    });
    for (int round = 0; round < 50; ++round) {
        VkLocalorvoClient::Create(&pool);
        Answers answers;
        unsigned rpcId = 0;
        EXPECT_TRUE(SendAsync(VkLocalorvoClient::Get(), true, answers, rpcId));
        EXPECT_TRUE(WaitUntil([&] { return answers.n > 0; }));
        VkLocalorvoClient::Destroy();
        const unsigned n = answers.n;
        EXPECT_GE(20u, n);
        EXPECT_EQ(n, answers.n);  // no callback runs any more: the next round's answers lie in the same place
    }
}

TEST_F(TeardownTest, ByManyThreadsAtOnce) {
    Service service;
    for (int round = 0; round < 20; ++round) {
        VkLocalorvoClient::Create(&pool);
        Answers answers;
        unsigned rpcId = 0;
        EXPECT_TRUE(SendAsync(VkLocalorvoClient::Get(), true, answers, rpcId));
        OnThreads(4, [](unsigned) { VkLocalorvoClient::Destroy(); });
        EXPECT_EQ(nullptr, VkLocalorvoClient::Get());
        VkLocalorvoClient::Destroy();
    }
}

TEST_F(TeardownTest, WhileOneWaitsHandlingEvents) {
    std::atomic<bool> isAsked{false};
    Service service([&](const Request&) { isAsked = true; });
    ref<VkLocalorvoClient> client = VkLocalorvoClient::Get();
    std::thread destroyer([&] {
        EXPECT_TRUE(WaitUntil([&] { return isAsked.load(); }));
        VkLocalorvoClient::Destroy();
    });
    EXPECT_FALSE(FAnswered(client));
    destroyer.join();
    EXPECT_TRUE(WaitUntil([&] { return service.nCancels == 1 || service.nHellos == 1; }));
}

TEST_F(TeardownTest, WhileOthersSend) {
    for (int round = 0; round < (isSlowG ? 5 : 20); ++round) {
        Service service;
        VkLocalorvoClient::Create(&pool);
        std::atomic<bool> isOver{false};
        std::deque<Answers> all(4);
        OnThreads(5, [&](unsigned number) {
            if (number == 4) {
                WaitUntil([&] { return all[0].n + all[1].n + all[2].n + all[3].n > 10; });
                VkLocalorvoClient::Destroy();
                isOver = true;
                return;
            }
            unsigned rpcId = 0;
            while (!isOver) {
                if (const ref<VkLocalorvoClient> client = VkLocalorvoClient::Get(); client != nullptr) {
                    SendAsync(client, false, all[number], rpcId);
                }
            }
        });
        // Nor did a thread that held the client connect it again: see the threads left at the end of the
        // test.
    }
}

TEST_F(TeardownTest, WhoStillHoldsTheClientConnectsNoMore) {
    Service service;
    const ref<VkLocalorvoClient> client = VkLocalorvoClient::Get();
    EXPECT_TRUE(WaitUntil([&] { return service.nHellos == 1; }));
    const size_t nDescriptors = CountInProc("fd");
    VkLocalorvoClient::Destroy();
    Answers answers;
    unsigned rpcId = 0;
    EXPECT_FALSE(SendAsync(client, true, answers, rpcId));
    EXPECT_FALSE(FAnswered(client));
    EXPECT_FALSE(client->SendRequestAndForget(Object().get()));
    EXPECT_FALSE(client->FPending(1));
    EXPECT_GT(nDescriptors, CountInProc("fd"));
    EXPECT_EQ(1u, service.nHellos);
}

TEST_F(TeardownTest, WaitsForACallbackOfASenderThatHandlesEvents) {
    // The synchronous sender is asked first and answered last, so that the callback runs on its thread.
    std::atomic<unsigned> nAsked{0};
    Service service([&](const Request& request) {
        if (++nAsked == 2) Service::Respond(request, true, request.body);
    });
    const ref<VkLocalorvoClient> client = VkLocalorvoClient::Get();
    std::thread waiter([&] { EXPECT_FALSE(FAnswered(client)); });
    EXPECT_TRUE(WaitUntil([&] { return nAsked == 1; }));
    Answers answers;
    std::atomic<bool> isInside{false};
    std::atomic<bool> isDone{false};
    answers.then = [&](unsigned, bool) {
        isInside = true;
        std::this_thread::sleep_for(std::chrono::milliseconds(200));
        isDone = true;
    };
    unsigned rpcId = 0;
    EXPECT_TRUE(SendAsync(client, false, answers, rpcId));
    EXPECT_TRUE(WaitUntil([&] { return isInside.load(); }));
    VkLocalorvoClient::Destroy();
    EXPECT_TRUE(isDone);
    waiter.join();
}

TEST_F(TeardownTest, TwiceAndByTheRuntime) {
    for (int round = 0; round < 5; ++round) {
        Service service;
        Answers answers;
        unsigned rpcId = 0;
        EXPECT_TRUE(SendAsync(VkLocalorvoClient::Get(), true, answers, rpcId));
        VkLocalorvoClient::Destroy();
        VkLocalorvoClient::Destroy();
        RoxInitInfo::StopAll();  // which closes the service, too
        EXPECT_EQ(nullptr, VkLocalorvoClient::Get());
        EXPECT_EQ(0u, RoxInitInfo::StartAll(&pool));
    }
}

TEST_F(TeardownDeathTest, AtTheEndOfTheProcessNobodyWaits) {
    testing::FLAGS_gtest_death_test_style = sizeof(void*) == 4 ? "fast" : "threadsafe";
    const auto work = [this](bool isStopped) {
        auto* const service =
            new Service([](const Request& request) { Service::Respond(request, false, request.body); });
        auto* const answers = new Answers;
        unsigned rpcId = 0;
        if (service->nHellos != 0 || !SendAsync(VkLocalorvoClient::Get(), true, *answers, rpcId)) _exit(3);
        if (!WaitUntil([&] { return answers->n > 0; })) _exit(4);
        if (isStopped) {
            RoxInitInfo::StopAll();
            delete service;
            delete answers;
        }
        exit(0);
    };
    EXPECT_EXIT(work(false), testing::ExitedWithCode(0), "");
    EXPECT_EXIT(work(true), testing::ExitedWithCode(0), "");
}
