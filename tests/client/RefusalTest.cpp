#include "ClientFixture.h"
#include "support/SmallStack.h"

// What happens while the bus refuses the connection and requests are pending: every cancel makes attempts to
// connect, up to a thousand in a row, and the stack does not grow with them.

namespace {

struct Stage {
    const char* name;
    unsigned ScriptedBus::*refuse;
    Lines attempt;  // the calls of one that is refused
};

const Stage stagesG[] = {
    {"open", &ScriptedBus::nRefuseOpen, {"open refused"}},
    {"session", &ScriptedBus::nRefuseSession, {"open", "session refused", "close"}},
};

Lines Repeat(const Lines& lines, unsigned n) {
    Lines all;
    for (unsigned i = 0; i < n; ++i) all.insert(all.end(), lines.begin(), lines.end());
    return all;
}

}  // namespace

class RefusalTest : public ClientTest {
 protected:
    /// The calls in which lines of cancels, which come in any order, are sorted.
    Lines SortedCalls() {
        Lines calls = bus.CallsBeside();
        const auto isCancel = [](const std::string& call) { return call.starts_with("cancel"); };
        const auto begin = std::find_if(calls.begin(), calls.end(), isCancel);
        std::sort(begin, std::find_if_not(begin, calls.end(), isCancel));
        return calls;
    }
    static Lines Cancels(unsigned n) {
        Lines lines;
        for (unsigned i = 1; i <= n; ++i) lines.push_back("cancel " + std::to_string(i));
        return lines;
    }
    /// A client that is not connected, with requests 1 to n pending.
    ref<VkLocalorvoClient> WithPending(unsigned n) {
        VkLocalorvoClient::Destroy();
        VkLocalorvoClient::Create(&pool);
        bus.nRefuseOpen = 1;
        ref<VkLocalorvoClient> client = VkLocalorvoClient::Get();
        for (unsigned i = 0; i < n; ++i) VkLocalorvoClientProbe{*client}.StorePending(object, this);
        bus.ForgetCalls();
        return client;
    }
};

TEST_F(RefusalTest, ASendTriesOnceWhenNothingIsPending) {
    for (const Stage& stage : stagesG) {
        const ref<VkLocalorvoClient> client = WithPending(0);
        bus.*stage.refuse = 1;
        EXPECT_FALSE(client->SendRequestAndForget(object.get()));
        EXPECT_EQ(stage.attempt, bus.Calls()) << stage.name;
    }
}

TEST_F(RefusalTest, CancelsAreSentAsSoonAsAnAttemptSucceeds) {
    for (const Stage& stage : stagesG) {
        for (const unsigned nPending : {1u, 3u}) {
            for (const unsigned nRefusals : {1u, 2u, 10u, 999u}) {
                const ref<VkLocalorvoClient> client = WithPending(nPending);
                bus.*stage.refuse = nRefusals;
                bool isSent = true;
                RunOnSmallStack([&] { isSent = client->SendRequestAndForget(object.get()); });
                EXPECT_FALSE(isSent);
                Lines expected = Repeat(stage.attempt, nRefusals);
                for (const Lines& more : {Lines{"open", "session", "hello"}, Cancels(nPending),
                                          Lines{"close session", "close"}}) {
                    expected.insert(expected.end(), more.begin(), more.end());
                }
                EXPECT_EQ(expected, SortedCalls()) << stage.name << nPending << " " << nRefusals;
                EXPECT_EQ("0 0 0 0", Tables(client));
                EXPECT_EQ(0u, bus.NOpen());
            }
        }
    }
}

TEST_F(RefusalTest, AThousandAttemptsInARowAreTheLast) {
    for (const Stage& stage : stagesG) {
        for (const unsigned nPending : {1u, 3u}) {
            const ref<VkLocalorvoClient> client = WithPending(nPending);
            bus.*stage.refuse = 1000;
            bool isSent = true;
            RunOnSmallStack([&] { isSent = client->SendRequestAndForget(object.get()); });
            EXPECT_FALSE(isSent);
            EXPECT_EQ(Repeat(stage.attempt, 1000), bus.Calls()) << stage.name << nPending;
            EXPECT_EQ("0 0 0 0", Tables(client));
            EXPECT_EQ(0u, bus.NOpen());
            EXPECT_TRUE(client->SendRequestAndForget(object.get()));
        }
    }
}

TEST_F(RefusalTest, AServiceThatNeverAnswersTheOpeningIsGivenUpInTime) {
    const ref<VkLocalorvoClient> client = WithPending(3);
    bus.nRefuseSession = 1000;
    bus.openingTime = 5'000'000'000;  // as the bus waits
    EXPECT_FALSE(client->SendRequestAndForget(object.get()));
    EXPECT_EQ(2u, bus.Count("session refused"));  // the send's own, and one within ten seconds
    EXPECT_EQ("0 0 0 0", Tables(client));
    EXPECT_EQ(0u, bus.NOpen());
}

TEST_F(RefusalTest, AServiceThatDoesNotReadIsToldTheCancelsOfTenSeconds) {
    const ref<VkLocalorvoClient> client = VkLocalorvoClient::Get();
    for (int i = 0; i < 30; ++i) SendAsync(client, true);
    bus.ForgetCalls();
    bus.sendingTime = 1'000'000'000;
    VkLocalorvoClient::Destroy();
    EXPECT_EQ(10u, bus.Sent().size());
    EXPECT_EQ(0u, bus.NOpen());
}

TEST_F(RefusalTest, WithoutAHelloTheSessionStillTakesTheCancels) {
    for (const unsigned nPending : {0u, 1u, 3u}) {
        const ref<VkLocalorvoClient> client = WithPending(nPending);
        bus.nRefuseHello = 1;
        EXPECT_FALSE(client->SendRequestAndForget(object.get()));
        Lines expected = {"open", "session", "hello refused"};
        for (const Lines& more : {Cancels(nPending), Lines{"close session", "close"}}) {
            expected.insert(expected.end(), more.begin(), more.end());
        }
        EXPECT_EQ(expected, SortedCalls()) << nPending;
        EXPECT_EQ("0 0 0 0", Tables(client));
    }
}

TEST_F(RefusalTest, TheRequestThatIsSentIsPendingItself) {
    bus.nRefuseOpen = 4;
    const ref<VkLocalorvoClient> client = VkLocalorvoClient::Get();  // takes one
    bus.ForgetCalls();
    ref<sorn::LazyDict> response;
    EXPECT_FALSE(client->SendRequestSync(object.get(), response));
    const Lines expected = {"open refused", "open refused", "open refused",  "open", "session",
                            "hello",        "cancel 1",     "close session", "close"};
    EXPECT_EQ(expected, bus.Calls());
    EXPECT_EQ(nullptr, response);

    bus.ForgetCalls();
    bus.nRefuseOpen = 3;
    unsigned rpcId = 99;
    EXPECT_FALSE(client->SendRequestAsync(object.get(), true, &OnResponse, rpcId));
    Lines second = expected;
    second[6] = "cancel 2";
    EXPECT_EQ(second, bus.Calls());
    EXPECT_EQ(99u, rpcId);
    EXPECT_FALSE(FMonitored(client));
    EXPECT_EQ("0 0 0 0", Tables(client));

    EXPECT_EQ(3u, SendAsync(client, true));
}

TEST_F(RefusalTest, AfterGivingUpTheNextSendWorks) {
    const ref<VkLocalorvoClient> client = WithPending(0);
    bus.nRefuseOpen = 1000;
    ref<sorn::LazyDict> response;
    EXPECT_FALSE(client->SendRequestSync(object.get(), response));
    EXPECT_EQ(1000u, bus.Calls().size());
    bus.Respond(2);
    EXPECT_TRUE(client->SendRequestSync(object.get(), response));
    EXPECT_NE(nullptr, response);
}

TEST_F(RefusalTest, TearingDownWithoutAConnectionTriesForItsCancels) {
    const ref<VkLocalorvoClient> client = WithPending(2);
    bus.nRefuseOpen = 5;
    VkLocalorvoClient::Destroy();
    Lines expected = Repeat({"open refused"}, 5);
    for (const char* call : {"open", "session", "hello", "cancel 1", "cancel 2", "close session", "close"}) {
        expected.push_back(call);
    }
    EXPECT_EQ(expected, SortedCalls());
}

TEST_F(RefusalTest, AClientThatIgnoresAllStillConnectsForCancelsAndSendsNone) {
    const ref<VkLocalorvoClient> client = WithPending(2);
    client->IgnoreAllRequests();
    VkLocalorvoClient::Destroy();
    EXPECT_EQ((Lines{"open", "session", "hello", "close session", "close"}), bus.Calls());
    EXPECT_EQ("0 0 0 0", Tables(client));
}
