#include <malloc.h>

#include "ClientBusFixture.h"

class ReconnectTest : public ClientBusTest {
 protected:
    struct Usage {
        size_t nDescriptors;
        size_t nThreads;
        size_t nPoolBytes;
        size_t nHeapBytes;
    };
    Usage Now() {
        return {CountInProc("fd"), CountInProc("task"), pool.GetUsedBytes(),
                isSlowG ? 0 : size_t{mallinfo2().uordblks}};
    }
    static constexpr unsigned nReconnectsG = isSlowG ? 500 : 10'000;
};

TEST_F(ReconnectTest, OfOneWhoWaitsLeaveNothingBehind) {
    Service service([](const Request& request) {
        Service::RespondByDefault(request);
        VkBusCloseSession(request.session);
    });
    const ref<VkLocalorvoClient> client = VkLocalorvoClient::Get();
    const auto round = [&] { return FAnswered(client) || FAnswered(client); };
    for (int i = 0; i < 100; ++i) EXPECT_TRUE(round());
    const Usage before = Now();
    for (unsigned i = 0; i < nReconnectsG; ++i) ASSERT_TRUE(round());
    const Usage after = Now();
    EXPECT_LE(100u + nReconnectsG, service.nHellos);
    EXPECT_GE(before.nDescriptors + 8, after.nDescriptors);
    EXPECT_GE(before.nThreads + 2, after.nThreads);
    EXPECT_EQ(before.nPoolBytes, after.nPoolBytes);
    EXPECT_GE(before.nHeapBytes + 100'000, after.nHeapBytes);
}

TEST_F(ReconnectTest, WithTheActivityLeaveNothingBehind) {
    Service service([](const Request& request) {
        Service::RespondByDefault(request);
        VkBusCloseSession(request.session);
    });
    const ref<VkLocalorvoClient> client = VkLocalorvoClient::Get();
    const auto round = [&] {
        Answers answers;
        unsigned rpcId = 0;
        ASSERT_TRUE(SendAsync(client, false, answers, rpcId));
        ASSERT_TRUE(WaitUntil([&] { return VkLocalorvoClientProbe{*client}.Connection() == 0; }));
        ASSERT_EQ(1u, answers.n);
    };
    for (int i = 0; i < 100; ++i) round();
    const Usage before = Now();
    for (unsigned i = 0; i < nReconnectsG / 5 && !HasFatalFailure(); ++i) round();
    VkLocalorvoClient::Destroy();
    const Usage after = Now();
    EXPECT_GE(before.nDescriptors + 8, after.nDescriptors);
    EXPECT_GE(before.nThreads + 2, after.nThreads);
    EXPECT_GE(before.nPoolBytes + 50'000, after.nPoolBytes);
    EXPECT_GE(before.nHeapBytes + 100'000, after.nHeapBytes);
}
