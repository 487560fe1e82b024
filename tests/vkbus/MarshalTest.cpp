#include <gtest/gtest.h>

#include <cstring>
#include <memory>

#include "BusFixture.h"
#include "TestTypes.h"
#include "support/SmallStack.h"

namespace {

constexpr Terms testTermsG = {&testLibraryG, TestIds::protocol, testChecksumG};

// A service that sends each event back as it has decoded it.
class Marshal : public BusTest {
 protected:
    Marshal()
        : serviceM(
              [](const SeenEvent& event) {
                  EXPECT_EQ(VK_BUS_DONE, VkBusMarshalAndSend(event.session, event.id, event.record));
                  return 0u;
              },
              testTermsG),
          client(testTermsG, false) {
        EXPECT_EQ(VK_BUS_DONE, client.openResult);
    }

    unsigned Send(uint32_t id, const void* record) { return VkBusMarshalAndSend(client.session, id, record); }

    // Sends a record there and back, and looks at what comes.
    template <class T>
    void Echo(uint32_t id, const T& record, const std::function<void(const T&)>& look) {
        client.onEvent = [&](const SeenEvent& event) {
            EXPECT_EQ(id, event.id);
            look(event.As<T>());
            return 0u;
        };
        ASSERT_EQ(VK_BUS_DONE, Send(id, &record));
        ASSERT_EQ(VK_BUS_DONE, client.Process());
        client.onEvent = nullptr;
    }

 private:
    Service serviceM;

 protected:
    Client client;
};

template <class T>
std::vector<T> Listed(const BusSequence<T>& sequence) {
    return std::vector<T>(sequence.vElement, sequence.vElement + sequence.count);
}

std::vector<std::string> Texts(const BusSequence<const char*>& sequence) {
    return std::vector<std::string>(sequence.vElement, sequence.vElement + sequence.count);
}

template <class T, size_t n>
BusSequence<T> Of(const T (&vElement)[n]) {
    return {n, vElement};
}

TEST_F(Marshal, EverythingFilled) {
    const int16_t shorts[] = {-32768, 0, 32767};
    const uint16_t unsignedShorts[] = {65535};
    const int32_t longs[] = {INT32_MIN, INT32_MAX};
    const uint32_t unsignedLongs[] = {UINT32_MAX, 1};
    const int64_t longLongs[] = {INT64_MIN, 5, INT64_MAX};
    const uint64_t unsignedLongLongs[] = {UINT64_MAX};
    const char* const texts[] = {"", "one", "zw\xC3\xB6lf"};
    const int32_t enums[] = {-1, 2};
    const uint8_t octets[] = {0, 255, 10};
    const bool booleans[] = {true, false, true};
    const TestPoint points[] = {{1, 2}, {-3, INT64_MIN}};
    const uint8_t empties[] = {0, 0, 0, 0, 0};
    const TestPoint inAny = {7, -8};
    const TestEverything* const noStructG = nullptr;
    const uint8_t emptyInAny = 0;
    const BusAnyStruct anys[] = {{TestIds::point, &inAny}, {TestIds::empty, &emptyInAny}, {0, noStructG}};
    const uint16_t row0[] = {1, 2, 3};
    const BusSequence<uint16_t> rows[] = {Of(row0), {0, nullptr}, {2, row0}};
    const int32_t pointedLong = -9;
    const int32_t* const optionals[] = {nullptr, &pointedLong, nullptr};
    const uint8_t octet = 200;
    const int64_t longLong = -1;
    const char* const text = "optional";
    const BusSequence<const char*> innerTexts = Of(texts);
    const bool boolean = true;
    const int16_t aShort = -5;
    const int16_t* const inner = &aShort;

    TestEverything record = {};
    record.aShort = -2;
    record.anUnsignedShort = 40000;
    record.aLong = -70000;
    record.anUnsignedLong = 4000000000;
    record.aLongLong = -5000000000;
    record.anUnsignedLongLong = 0xFEDCBA9876543210;
    record.text = "text";
    record.anEnum = -77;
    record.anOctet = 129;
    record.aBoolean = true;
    record.point = {11, -12};
    record.any = {TestIds::point, &inAny};
    record.shorts = Of(shorts);
    record.unsignedShorts = Of(unsignedShorts);
    record.longs = Of(longs);
    record.unsignedLongs = Of(unsignedLongs);
    record.longLongs = Of(longLongs);
    record.unsignedLongLongs = Of(unsignedLongLongs);
    record.texts = Of(texts);
    record.enums = Of(enums);
    record.octets = Of(octets);
    record.booleans = Of(booleans);
    record.points = Of(points);
    record.empties = Of(empties);
    record.anys = Of(anys);
    record.rows = Of(rows);
    record.optionals = Of(optionals);
    record.optionalOctet = &octet;
    record.optionalLongLong = &longLong;
    record.optionalText = &text;
    record.optionalPoint = &points[1];
    record.optionalTexts = &innerTexts;
    record.optionalBoolean = &boolean;
    record.optionalOptional = &inner;

    bool looked = false;
    Echo<TestEverything>(TestIds::everything, record, [&](const TestEverything& got) {
        looked = true;
        EXPECT_EQ(-2, got.aShort);
        EXPECT_EQ(40000, got.anUnsignedShort);
        EXPECT_EQ(-70000, got.aLong);
        EXPECT_EQ(4000000000u, got.anUnsignedLong);
        EXPECT_EQ(-5000000000, got.aLongLong);
        EXPECT_EQ(0xFEDCBA9876543210, got.anUnsignedLongLong);
        EXPECT_STREQ("text", got.text);
        EXPECT_EQ(-77, got.anEnum);
        EXPECT_EQ(129, got.anOctet);
        EXPECT_TRUE(got.aBoolean);
        EXPECT_EQ(11, got.point.x);
        EXPECT_EQ(-12, got.point.y);
        ASSERT_EQ(uint32_t{TestIds::point}, got.any.id);
        EXPECT_EQ(7, static_cast<const TestPoint*>(got.any.pStruct)->x);
        EXPECT_EQ(-8, static_cast<const TestPoint*>(got.any.pStruct)->y);
        EXPECT_EQ(std::vector<int16_t>({-32768, 0, 32767}), Listed(got.shorts));
        EXPECT_EQ(std::vector<uint16_t>({65535}), Listed(got.unsignedShorts));
        EXPECT_EQ(std::vector<int32_t>({INT32_MIN, INT32_MAX}), Listed(got.longs));
        EXPECT_EQ(std::vector<uint32_t>({UINT32_MAX, 1}), Listed(got.unsignedLongs));
        EXPECT_EQ(std::vector<int64_t>({INT64_MIN, 5, INT64_MAX}), Listed(got.longLongs));
        EXPECT_EQ(std::vector<uint64_t>({UINT64_MAX}), Listed(got.unsignedLongLongs));
        EXPECT_EQ(std::vector<std::string>({"", "one", "zw\xC3\xB6lf"}), Texts(got.texts));
        EXPECT_EQ(std::vector<int32_t>({-1, 2}), Listed(got.enums));
        EXPECT_EQ(std::vector<uint8_t>({0, 255, 10}), Listed(got.octets));
        EXPECT_EQ(std::vector<bool>({true, false, true}), Listed(got.booleans));
        ASSERT_EQ(2u, got.points.count);
        EXPECT_EQ(1, got.points.vElement[0].x);
        EXPECT_EQ(2, got.points.vElement[0].y);
        EXPECT_EQ(-3, got.points.vElement[1].x);
        EXPECT_EQ(INT64_MIN, got.points.vElement[1].y);
        EXPECT_EQ(5u, got.empties.count);
        ASSERT_EQ(3u, got.anys.count);
        EXPECT_EQ(-8, static_cast<const TestPoint*>(got.anys.vElement[0].pStruct)->y);
        EXPECT_EQ(uint32_t{TestIds::empty}, got.anys.vElement[1].id);
        EXPECT_NE(nullptr, got.anys.vElement[1].pStruct);
        EXPECT_EQ(0u, got.anys.vElement[2].id);
        EXPECT_EQ(nullptr, got.anys.vElement[2].pStruct);
        ASSERT_EQ(3u, got.rows.count);
        EXPECT_EQ(std::vector<uint16_t>({1, 2, 3}), Listed(got.rows.vElement[0]));
        EXPECT_EQ(0u, got.rows.vElement[1].count);
        EXPECT_EQ(std::vector<uint16_t>({1, 2}), Listed(got.rows.vElement[2]));
        ASSERT_EQ(3u, got.optionals.count);
        EXPECT_EQ(nullptr, got.optionals.vElement[0]);
        EXPECT_EQ(-9, *got.optionals.vElement[1]);
        EXPECT_EQ(nullptr, got.optionals.vElement[2]);
        EXPECT_EQ(200, *got.optionalOctet);
        EXPECT_EQ(-1, *got.optionalLongLong);
        EXPECT_STREQ("optional", *got.optionalText);
        EXPECT_EQ(INT64_MIN, got.optionalPoint->y);
        EXPECT_EQ(std::vector<std::string>({"", "one", "zw\xC3\xB6lf"}), Texts(*got.optionalTexts));
        EXPECT_TRUE(*got.optionalBoolean);
        EXPECT_EQ(-5, **got.optionalOptional);
    });
    EXPECT_TRUE(looked);
}

TEST_F(Marshal, EverythingEmpty) {
    bool looked = false;
    Echo<TestEverything>(TestIds::everything, {}, [&](const TestEverything& got) {
        looked = true;
        EXPECT_STREQ("", got.text) << "no text is the empty one";
        EXPECT_EQ(0u, got.any.id);
        EXPECT_EQ(nullptr, got.any.pStruct);
        EXPECT_FALSE(got.aBoolean);
        EXPECT_EQ(0, got.point.y);
        EXPECT_EQ(
            0u, got.shorts.count + got.texts.count + got.booleans.count + got.points.count + got.rows.count);
        EXPECT_EQ(nullptr, got.shorts.vElement);
        EXPECT_EQ(nullptr, got.points.vElement);
        EXPECT_EQ(nullptr, got.optionalOctet);
        EXPECT_EQ(nullptr, got.optionalTexts);
        EXPECT_EQ(nullptr, got.optionalOptional);
    });
    EXPECT_TRUE(looked);
}

TEST_F(Marshal, EventWithoutMembers) {
    client.onEvent = [](const SeenEvent& event) {
        EXPECT_EQ(uint32_t{TestIds::empty}, event.id);
        EXPECT_NE(nullptr, event.record);
        return 0u;
    };
    ASSERT_EQ(VK_BUS_DONE, Send(TestIds::empty, nullptr));
    EXPECT_EQ(VK_BUS_DONE, client.Process());
    EXPECT_EQ(1u, client.nEvents);
}

TEST_F(Marshal, NestingIsBounded) {
    RunOnSmallStack([this] {
        TestLink links[40] = {};
        for (uint32_t i = 0; i < 40; ++i) {
            links[i].level = i;
            links[i].next = {TestIds::aLink, i + 1 < 40 ? &links[i + 1] : nullptr};
        }
        unsigned nFit = 0;
        for (unsigned n = 1; n <= 40; ++n) {
            const BusAnyStruct cut = std::exchange(links[n - 1].next, BusAnyStruct{0, nullptr});
            unsigned nGot = 0;
            client.onEvent = [&](const SeenEvent& event) {
                const TestLink* link = &event.As<TestLink>();
                while (link != nullptr && link->level == nGot) {
                    ++nGot;
                    link = static_cast<const TestLink*>(link->next.pStruct);
                }
                return 0u;
            };
            const unsigned result = Send(TestIds::aLink, &links[0]);
            if (result == VK_BUS_DONE) {
                ASSERT_EQ(VK_BUS_DONE, client.Process());
                ASSERT_EQ(n, nGot);
                nFit = n;
            } else {
                ASSERT_EQ(VK_BUS_BAD_EVENT, result) << n;
            }
            links[n - 1].next = cut;
        }
        EXPECT_GE(nFit, 16u);
        EXPECT_LT(nFit, 40u);
        client.onEvent = nullptr;
        // A refused one leaves the session as it was.
        ASSERT_EQ(VK_BUS_DONE, Send(TestIds::empty, nullptr));
        EXPECT_EQ(VK_BUS_DONE, client.Process());
    });
}

TEST_F(Marshal, RingOfStructures) {
    TestLink ring = {1, {TestIds::aLink, nullptr}};
    ring.next.pStruct = &ring;
    EXPECT_EQ(VK_BUS_BAD_EVENT, Send(TestIds::aLink, &ring));
}

TEST_F(Marshal, BadTypesAndRecords) {
    const uint64_t record[8] = {};
    EXPECT_EQ(VK_BUS_BAD_TYPE, Send(TestIds::selfHolding, record));
    EXPECT_EQ(VK_BUS_BAD_TYPE, Send(TestIds::malformed, record));
    EXPECT_EQ(VK_BUS_BAD_TYPE, Send(TestIds::unknownInside, record));
    EXPECT_EQ(VK_BUS_BAD_TYPE, Send(TestIds::unknownWord, record));
    EXPECT_EQ(VK_BUS_BAD_TYPE, Send(998, record)) << "in the protocol, not in the library";
    EXPECT_EQ(VK_BUS_NOT_ALLOWED, Send(999, record));
    const TestOctets missing = {{3, nullptr}};
    EXPECT_EQ(VK_BUS_BAD_EVENT, Send(TestIds::octets, &missing));
    const char* const texts[] = {"\xFF no UTF-8"};
    const TestTexts bad = {Of(texts)};
    EXPECT_EQ(VK_BUS_BAD_EVENT, Send(TestIds::texts, &bad));
    const TestLink unknown = {1, {999, record}};
    EXPECT_EQ(VK_BUS_BAD_EVENT, Send(TestIds::aLink, &unknown));
    const TestLink noStruct = {1, {TestIds::anEnum, record}};
    EXPECT_EQ(VK_BUS_BAD_EVENT, Send(TestIds::aLink, &noStruct));
    ASSERT_EQ(VK_BUS_DONE, Send(TestIds::empty, nullptr)) << "the session goes on";
    EXPECT_EQ(VK_BUS_DONE, client.Process());
}

TEST_F(Marshal, LargestEvent) {
    // Id, checksum and the count of the octets take four bytes each.
    const size_t most = maxVkBusEventBytesG - 12;
    const auto bytes = std::make_unique<uint8_t[]>(most + 1);
    for (size_t i = 0; i <= most; ++i) {
        bytes[i] = static_cast<uint8_t>(i * 7 + i / 4096);
    }
    TestOctets record = {{static_cast<uint32_t>(most), bytes.get()}};
    bool looked = false;
    Echo<TestOctets>(TestIds::octets, record, [&](const TestOctets& got) {
        ASSERT_EQ(most, got.bytes.count);
        EXPECT_EQ(0, memcmp(bytes.get(), got.bytes.vElement, most));
        looked = true;
    });
    EXPECT_TRUE(looked);
    record.bytes.count += 1;
    EXPECT_EQ(VK_BUS_TOO_LARGE, Send(TestIds::octets, &record));
    record.bytes.count = UINT32_MAX;
    EXPECT_EQ(VK_BUS_TOO_LARGE, Send(TestIds::octets, &record));
    ASSERT_EQ(VK_BUS_DONE, Send(TestIds::empty, nullptr)) << "the session goes on";
    EXPECT_EQ(VK_BUS_DONE, client.Process());
}

TEST_F(Marshal, LimitHoldsForManySmallElements) {
    // Each takes four bytes of length and a zero, and three to the next one but for the last.
    const uint32_t most = (maxVkBusEventBytesG - 12 + 3) / 8;
    const std::vector<const char*> texts(most + 1, "");
    TestTexts record = {{most + 1, texts.data()}};
    EXPECT_EQ(VK_BUS_TOO_LARGE, Send(TestIds::texts, &record));
    record.texts.count = most;
    bool looked = false;
    Echo<TestTexts>(TestIds::texts, record, [&](const TestTexts& got) {
        looked = true;
        ASSERT_EQ(most, got.texts.count);
        EXPECT_STREQ("", got.texts.vElement[most - 1]);
    });
    EXPECT_TRUE(looked);
}

}  // namespace
