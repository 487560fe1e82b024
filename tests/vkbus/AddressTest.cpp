#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/file.h>
#include <sys/wait.h>

#include <cstdlib>

#include "BusFixture.h"
#include "RawPeer.h"

namespace {

// The environment that decides the address, put back at the end.
class Address : public BusTest {
 protected:
    Address() {
        for (const char* name : namesG) {
            const char* value = getenv(name);
            beforeM.push_back(value != nullptr ? value : "");
            unsetenv(name);
        }
    }
    ~Address() override {
        for (size_t i = 0; i < beforeM.size(); ++i) {
            beforeM[i].empty() ? unsetenv(namesG[i]) : setenv(namesG[i], beforeM[i].c_str(), 1);
        }
    }

    static unsigned Listen(uint32_t* listener) {
        return VkBusListen(busTypeLibrary, VkAesQueryProtocol::idG, VkAesQueryProtocol::checksumG, nullptr,
                           nullptr, nullptr, nullptr, listener);
    }
    static unsigned Connect() {
        uint32_t connection = 0;
        const unsigned result = VkBusOpenNamedConnection(busTypeLibrary, "tester", &connection);
        VkBusCloseConnection(connection);
        return result;
    }

 private:
    static constexpr const char* namesG[] = {"SORN_BUS", "XDG_RUNTIME_DIR"};
    std::vector<std::string> beforeM;
};

TEST_F(Address, Default) {
    VkBusSetAddress(nullptr);
    const std::string number = std::to_string(geteuid());
    const std::string inRun = "/run/user/" + number;
    struct stat found;
    const bool run = stat(inRun.c_str(), &found) == 0 && found.st_uid == geteuid();
    const std::string last = run ? inRun + "/sorn-bus" : "/tmp/sorn-" + number + "/sorn-bus";
    EXPECT_EQ(last, VkBusGetAddress());
    setenv("XDG_RUNTIME_DIR", "relative", 1);
    EXPECT_EQ(last, VkBusGetAddress()) << "only a whole path counts";
    setenv("XDG_RUNTIME_DIR", "/somewhere", 1);
    EXPECT_EQ("/somewhere/sorn-bus", VkBusGetAddress());
    setenv("SORN_BUS", "", 1);
    EXPECT_EQ("/somewhere/sorn-bus", VkBusGetAddress());
    setenv("SORN_BUS", "/else/where", 1);
    EXPECT_EQ("/else/where", VkBusGetAddress());
    VkBusSetAddress("/set");
    EXPECT_EQ("/set", VkBusGetAddress());
    VkBusSetAddress(nullptr);
    EXPECT_EQ("/else/where", VkBusGetAddress());
}

TEST_F(Address, EnvironmentLeadsBothEnds) {
    VkBusSetAddress(nullptr);
    setenv("XDG_RUNTIME_DIR", Folder().c_str(), 1);
    Service service;
    struct stat found;
    EXPECT_EQ(0, stat((Folder() + "/sorn-bus").c_str(), &found));
    EXPECT_EQ("x", Client().RoundTrip("x"));
}

TEST_F(Address, ModeAndEnd) {
    const mode_t before = umask(0);
    Service service;
    umask(before);
    struct stat found;
    ASSERT_EQ(0, stat(address.c_str(), &found));
    EXPECT_TRUE(S_ISSOCK(found.st_mode));
    EXPECT_EQ(mode_t{0600}, found.st_mode & 07777);
    service.Stop();
    EXPECT_NE(0, stat(address.c_str(), &found)) << "removed at the end";
    EXPECT_EQ(VK_BUS_NO_SERVICE, Connect());
}

TEST_F(Address, TooLong) {
    const size_t most = sizeof(sockaddr_un::sun_path) - 1;
    const std::string fits = Folder() + "/" + std::string(most - Folder().size() - 1, 'x');
    VkBusSetAddress(fits.c_str());
    uint32_t listener = 0;
    EXPECT_EQ(VK_BUS_DONE, Listen(&listener));
    EXPECT_EQ(VK_BUS_DONE, Connect());
    for (const std::string& longer : {fits + "x", fits + std::string(5000, 'x')}) {
        VkBusSetAddress(longer.c_str());
        EXPECT_EQ(VK_BUS_BAD_ADDRESS, Listen(&listener));
        EXPECT_EQ(VK_BUS_BAD_ADDRESS, Connect());
    }
}

TEST_F(Address, NotToBeUsed) {
    uint32_t listener = 77;
    VkBusSetAddress((Folder() + "/no/such/folder").c_str());
    EXPECT_EQ(VK_BUS_BAD_ADDRESS, Listen(&listener));
    EXPECT_EQ(VK_BUS_NO_SERVICE, Connect());
    // What is no socket stays.
    VkBusSetAddress(Folder().c_str());
    EXPECT_EQ(VK_BUS_BAD_ADDRESS, Listen(&listener));
    VkBusSetAddress(address.c_str());
    close(open(address.c_str(), O_CREAT | O_WRONLY | O_CLOEXEC, 0600));
    EXPECT_EQ(VK_BUS_BAD_ADDRESS, Listen(&listener));
    EXPECT_EQ(VK_BUS_NO_SERVICE, Connect());
    EXPECT_EQ(0, access(address.c_str(), F_OK));
    EXPECT_EQ(77u, listener);
}

TEST_F(Address, InUse) {
    Service service;
    uint32_t second = 77;
    EXPECT_EQ(VK_BUS_ADDRESS_IN_USE, Listen(&second));
    EXPECT_EQ(77u, second);
    EXPECT_EQ("x", Client().RoundTrip("x")) << "the first one lives on";
    VkBusSetAddress((Folder() + "/other").c_str());
    EXPECT_EQ(VK_BUS_DONE, Listen(&second)) << "a process may have several";
}

TEST_F(Address, StaleSocketIsReplaced) {
    {
        // What a killed service leaves behind.
        RawPeer dead(socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0));
        const sockaddr_un name = RawPeer::Name(address);
        ASSERT_EQ(0, bind(dead.Fd(), reinterpret_cast<const sockaddr*>(&name), sizeof(name)));
        ASSERT_EQ(0, listen(dead.Fd(), 1));
    }
    EXPECT_EQ(VK_BUS_NO_SERVICE, Connect());
    Service service;
    EXPECT_EQ("x", Client().RoundTrip("x"));
}

TEST_F(Address, EndLeavesAnothersSocket) {
    Service first;
    ASSERT_EQ(0, unlink(address.c_str()));
    Service second;
    first.Stop();
    EXPECT_EQ("x", Client().RoundTrip("x"));
}

TEST_F(Address, OnlyOneOfManyStarters) {
    std::atomic<unsigned> nDone{0};
    std::atomic<unsigned> nInUse{0};
    std::vector<std::thread> starters;
    for (int i = 0; i < 8; ++i) {
        starters.emplace_back([&] {
            uint32_t listener = 0;
            const unsigned result = Listen(&listener);
            nDone += result == VK_BUS_DONE;
            nInUse += result == VK_BUS_ADDRESS_IN_USE;
        });
    }
    for (std::thread& starter : starters) starter.join();
    EXPECT_EQ(1u, nDone);
    EXPECT_EQ(7u, nInUse);
}

TEST_F(Address, FolderThatAnotherHoldsLocked) {
    const int folder = open(Folder().c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC);
    ASSERT_EQ(0, flock(folder, LOCK_EX));
    uint32_t listener = 0;
    EXPECT_EQ(VK_BUS_BAD_ADDRESS, Listen(&listener)) << "it gives up after a while";
    close(folder);
    EXPECT_EQ(VK_BUS_DONE, Listen(&listener));
}

// What another user's process gives: a number below 100.
int AsUser(uid_t user, const std::function<int()>& work) {
    const pid_t child = fork();
    if (child == 0) {
        _exit(setgid(user) == 0 && setuid(user) == 0 ? work() : 99);
    }
    int status = 0;
    waitpid(child, &status, 0);
    return WIFEXITED(status) ? WEXITSTATUS(status) : 100;
}

constexpr uid_t strangerG = 54321;

TEST_F(Address, AnotherUserIsKeptOut) {
    if (geteuid() != 0) {
        GTEST_SKIP() << "only root can be another user, too";
    }
    uint32_t listener = 0;
    ASSERT_EQ(VK_BUS_DONE, Listen(&listener));
    ASSERT_EQ(0, chmod(Folder().c_str(), 0755));
    EXPECT_EQ(VK_BUS_WRONG_USER,
              static_cast<unsigned>(AsUser(strangerG, [] { return static_cast<int>(Connect()); })))
        << "by the mode of the socket";
    // And where the mode lets them through, by who they are.
    ASSERT_EQ(0, chmod(address.c_str(), 0666));
    const pid_t stranger = fork();
    if (stranger == 0) {
        if (setuid(strangerG) != 0) _exit(99);
        RawPeer peer(address);
        peer.Send(ClientGreeting() + OpenMessage());
        _exit(peer.ReadToEnd().empty() ? 0 : 1);
    }
    int status = 1;
    EXPECT_TRUE(WaitUntil([&] {
        VkBusProcessOneEvent(listener, nullptr);
        return waitpid(stranger, &status, WNOHANG) == stranger;
    }));
    EXPECT_EQ(0, status);
}

TEST_F(Address, AnotherUsersServiceIsNotTrusted) {
    if (geteuid() != 0) {
        GTEST_SKIP() << "only root can be another user, too";
    }
    ASSERT_EQ(0, chown(Folder().c_str(), strangerG, strangerG));
    int ready[2];
    ASSERT_EQ(0, pipe(ready));
    const pid_t child = fork();
    if (child == 0) {
        uint32_t listener = 0;
        if (setuid(strangerG) != 0 || Listen(&listener) != VK_BUS_DONE || write(ready[1], "x", 1) != 1)
            _exit(99);
        // Serves until it is killed; root may speak to it.
        while (VkBusProcessOneEvent(listener, &patienceG) == VK_BUS_DONE) {
        }
        _exit(98);
    }
    char c;
    ASSERT_EQ(1, read(ready[0], &c, 1));
    EXPECT_EQ(VK_BUS_WRONG_USER, Connect());
    RawPeer root(address);
    root.Send(ClientGreeting());
    EXPECT_NE(std::string::npos, root.ReadUntil("OK ").find("OK "));
    kill(child, SIGKILL);
    waitpid(child, nullptr, 0);
    close(ready[0]);
    close(ready[1]);
}

TEST_F(Address, FolderOfTheLastResort) {
    if (geteuid() != 0) {
        GTEST_SKIP() << "only root can be another user, too";
    }
    VkBusSetAddress(nullptr);
    const std::string folder = "/tmp/sorn-" + std::to_string(strangerG);
    const auto listen = [] {
        uint32_t listener = 0;
        return static_cast<int>(Listen(&listener));
    };
    std::filesystem::remove_all(folder);
    EXPECT_EQ(0, AsUser(strangerG, listen));
    struct stat found;
    ASSERT_EQ(0, stat(folder.c_str(), &found));
    EXPECT_EQ(mode_t{0700}, found.st_mode & 0777);
    EXPECT_EQ(strangerG, found.st_uid);
    EXPECT_EQ(0, AsUser(strangerG, listen)) << "what the first has left is taken over";
    ASSERT_EQ(0, chmod(folder.c_str(), 0777));
    EXPECT_EQ(VK_BUS_BAD_ADDRESS, static_cast<unsigned>(AsUser(strangerG, listen))) << "open to others";
    ASSERT_EQ(0, chown(folder.c_str(), 0, 0));
    EXPECT_EQ(VK_BUS_BAD_ADDRESS, static_cast<unsigned>(AsUser(strangerG, listen))) << "somebody else's";
    std::filesystem::remove_all(folder);
    ASSERT_EQ(0, symlink(Folder().c_str(), folder.c_str()));
    ASSERT_EQ(0, chown(Folder().c_str(), strangerG, strangerG));
    EXPECT_EQ(VK_BUS_BAD_ADDRESS, static_cast<unsigned>(AsUser(strangerG, listen)))
        << "no folder, but a link";
    std::filesystem::remove_all(folder);
}

}  // namespace
