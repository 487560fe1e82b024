#include "ClientFixture.h"
#include "sorn/model/InternedString.h"

class LifecycleTest : public ClientTest {};

TEST_F(LifecycleTest, CreatingConnectsNothing) {
    EXPECT_EQ(Lines{}, bus.Calls());
}

TEST_F(LifecycleTest, TheFirstGetConnectsAndTheSecondDoesNot) {
    const ref<VkLocalorvoClient> client = VkLocalorvoClient::Get();
    EXPECT_EQ((Lines{"open", "session", "hello"}), bus.Calls());
    EXPECT_NE(0u, VkLocalorvoClientProbe{*client}.Connection());
    EXPECT_NE(0u, VkLocalorvoClientProbe{*client}.Session());
    EXPECT_EQ(client, VkLocalorvoClient::Get());
    EXPECT_EQ(3u, bus.Calls().size());
}

TEST_F(LifecycleTest, ASecondCreateKeepsTheFirstClient) {
    const ref<VkLocalorvoClient> client = VkLocalorvoClient::Get();
    EXPECT_EQ(0u, VkLocalorvoClient::Create(&pool));
    EXPECT_EQ(client, VkLocalorvoClient::Get());
}

TEST_F(LifecycleTest, GetBeforeCreateGivesNull) {
    VkLocalorvoClient::Destroy();
    EXPECT_EQ(nullptr, VkLocalorvoClient::Get());
    EXPECT_EQ(Lines{}, bus.Calls());
}

TEST_F(LifecycleTest, GetGivesTheClientWithTheBusDown) {
    struct Case {
        unsigned ScriptedBus::*refuse;
        Lines calls;
    };
    const Case cases[] = {
        {&ScriptedBus::nRefuseOpen, {"open refused"}},
        {&ScriptedBus::nRefuseSession, {"open", "session refused", "close"}},
        {&ScriptedBus::nRefuseHello, {"open", "session", "hello refused", "close session", "close"}},
    };
    for (const Case& each : cases) {
        bus.ForgetCalls();
        bus.*each.refuse = 1;
        const ref<VkLocalorvoClient> client = VkLocalorvoClient::Get();
        ASSERT_NE(nullptr, client);
        EXPECT_EQ(each.calls, bus.Calls());
        EXPECT_EQ(0u, VkLocalorvoClientProbe{*client}.Connection());
        EXPECT_EQ(0u, VkLocalorvoClientProbe{*client}.Session());
        EXPECT_EQ(0u, bus.NOpen());
    }
    bus.ForgetCalls();
    VkLocalorvoClient::Get();  // each one is a new attempt
    EXPECT_EQ((Lines{"open", "session", "hello"}), bus.Calls());
}

TEST_F(LifecycleTest, DestroyWithoutAClientDoesNothing) {
    VkLocalorvoClient::Destroy();
    VkLocalorvoClient::Destroy();
    EXPECT_EQ(Lines{}, bus.Calls());
}

TEST_F(LifecycleTest, DestroyEndsTheTableOfSharedNamesEvenWithoutAClient) {
    VkLocalorvoClient::Destroy();
    const size_t nUsed = pool.GetUsedBytes();
    std::vector<std::string> names;
    for (int i = 0; i < 20'000; ++i) names.push_back("name" + std::to_string(i));
    for (const std::string& name : names) sorn::InternedString(&pool, name.c_str());
    EXPECT_GT(pool.GetUsedBytes(), nUsed);
    VkLocalorvoClient::Destroy();
    EXPECT_EQ(nUsed, pool.GetUsedBytes());
}

TEST_F(LifecycleTest, DestroyClosesTheSessionBeforeTheConnection) {
    Connected();
    VkLocalorvoClient::Destroy();
    EXPECT_EQ((Lines{"close session", "close"}), bus.Calls());
    EXPECT_EQ(nullptr, VkLocalorvoClient::Get());
}

TEST_F(LifecycleTest, DestroyCancelsWhatIsPendingFirst) {
    const ref<VkLocalorvoClient> client = Connected();
    SendAsync(client, true);
    SendAsync(client, false);  // this kind, too, though CancelRequest refuses it
    SendAsync(client, true, this);
    EXPECT_EQ("3 0 3 1", Tables(client));
    bus.ForgetCalls();
    VkLocalorvoClient::Destroy();
    Lines calls = bus.CallsBeside();
    ASSERT_EQ(5u, calls.size());
    std::sort(calls.begin(), calls.begin() + 3);
    EXPECT_EQ((Lines{"cancel 1", "cancel 2", "cancel 3", "close session", "close"}), calls);
    EXPECT_EQ("0 0 0 0", Tables(client));
    EXPECT_FALSE(FMonitored(client));
}

TEST_F(LifecycleTest, DestroyGoesOnWhenCancelsFail) {
    const ref<VkLocalorvoClient> client = Connected();
    SendAsync(client, true);
    SendAsync(client, true);
    bus.ForgetCalls();
    bus.nFailSend = 2;
    VkLocalorvoClient::Destroy();
    EXPECT_EQ(4u, bus.CallsBeside().size());
    EXPECT_EQ("0 0 0 0", Tables(client));
}

TEST_F(LifecycleTest, AClientThatIsHeldSendsNothingAfterDestroy) {
    const ref<VkLocalorvoClient> client = Connected();
    VkLocalorvoClient::Destroy();
    bus.ForgetCalls();
    EXPECT_FALSE(client->SendRequestAndForget(object.get()));
    EXPECT_EQ(Lines{}, bus.Calls());
}

TEST_F(LifecycleTest, ANewClientCountsFromOne) {
    EXPECT_EQ(1u, SendAsync(VkLocalorvoClient::Get(), true));
    VkLocalorvoClient::Destroy();
    VkLocalorvoClient::Create(&pool);
    EXPECT_EQ(1u, SendAsync(VkLocalorvoClient::Get(), true));
}

TEST_F(LifecycleTest, AfterDisconnectTheNextSendConnectsAndNumbersGoOn) {
    const ref<VkLocalorvoClient> client = Connected();
    EXPECT_EQ(1u, SendAsync(client, true, this));
    VkLocalorvoClientProbe{*client}.Disconnect();
    EXPECT_EQ("0 0 0 0", Tables(client));
    EXPECT_EQ(0u, bus.NOpen());
    bus.ForgetCalls();
    EXPECT_TRUE(client->SendRequestAndForget(object.get()));
    EXPECT_EQ((Lines{"open", "session", "hello", "request 2 none"}), bus.Calls());
}

TEST_F(LifecycleTest, TheOtherEndClosesAndTheNextGetConnects) {
    const ref<VkLocalorvoClient> client = Monitored();
    bus.CloseFromAfar();
    bus.WaitHandled();
    EXPECT_EQ((Lines{"close session", "close"}), bus.CallsBeside());
    EXPECT_FALSE(FMonitored(client));
    bus.ForgetCalls();
    VkLocalorvoClient::Get();
    EXPECT_EQ((Lines{"open", "session", "hello"}), bus.Calls());
}

TEST_F(LifecycleTest, ALossEndsAsynchronousRequestsAndTellsNobody) {
    const ref<VkLocalorvoClient> client = Connected();
    const unsigned rpcId = SendAsync(client, true);
    bus.CloseFromAfar();
    bus.WaitHandled();
    EXPECT_EQ("0 0 0 0", Tables(client));
    EXPECT_FALSE(client->SendUpdateRequest(rpcId, object.get()));
    EXPECT_TRUE(AllReceived().empty());
}

TEST_F(LifecycleTest, DisconnectTwiceClosesOnce) {
    const ref<VkLocalorvoClient> client = Monitored();
    VkLocalorvoClientProbe{*client}.Disconnect();
    VkLocalorvoClientProbe{*client}.Disconnect();
    EXPECT_EQ((Lines{"close session", "close"}), bus.CallsBeside());
}
