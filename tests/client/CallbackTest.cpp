#include "ClientFixture.h"

// What a callback may do; it runs on the activity's thread.

class CallbackTest : public ClientTest {
 protected:
    /// Sends a stream, answers it once, and does `work` in the callback.
    unsigned InCallback(const ref<VkLocalorvoClient>& client, std::function<void(const Received&)> work,
                        bool isFinal = false) {
        OnReceived([work](const Received& received) {
            OnReceived(nullptr);
            work(received);
        });
        const unsigned rpcId = SendAsync(client, true, this);
        bus.ForgetCalls();
        bus.Respond(rpcId, isFinal);
        bus.WaitHandled();
        EXPECT_EQ(1u, AllReceived().size());
        return rpcId;
    }
};

TEST_F(CallbackTest, ItCancelsItsOwnRequest) {
    for (const bool isFinal : {false, true}) {
        const ref<VkLocalorvoClient> client = VkLocalorvoClient::Get();
        bool isCancelled = false;
        const unsigned rpcId = [&] {
            unsigned id = 0;
            OnReceived([&](const Received& received) {
                isCancelled = client->CancelRequest(received.rpcId);
                EXPECT_FALSE(client->CancelRequest(received.rpcId));
            });
            id = SendAsync(client, true);
            bus.ForgetCalls();
            bus.Respond(id, isFinal);
            bus.Respond(id, true);
            bus.WaitHandled();
            return id;
        }();
        EXPECT_TRUE(isCancelled);
        EXPECT_EQ("0 0 0 0", Tables(client));
        EXPECT_EQ(Lines{"cancel " + std::to_string(rpcId)}, bus.CallsBeside());
    }
    EXPECT_EQ(2u, AllReceived().size());
}

TEST_F(CallbackTest, ItSendsMore) {
    const ref<VkLocalorvoClient> client = Connected();
    unsigned more = 0;
    InCallback(client, [&](const Received& received) {
        EXPECT_TRUE(client->SendRequestAndForget(object.get()));
        EXPECT_TRUE(client->SendUpdateRequest(received.rpcId, object.get()));
        EXPECT_TRUE(client->SendRequestAsync(object.get(), false, &OnResponse, more));
    });
    EXPECT_EQ((Lines{"request 2 none", "requestUpdate 1 multiple", "request 3 single"}), bus.CallsBeside());
    EXPECT_EQ("2 0 2 1", Tables(client));
    bus.Respond(more);
    bus.WaitHandled();
    EXPECT_EQ(2u, AllReceived().size());
    EXPECT_EQ(0u, bus.Count("fd"));  // no second activity
}

TEST_F(CallbackTest, ItCannotWaitForAResponse) {
    const ref<VkLocalorvoClient> client = Connected();
    const int64_t start = TestClock::Now();
    InCallback(client, [&](const Received&) {
        ref<sorn::LazyDict> response;
        EXPECT_FALSE(client->SendRequestSync(object.get(), response));
        EXPECT_EQ(nullptr, response);
        EXPECT_EQ(nullptr, client->SendRequestSync(object.get()));
    });
    EXPECT_EQ(start, TestClock::Now());
    EXPECT_EQ("1 0 1 1", Tables(client));
}

TEST_F(CallbackTest, AFailedSendInItHandlesNoEvents) {
    const ref<VkLocalorvoClient> client = Connected();
    bus.nFailSend = 0;
    InCallback(client, [&](const Received&) {
        bus.nFailSend = 1;
        bus.Respond(4711);
        EXPECT_FALSE(client->SendRequestAndForget(object.get()));
        EXPECT_TRUE(bus.EventResults().empty());
    });
    EXPECT_EQ(2u, bus.EventResults().size());
}

TEST_F(CallbackTest, ItDestroysTheClient) {
    ref<VkLocalorvoClient> client = Connected();
    InCallback(client, [&](const Received&) {
        VkLocalorvoClient::Destroy();
        EXPECT_EQ(nullptr, VkLocalorvoClient::Get());
    });
    EXPECT_EQ((Lines{"cancel 1", "close session", "close"}), bus.CallsBeside());
    EXPECT_EQ("0 0 0 0", Tables(client));
    EXPECT_FALSE(FMonitored(client));
}

TEST_F(CallbackTest, ItDestroysTheClientAndMakesAnother) {
    const ref<VkLocalorvoClient> client = Connected();
    ref<VkLocalorvoClient> second;
    unsigned rpcId = 0;
    InCallback(client, [&](const Received&) {
        VkLocalorvoClient::Destroy();
        VkLocalorvoClient::Create(&pool);
        second = VkLocalorvoClient::Get();
        EXPECT_TRUE(second->SendRequestAsync(object.get(), false, &OnResponse, rpcId));
    });
    EXPECT_NE(client, second);
    EXPECT_EQ(1u, rpcId);
    bus.Respond(rpcId);
    bus.WaitHandled();
    EXPECT_EQ(2u, AllReceived().size());
}

TEST_F(CallbackTest, ItDisconnectsAndGoesOn) {
    const ref<VkLocalorvoClient> client = Connected();
    unsigned rpcId = 0;
    InCallback(client, [&](const Received&) {
        VkLocalorvoClientProbe{*client}.Disconnect();
        EXPECT_EQ("0 0 0 0", Tables(client));
        EXPECT_TRUE(client->SendRequestAsync(object.get(), true, &OnResponse, rpcId));
        EXPECT_TRUE(FMonitored(client));
    });
    EXPECT_EQ((Lines{"cancel 1", "close session", "close", "open", "session", "hello", "request 2 multiple"}),
              bus.CallsBeside());
    bus.Respond(rpcId);
    bus.WaitHandled();
    EXPECT_EQ(2u, AllReceived().size());
}

TEST_F(CallbackTest, ItIgnoresAll) {
    const ref<VkLocalorvoClient> client = Connected();
    const unsigned rpcId = InCallback(client, [&](const Received&) { client->IgnoreAllRequests(); });
    bus.Respond(rpcId);
    bus.WaitHandled();
    EXPECT_EQ(1u, AllReceived().size());
}

TEST_F(CallbackTest, ItIsGivenEachResponseInItsOrder) {
    const ref<VkLocalorvoClient> client = Connected();
    const unsigned rpcId = SendAsync(client, true);
    constexpr unsigned n = 500;
    for (unsigned i = 0; i < n; ++i) bus.Respond(rpcId, i == n - 1, "{\"n\":" + std::to_string(i) + "}");
    bus.WaitHandled();
    const std::vector<Received> all = AllReceived();
    ASSERT_EQ(n, all.size());
    for (unsigned i = 0; i < n; ++i) EXPECT_EQ("{\"n\":" + std::to_string(i) + "}", all[i].json);
}
