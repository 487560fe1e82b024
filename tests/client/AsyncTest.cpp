#include "ClientFixture.h"
#include "sorn/rpc/RequestWrapper.h"

class AsyncTest : public ClientTest {
 protected:
    void Answer(uint32_t rpcId, bool isFinal = true, const std::string& body = ScriptedBus::bodyG) {
        bus.Respond(rpcId, isFinal, body);
        bus.WaitHandled();
    }
};

TEST_F(AsyncTest, ASingleRequestGetsOneCallback) {
    const ref<VkLocalorvoClient> client = Connected();
    const unsigned rpcId = SendAsync(client, false);
    EXPECT_EQ("1 0 1 0", Tables(client));
    Answer(rpcId);
    EXPECT_EQ((std::vector<Received>{{1, true, ScriptedBus::bodyG, nullptr}}), AllReceived());
    EXPECT_EQ("0 0 0 0", Tables(client));
    Answer(rpcId);
    EXPECT_EQ(1u, AllReceived().size());
}

TEST_F(AsyncTest, ASingleRequestEndsWithAResponseThatIsNotFinal) {
    const ref<VkLocalorvoClient> client = Connected();
    Answer(SendAsync(client, false, this), false);
    EXPECT_EQ((std::vector<Received>{{1, false, ScriptedBus::bodyG, this}}), AllReceived());
    EXPECT_EQ("0 0 0 0", Tables(client));
}

TEST_F(AsyncTest, AStreamEndsWithItsFinalResponse) {
    for (void* context : {static_cast<void*>(nullptr), static_cast<void*>(this)}) {
        const ref<VkLocalorvoClient> client = VkLocalorvoClient::Get();
        const unsigned rpcId = SendAsync(client, true, context);
        const std::string tables = context == nullptr ? "1 0 1 0" : "1 0 1 1";
        std::vector<Received> expected = AllReceived();
        for (const char* body : {"{\"type\":\"a\"}", "{\"type\":\"b\"}", "{\"type\":\"c\"}"}) {
            EXPECT_EQ(tables, Tables(client));
            const bool isFinal = body[9] == 'c';
            Answer(rpcId, isFinal, body);
            expected.push_back({rpcId, isFinal, body, context});
        }
        EXPECT_EQ(expected, AllReceived());
        EXPECT_EQ("0 0 0 0", Tables(client));
    }
}

TEST_F(AsyncTest, ANullContextMakesItTheCallWithoutOne) {
    const ref<VkLocalorvoClient> client = Connected();
    unsigned rpcId = 0;
    EXPECT_TRUE(client->SendRequestAsync(object.get(), false, &OnContextResponse, nullptr, rpcId));
    EXPECT_EQ("1 0 1 0", Tables(client));
    unsigned second = 0;
    EXPECT_TRUE(client->SendRequestAsyncInternal(object.get(), false, reinterpret_cast<void*>(&OnResponse),
                                                 nullptr, second));
    Answer(second);
    EXPECT_EQ((std::vector<Received>{{2, true, ScriptedBus::bodyG, nullptr}}), AllReceived());
    EXPECT_TRUE(client->SendRequestAsyncInternal(object.get(), false,
                                                 reinterpret_cast<void*>(&OnContextResponse), &pool, second));
    Answer(second);
    EXPECT_EQ((Received{3, true, ScriptedBus::bodyG, &pool}), AllReceived().back());
}

TEST_F(AsyncTest, TheResponseMayComeBeforeTheSendReturns) {
    const ref<VkLocalorvoClient> client = Monitored();
    bus.onSend = [this](const std::string&) { Answer(1); };
    unsigned rpcId = 0;
    EXPECT_TRUE(client->SendRequestAsync(object.get(), true, &OnResponse, rpcId));
    EXPECT_EQ(1u, rpcId);
    EXPECT_EQ(1u, AllReceived().size());
    EXPECT_EQ("0 0 0 0", Tables(client));
}

TEST_F(AsyncTest, AFailedSendLeavesNothingBehind) {
    const ref<VkLocalorvoClient> client = Connected();
    bus.nFailSend = 2;
    unsigned rpcId = 55;
    EXPECT_FALSE(client->SendRequestAsync(object.get(), true, &OnResponse, rpcId));
    EXPECT_FALSE(client->SendRequestAsync(object.get(), false, &OnContextResponse, this, rpcId));
    EXPECT_EQ(55u, rpcId);
    EXPECT_EQ("0 0 0 0", Tables(client));
    EXPECT_FALSE(FMonitored(client));
}

TEST_F(AsyncTest, ANullCallbackKeepsTheResponse) {
    const ref<VkLocalorvoClient> client = Connected();
    unsigned rpcId = 0;
    EXPECT_TRUE(client->SendRequestAsync(object.get(), false, nullptr, rpcId));
    EXPECT_EQ("1 0 0 0", Tables(client));
    Answer(rpcId);
    EXPECT_EQ("0 1 0 0", Tables(client));
    EXPECT_TRUE(client->SendRequestAsync(object.get(), true, nullptr, rpcId));
    Answer(rpcId, false);
    EXPECT_EQ("1 2 0 0", Tables(client));
    EXPECT_TRUE(client->CancelRequest(rpcId));
    EXPECT_EQ("0 1 0 0", Tables(client));
    VkLocalorvoClientProbe{*client}.Disconnect();
    EXPECT_EQ("0 0 0 0", Tables(client));
}

TEST_F(AsyncTest, CancellingAStream) {
    const ref<VkLocalorvoClient> client = Connected();
    const unsigned rpcId = SendAsync(client, true, this);
    bus.ForgetCalls();
    EXPECT_TRUE(client->CancelRequest(rpcId));
    EXPECT_EQ("0 0 0 0", Tables(client));
    EXPECT_FALSE(client->CancelRequest(rpcId));
    EXPECT_EQ(Lines{"cancel 1"}, bus.CallsBeside());
    Answer(rpcId);
    EXPECT_TRUE(AllReceived().empty());
    EXPECT_TRUE(FMonitored(client));
}

TEST_F(AsyncTest, ACancelThatIsNotSentEndsTheStreamAllTheSame) {
    const ref<VkLocalorvoClient> client = Connected();
    const unsigned rpcId = SendAsync(client, true);
    bus.nFailSend = 1;
    EXPECT_FALSE(client->CancelRequest(rpcId));
    EXPECT_EQ("0 0 0 0", Tables(client));
    Answer(rpcId);
    EXPECT_TRUE(AllReceived().empty());
}

TEST_F(AsyncTest, WhatCannotBeCancelled) {
    const ref<VkLocalorvoClient> client = Connected();
    const unsigned single = SendAsync(client, false);
    const unsigned ended = SendAsync(client, true);
    Answer(ended);
    bus.ForgetCalls();
    for (const unsigned rpcId : {single, ended, 0u, 4711u})
        EXPECT_FALSE(client->CancelRequest(rpcId)) << rpcId;
    EXPECT_EQ(Lines{}, bus.CallsBeside());
    EXPECT_EQ("1 0 1 0", Tables(client));
    Answer(single);
    EXPECT_EQ(2u, AllReceived().size());
}

TEST_F(AsyncTest, UpdatesOfPendingRequests) {
    const ref<VkLocalorvoClient> client = Connected();
    const unsigned stream = SendAsync(client, true, this);
    const unsigned single = SendAsync(client, false);
    bus.ForgetCalls();
    EXPECT_TRUE(client->SendUpdateRequest(stream, object.get()));
    EXPECT_TRUE(client->SendUpdateRequest(single, object.get()));
    EXPECT_EQ("2 0 2 1", Tables(client));
    bus.nFailSend = 1;
    EXPECT_FALSE(client->SendUpdateRequest(stream, object.get()));
    EXPECT_EQ("2 0 2 1", Tables(client));
    EXPECT_EQ((Lines{"requestUpdate 1 multiple", "requestUpdate 2 multiple", "requestUpdate 1 multiple"}),
              bus.CallsBeside());
    Answer(stream);
    bus.ForgetCalls();
    for (const unsigned rpcId : {stream, 0u, 4711u}) {
        EXPECT_FALSE(client->SendUpdateRequest(rpcId, object.get())) << rpcId;
    }
    EXPECT_EQ(Lines{}, bus.CallsBeside());
    EXPECT_EQ(2u, VkLocalorvoClientProbe{*client}.LastRpcId());
}

TEST_F(AsyncTest, AnUpdateConnectsWhenTheConnectionIsGone) {
    const ref<VkLocalorvoClient> client = Connected();
    VkLocalorvoClientProbe{*client}.Disconnect();
    VkLocalorvoClientProbe{*client}.StorePending(object, this);
    bus.ForgetCalls();
    EXPECT_TRUE(client->SendUpdateRequest(1, object.get()));
    EXPECT_EQ((Lines{"open", "session", "hello", "requestUpdate 1 multiple"}), bus.Calls());
}
