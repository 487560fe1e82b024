#include <atomic>
#include <thread>

#include "ClientFixture.h"

// What other threads do between two steps of an operation.
class MeanwhileTest : public ClientTest {
 protected:
    static void OnAnotherThread(const std::function<void()>& work) { std::thread(work).join(); }

    ref<sorn::LazyDict> response;
};

TEST_F(MeanwhileTest, TheActivityStartsWhenTheWaiterHasHandledItsEvent) {
    const ref<VkLocalorvoClient> client = Connected();
    unsigned rpcId = 0;
    bus.DoMeanwhile([&] {
        OnAnotherThread([&] { rpcId = SendAsync(client, false); });
        EXPECT_FALSE(FMonitored(client));  // two that handle events would take them from each other
        EXPECT_EQ(1u, bus.Count("fd"));
    });
    EXPECT_TRUE(client->SendRequestSync(object.get(), response));
    EXPECT_EQ(nullptr, response);
    EXPECT_TRUE(FMonitored(client));
    EXPECT_EQ(2u, bus.Count("fd"));
    bus.Respond(rpcId);
    bus.WaitHandled();
    EXPECT_EQ(1u, AllReceived().size());
}

TEST_F(MeanwhileTest, AWaiterThatHandlesTheResponseOfAnotherGoesOn) {
    const ref<VkLocalorvoClient> client = Connected();
    unsigned rpcId = 0;
    bus.onSend = [&](const std::string&) {
        bus.onSend = nullptr;
        // Another thread's request, of which the activity does not know yet.
        rpcId = VkLocalorvoClientProbe{*client}.LastRpcId() + 1;
        VkLocalorvoClientProbe{*client}.StorePending(object, reinterpret_cast<void*>(&OnContextResponse));
        bus.Respond(rpcId);
        bus.Respond(1);
    };
    EXPECT_TRUE(client->SendRequestSync(object.get(), response));
    EXPECT_NE(nullptr, response);
    EXPECT_EQ(rpcId, AllReceived().at(0).rpcId);
}

TEST_F(MeanwhileTest, AWaiterDoesNotHandleEventsBesideAnother) {
    const ref<VkLocalorvoClient> client = Connected();
    std::thread second;
    ref<sorn::LazyDict> secondResponse;
    bool isSecondDone = false;
    std::atomic<bool> hasSlept{false};
    std::atomic<bool> isFirstDone{false};
    // The other one sleeps, and looks, until this one is done.
    TestClock::OnSleep([&](size_t nSleeps) {
        if (nSleeps < 3) return;
        hasSlept = true;
        while (!isFirstDone) std::this_thread::yield();
    });
    bus.DoMeanwhile([&] {
        second = std::thread([&] { isSecondDone = client->SendRequestSync(object.get(), secondResponse); });
        while (!hasSlept) std::this_thread::yield();
        EXPECT_EQ(1u, bus.Count("process 5000000000"));
        bus.Respond(2);
    });
    client->SendRequestSync(object.get(), response);
    isFirstDone = true;
    second.join();
    EXPECT_TRUE(isSecondDone);
    EXPECT_NE(nullptr, secondResponse);
    EXPECT_EQ("0 0 0 0", Tables(client));
}

// A loss, on another thread, while this one waits for the connection: the request is not sent before it is
// pending.
TEST_F(MeanwhileTest, ARequestThatEndedBeforeItWasSentIsPendingAgain) {
    bus.nRefuseOpen = 1;
    const ref<VkLocalorvoClient> client = VkLocalorvoClient::Get();
    bus.onHello = [&] {
        EXPECT_EQ("1 0 0 0", Tables(client));
        VkLocalorvoClientProbe{*client}.RemovePending(1);
    };
    bus.Respond(1);
    EXPECT_TRUE(client->SendRequestSync(object.get(), response));
    EXPECT_NE(nullptr, response);
}

TEST_F(MeanwhileTest, CancelsAreForWhatWasPendingAtTheStart) {
    const ref<VkLocalorvoClient> client = Connected();
    for (int i = 0; i < 20; ++i) VkLocalorvoClientProbe{*client}.StorePending(object, nullptr);
    bus.onSend = [&](const std::string&) { VkLocalorvoClientProbe{*client}.StorePending(object, nullptr); };
    VkLocalorvoClient::Destroy();
    bus.onSend = nullptr;
    EXPECT_EQ(22u, bus.Calls().size());  // with the two closings
    EXPECT_EQ("0 0 0 0", Tables(client));
}

TEST_F(MeanwhileTest, ARequestThatEndsBeforeItsCancelGetsNone) {
    const ref<VkLocalorvoClient> client = Connected();
    for (int i = 0; i < 3; ++i) VkLocalorvoClientProbe{*client}.StorePending(object, nullptr);
    bus.onSend = [&](const std::string&) {
        for (uint32_t rpcId = 1; rpcId <= 3; ++rpcId) VkLocalorvoClientProbe{*client}.RemovePending(rpcId);
    };
    VkLocalorvoClient::Destroy();
    EXPECT_EQ(3u, bus.Calls().size());  // with the two closings
}

TEST_F(MeanwhileTest, AnotherThreadTearsDownWhileOneWaits) {
    const ref<VkLocalorvoClient> client = Connected();
    bus.DoMeanwhile([&] { OnAnotherThread(&VkLocalorvoClient::Destroy); });
    EXPECT_TRUE(client->SendRequestSync(object.get(), response));
    EXPECT_EQ(nullptr, response);
    EXPECT_EQ((Lines{"request 1 single", "cancel 1", "close session", "close"}), bus.CallsBeside());
}
