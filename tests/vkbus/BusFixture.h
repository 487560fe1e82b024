#pragma once

#include <gtest/gtest.h>
#include <poll.h>
#include <stdlib.h>
#include <sys/stat.h>
#include <unistd.h>

#include <atomic>
#include <condition_variable>
#include <cstdint>
#include <filesystem>
#include <functional>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

#include "client/BusTypeLibrary.h"
#include "vkbus/VkBus.h"

// More than anything here takes, on the slowest machine: who waits that long has failed.
constexpr int64_t patienceG = 60'000'000'000;

/// Waits until `condition` holds; false when patience runs out. Yields the processor meanwhile.
inline bool WaitUntil(const std::function<bool()>& condition) {
    const auto end = std::chrono::steady_clock::now() + std::chrono::nanoseconds(patienceG);
    while (!condition()) {
        if (std::chrono::steady_clock::now() > end) {
            return false;
        }
        std::this_thread::sleep_for(std::chrono::milliseconds(1));
    }
    return true;
}

/// Entries of a folder of /proc/self: "fd" or "task".
inline size_t CountInProc(const char* folder) {
    size_t n = 0;
    for ([[maybe_unused]] const auto& entry :
         std::filesystem::directory_iterator(std::string("/proc/self/") + folder)) {
        ++n;
    }
    return n;
}

/// A private address for the time of a test; fails the test when descriptors are left at its end.
class BusTest : public testing::Test {
 protected:
    BusTest() {
        char folder[] = "/tmp/vkbus-test.XXXXXX";
        folderM = mkdtemp(folder);
        address = folderM + "/bus";
        VkBusSetAddress(address.c_str());
        nDescriptorsM = CountInProc("fd");
    }
    ~BusTest() override {
        VkBusCloseAll();
        VkBusSetAddress(nullptr);
        EXPECT_TRUE(WaitUntil([this] { return CountInProc("fd") <= nDescriptorsM; }))
            << "descriptors are left";
        std::filesystem::remove_all(folderM);
    }

    const std::string& Folder() const { return folderM; }
    std::string address;

 private:
    std::string folderM;
    size_t nDescriptorsM;
};

/// One protocol of a library, with who listens to it.
struct Terms {
    const VkBusTypeLibrary* library = &busTypeLibrary;
    unsigned protocol = VkAesQueryProtocol::idG;
    unsigned checksum = VkAesQueryProtocol::checksumG;
};

/// An event as a callback got it.
struct SeenEvent {
    uint32_t session;
    unsigned id;
    const void* record;  // during the callback
    const VkBusTypeLibrary* library;

    template <class T>
    const T& As() const {
        return *static_cast<const T*>(record);
    }
    std::string Packet() const {
        const auto& packet = As<VkAesRequest>().orpcV2Packet;
        return std::string(reinterpret_cast<const char*>(packet.vElement), packet.count);
    }
};

inline SeenEvent Unmarshal(const VkBusTypeLibrary& library, uint32_t session, uintptr_t word1,
                           uintptr_t word2) {
    SeenEvent seen = {session, VkMarshal_GetTypeFromSerialEvent(word2, word1), nullptr, &library};
    EXPECT_EQ(VK_BUS_DONE, VkMarshal_UnmarshalSerialEvent(library, word2, word1, &seen.record));
    return seen;
}

inline unsigned SendPacket(uint32_t session, unsigned id, const std::string& bytes) {
    const VkAesRequest record = {
        {static_cast<uint32_t>(bytes.size()), reinterpret_cast<const uint8_t*>(bytes.data())}};
    return VkBusMarshalAndSend(session, id, &record);
}

/// A listener with a thread of its own that processes it.
class Service {
 public:
    using OnEvent = std::function<unsigned(const SeenEvent&)>;

    /// By default it answers each request with a response of the same bytes.
    explicit Service(OnEvent onEvent = nullptr, Terms terms = {})
        : onEventM(std::move(onEvent)), termsM(terms) {
        EXPECT_EQ(VK_BUS_DONE, VkBusListen(*terms.library, terms.protocol, terms.checksum, &Accept, &Event,
                                           &Close, this, &listener));
        threadM = std::thread([this] {
            const int64_t limit = patienceG;
            unsigned result;
            while ((result = VkBusProcessOneEvent(listener, &limit)) == VK_BUS_DONE ||
                   result == VK_BUS_TIMED_OUT) {
            }
        });
    }
    ~Service() { Stop(); }
    void Stop() {
        if (threadM.joinable()) {
            VkBusCloseConnection(listener);
            threadM.join();
        }
    }

    uint32_t listener = 0;
    std::function<unsigned(uint32_t session)> onAccept;
    std::atomic<unsigned> nAccepted{0};
    std::atomic<unsigned> nEvents{0};
    std::atomic<unsigned> nClosed{0};
    std::atomic<uintptr_t> lastReason{0};
    std::atomic<uint32_t> lastSession{0};

    std::string LastName() {
        std::lock_guard<std::mutex> hold(mutexM);
        return lastNameM;
    }

 private:
    static unsigned Accept(uint32_t session, const char* name, void* context) {
        Service* self = static_cast<Service*>(context);
        {
            std::lock_guard<std::mutex> hold(self->mutexM);
            self->lastNameM = name;
        }
        self->lastSession = session;
        ++self->nAccepted;
        return self->onAccept ? self->onAccept(session) : 0;
    }
    static unsigned Event(uint32_t session, uintptr_t word1, uintptr_t word2, void* context) {
        Service* self = static_cast<Service*>(context);
        const SeenEvent seen = Unmarshal(*self->termsM.library, session, word1, word2);
        unsigned result = 0;
        ++self->nEvents;
        if (self->onEventM) {
            result = self->onEventM(seen);
        } else if (seen.id == VkAesRequest::idG) {
            VkBusMarshalAndSend(session, VkAesResponse::idG, seen.record);
        }
        return result;
    }
    static void Close(uint32_t, uintptr_t reason, void* context) {
        Service* self = static_cast<Service*>(context);
        self->lastReason = reason;
        ++self->nClosed;
    }

    OnEvent onEventM;
    Terms termsM;
    std::mutex mutexM;
    std::string lastNameM;
    std::thread threadM;
};

/// A connection with a session, processed by whoever calls.
class Client {
 public:
    explicit Client(Terms terms = {}, bool hello = true) : termsM(terms) {
        openResult = VkBusOpenNamedConnection(*terms.library, "tester", &connection);
        if (openResult == VK_BUS_DONE) {
            openResult = VkBusOpenSession(connection, terms.protocol, terms.checksum, &Event, &Close, this, 0,
                                          &session);
        }
        if (openResult == VK_BUS_DONE && hello) {
            const VkAesHello record = {0};
            EXPECT_EQ(VK_BUS_DONE, VkBusMarshalAndSend(session, VkAesHello::idG, &record));
        }
    }
    ~Client() {
        VkBusCloseSession(session);
        VkBusCloseConnection(connection);
    }

    unsigned Process(int64_t limit = patienceG) { return VkBusProcessOneEvent(connection, &limit); }
    unsigned Request(const std::string& bytes) { return SendPacket(session, VkAesRequest::idG, bytes); }
    /// A request and the bytes of its response; the result's name on a failure.
    std::string RoundTrip(const std::string& bytes) {
        const size_t n = packets.size();
        unsigned result = Request(bytes);
        if (result == VK_BUS_DONE) {
            result = Process();
        }
        return result == VK_BUS_DONE && packets.size() == n + 1 ? packets.back() : VkBusResultText(result);
    }

    uint32_t connection = 0;
    uint32_t session = 0;
    unsigned openResult;
    unsigned nEvents = 0;
    unsigned nClosed = 0;
    uintptr_t reason = 0;
    std::vector<std::string> packets;
    std::function<unsigned(const SeenEvent&)> onEvent;
    std::function<void()> onClose;

 private:
    static unsigned Event(uint32_t session, uintptr_t word1, uintptr_t word2, void* context) {
        Client* self = static_cast<Client*>(context);
        const SeenEvent seen = Unmarshal(*self->termsM.library, session, word1, word2);
        ++self->nEvents;
        if (self->onEvent) {
            return self->onEvent(seen);
        }
        if (seen.id == VkAesResponse::idG) {
            self->packets.push_back(seen.Packet());
        }
        return 0;
    }
    static void Close(uint32_t, uintptr_t reason, void* context) {
        Client* self = static_cast<Client*>(context);
        ++self->nClosed;
        self->reason = reason;
        if (self->onClose) {
            self->onClose();
        }
    }

    Terms termsM;
};

inline bool FReadable(int fd, int milliseconds) {
    pollfd watched = {fd, POLLIN, 0};
    return poll(&watched, 1, milliseconds) == 1 && (watched.revents & POLLIN) != 0;
}
