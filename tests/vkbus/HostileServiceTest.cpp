#include <gtest/gtest.h>

#include "BusFixture.h"
#include "RawPeer.h"

namespace {

// Services that do not keep to the rules, against a client that does.
class HostileService : public BusTest {
 protected:
    HostileService() : listeningM(socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0)) {
        const sockaddr_un name = RawPeer::Name(address);
        EXPECT_EQ(0, bind(listeningM.Fd(), reinterpret_cast<const sockaddr*>(&name), sizeof(name)));
        EXPECT_EQ(0, listen(listeningM.Fd(), 10));
    }

    static std::string Greeting() { return "DATA\r\nOK 00112233445566778899aabbccddeeff\r\n"; }
    static std::string Answer(unsigned type = 2, uint32_t serial = 1) {
        return RawMessage{.type = type, .replySerial = serial}.Bytes();
    }

    // Says `bytes` to the next client at once, then closes, or waits until the client has.
    std::thread Say(const std::string& bytes, bool close = true) {
        return std::thread([this, bytes, close] {
            RawPeer peer(accept(listeningM.Fd(), nullptr, nullptr));
            peer.Send(bytes);
            if (!close) peer.ReadToEnd();
        });
    }

    RawPeer listeningM;
};

TEST_F(HostileService, ByTheRules) {
    std::string request;
    std::thread service([&] {
        RawPeer peer(accept(listeningM.Fd(), nullptr, nullptr));
        request = peer.ReadUntil("BEGIN\r\n");
        peer.Send(Greeting());
        request += peer.ReadUntil("tester");
        peer.Send(Answer() + PacketMessage(171752, "unasked"));
        peer.ReadToEnd();
    });
    {
        Client client;
        EXPECT_EQ(VK_BUS_DONE, client.openResult);
        EXPECT_EQ(VK_BUS_DONE, client.Process());
        EXPECT_EQ(std::vector<std::string>{"unasked"}, client.packets);
    }
    service.join();
    // The call's body: 171754 is 0x00029EEA, 8678623 is 0x00846CDF, and the name has six bytes.
    const char body[] = "\xEA\x9E\x02\x00\xDF\x6C\x84\x00\x06\x00\x00\x00tester";
    EXPECT_NE(std::string::npos, request.find(std::string(body, sizeof(body))));
}

TEST_F(HostileService, ClosesAtEveryByte) {
    const std::string all = Greeting() + Answer() + PacketMessage(171752, "unasked");
    const size_t nOpening = (Greeting() + Answer()).size();
    for (size_t n = 0; n <= all.size(); ++n) {
        std::thread service = Say(all.substr(0, n));
        {
            Client client({}, false);
            if (n < nOpening) {
                EXPECT_EQ(VK_BUS_LOST, client.openResult) << n;
                EXPECT_EQ(0u, client.nClosed);
            } else if (client.openResult == VK_BUS_DONE) {
                // The event is not allowed yet, and half of one is none.
                EXPECT_EQ(VK_BUS_LOST, client.Process());
                EXPECT_EQ(1u, client.nClosed);
                EXPECT_EQ(0u, client.nEvents);
            }
        }
        service.join();
    }
}

TEST_F(HostileService, BadAnswers) {
    const struct {
        const char* what;
        std::string bytes;
        unsigned result;
    } cases[] = {
        {"nothing", "", VK_BUS_LOST},
        {"garbage", "garbage\r\ngarbage\r\n", VK_BUS_LOST},
        {"refused trust", "REJECTED\r\n", VK_BUS_LOST},
        {"error", Greeting() + Answer(3), VK_BUS_REFUSED},
        {"answer to another call", Greeting() + Answer(2, 99), VK_BUS_NOT_ALLOWED},
        {"event", Greeting() + PacketMessage(171752, "x"), VK_BUS_NOT_ALLOWED},
        {"call", Greeting() + OpenMessage(), VK_BUS_NOT_ALLOWED},
    };
    for (const auto& each : cases) {
        std::thread service = Say(each.bytes, each.result == VK_BUS_LOST);
        {
            Client client({}, false);
            EXPECT_EQ(each.result, client.openResult) << each.what;
            EXPECT_EQ(0u, client.session);
            EXPECT_EQ(0u, client.nClosed);
        }
        service.join();
    }
}

TEST_F(HostileService, BadEvents) {
    const struct {
        const char* what;
        std::string bytes;
        unsigned reason;
    } cases[] = {
        {"what only the client sends", PacketMessage(171750, "x"), VK_BUS_NOT_ALLOWED},
        {"other checksum", PacketMessage(171752, "x", 1), VK_BUS_BAD_EVENT},
        {"other shape",
         RawMessage{.signature = "uus", .body = Wire().U32(171752).U32(0x6F671A).Text("x").bytes}.Bytes(),
         VK_BUS_BAD_EVENT},
        {"second answer", Answer(), VK_BUS_BAD_EVENT},
        {"too large", PacketMessage(171752, std::string(maxVkBusEventBytesG, 'x')), VK_BUS_TOO_LARGE},
    };
    for (const auto& each : cases) {
        std::thread service([&] {
            RawPeer peer(accept(listeningM.Fd(), nullptr, nullptr));
            peer.Send(Greeting() + Answer());
            // The hello's record ends in its checksum and a zero word.
            peer.ReadUntil(std::string("\x81\x95\x22\x00\x00\x00\x00\x00", 8));
            peer.Send(each.bytes);
            peer.ReadToEnd();
        });
        {
            Client client;
            EXPECT_EQ(VK_BUS_DONE, client.openResult);
            EXPECT_EQ(VK_BUS_LOST, client.Process()) << each.what;
            EXPECT_EQ(1u, client.nClosed);
            EXPECT_EQ(uintptr_t{each.reason}, client.reason) << each.what;
            EXPECT_EQ(0u, client.nEvents);
        }
        service.join();
    }
}

TEST_F(HostileService, NeverReads) {
    RawPeer peer;
    std::atomic<bool> stop{false};
    std::thread service([&] {
        RawPeer accepted(accept(listeningM.Fd(), nullptr, nullptr));
        accepted.Send(Greeting() + Answer());
        EXPECT_TRUE(WaitUntil([&] { return stop.load(); }));
    });
    {
        Client client;
        ASSERT_EQ(VK_BUS_DONE, client.openResult);
        const std::string large(4u << 20, 'x');
        unsigned result = VK_BUS_DONE;
        unsigned nSent = 0;
        while ((result = client.Request(large)) == VK_BUS_DONE && nSent < 100) {
            ++nSent;
        }
        EXPECT_EQ(VK_BUS_QUEUE_FULL, result);
        EXPECT_GE(nSent, 3u) << "the queue holds three of them at least";
        EXPECT_EQ(VK_BUS_QUEUE_FULL, client.Request(large));
        EXPECT_EQ(0u, client.nClosed) << "the session is still there";
        EXPECT_EQ(VK_BUS_TIMED_OUT, client.Process(1'000'000));
    }
    stop = true;
    service.join();
}

}  // namespace
