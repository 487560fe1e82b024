#include <fcntl.h>
#include <gtest/gtest.h>
#include <signal.h>
#include <sys/wait.h>

#include <set>

#include "BusFixture.h"
#include "rox/RoxInitInfo.h"
#include "rox/RoxMempool.h"
#include "vkbus/LqxIpc.h"

namespace {

class Threads : public BusTest {};

// Processes a client's connection until it is gone.
std::thread Pump(const Client& client) {
    return std::thread([connection = client.connection] {
        unsigned result;
        do {
            result = VkBusProcessOneEvent(connection, &patienceG);
        } while (result == VK_BUS_DONE);
    });
}

TEST_F(Threads, SendersBesideOneThatProcesses) {
    Service service;
    Client client;
    std::set<std::string> missing;
    std::atomic<unsigned> nLeft{8 * 1000};
    for (int sender = 0; sender < 8; ++sender) {
        for (int i = 0; i < 1000; ++i) missing.insert(std::to_string(sender) + ":" + std::to_string(i));
    }
    std::vector<int> next(8, 0);
    client.onEvent = [&](const SeenEvent& event) {
        const std::string packet = event.Packet();
        EXPECT_EQ(1u, missing.erase(packet)) << packet;
        EXPECT_EQ(next[static_cast<size_t>(packet[0] - '0')]++, std::stoi(packet.substr(2))) << "in order";
        --nLeft;
        return 0u;
    };
    std::thread pump = Pump(client);
    std::vector<std::thread> senders;
    for (int sender = 0; sender < 8; ++sender) {
        senders.emplace_back([&client, sender] {
            for (int i = 0; i < 1000; ++i) {
                ASSERT_EQ(VK_BUS_DONE, client.Request(std::to_string(sender) + ":" + std::to_string(i)));
            }
        });
    }
    for (std::thread& sender : senders) sender.join();
    EXPECT_TRUE(WaitUntil([&] { return nLeft == 0; }));
    VkBusCloseConnection(client.connection);
    pump.join();
    EXPECT_TRUE(missing.empty());
}

TEST_F(Threads, CallbacksThatSend) {
    Service service;
    Client client;
    std::atomic<unsigned> nGot{0};
    client.onEvent = [&](const SeenEvent& event) {
        const int left = std::stoi(event.Packet());
        ++nGot;
        return left > 0 ? client.Request(std::to_string(left - 1)) : 0u;
    };
    std::thread pump = Pump(client);
    std::vector<std::thread> senders;
    for (int sender = 0; sender < 4; ++sender) {
        senders.emplace_back([&] { EXPECT_EQ(VK_BUS_DONE, client.Request("100")); });
    }
    for (std::thread& sender : senders) sender.join();
    EXPECT_TRUE(WaitUntil([&] { return nGot == 4 * 101; }));
    VkBusCloseConnection(client.connection);
    pump.join();
}

TEST_F(Threads, LargeEventsBothWaysAtOnce) {
    Service service;
    Client client;
    const std::string large(5u << 20, 'x');
    std::atomic<unsigned> nGot{0};
    client.onEvent = [&](const SeenEvent& event) {
        EXPECT_EQ(large.size(), event.As<VkAesResponse>().orpcV2Packet.count);
        ++nGot;
        return 0u;
    };
    std::thread pump = Pump(client);
    for (unsigned i = 0; i < 10; ++i) {
        // The service is ahead by a queue's length at most.
        ASSERT_TRUE(WaitUntil([&] { return i < nGot + 2; }));
        ASSERT_EQ(VK_BUS_DONE, client.Request(large));
    }
    EXPECT_TRUE(WaitUntil([&] { return nGot == 10; }));
    VkBusCloseConnection(client.connection);
    pump.join();
    EXPECT_EQ(0u, service.nClosed - (service.nClosed > 0)) << "no other session";
}

TEST_F(Threads, SendOfOneThatNobodyProcesses) {
    // More than a socket holds, and nobody but the sender to bring it on its way.
    std::atomic<uint32_t> nBytes{0};
    Service service([&](const SeenEvent& event) {
        if (event.id == VkAesRequest::idG) nBytes += event.As<VkAesRequest>().orpcV2Packet.count;
        return 0u;
    });
    Client client;
    ASSERT_EQ(VK_BUS_DONE, client.Request(std::string(8u << 20, 'x').substr(100)));
    ASSERT_EQ(VK_BUS_DONE, client.Request(std::string(5u << 20, 'y')));
    EXPECT_TRUE(WaitUntil([&] { return nBytes == (13u << 20) - 100; }));
}

TEST_F(Threads, ServiceSendsFromAnotherThread) {
    Service service;
    Client client;
    EXPECT_EQ("x", client.RoundTrip("x"));
    std::thread sender([&] {
        for (int i = 0; i < 1000; ++i) {
            ASSERT_EQ(VK_BUS_DONE, SendPacket(service.lastSession, VkAesResponse::idG, std::to_string(i)));
        }
    });
    for (int i = 0; i < 1000; ++i) {
        ASSERT_EQ(VK_BUS_DONE, client.Process());
        ASSERT_EQ(std::to_string(i), client.packets.back());
    }
    sender.join();
}

TEST_F(Threads, NeverReadingClientLosesItsSession) {
    std::atomic<unsigned> refused{VK_BUS_DONE};
    Service service([&](const SeenEvent& event) {
        if (event.id == VkAesRequest::idG) {
            unsigned result;
            do {
                result = SendPacket(event.session, VkAesResponse::idG, std::string(1u << 20, 'x'));
            } while (result == VK_BUS_DONE);
            refused = result;
        }
        return 0u;
    });
    Client lazy;
    ASSERT_EQ(VK_BUS_DONE, lazy.Request("all"));
    ASSERT_TRUE(WaitUntil([&] { return service.nClosed == 1; }));
    EXPECT_EQ(VK_BUS_QUEUE_FULL, refused);
    EXPECT_EQ(uintptr_t{VK_BUS_QUEUE_FULL}, service.lastReason);
    EXPECT_EQ(VK_BUS_NO_HANDLE, SendPacket(service.lastSession, VkAesResponse::idG, "x"));
    Client other;
    EXPECT_EQ(VK_BUS_DONE, other.openResult) << "others are served";
    // What the kernel held still arrives, and then the end.
    while (lazy.Process() == VK_BUS_DONE) {
    }
    EXPECT_EQ(1u, lazy.nClosed);
}

TEST_F(Threads, ManySmallEventsFillTheQueueToo) {
    std::atomic<unsigned> nSent{0};
    Service service([&](const SeenEvent& event) {
        if (event.id == VkAesRequest::idG) {
            while (SendPacket(event.session, VkAesResponse::idG, "") == VK_BUS_DONE) ++nSent;
        }
        return 0u;
    });
    Client lazy;
    ASSERT_EQ(VK_BUS_DONE, lazy.Request("all"));
    ASSERT_TRUE(WaitUntil([&] { return service.nClosed == 1; }));
    // Each counts as its overhead; the kernel holds some more.
    EXPECT_GE(nSent, maxVkBusQueuedBytesG / (vkBusEventOverheadG + 12) - 1);
    EXPECT_LT(nSent, 1'000'000u);
}

TEST_F(Threads, SendersWhileItCloses) {
    Service service;
    for (int round = 0; round < 50; ++round) {
        Client client;
        std::thread pump = Pump(client);
        std::vector<std::thread> senders;
        for (int sender = 0; sender < 3; ++sender) {
            senders.emplace_back([&] {
                while (client.Request("x") == VK_BUS_DONE) {
                }
            });
        }
        round % 2 == 0 ? VkBusCloseConnection(client.connection) : VkBusCloseSession(client.session);
        for (std::thread& sender : senders) sender.join();
        pump.join();
    }
}

TEST_F(Threads, ServiceEndsWhileClientsCome) {
    for (int round = 0; round < 20; ++round) {
        Service service;
        std::vector<std::thread> clients;
        for (int i = 0; i < 4; ++i) {
            clients.emplace_back([] {
                Client client({}, false);
                const unsigned result = client.openResult;
                EXPECT_TRUE(result == VK_BUS_DONE || result == VK_BUS_LOST || result == VK_BUS_NO_SERVICE)
                    << result;
            });
        }
        service.Stop();
        for (std::thread& client : clients) client.join();
    }
}

TEST_F(Threads, CloseAllBeatsEverything) {
    Service service;
    Client client;
    std::thread pump = Pump(client);
    VkBusCloseAll();
    pump.join();
    EXPECT_EQ(VK_BUS_NO_HANDLE, client.Request("x"));
    VkBusCloseAll();
}

TEST_F(Threads, OpenDescriptorsAreNotInherited) {
    Service service;
    Client client;
    for (const auto& entry : std::filesystem::directory_iterator("/proc/self/fd")) {
        const int fd = std::stoi(entry.path().filename());
        std::error_code gone;
        const std::string target = std::filesystem::read_symlink(entry.path(), gone);
        if (target.find("socket:") == 0 || target.find("anon_inode:[event") == 0 ||
            target.find("anon_inode:[timerfd") == 0) {
            EXPECT_NE(0, fcntl(fd, F_GETFD) & FD_CLOEXEC) << target;
        }
    }
    EXPECT_EQ("x", client.RoundTrip("x"));
}

TEST_F(Threads, ChildThatHoldsCopiesKeepsNothingOpen) {
    Service service;
    int hold[2];
    ASSERT_EQ(0, pipe(hold));
    pid_t child;
    {
        Client client;
        EXPECT_EQ("x", client.RoundTrip("x"));
        child = fork();
        if (child == 0) {
            char c;
            close(hold[1]);
            _exit(read(hold[0], &c, 1) == 0 ? 0 : 1);
        }
    }
    EXPECT_TRUE(WaitUntil([&] { return service.nClosed == 1; }));
    EXPECT_EQ("y", Client().RoundTrip("y"));
    close(hold[0]);
    close(hold[1]);
    int status = 1;
    waitpid(child, &status, 0);
    EXPECT_EQ(0, status);
}

// What a child closes is still open in its parent.
TEST_F(Threads, ChildThatClosesDisturbsNobody) {
    Service service;
    Client client;
    EXPECT_EQ("x", client.RoundTrip("x"));
    for (int i = 0; i < 3; ++i) {
        // A lock that the service's thread held now would be held in the child for ever.
        std::this_thread::sleep_for(std::chrono::milliseconds(100));
        const pid_t child = fork();
        if (child == 0) {
            alarm(30);
            VkBusCloseSession(client.session);
            VkBusCloseAll();
            _exit(0);
        }
        int status = 1;
        ASSERT_EQ(child, waitpid(child, &status, 0));
        EXPECT_EQ(0, status);
        EXPECT_EQ("still there", client.RoundTrip("still there"));
    }
    EXPECT_EQ("the service, too", Client().RoundTrip("the service, too"));
    EXPECT_TRUE(WaitUntil([&] { return service.nClosed == 1; })) << "that one";
    EXPECT_EQ("still there", client.RoundTrip("still there"));
}

// All who wait for a connection come back when it is closed.
TEST_F(Threads, FiveWaitersOfAConnectionThatIsClosed) {
    Service service;
    Client client;
    std::atomic<int> nBack{0};
    std::vector<std::thread> waiters;
    for (int i = 0; i < 5; ++i) {
        waiters.emplace_back([&] {
            EXPECT_NE(VK_BUS_DONE, client.Process(patienceG));
            ++nBack;
        });
    }
    std::this_thread::sleep_for(std::chrono::milliseconds(100));
    const auto start = std::chrono::steady_clock::now();
    EXPECT_EQ(VK_BUS_DONE, VkBusCloseConnection(client.connection));
    for (std::thread& each : waiters) {
        each.join();
    }
    EXPECT_EQ(5, nBack);
    EXPECT_LT(std::chrono::steady_clock::now() - start, std::chrono::nanoseconds(patienceG / 2));
}

TEST_F(Threads, SignalsDoNotDisturb) {
    struct sigaction action = {};
    action.sa_handler = [](int) {};
    struct sigaction before;
    sigaction(SIGUSR1, &action, &before);  // without SA_RESTART
    Service service;
    Client client;
    std::atomic<bool> stop{false};
    const pthread_t target = pthread_self();
    std::thread disturber([&] {
        while (!stop) {
            pthread_kill(target, SIGUSR1);
            std::this_thread::yield();
        }
    });
    for (int i = 0; i < 300; ++i) {
        EXPECT_EQ("x", client.RoundTrip("x"));
    }
    EXPECT_EQ(std::string(5u << 20, 'y'), client.RoundTrip(std::string(5u << 20, 'y')));
    EXPECT_EQ(VK_BUS_TIMED_OUT, client.Process(20'000'000));
    EXPECT_EQ("again", Client().RoundTrip("again"));
    stop = true;
    disturber.join();
    sigaction(SIGUSR1, &before, nullptr);
}

TEST_F(Threads, NoSignalForABrokenConnection) {
    struct sigaction before;
    ASSERT_EQ(0, sigaction(SIGPIPE, nullptr, &before));
    ASSERT_EQ(SIG_DFL, before.sa_handler) << "it would end the process";
    Service service;
    Client client;
    service.Stop();
    unsigned result = VK_BUS_DONE;
    for (int i = 0; i < 10 && result == VK_BUS_DONE; ++i) {
        result = client.Request("x");
    }
    EXPECT_NE(VK_BUS_DONE, result);
    EXPECT_EQ(VK_BUS_LOST, client.Process());
}

TEST_F(Threads, ModuleClosesWhatIsLeft) {
    RoxMempool pool("modules");
    ASSERT_EQ(0u, RoxInitInfo::StartAll(&pool));
    EXPECT_TRUE(LqxIpc::initInfo.FRunning());
    Service service;
    Client client;
    EXPECT_EQ("x", client.RoundTrip("x"));
    RoxInitInfo::StopAll();
    EXPECT_EQ(VK_BUS_NO_HANDLE, client.Request("x"));
    EXPECT_EQ(VK_BUS_NO_HANDLE, VkBusProcessOneEvent(service.listener, nullptr));
}

}  // namespace
