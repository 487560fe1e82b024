#include <gtest/gtest.h>

#include <optional>

#include "BusFixture.h"

// Records that are kept beyond the callback of their event.

namespace {

constexpr size_t bigG = 1 << 20;

/// Keeps the record of each response.
class Keeper {
 public:
    struct Kept {
        ref<RoxCore> event;
        const VkAesResponse* record;

        std::string Packet() const {
            const auto& packet = record->orpcV2Packet;
            return std::string(reinterpret_cast<const char*>(packet.vElement), packet.count);
        }
    };

    Keeper() {
        EXPECT_EQ(VK_BUS_DONE, VkBusOpenNamedConnection(busTypeLibrary, "keeper", &connection));
        EXPECT_EQ(VK_BUS_DONE,
                  VkBusOpenSession(connection, VkAesQueryProtocol::idG, VkAesQueryProtocol::checksumG, &Event,
                                   nullptr, this, 0, &session));
        const VkAesHello hello = {0};
        EXPECT_EQ(VK_BUS_DONE, VkBusMarshalAndSend(session, VkAesHello::idG, &hello));
    }
    ~Keeper() { Close(); }
    void Close() {
        VkBusCloseSession(session);
        VkBusCloseConnection(connection);
    }
    unsigned RoundTrip(const std::string& bytes) {
        const unsigned result = SendPacket(session, VkAesRequest::idG, bytes);
        return result == VK_BUS_DONE ? VkBusProcessOneEvent(connection, &patienceG) : result;
    }

    uint32_t connection = 0;
    uint32_t session = 0;
    unsigned resultOfCallback = VK_BUS_DONE;
    std::vector<Kept> kept;
    uintptr_t word1 = 0;
    uintptr_t word2 = 0;

 private:
    static unsigned Event(uint32_t, uintptr_t word1, uintptr_t word2, void* context) {
        auto* const self = static_cast<Keeper*>(context);
        Kept kept = {VkMarshal_KeepSerialEvent(word2, word1), nullptr};
        EXPECT_NE(nullptr, kept.event);
        EXPECT_EQ(kept.event, VkMarshal_KeepSerialEvent(word2, word1)) << "one for all who ask";
        EXPECT_EQ(nullptr, VkMarshal_KeepSerialEvent(word2 + 1, word1));
        // The record may be asked for before and afterwards.
        const void* record = nullptr;
        EXPECT_EQ(VK_BUS_DONE, VkMarshal_UnmarshalSerialEvent(busTypeLibrary, word2, word1, &record));
        kept.record = static_cast<const VkAesResponse*>(record);
        self->kept.push_back(std::move(kept));
        self->word1 = word1;
        self->word2 = word2;
        return self->resultOfCallback;
    }
};

class KeptEvent : public BusTest {};

TEST_F(KeptEvent, OutlivesTheCallback) {
    Service service;
    Keeper keeper;
    for (const char c : {'a', 'b', 'c'}) {
        ASSERT_EQ(VK_BUS_DONE, keeper.RoundTrip(std::string(bigG, c)));
    }
    ASSERT_EQ(3u, keeper.kept.size());
    for (size_t i = 0; i < 3; ++i) {
        EXPECT_TRUE(keeper.kept[i].Packet() == std::string(bigG, static_cast<char>('a' + i)));
    }
    EXPECT_EQ(nullptr, VkMarshal_KeepSerialEvent(keeper.word2, keeper.word1)) << "after the callback";
}

TEST_F(KeptEvent, OutlivesTheConnection) {
    std::optional<Service> service(std::in_place);
    std::optional<Keeper> keeper(std::in_place);
    ASSERT_EQ(VK_BUS_DONE, keeper->RoundTrip(std::string(bigG, 'x')));
    const Keeper::Kept kept = keeper->kept[0];
    keeper.reset();
    service.reset();
    VkBusCloseAll();
    EXPECT_TRUE(kept.Packet() == std::string(bigG, 'x'));
}

TEST_F(KeptEvent, OutlivesASessionThatItsCallbackEnds) {
    Service service;
    Keeper keeper;
    keeper.resultOfCallback = 1;
    ASSERT_EQ(VK_BUS_DONE, keeper.RoundTrip("last words"));
    EXPECT_NE(VK_BUS_DONE, keeper.RoundTrip("none"));
    ASSERT_EQ(1u, keeper.kept.size());
    EXPECT_EQ("last words", keeper.kept[0].Packet());
}

TEST_F(KeptEvent, IsDroppedByOtherThreadsWhileMoreCome) {
    Service service;
    Keeper keeper;
    std::mutex mutex;
    std::vector<Keeper::Kept> handed;
    std::atomic<bool> isDone{false};
    size_t nDropped = 0;
    std::thread dropper([&] {
        while (!isDone || nDropped < 500) {
            std::vector<Keeper::Kept> taken;
            {
                std::lock_guard<std::mutex> hold(mutex);
                taken.swap(handed);
            }
            for (const Keeper::Kept& each : taken) {
                EXPECT_EQ(std::to_string(nDropped++), each.Packet());
            }
        }
    });
    for (unsigned i = 0; i < 500; ++i) {
        const unsigned result = keeper.RoundTrip(std::to_string(i));
        EXPECT_EQ(VK_BUS_DONE, result);
        std::lock_guard<std::mutex> hold(mutex);
        for (Keeper::Kept& each : keeper.kept) {
            handed.push_back(std::move(each));
        }
        keeper.kept.clear();
    }
    isDone = true;
    dropper.join();
}

TEST_F(KeptEvent, OfNoEvent) {
    EXPECT_EQ(nullptr, VkMarshal_KeepSerialEvent(0, 0));
    EXPECT_EQ(nullptr, VkMarshal_KeepSerialEvent(VkAesResponse::idG, 1));
}

}  // namespace
