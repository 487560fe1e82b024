#include "ClientFixture.h"
#include "rox/RoxFeatures.h"

class SyncTest : public ClientTest {
 protected:
    ~SyncTest() override { RoxFeatures::SetEnabled(VK_FEATURE_LAST_SCHEMA_VERSION, false); }

    const ref<sorn::LazyDict> before = sorn::LazyDict::FromJsonString(&pool, "{\"type\":\"before\"}", 42);
    ref<sorn::LazyDict> response = before;
};

TEST_F(SyncTest, TheCallerHandlesTheEventItself) {
    const ref<VkLocalorvoClient> client = Connected();
    bus.Respond(1);
    EXPECT_TRUE(client->SendRequestSync(object.get(), response));
    EXPECT_EQ((Lines{"request 1 single", "fd", "process 5000000000"}), bus.Calls());
    ASSERT_NE(nullptr, response);
    EXPECT_EQ(ScriptedBus::bodyG, response->ToJson(false));
    EXPECT_EQ("0 0 0 0", Tables(client));
    EXPECT_FALSE(FMonitored(client));
    EXPECT_TRUE(TestClock::Sleeps().empty());
}

TEST_F(SyncTest, WithoutAnActivityOneEventEndsTheWait) {
    struct Case {
        const char* name;
        std::function<void()> arrive;
        bool result;
    };
    const Case cases[] = {
        {"a response to nobody", [this] { bus.Respond(4711); }, true},
        {"not a message", [this] { bus.RespondWithText("what"); }, true},
        {"another kind of event", [this] { bus.SendEvent(VkAesResponseChunk::idG); }, true},
        {"nothing", [] {}, false},
        {"a failure of the bus", [this] { bus.FailProcessing(); }, false},
        {"the end, which the bus calls handled", [this] { bus.CloseFromAfar(VK_BUS_DONE); }, true},
        {"the end", [this] { bus.CloseFromAfar(VK_BUS_LOST); }, false},
    };
    for (const Case& each : cases) {
        const ref<VkLocalorvoClient> client = VkLocalorvoClient::Get();
        each.arrive();
        EXPECT_EQ(each.result, client->SendRequestSync(object.get(), response)) << each.name;
        EXPECT_EQ(before, response) << each.name;
        EXPECT_EQ("0 0 0 0", Tables(client)) << each.name;
    }
}

TEST_F(SyncTest, AFailedSendDoesNotWait) {
    const ref<VkLocalorvoClient> client = Connected();
    bus.nFailSend = 1;
    EXPECT_FALSE(client->SendRequestSync(object.get(), response));
    EXPECT_EQ(before, response);
    EXPECT_EQ("0 0 0 0", Tables(client));
    EXPECT_EQ(0u, bus.Count("process 5000000000"));
}

TEST_F(SyncTest, ALateResponseIsDroppedAndNothingWasCancelled) {
    const ref<VkLocalorvoClient> client = Connected();
    EXPECT_FALSE(client->SendRequestSync(object.get(), response));
    bus.Respond(1);
    EXPECT_TRUE(client->SendRequestSync(object.get(), response));  // its one event is the late one
    EXPECT_EQ(before, response);
    bus.Respond(3);
    EXPECT_TRUE(client->SendRequestSync(object.get(), response));
    EXPECT_NE(before, response);
    EXPECT_EQ((Lines{"request 1 single", "request 2 single", "request 3 single"}), bus.CallsBeside());
}

TEST_F(SyncTest, ASecondResponseIsDropped) {
    const ref<VkLocalorvoClient> client = Connected();
    bus.Respond(1);
    bus.Respond(1, true, "{\"type\":\"second\"}");
    EXPECT_TRUE(client->SendRequestSync(object.get(), response));
    EXPECT_EQ(ScriptedBus::bodyG, response->ToJson(false));
    response = before;
    EXPECT_TRUE(client->SendRequestSync(object.get(), response));
    EXPECT_EQ(before, response);
    EXPECT_EQ("0 0 0 0", Tables(client));
}

TEST_F(SyncTest, OneResponseIsEnoughWhetherItIsFinalOrNot) {
    const ref<VkLocalorvoClient> client = Connected();
    bus.Respond(1, false);
    EXPECT_TRUE(client->SendRequestSync(object.get(), response));
    EXPECT_NE(before, response);
    EXPECT_EQ("0 0 0 0", Tables(client));
}

TEST_F(SyncTest, TheBodysVersion) {
    const ref<VkLocalorvoClient> client = Connected();
    struct Case {
        const char* header;
        bool isLast;
        int version;
    };
    const Case cases[] = {
        {"", false, 41},
        {"", true, 42},
        {"SchemaVersion: 25\r\n", false, 25},
        {"SchemaVersion: 25\r\n", true, 25},
        {"SchemaVersion: 0\r\n", true, 42},
    };
    uint32_t rpcId = 0;
    for (const Case& each : cases) {
        RoxFeatures::SetEnabled(VK_FEATURE_LAST_SCHEMA_VERSION, each.isLast);
        bus.RespondWithText(ScriptedBus::ResponseText(++rpcId, "true", ScriptedBus::bodyG, each.header));
        ASSERT_TRUE(client->SendRequestSync(object.get(), response));
        EXPECT_EQ(each.version, response->GetVersion().Number()) << each.header << each.isLast;
    }
}

TEST_F(SyncTest, TheObjectForm) {
    struct Case {
        const char* body;
        const char* type;  // null: no object
    };
    const Case cases[] = {
        {ScriptedBus::bodyG, "error"},
        {"{\"type\":\"recordingSearch\"}", "recordingSearch"},
        {"{\"type\":\"noSuchThing\"}", "error"},
        {"{nonsense", "error"},
        {nullptr, nullptr},
    };
    const ref<VkLocalorvoClient> client = Connected();
    uint32_t rpcId = 0;
    for (const Case& each : cases) {
        ++rpcId;
        each.body != nullptr ? bus.Respond(rpcId, true, each.body) : bus.Respond(4711);
        const ref<sorn::SornObject> answer = client->SendRequestSync(object.get());
        ASSERT_EQ(each.type != nullptr, answer != nullptr) << rpcId;
        if (answer != nullptr) {
            EXPECT_EQ(each.type, answer->GetTypeName()) << rpcId;
        }
    }
    EXPECT_EQ(nullptr, client->SendRequestSync(object.get()));  // nothing came in time
    bus.nFailSend = 1;
    EXPECT_EQ(nullptr, client->SendRequestSync(object.get()));
}

TEST_F(SyncTest, WithTheActivityTheCallerLooksEvery50Milliseconds) {
    const ref<VkLocalorvoClient> client = Monitored();
    TestClock::OnSleep([this](size_t nSleeps) {
        if (nSleeps != 7) return;
        bus.Respond(1);
        bus.WaitHandled();
    });
    EXPECT_TRUE(client->SendRequestSync(object.get(), response));
    EXPECT_EQ(std::vector<long long>(7, 50), TestClock::Sleeps());
    EXPECT_EQ(ScriptedBus::bodyG, response->ToJson(false));
    EXPECT_EQ("0 0 0 0", Tables(client));
    EXPECT_EQ(0u, bus.Count("process 5000000000"));
}

TEST_F(SyncTest, WithTheActivityAResponseThatIsThereNeedsNoSleep) {
    const ref<VkLocalorvoClient> client = Monitored();
    bus.onSend = [this](const std::string&) {
        bus.Respond(1);
        bus.WaitHandled();
    };
    EXPECT_TRUE(client->SendRequestSync(object.get(), response));
    EXPECT_NE(before, response);
    EXPECT_TRUE(TestClock::Sleeps().empty());
}

TEST_F(SyncTest, WithTheActivityAndASilentServiceItTakesFiveSeconds) {
    const ref<VkLocalorvoClient> client = Monitored();
    const int64_t start = TestClock::Now();
    EXPECT_FALSE(client->SendRequestSync(object.get(), response));
    EXPECT_EQ(5'000'000'000, TestClock::Now() - start);
    EXPECT_EQ(std::vector<long long>(100, 50), TestClock::Sleeps());
    EXPECT_EQ(before, response);
    EXPECT_EQ("0 0 0 0", Tables(client));
    EXPECT_EQ(Lines{"request 1 single"}, bus.CallsBeside());
}

TEST_F(SyncTest, WithTheActivityOtherEventsDoNotEndTheWait) {
    const ref<VkLocalorvoClient> client = Monitored();
    TestClock::OnSleep([this](size_t nSleeps) {
        nSleeps == 3 ? bus.Respond(1) : bus.Respond(4711);
        bus.WaitHandled();
    });
    EXPECT_TRUE(client->SendRequestSync(object.get(), response));
    EXPECT_NE(before, response);
    EXPECT_EQ(3u, TestClock::Sleeps().size());
}

TEST_F(SyncTest, ALossWithTheActivityRunsTheTimeOut) {
    const ref<VkLocalorvoClient> client = Monitored();
    const int64_t start = TestClock::Now();
    TestClock::OnSleep([this](size_t nSleeps) {
        if (nSleeps != 4) return;
        bus.CloseFromAfar();
        bus.WaitHandled();
    });
    EXPECT_FALSE(client->SendRequestSync(object.get(), response));
    EXPECT_EQ(5'000'000'000, TestClock::Now() - start);
    EXPECT_EQ(before, response);
    EXPECT_EQ("0 0 0 0", Tables(client));
}

TEST_F(SyncTest, ALateResponseWithTheActivityIsDropped) {
    const ref<VkLocalorvoClient> client = Monitored();
    EXPECT_FALSE(client->SendRequestSync(object.get(), response));
    bus.Respond(1);
    bus.WaitHandled();
    EXPECT_EQ("0 0 0 0", Tables(client));
}
