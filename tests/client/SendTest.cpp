#include "ClientFixture.h"
#include "rox/RoxFeatures.h"
#include "sornschema/RecordingSearch.h"

using testing::HasSubstr;

class SendTest : public ClientTest {
 protected:
    ~SendTest() override { RoxFeatures::SetEnabled(VK_FEATURE_LAST_SCHEMA_VERSION, false); }
};

TEST_F(SendTest, TheFirstRequestHasNumberOneAndAFailedSendSpendsOne) {
    const ref<VkLocalorvoClient> client = Connected();
    EXPECT_TRUE(client->SendRequestAndForget(object.get()));
    bus.nFailSend = 1;
    EXPECT_FALSE(client->SendRequestAndForget(object.get()));
    EXPECT_EQ(3u, SendAsync(client, true));
    bus.Respond(4);
    ref<sorn::LazyDict> response;
    client->SendRequestSync(object.get(), response);
    EXPECT_EQ((Lines{"request 1 none", "request 2 none", "request 3 multiple", "request 4 single"}),
              bus.CallsBeside());
}

TEST_F(SendTest, ARequestOnTheWire) {
    const ref<VkLocalorvoClient> client = Connected();
    object = sornschema::RecordingSearch::Factory(&pool);
    EXPECT_TRUE(client->SendRequestAndForget(object.get()));
    const std::string headers =
        "Content-Type: application/json\r\nRequestType: recordingSearch\r\nResponseCount: none\r\n"
        "RpcId: 1\r\nSchemaVersion: 41\r\nType: request\r\n\r\n";
    const std::string body = "{\"type\": \"recordingSearch\"}";
    EXPECT_EQ(Lines{"ORPC/2 " + std::to_string(headers.size()) + " 27\r\n" + headers + body}, bus.Sent());
}

TEST_F(SendTest, ForgettingLeavesNothingBehind) {
    const ref<VkLocalorvoClient> client = Connected();
    EXPECT_TRUE(client->SendRequestAndForget(object.get()));
    EXPECT_EQ("0 0 0 0", Tables(client));
    bus.nFailSend = 1;
    EXPECT_FALSE(client->SendRequestAndForget(object.get()));
    EXPECT_EQ("0 0 0 0", Tables(client));
}

TEST_F(SendTest, TheFeatureChoosesTheVersionOfEachRequest) {
    const ref<VkLocalorvoClient> client = Connected();
    ref<sorn::LazyDict> response;
    for (const bool isLast : {false, true, false}) {
        RoxFeatures::SetEnabled(VK_FEATURE_LAST_SCHEMA_VERSION, isLast);
        bus.ForgetCalls();
        EXPECT_TRUE(client->SendRequestAndForget(object.get()));
        bus.Respond(VkLocalorvoClientProbe{*client}.LastRpcId() + 1);
        EXPECT_TRUE(client->SendRequestSync(object.get(), response));
        ASSERT_EQ(2u, bus.Sent().size());
        for (const std::string& text : bus.Sent()) {
            EXPECT_THAT(text, HasSubstr(isLast ? "\r\nSchemaVersion: 42\r\n" : "\r\nSchemaVersion: 41\r\n"));
        }
    }
    RoxFeatures::SetEnabled(VK_FEATURE_LAST_SCHEMA_VERSION, true);
    bus.ForgetCalls();
    const unsigned rpcId = SendAsync(client, true);
    EXPECT_THAT(bus.Sent().at(0), HasSubstr("\r\nSchemaVersion: 42\r\n"));
    EXPECT_TRUE(client->SendUpdateRequest(rpcId, object.get()));
    EXPECT_THAT(bus.Sent().at(1), HasSubstr("\r\nType: requestUpdate\r\n"));
    EXPECT_THAT(bus.Sent().at(1), HasSubstr("\r\nSchemaVersion: 0\r\n"));
}

TEST_F(SendTest, TooLargeAMessageIsNotHandedToTheBus) {
    const ref<VkLocalorvoClient> client = Connected();
    const ref<sornschema::Error> error(static_cast<sornschema::Error*>(object.get()));
    const RoxString shown = object->ToString(false, 0);
    error->text = RoxString(std::string(0x500000 - shown.NByte(), 'x').c_str());
    const uint32_t nLargest = object->ToString(false, 0).NByte();
    ASSERT_EQ(0x500000u, nLargest);
    EXPECT_TRUE(client->SendRequestAndForget(object.get()));
    error->text = RoxString((std::string(error->text.Utf8()) + "x").c_str());
    bus.ForgetCalls();
    unsigned rpcId = 7;
    ref<sorn::LazyDict> response;
    EXPECT_FALSE(client->SendRequestAndForget(object.get()));
    EXPECT_FALSE(client->SendRequestSync(object.get(), response));
    EXPECT_FALSE(client->SendRequestAsync(object.get(), true, &OnResponse, rpcId));
    EXPECT_EQ(7u, rpcId);
    EXPECT_EQ(Lines{}, bus.CallsBeside());
    EXPECT_EQ("0 0 0 0", Tables(client));
    EXPECT_EQ(4u, VkLocalorvoClientProbe{*client}.LastRpcId());
}

TEST_F(SendTest, IgnoringEndsAllSendsButNotTheConnecting) {
    const ref<VkLocalorvoClient> client = Connected();
    const unsigned pending = SendAsync(client, true);
    bus.ForgetCalls();
    client->IgnoreAllRequests();
    unsigned rpcId = 7;
    ref<sorn::LazyDict> response;
    EXPECT_FALSE(client->SendRequestAndForget(object.get()));
    EXPECT_FALSE(client->SendRequestSync(object.get(), response));
    EXPECT_EQ(nullptr, client->SendRequestSync(object.get()));
    EXPECT_FALSE(client->SendRequestAsync(object.get(), true, &OnResponse, rpcId));
    EXPECT_FALSE(client->SendUpdateRequest(pending, object.get()));
    EXPECT_FALSE(client->CancelRequest(pending));  // which has ended all the same
    EXPECT_EQ("0 0 0 0", Tables(client));
    EXPECT_EQ(Lines{}, bus.CallsBeside());

    VkLocalorvoClientProbe{*client}.Disconnect();
    bus.ForgetCalls();
    EXPECT_FALSE(client->SendRequestAndForget(object.get()));
    EXPECT_EQ((Lines{"open", "session", "hello"}), bus.Calls());
    VkLocalorvoClientProbe{*client}.Disconnect();
    bus.ForgetCalls();
    VkLocalorvoClient::Get();
    EXPECT_EQ((Lines{"open", "session", "hello"}), bus.Calls());
}

TEST_F(SendTest, IgnoringDropsWhatComes) {
    const ref<VkLocalorvoClient> client = Connected();
    const unsigned rpcId = SendAsync(client, true);
    client->IgnoreAllRequests();
    bus.Respond(rpcId);
    bus.WaitHandled();
    EXPECT_EQ(std::vector<unsigned>{0}, bus.EventResults());
    EXPECT_TRUE(AllReceived().empty());
    EXPECT_EQ("1 0 1 0", Tables(client));
}

TEST_F(SendTest, AFailedSendWithoutALossKeepsTheConnection) {
    const ref<VkLocalorvoClient> client = Connected();
    bus.nFailSend = 1;
    EXPECT_FALSE(client->SendRequestAndForget(object.get()));
    EXPECT_TRUE(client->SendRequestAndForget(object.get()));
    EXPECT_EQ((Lines{"request 1 none", "request 2 none"}), bus.CallsBeside());
}

// Nobody handles events for one who only sends: the failed send does.
TEST_F(SendTest, AfterALossThatOnlyASendShowsTheNextOneConnects) {
    for (const unsigned nWaiting : {0u, 1u, 30u}) {
        const ref<VkLocalorvoClient> client = VkLocalorvoClient::Get();
        for (unsigned i = 0; i < nWaiting; ++i) bus.Respond(1000 + i);
        bus.CloseFromAfar();
        bus.nFailSend = 1;
        bus.ForgetCalls();
        EXPECT_FALSE(client->SendRequestAndForget(object.get()));
        EXPECT_EQ("close", bus.Calls().back());
        EXPECT_EQ(nWaiting + 1, bus.Count("process 0"));
        bus.ForgetCalls();
        EXPECT_TRUE(client->SendRequestAndForget(object.get()));
        const Lines calls = bus.Calls();
        EXPECT_EQ((Lines{"open", "session", "hello"}), Lines(calls.begin(), calls.begin() + 3));
        VkLocalorvoClientProbe{*client}.Disconnect();
    }
}
