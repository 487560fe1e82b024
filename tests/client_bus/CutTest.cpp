#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/un.h>

#include "ClientBusFixture.h"
#include "Proxy.h"

// A service whose bytes end anywhere.
class CutTest : public ClientBusTest {
 protected:
    CutTest() : proxy(address + "-proxy", address) { VkBusSetAddress((address + "-proxy").c_str()); }

    Service service;
    Proxy proxy;
};

TEST_F(CutTest, TheConnectionEndsAtEveryByteAndTheNextSendWorks) {
    EXPECT_TRUE(FAnswered(VkLocalorvoClient::Get()));
    VkLocalorvoClient::Destroy();
    const size_t nBytes = proxy.nPassed;
    ASSERT_LT(200u, nBytes);  // greeting, answer to the opening, response
    for (size_t n = 0; n < nBytes; n += isSlowG ? 5 : 1) {
        VkLocalorvoClient::Create(&pool);
        proxy.CutNext(n);
        const ref<VkLocalorvoClient> client = VkLocalorvoClient::Get();
        EXPECT_TRUE(FAnswered(client) || FAnswered(client)) << n;
        VkLocalorvoClient::Destroy();
    }
}

TEST_F(CutTest, TheConnectionEndsAtEveryByteBesideTheActivity) {
    Answers whole;
    unsigned rpcId = 0;
    EXPECT_TRUE(SendAsync(VkLocalorvoClient::Get(), true, whole, rpcId));
    EXPECT_TRUE(WaitUntil([&] { return whole.n == 3; }));
    VkLocalorvoClient::Destroy();
    const size_t nBytes = proxy.nPassed;
    for (size_t n = 0; n < nBytes; n += isSlowG ? 31 : 7) {
        VkLocalorvoClient::Create(&pool);
        proxy.CutNext(n);
        const ref<VkLocalorvoClient> client = VkLocalorvoClient::Get();
        Answers cut;
        Answers next;
        SendAsync(client, true, cut, rpcId);
        // Over when the loss is known, or when the first connection was refused.
        EXPECT_TRUE(WaitUntil([&] {
            return cut.n == 3 || VkLocalorvoClientProbe{*client}.Tables() == "0 0 0 0";
        })) << n;
        EXPECT_TRUE(WaitUntil([&] { return SendAsync(client, true, next, rpcId); })) << n;
        EXPECT_TRUE(WaitUntil([&] { return next.n == 3; })) << n;
        VkLocalorvoClient::Destroy();
    }
}

TEST_F(CutTest, TheServiceStopsInTheMiddleOfAMessage) {
    EXPECT_TRUE(FAnswered(VkLocalorvoClient::Get()));
    VkLocalorvoClient::Destroy();
    VkLocalorvoClient::Create(&pool);
    proxy.CutNext(proxy.nPassed - 10, true);
    const auto start = std::chrono::steady_clock::now();
    EXPECT_FALSE(FAnswered(VkLocalorvoClient::Get()));
    EXPECT_LE(std::chrono::seconds(5), std::chrono::steady_clock::now() - start);
    VkLocalorvoClient::Destroy();
    VkLocalorvoClient::Create(&pool);
    EXPECT_TRUE(FAnswered(VkLocalorvoClient::Get()));
}

TEST_F(CutTest, TheServiceNeverAnswersTheOpening) {
    proxy.CutNext(0, true);
    const auto start = std::chrono::steady_clock::now();
    const ref<VkLocalorvoClient> client = VkLocalorvoClient::Get();
    EXPECT_LE(std::chrono::seconds(5), std::chrono::steady_clock::now() - start);
    EXPECT_EQ(0u, VkLocalorvoClientProbe{*client}.Connection());
    EXPECT_TRUE(FAnswered(client));
}
