#include <gtest/gtest.h>

#include <cstddef>
#include <cstring>
#include <set>
#include <string>
#include <vector>

#include "client/BusTypeLibrary.h"

// The tables are data that both ends of the bus hold, so they are written out here once more.
namespace {

using Words = std::vector<uint32_t>;

struct MemberRow {
    std::string name;
    Words words;
};

struct StructRow {
    uint32_t id;
    const char* name;
    uint32_t checksum;
    std::vector<MemberRow> members;
};

// 1 short, 2 unsigned short, 3 long, 4 unsigned long, 5 long long, 6 unsigned long long, 7 string, 8
// sequence, 9 optional, 10 struct, 11 enum, 12 octet, 13 boolean.
const std::vector<StructRow> structRowsG = {
    {0x10001, "VkBusStructMember", 0xDAC71D, {{"name", {7}}, {"vType", {8, 11, 0x10005}}}},
    {0x10002,
     "VkBusStruct",
     0x9D211A,
     {{"id", {4}}, {"name", {7}}, {"checksum", {4}}, {"vMember", {8, 10, 0x10001}}}},
    {0x10003, "VkBusEnumItem", 0x146B50, {{"name", {7}}, {"value", {3}}}},
    {0x10004,
     "VkBusEnum",
     0xC423B0,
     {{"id", {4}}, {"name", {7}}, {"checksum", {4}}, {"flags", {4}}, {"vItem", {8, 10, 0x10003}}}},
    {0x10007,
     "VkBusProtocolStateTransition",
     0xC47952,
     {{"direction", {11, 0x10006}}, {"eventId", {4}}, {"gotoState", {4}}, {"bits", {11, 0x1000A}}}},
    {0x10008, "VkBusProtocolState", 0x7D9A6, {{"name", {7}}, {"vTransition", {8, 10, 0x10007}}}},
    {0x10009,
     "VkBusProtocol",
     0xC9C55D,
     {{"id", {4}}, {"name", {7}}, {"checksum", {4}}, {"vState", {8, 10, 0x10008}}}},
    {0x10100, "VkBusTime", 0x11DC481, {{"nanoseconds", {5}}}},
    {0x10101, "VkBusChannel", 0x85CB65, {{"xxx", {3}}}},
    {0x10102, "VkBusChannelNumber", 0x195D1E4, {{"major", {2}}, {"minor", {2}}}},
    {0x10103, "VkBusPoint", 0x1898439, {{"x", {1}}, {"y", {1}}}},
    {0x10104, "VkBusRect", 0xB873CF, {{"topLeft", {10, 0x10103}}, {"bottomRight", {10, 0x10103}}}},
    {0x10105, "VkBusHello", 0x1000000, {}},
    {0x10107, "VkBusSucceeded", 0x1000000, {}},
    {0x10108, "VkBusFailed", 0x1000000, {}},
    {0x10109, "VkBusMarshalledStruct", 0x15C9DB1, {{"vByte", {8, 12}}}},
    {0x101A4, "VkBusGoodbye", 0, {}},
    {0x101A7, "VkBusObjectIdStruct", 0xD97D67, {{"id", {6}}}},
    {0x29AA1, "VkBusDateTime", 0x11DC481, {{"nanoseconds", {5}}}},
    {0x29AA2, "VkBusDuration", 0x11DC481, {{"nanoseconds", {5}}}},
    {0x29AF1, "VkBusChannelNumberV2", 0x19E86F8, {{"major", {2}}, {"minor", {9, 2}}}},
    {0x29C21, "VkBusString", 0x24D127, {{"str", {7}}}},
    {0x29C8D, "VkBusReady", 0, {}},
    {0x29CFE, "VkBusMarshalledDict", 0x15C9DB1, {{"vByte", {8, 12}}}},
    {0x29EE6, "VkAesRequest", 0x6F671A, {{"orpcV2Packet", {8, 12}}}},
    {0x29EE8, "VkAesResponse", 0x6F671A, {{"orpcV2Packet", {8, 12}}}},
    {0x2A3A7, "VkAesHello", 0x229581, {{"partnerId", {4}}}},
    {0x2A41A,
     "VkAesResponseChunk",
     0x345E1F,
     {{"rpcId", {4}}, {"lastChunk", {13}}, {"orpcV2Chunk", {8, 12}}}},
};

struct EnumRow {
    uint32_t id;
    const char* name;
    uint32_t checksum;
    uint32_t flags;
    std::vector<std::pair<std::string, int32_t>> items;
};

const std::vector<EnumRow> enumRowsG = {
    {0x10005,
     "VkBusTypeDescriptor",
     0xEB3763,
     0,
     {{"ANYSTRUCT", 14},
      {"BOOLEAN", 13},
      {"ENUM", 11},
      {"LONG", 3},
      {"LONG_LONG", 5},
      {"OCTET", 12},
      {"OPTIONAL", 9},
      {"SEQUENCE", 8},
      {"SHORT", 1},
      {"STRING", 7},
      {"STRUCT", 10},
      {"U32_MAX", 0x7FFFFFFF},
      {"UNSIGNED_LONG", 4},
      {"UNSIGNED_LONG_LONG", 6},
      {"UNSIGNED_SHORT", 2}}},
    {0x10006, "VkBusEventDirection", 0xEDD297, 0, {{"RECEIVE", 2}, {"SEND", 1}}},
    {0x1000A, "VkBusTransitionBits", 0xA980A2, 0, {{"DROPPABLE", 2}, {"IGNORE", 1}}},
    {0x10106, "VkBusScreenResolution", 0x466A5D, 1, {{"NTSC_640X480", 1}, {"NTSC_704X480", 2}}},
};

// The descriptor of an id whose kind must be the given one; null after a failure.
template <class Descriptor>
const Descriptor* Find(uint32_t id, uint32_t kind) {
    unsigned stored = 0;
    const BusTypeLookup found = LookupBusType(nullptr, id, &stored);
    EXPECT_EQ(kind, stored) << std::hex << id;
    EXPECT_EQ(kind, found.kind) << std::hex << id;
    EXPECT_EQ(found.descriptor, LookupBusType(&stored, id, nullptr).descriptor)
        << "without a place for the kind";
    EXPECT_NE(nullptr, found.descriptor) << std::hex << id;
    return static_cast<const Descriptor*>(found.descriptor);
}

TEST(TypeLibrary, Record) {
    EXPECT_EQ(0x0F010001u, busTypeLibrary.format);
    EXPECT_EQ(0u, busTypeLibrary.reserved);
    for (const uint32_t word : busTypeLibrary.vReserved) {
        EXPECT_EQ(0u, word);
    }
    EXPECT_EQ(&LookupBusType, busTypeLibrary.lookup);
    void* block = busTypeLibrary.allocate(100);
    ASSERT_NE(nullptr, block);
    memset(block, 1, 100);
    busTypeLibrary.release(block);
}

TEST(TypeLibrary, Structs) {
    EXPECT_EQ(28u, structRowsG.size());
    for (const StructRow& row : structRowsG) {
        const auto* found = Find<BusStructDescriptor>(row.id, 0x10002);
        ASSERT_NE(nullptr, found);
        EXPECT_EQ(row.id, found->id);
        EXPECT_STREQ(row.name, found->name);
        EXPECT_EQ(row.checksum, found->checksum) << row.name;
        ASSERT_EQ(row.members.size(), found->nMembers) << row.name;
        for (uint32_t i = 0; i < found->nMembers; ++i) {
            const BusStructMemberDescriptor& member = found->vMember[i];
            EXPECT_EQ(row.members[i].name, member.name) << row.name;
            EXPECT_EQ(row.members[i].words, Words(member.vTypeWord, member.vTypeWord + member.nTypeWords))
                << row.name << " " << member.name;
        }
    }
}

TEST(TypeLibrary, Enums) {
    for (const EnumRow& row : enumRowsG) {
        const auto* found = Find<BusEnumDescriptor>(row.id, 0x10004);
        ASSERT_NE(nullptr, found);
        EXPECT_EQ(row.id, found->id);
        EXPECT_STREQ(row.name, found->name);
        EXPECT_EQ(row.checksum, found->checksum) << row.name;
        EXPECT_EQ(row.flags, found->flags) << row.name;
        ASSERT_EQ(row.items.size(), found->nItems) << row.name;
        for (uint32_t i = 0; i < found->nItems; ++i) {
            EXPECT_EQ(row.items[i].first, found->vItem[i].name) << row.name;
            EXPECT_EQ(row.items[i].second, found->vItem[i].value) << row.name << " " << row.items[i].first;
        }
    }
}

TEST(TypeLibrary, Protocol) {
    const auto* found = Find<BusProtocolDescriptor>(0x29EEA, 0x10009);
    ASSERT_NE(nullptr, found);
    EXPECT_EQ(171754u, found->id);
    EXPECT_STREQ("VkAesQueryProtocol", found->name);
    EXPECT_EQ(0x846CDFu, found->checksum);
    EXPECT_EQ(8678623u, found->checksum);
    ASSERT_EQ(2u, found->nStates);
    // State, direction (1 for what the service sends, 2 for what it receives), event, next state, bits.
    const std::vector<std::vector<uint32_t>> rows = {
        {0, 2, 172967, 1, 0}, {1, 2, 171750, 1, 0}, {1, 1, 171752, 1, 0}, {1, 1, 173082, 1, 0}};
    std::vector<std::vector<uint32_t>> all;
    for (uint32_t state = 0; state < found->nStates; ++state) {
        for (uint32_t i = 0; i < found->vState[state].nTransitions; ++i) {
            const BusTransitionDescriptor& each = found->vState[state].vTransition[i];
            all.push_back({state, each.direction, each.eventId, each.nextState, each.bits});
        }
    }
    EXPECT_EQ(rows, all);
    EXPECT_STREQ("Start", found->vState[0].name);
    EXPECT_STREQ("Active", found->vState[1].name);
}

TEST(TypeLibrary, KnowsNothingElse) {
    std::set<uint32_t> known = {0x29EEA};
    for (const StructRow& row : structRowsG) known.insert(row.id);
    for (const EnumRow& row : enumRowsG) known.insert(row.id);
    EXPECT_EQ(33u, known.size());
    for (uint32_t id = 0; id < 0x30000; ++id) {
        unsigned kind = 77;
        const BusTypeLookup found = LookupBusType(nullptr, id, &kind);
        ASSERT_EQ(known.count(id) == 1, found.descriptor != nullptr) << std::hex << id;
        ASSERT_EQ(found.descriptor == nullptr, kind == 77) << std::hex << id;
    }
    unsigned kind = 77;
    EXPECT_EQ(nullptr, LookupBusType(nullptr, 0x29EE7, &kind).descriptor);
    EXPECT_EQ(nullptr, LookupBusType(nullptr, 0xFFFFFFFF, nullptr).descriptor);
    EXPECT_EQ(77u, kind);
}

TEST(TypeLibrary, RecordsOfTheClient) {
    const size_t word = sizeof(void*);
    EXPECT_EQ(4u, sizeof(VkAesHello));
    EXPECT_EQ(2 * word, sizeof(VkAesRequest));
    EXPECT_EQ(2 * word, sizeof(VkAesResponse));
    EXPECT_EQ(word, offsetof(VkAesRequest, orpcV2Packet.vElement));
    EXPECT_EQ(4u, offsetof(VkAesResponseChunk, lastChunk));
    EXPECT_EQ(8u, offsetof(VkAesResponseChunk, orpcV2Chunk));
    EXPECT_EQ(8 + 2 * word, sizeof(VkAesResponseChunk));
}

}  // namespace
