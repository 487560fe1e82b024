#include <fcntl.h>
#include <gtest/gtest.h>
#include <signal.h>
#include <sys/resource.h>
#include <sys/wait.h>

#include <future>
#include <random>

#include "BusFixture.h"
#include "RawPeer.h"

namespace {

// Clients that do not keep to the rules, against a service that does. Whatever they do, others are served.
class HostileClient : public BusTest {
 protected:
    ~HostileClient() override { EXPECT_EQ("served", Client().RoundTrip("served")); }

    // Sends all of it, and gives what comes back until the service closes.
    std::string SendAndReadToEnd(const std::string& bytes) {
        RawPeer peer(address);
        peer.Send(bytes);
        return peer.ReadToEnd();
    }
    // A peer with an open session that has sent its hello.
    RawPeer Opened() {
        RawPeer peer(address);
        const unsigned nBefore = service.nEvents;
        EXPECT_TRUE(peer.Send(ClientGreeting() + OpenMessage() + HelloMessage()));
        EXPECT_TRUE(WaitUntil([&] { return service.nEvents > nBefore; }));
        return peer;
    }

    Service service;
};

TEST_F(HostileClient, ByTheRulesInOneGo) {
    // All of it is there before the service has read the first byte.
    RawPeer peer(address);
    ASSERT_TRUE(peer.Send(ClientGreeting() + OpenMessage() + HelloMessage() + PacketMessage(171750, "first") +
                          PacketMessage(171750, "second")));
    const std::string got = peer.ReadUntil("second");
    EXPECT_NE(std::string::npos, got.find("OK ")) << "trust is granted";
    EXPECT_LT(got.find("first"), got.find("second"));
    EXPECT_EQ(3u, service.nEvents);
    EXPECT_EQ("raw", service.LastName());
}

TEST_F(HostileClient, ByTheRulesByteByByte) {
    RawPeer peer(address);
    const std::string all =
        ClientGreeting() + OpenMessage() + HelloMessage() + PacketMessage(171750, "slowly");
    for (const char c : all) {
        ASSERT_TRUE(peer.Send(std::string(1, c)));
    }
    EXPECT_NE(std::string::npos, peer.ReadUntil("slowly").find("slowly"));
}

TEST_F(HostileClient, ClosesAtEveryByte) {
    const std::string all =
        ClientGreeting() + OpenMessage() + HelloMessage() + PacketMessage(171750, "a request");
    for (size_t n = 0; n <= all.size(); ++n) {
        // Still reads what is said until the service closes, too.
        const unsigned nEvents = service.nEvents;
        RawPeer peer(address);
        ASSERT_TRUE(peer.Send(all.substr(0, n)));
        ASSERT_EQ(0, shutdown(peer.Fd(), SHUT_WR));
        const std::string got = peer.ReadToEnd();
        EXPECT_EQ(n == all.size(), got.find("a request") != std::string::npos) << n;
        const size_t nWithHello = all.size() - PacketMessage(171750, "a request").size();
        EXPECT_EQ(n >= nWithHello, service.nEvents > nEvents) << n;
    }
    for (size_t n = 0; n <= all.size(); ++n) {
        RawPeer(address).Send(all.substr(0, n));
    }
    EXPECT_TRUE(WaitUntil([&] { return service.nClosed == service.nAccepted; }));
}

TEST_F(HostileClient, WrongOpening) {
    const struct {
        const char* what;
        std::string message;
    } cases[] = {
        {"checksum", OpenMessage(171754, 8678622)},
        {"protocol", OpenMessage(171753)},
        {"no protocol", OpenMessage(172967, 0x229581)},
        {"name", OpenMessage(171754, 8678623, std::string(256, 'n'))},
        {"event instead", HelloMessage()},
        {"request instead", PacketMessage(171750, "x")},
        {"member", RawMessage{.type = 1, .member = "Close"}.Bytes()},
        {"interface", RawMessage{.type = 1, .interface = "sorn.Other", .member = "Open"}.Bytes()},
        {"signature",
         RawMessage{
             .type = 1, .member = "Open", .signature = "uu", .body = Wire().U32(171754).U32(8678623).bytes}
             .Bytes()},
        {"ping", RawMessage{.type = 1, .interface = "org.freedesktop.DBus.Peer", .member = "Ping"}.Bytes()},
        {"return", RawMessage{.type = 2, .replySerial = 1}.Bytes()},
        {"error", RawMessage{.type = 3, .replySerial = 1}.Bytes()},
    };
    for (const auto& each : cases) {
        const std::string got = SendAndReadToEnd(ClientGreeting() + each.message);
        EXPECT_NE(std::string::npos, got.find("OK ")) << each.what;
        EXPECT_EQ(std::string::npos, got.find("GetMachineId")) << each.what;
    }
    EXPECT_EQ(0u, service.nAccepted);
    EXPECT_NE(std::string::npos,
              SendAndReadToEnd(ClientGreeting() + OpenMessage(1, 2)).find("sorn.Bus.Refused"))
        << "a refusal is told";
}

TEST_F(HostileClient, OpensTwice) {
    RawPeer peer(address);
    peer.Send(ClientGreeting() + OpenMessage() + OpenMessage());
    peer.ReadToEnd();
    EXPECT_TRUE(WaitUntil([&] { return service.nClosed == 1; }));
    EXPECT_EQ(uintptr_t{VK_BUS_BAD_EVENT}, service.lastReason);
}

TEST_F(HostileClient, EventBeforeTheHello) {
    SendAndReadToEnd(ClientGreeting() + OpenMessage() + PacketMessage(171750, "x"));
    EXPECT_TRUE(WaitUntil([&] { return service.nClosed == 1; }));
    EXPECT_EQ(uintptr_t{VK_BUS_NOT_ALLOWED}, service.lastReason);
    EXPECT_EQ(0u, service.nEvents);
}

TEST_F(HostileClient, BadEvents) {
    const Wire front = Wire().U32(171750).U32(0x6F671A);
    std::string bigEndian = PacketMessage(171750, "x");
    bigEndian[0] = 'B';
    Wire unevenArray = front;
    unevenArray.U32(100).U8(1);  // more octets than there are
    const struct {
        const char* what;
        std::string message;
        unsigned reason;
    } cases[] = {
        {"what only the service sends", PacketMessage(171752, "x"), VK_BUS_NOT_ALLOWED},
        {"a second hello", HelloMessage(), VK_BUS_NOT_ALLOWED},
        {"unknown event", PacketMessage(171751, "x"), VK_BUS_NOT_ALLOWED},
        {"other checksum", PacketMessage(171750, "x", 0x6F671B), VK_BUS_BAD_EVENT},
        {"no checksum", RawMessage{.signature = "u", .body = Wire().U32(171750).bytes}.Bytes(),
         VK_BUS_BAD_EVENT},
        {"no body", RawMessage{}.Bytes(), VK_BUS_BAD_EVENT},
        {"no packet", RawMessage{.signature = "uu", .body = front.bytes}.Bytes(), VK_BUS_BAD_EVENT},
        {"text for packet", RawMessage{.signature = "uus", .body = Wire(front).Text("x").bytes}.Bytes(),
         VK_BUS_BAD_EVENT},
        {"numbers for octets",
         RawMessage{.signature = "uuau", .body = Wire(front).U32(4).U32(1).bytes}.Bytes(), VK_BUS_BAD_EVENT},
        {"one more", RawMessage{.signature = "uuayu", .body = Wire(front).Octets("x").U32(1).bytes}.Bytes(),
         VK_BUS_BAD_EVENT},
        {"too few octets", RawMessage{.signature = "uuay", .body = unevenArray.bytes}.Bytes(),
         VK_BUS_BAD_EVENT},
        {"other member",
         RawMessage{.member = "Incident", .signature = "uuay", .body = Wire(front).Octets("x").bytes}.Bytes(),
         VK_BUS_BAD_EVENT},
        {"ping", RawMessage{.type = 1, .interface = "org.freedesktop.DBus.Peer", .member = "Ping"}.Bytes(),
         VK_BUS_BAD_EVENT},
        {"return", RawMessage{.type = 2, .replySerial = 1}.Bytes(), VK_BUS_BAD_EVENT},
    };
    for (const auto& each : cases) {
        RawPeer peer = Opened();
        const unsigned nBefore = service.nEvents;
        const unsigned nClosed = service.nClosed;
        ASSERT_TRUE(peer.Send(each.message)) << each.what;
        peer.ReadToEnd();
        ASSERT_TRUE(WaitUntil([&] { return service.nClosed == nClosed + 1; })) << each.what;
        EXPECT_EQ(uintptr_t{each.reason}, service.lastReason) << each.what;
        EXPECT_EQ(nBefore, service.nEvents) << each.what;
    }
    // What the transport itself does not take ends the session just so.
    RawPeer peer = Opened();
    peer.Send(bigEndian);
    peer.ReadToEnd();
}

TEST_F(HostileClient, Garbage) {
    std::mt19937 random(4711);
    for (int round = 0; round < 300; ++round) {
        std::string bytes(random() % 300, 0);
        for (char& c : bytes) c = static_cast<char>(random());
        RawPeer peer(address);
        switch (round % 3) {
            case 0:
                peer.Send(bytes);
                break;
            case 1:
                peer.Send(ClientGreeting() + bytes);
                break;
            default:
                peer.Send(ClientGreeting() + OpenMessage() + HelloMessage() + bytes);
        }
    }
}

TEST_F(HostileClient, OneByteIsOther) {
    const std::string all = OpenMessage() + HelloMessage() + PacketMessage(171750, "a request");
    for (size_t i = 0; i < all.size(); ++i) {
        for (const int change : {1, 0x80, 0xFF}) {
            std::string bytes = all;
            bytes[i] = static_cast<char>(bytes[i] ^ change);
            RawPeer peer(address);
            peer.Send(ClientGreeting() + bytes);
        }
    }
}

TEST_F(HostileClient, EventOverTheLimit) {
    RawPeer peer = Opened();
    // Id, checksum and count are twelve bytes: one octet too many.
    EXPECT_TRUE(peer.Send(PacketMessage(171750, std::string(maxVkBusEventBytesG - 11, 'x'))));
    peer.ReadToEnd();
    EXPECT_TRUE(WaitUntil([&] { return service.nClosed == 1; }));
    EXPECT_EQ(uintptr_t{VK_BUS_TOO_LARGE}, service.lastReason);
}

TEST_F(HostileClient, SizesThatAreNotThere) {
    for (const uint32_t size : {100'000'000u, 0x08000000u, 0x7FFFFFFFu, 0xFFFFFFF8u}) {
        for (const size_t at : {4u, 12u}) {  // of the body, of the header's fields
            std::string bytes = PacketMessage(171750, "x");
            for (size_t i = 0; i < 4; ++i) bytes[at + i] = static_cast<char>(size >> 8 * i);
            RawPeer peer = Opened();
            peer.Send(bytes);
        }
    }
}

TEST_F(HostileClient, BringsDescriptors) {
    const size_t nBefore = CountInProc("fd");
    {
        RawPeer peer = Opened();
        const std::string bytes = PacketMessage(171750, "x");
        iovec part = {const_cast<char*>(bytes.data()), bytes.size()};
        alignas(cmsghdr) char control[CMSG_SPACE(sizeof(int))] = {};
        msghdr message = {};
        message.msg_iov = &part;
        message.msg_iovlen = 1;
        message.msg_control = control;
        message.msg_controllen = sizeof(control);
        cmsghdr* head = CMSG_FIRSTHDR(&message);
        head->cmsg_level = SOL_SOCKET;
        head->cmsg_type = SCM_RIGHTS;
        head->cmsg_len = CMSG_LEN(sizeof(int));
        const int fd = peer.Fd();
        memcpy(CMSG_DATA(head), &fd, sizeof(fd));
        EXPECT_EQ(static_cast<ssize_t>(bytes.size()), sendmsg(peer.Fd(), &message, MSG_NOSIGNAL));
        // The copy of its own socket would keep it open, were it kept.
        peer.ReadToEnd();
        EXPECT_TRUE(peer.fClosed);
    }
    EXPECT_TRUE(WaitUntil([&] { return CountInProc("fd") <= nBefore; }));
}

TEST_F(HostileClient, NeverAsks) {
    RawPeer silent(address);
    RawPeer greeted(address);
    greeted.Send(ClientGreeting());
    RawPeer other(address);
    // Kinds of messages that the transport passes over.
    other.Send(ClientGreeting() + RawMessage{.type = 9}.Bytes() +
               RawMessage{.interface = "org.freedesktop.DBus.Local",
                          .member = "Disconnected",
                          .path = "/org/freedesktop/DBus/Local"}
                   .Bytes());
    const auto start = std::chrono::steady_clock::now();
    greeted.ReadToEnd();
    other.ReadToEnd();
    silent.ReadToEnd();
    EXPECT_GE(std::chrono::steady_clock::now() - start,
              std::chrono::nanoseconds(vkBusOpeningLimitG * 9 / 10));
    EXPECT_EQ(0u, service.nClosed);
}

// Lets the process have many descriptors for the time of a test.
class DescriptorLimit {
 public:
    explicit DescriptorLimit(rlim_t wanted) {
        getrlimit(RLIMIT_NOFILE, &beforeM);
        rlimit now = beforeM;
        now.rlim_cur = std::min(wanted, beforeM.rlim_max);
        fEnough = setrlimit(RLIMIT_NOFILE, &now) == 0 && now.rlim_cur == wanted;
    }
    ~DescriptorLimit() { setrlimit(RLIMIT_NOFILE, &beforeM); }
    bool fEnough;

 private:
    rlimit beforeM;
};

TEST_F(HostileClient, ThirtyAtOnce) {
    std::vector<std::unique_ptr<Client>> clients;
    for (size_t i = 0; i < 30; ++i) {
        clients.push_back(std::make_unique<Client>());
        ASSERT_EQ(VK_BUS_DONE, clients.back()->openResult);
    }
    for (size_t i = 0; i < clients.size(); ++i) {
        ASSERT_EQ(VK_BUS_DONE, clients[i]->Request(std::to_string(i)));
    }
    for (size_t i = 0; i < clients.size(); ++i) {
        ASSERT_EQ(VK_BUS_DONE, clients[i]->Process());
        ASSERT_EQ(std::vector<std::string>{std::to_string(i)}, clients[i]->packets);
    }
}

// A process with so many sessions.
class ProcessWithSessions {
 public:
    ProcessWithSessions(const std::string& address, unsigned nSessions) {
        int vEnds[2];
        EXPECT_EQ(0, pipe2(vEnds, O_CLOEXEC));
        processM = fork();
        if (processM == 0) {
            const char told = Open(address, nSessions) ? 'y' : 'n';
            while (write(vEnds[1], &told, 1) == 1) {
                pause();
            }
            _exit(1);
        }
        char told = 0;
        fOpen = read(vEnds[0], &told, 1) == 1 && told == 'y';
        close(vEnds[0]);
        close(vEnds[1]);
    }
    ~ProcessWithSessions() {
        kill(processM, SIGKILL);
        EXPECT_EQ(processM, waitpid(processM, nullptr, 0));
    }
    ProcessWithSessions(const ProcessWithSessions&) = delete;
    ProcessWithSessions& operator=(const ProcessWithSessions&) = delete;

    bool fOpen = false;  // all of them

 private:
    static bool Open(const std::string& address, unsigned nSessions) {
        static std::vector<RawPeer> peers;
        for (unsigned i = 0; i < nSessions; ++i) {
            peers.emplace_back(address);
            if (!peers.back().Send(ClientGreeting() + OpenMessage() + HelloMessage())) {
                return false;
            }
        }
        return true;
    }

    pid_t processM;
};

TEST_F(HostileClient, MoreThanTheListenerTakes) {
    const DescriptorLimit limit(4096);
    ASSERT_TRUE(limit.fEnough);
    constexpr unsigned nProcesses = maxVkBusSessionsG / maxVkBusSessionsOfProcessG;
    std::vector<std::unique_ptr<ProcessWithSessions>> processes;
    for (unsigned i = 0; i < nProcesses; ++i) {
        processes.push_back(std::make_unique<ProcessWithSessions>(address, maxVkBusSessionsOfProcessG));
        ASSERT_TRUE(processes.back()->fOpen);
    }
    ASSERT_TRUE(WaitUntil([&] { return service.nAccepted == maxVkBusSessionsG; }));
    EXPECT_EQ("", SendAndReadToEnd(ClientGreeting())) << "not even trust";
    processes.pop_back();
    ASSERT_TRUE(WaitUntil([&] { return service.nClosed == maxVkBusSessionsOfProcessG; }));
    EXPECT_EQ("again", Client().RoundTrip("again"));
}

TEST_F(HostileClient, MoreThanAProcessMayHave) {
    const DescriptorLimit limit(4096);
    ASSERT_TRUE(limit.fEnough);
    std::vector<RawPeer> peers;
    for (unsigned i = 0; i < maxVkBusSessionsOfProcessG; ++i) {
        peers.emplace_back(address);
        ASSERT_TRUE(peers.back().Send(ClientGreeting() + OpenMessage() + HelloMessage()));
    }
    ASSERT_TRUE(WaitUntil([&] { return service.nAccepted == maxVkBusSessionsOfProcessG; }));
    EXPECT_EQ("", SendAndReadToEnd(ClientGreeting())) << "not even trust";
    {
        const ProcessWithSessions other(address, 3);
        EXPECT_TRUE(other.fOpen);
        EXPECT_TRUE(WaitUntil([&] { return service.nAccepted == maxVkBusSessionsOfProcessG + 3; }));
    }
    peers.pop_back();
    ASSERT_TRUE(WaitUntil([&] { return service.nClosed == 4; }));
    EXPECT_EQ("again", Client().RoundTrip("again"));
}

using Listener = BusTest;

// Sessions that were left may still have events to be served; they do not keep their process out.
TEST_F(Listener, AProcessComesAndGoesFasterThanItIsServed) {
    std::promise<void> go;
    const std::shared_future<void> gone = go.get_future().share();
    Service service([&](const SeenEvent& seen) {
        if (seen.id == VkAesRequest::idG && seen.Packet() == "wait") {
            gone.wait();
        }
        return 0u;
    });
    {
        std::vector<RawPeer> peers;
        for (unsigned i = 0; i < maxVkBusSessionsOfProcessG; ++i) {
            peers.emplace_back(address);
            ASSERT_TRUE(peers.back().Send(ClientGreeting() + OpenMessage() + HelloMessage()));
        }
        ASSERT_TRUE(WaitUntil([&] { return service.nEvents == maxVkBusSessionsOfProcessG; }));
        ASSERT_TRUE(peers[0].Send(PacketMessage(171750, "wait")));
        ASSERT_TRUE(WaitUntil([&] { return service.nEvents == maxVkBusSessionsOfProcessG + 1; }));
        for (RawPeer& each : peers) {
            for (int i = 0; i < 100; ++i) {
                ASSERT_TRUE(each.Send(PacketMessage(171750, "x")));
            }
        }
    }
    std::thread later([&] {
        std::this_thread::sleep_for(std::chrono::milliseconds(200));
        go.set_value();
    });
    EXPECT_EQ(VK_BUS_DONE, Client().openResult);
    later.join();
}

TEST_F(Listener, WaitsForDescriptors) {
    uint32_t listener = 0;
    ASSERT_EQ(VK_BUS_DONE, VkBusListen(busTypeLibrary, VkAesQueryProtocol::idG, VkAesQueryProtocol::checksumG,
                                       nullptr, nullptr, nullptr, nullptr, &listener));
    const int fd = VkBusGetSelectFd(listener);
    RawPeer peer(socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0));
    {
        const int firstFree = dup(STDERR_FILENO);
        close(firstFree);
        const DescriptorLimit none(static_cast<rlim_t>(firstFree));
        ASSERT_TRUE(none.fEnough);
        ASSERT_TRUE(peer.Connect(address));
        ASSERT_TRUE(FReadable(fd, 60'000));
        EXPECT_EQ(VK_BUS_DONE, VkBusProcessOneEvent(listener, nullptr));
        EXPECT_FALSE(FReadable(fd, 0)) << "a loop would turn on nothing";
    }
    ASSERT_TRUE(peer.Send(ClientGreeting()));
    EXPECT_TRUE(WaitUntil([&] { return VkBusProcessOneEvent(listener, nullptr), FReadable(peer.Fd(), 0); }));
    EXPECT_NE(std::string::npos, peer.ReadUntil("OK ").find("OK "));
}

TEST_F(HostileClient, DescriptorsAboveAThousand) {
    const DescriptorLimit limit(4096);
    ASSERT_TRUE(limit.fEnough);
    std::vector<RawPeer> taken;
    while (taken.empty() || taken.back().Fd() < 1100) {
        taken.emplace_back(dup(STDERR_FILENO));
    }
    Client client;
    EXPECT_GT(VkBusGetSelectFd(client.connection), 1024);
    EXPECT_EQ("high", client.RoundTrip("high"));
}

}  // namespace
