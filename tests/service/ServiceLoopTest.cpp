#include "service/ServiceLoop.h"

#include <sys/socket.h>
#include <sys/un.h>
#include <unistd.h>

#include <cstring>
#include <filesystem>
#include <memory>
#include <thread>
#include <vector>

#include "BusClient.h"
#include "ServiceFixture.h"

namespace sorntest {
namespace {

const std::string searchG = R"({"type": "recordingSearch"})";

/// A service on a private address of the bus, with a thread of its own.
class ServiceLoopTest : public testing::Test {
 protected:
    ServiceLoopTest() {
        char folder[] = "/tmp/sorn-service.XXXXXX";
        folderM = mkdtemp(folder);
        std::string words;
        storeM = sorn::service::Store::Open("", sorn::service::maxStoreBytesG, words);
        loopM = std::make_unique<sorn::service::ServiceLoop>(*storeM, sorn::service::Limits(), nullptr);
        EXPECT_TRUE(loopM->Listen(folderM + "/bus", words)) << words;
        EXPECT_EQ(loopM->GetAddress(), folderM + "/bus");
        threadM = std::thread([this] {
            std::string failure;
            EXPECT_TRUE(loopM->Run(failure)) << failure;
        });
    }
    ~ServiceLoopTest() override {
        loopM->Stop();
        threadM.join();
        loopM.reset();
        VkBusSetAddress(nullptr);
        std::filesystem::remove_all(folderM);
    }

    static void Put(BusClient& client, const std::string& record) {
        EXPECT_EQ(client.Ask({1'000'000, "recording", record, "single", "put"}).body, successG);
    }
    static std::string List(BusClient& client) {
        return client.Ask({1'000'001, "recordingSearch", searchG}).body;
    }
    /// A socket to the service without any protocol.
    int RawSocket() const {
        const int raw = ::socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0);
        sockaddr_un address = {};
        address.sun_family = AF_UNIX;
        std::strcpy(address.sun_path, loopM->GetAddress().c_str());
        EXPECT_EQ(::connect(raw, reinterpret_cast<const sockaddr*>(&address), sizeof address), 0);
        return raw;
    }

 private:
    std::string folderM;
    std::unique_ptr<sorn::service::Store> storeM;
    std::unique_ptr<sorn::service::ServiceLoop> loopM;
    std::thread threadM;
};

TEST_F(ServiceLoopTest, OneClientPutsAndAnotherWatches) {
    BusClient watcher;
    BusClient writer;
    EXPECT_EQ(watcher.Ask({5, "recordingSearch", searchG, "multiple"}).body, RecordingList({}));
    Put(writer, Recording(1));
    const ResponseText told = watcher.Next();
    EXPECT_EQ(told.rpcId, 5u);
    EXPECT_FALSE(told.isFinal);
    EXPECT_EQ(told.body, RecordingList({Recording(1)}));
    watcher.Send(UpdateText(5, "recordingSearch", R"({"type": "recordingSearch", "offset": 1})"));
    EXPECT_EQ(watcher.Next().body, RecordingList({}, 1, true, false));
    watcher.Send(CancelText(5));
    Put(watcher, Recording(2));  // comes behind the cancel: no list is between
    EXPECT_EQ(List(watcher), RecordingList({Recording(1), Recording(2)}));
}

TEST_F(ServiceLoopTest, TheLargestAnswer) {
    BusClient client;
    const std::string large = Recording(1, R"("title": ")" + std::string(5'000'000, 'x') + "\"");
    Put(client, large);
    EXPECT_TRUE(List(client) == RecordingList({large}));
}

TEST_F(ServiceLoopTest, GarbageOfOneClientDoesNotConcernOthers) {
    BusClient good;
    Put(good, Recording(1));
    std::vector<int> vRaw;
    for (const std::string& bytes : {std::string("GET / HTTP/1.1\r\n\r\n"), std::string(100'000, '\xFF'),
                                     std::string(1, '\0'), std::string()}) {
        vRaw.push_back(RawSocket());
        [[maybe_unused]] const ssize_t n = ::send(vRaw.back(), bytes.data(), bytes.size(), MSG_NOSIGNAL);
    }
    BusClient bad;
    for (const std::string& message :
         {std::string("x"), std::string(1'000'000, 'x'), std::string("ORPC/2 9 9\r\n")}) {
        EXPECT_EQ(bad.Send(message), VK_BUS_DONE);
        EXPECT_TRUE(bad.Next().FError("badArgument"));
    }
    EXPECT_EQ(List(good), RecordingList({Recording(1)}));
    EXPECT_EQ(List(bad), RecordingList({Recording(1)}));
    for (int raw : vRaw) ::close(raw);
}

TEST_F(ServiceLoopTest, ClientsComeAndGoWithStreamsOpen) {
    for (int i = 0; i < 50; ++i) {
        BusClient client;
        EXPECT_EQ(client.Ask({1, "recordingSearch", searchG, "multiple"}).rpcId, 1u);
        client.Send({2, "recordingSearch", searchG, "multiple"});
    }
    BusClient client;
    Put(client, Recording(1));
    EXPECT_EQ(List(client), RecordingList({Recording(1)}));
}

TEST_F(ServiceLoopTest, OneWhoNeverReadsIsLeftBehind) {
    BusClient deaf;
    BusClient good;
    BusClient last;
    for (uint32_t rpcId = 1; rpcId <= 40; ++rpcId) deaf.Ask({rpcId, "recordingSearch", searchG, "multiple"});
    last.Ask({1, "recordingSearch", searchG, "multiple"});
    // Forty lists of a megabyte and more are more than may wait. Whose stream is the last gets its list when
    // all others have been sent theirs.
    const std::string title = R"("title": ")" + std::string(1'000'000, 'x');
    Put(good, Recording(1, title + "\""));
    EXPECT_TRUE(last.Next().body == RecordingList({Recording(1, title + "\"")}));
    EXPECT_TRUE(List(good) == RecordingList({Recording(1, title + "\"")}));
    EXPECT_TRUE(deaf.FEnded());
}

TEST_F(ServiceLoopTest, TenThousandOpenStreamsAndOthersAreServed) {
    constexpr uint32_t nStreams = 10'000;
    BusClient watcher;
    BusClient other;
    for (uint32_t rpcId = 1; rpcId <= nStreams; ++rpcId) {
        watcher.Send({rpcId, "recordingSearch", searchG, "multiple"});
        if (rpcId % 100 != 0) continue;
        for (int i = 0; i < 100; ++i) ASSERT_EQ(watcher.Next().body, RecordingList({}));
    }
    EXPECT_TRUE(watcher.Ask({nStreams + 1, "recordingSearch", searchG, "multiple"}).FError("serverBusy"));
    Put(other, Recording(1));
    EXPECT_EQ(List(other), RecordingList({Recording(1)}));
    std::vector<bool> vSeen(nStreams + 1);
    for (uint32_t i = 0; i < nStreams; ++i) {
        const ResponseText told = watcher.Next();
        ASSERT_EQ(told.body, RecordingList({Recording(1)}));
        ASSERT_LE(told.rpcId, nStreams);
        ASSERT_FALSE(vSeen[told.rpcId]);
        vSeen[told.rpcId] = true;
    }
}

}  // namespace
}  // namespace sorntest
