#include "ClientFixture.h"
#include "client/MonitoringActivity.h"

class MonitoringTest : public ClientTest {};

TEST_F(MonitoringTest, StartingTwiceMakesOneActivity) {
    const ref<VkLocalorvoClient> client = Connected();
    VkLocalorvoClientProbe{*client}.StartMonitoring();
    VkLocalorvoClientProbe{*client}.StartMonitoring();
    EXPECT_TRUE(FMonitored(client));
    EXPECT_EQ(Lines{"fd"}, bus.Calls());
}

TEST_F(MonitoringTest, OnlyTheFirstAsynchronousSendStartsIt) {
    const ref<VkLocalorvoClient> client = Connected();
    EXPECT_TRUE(client->SendRequestAndForget(object.get()));
    EXPECT_FALSE(FMonitored(client));
    bus.Respond(2);
    ref<sorn::LazyDict> response;
    EXPECT_TRUE(client->SendRequestSync(object.get(), response));
    EXPECT_FALSE(FMonitored(client));
    bus.ForgetCalls();
    SendAsync(client, true);
    EXPECT_TRUE(FMonitored(client));
    SendAsync(client, true);
    EXPECT_EQ(1u, bus.Count("fd"));
}

TEST_F(MonitoringTest, ItComesBackWithTheNextAsynchronousSendOnly) {
    const ref<VkLocalorvoClient> client = Connected();
    SendAsync(client, true);
    VkLocalorvoClientProbe{*client}.Disconnect();
    EXPECT_FALSE(FMonitored(client));
    EXPECT_TRUE(client->SendRequestAndForget(object.get()));
    EXPECT_FALSE(FMonitored(client));
    bus.ForgetCalls();
    SendAsync(client, true);
    EXPECT_TRUE(FMonitored(client));
    EXPECT_EQ(1u, bus.Count("fd"));
}

TEST_F(MonitoringTest, AFailedSendStartsNone) {
    const ref<VkLocalorvoClient> client = Connected();
    bus.nFailSend = 1;
    unsigned rpcId = 4711;
    EXPECT_FALSE(client->SendRequestAsync(object.get(), true, &OnResponse, rpcId));
    EXPECT_EQ(4711u, rpcId);
    EXPECT_FALSE(FMonitored(client));
    EXPECT_EQ("0 0 0 0", Tables(client));
}

TEST_F(MonitoringTest, ItHandlesWhatComesOneEventACall) {
    const ref<VkLocalorvoClient> client = Monitored();
    for (uint32_t i = 0; i < 3; ++i) bus.Respond(100 + i);
    bus.WaitHandled();
    EXPECT_EQ(3u, bus.EventResults().size());
    EXPECT_LE(3u, bus.Count("process"));
    EXPECT_EQ(bus.Calls().size(), bus.Count("process"));  // without a limit, all of them
}

TEST_F(MonitoringTest, ItEndsWhenProcessingFailsAndTheClientStillCountsOnIt) {
    const ref<VkLocalorvoClient> client = Monitored();
    bus.FailProcessing();
    bus.WaitHandled();
    EXPECT_TRUE(FMonitored(client));
    // A waiter looks at a table that nobody fills, up to its limit.
    ref<sorn::LazyDict> response;
    EXPECT_FALSE(client->SendRequestSync(object.get(), response));
    EXPECT_EQ(100u, TestClock::Sleeps().size());
    // The way down does not wait for an activity that has ended by itself, and the way up starts another.
    VkLocalorvoClientProbe{*client}.Disconnect();
    EXPECT_FALSE(FMonitored(client));
    const unsigned rpcId = SendAsync(client, false);
    bus.Respond(rpcId);
    bus.WaitHandled();
    EXPECT_EQ(1u, AllReceived().size());
}

TEST_F(MonitoringTest, ItLetsGoOfTheClientAtItsEnd) {
    ref<VkLocalorvoClient> client = Monitored();
    VkLocalorvoClient::Destroy();
    const size_t nUsedWithClient = pool.GetUsedBytes();
    client = nullptr;
    EXPECT_GT(nUsedWithClient, pool.GetUsedBytes());
}

TEST_F(MonitoringTest, WithoutAConnectionThereIsNothingToMonitor) {
    const ref<VkLocalorvoClient> client = Monitored();
    VkLocalorvoClientProbe{*client}.Disconnect();
    VkLocalorvoClientProbe{*client}.StartMonitoring();
    EXPECT_FALSE(FMonitored(client));
    bus.ForgetCalls();
    SendAsync(client, true);
    EXPECT_TRUE(FMonitored(client));
}

TEST_F(MonitoringTest, AnActivityThatStartsWhenTheConnectionIsGoneEnds) {
    const ref<VkLocalorvoClient> client = VkLocalorvoClient::Get();
    VkLocalorvoClientProbe{*client}.Disconnect();
    const ref<RoxCoreSemaphore> stop = new (&pool) RoxCoreSemaphore(0);
    const ref<RoxCoreSemaphore> stopped = new (&pool) RoxCoreSemaphore(0);
    const ref<RoxCoreSemaphore> started = new (&pool) RoxCoreSemaphore(0);
    {
        RoxActivity::CreationScopePrivate scope;
        auto* activity = new (&pool) MonitoringActivity(client, stop, stopped, started);
        EXPECT_EQ("WDKMonitoringActivity", activity->GetName());
        EXPECT_EQ(&VkLocalorvoClient::initInfo, activity->GetInitInfo());
    }
    started->Acquire();
    stopped->Acquire();  // nobody has asked it to stop
}
