#include "client/BusTypeLibrary.h"

#include <algorithm>
#include <cstdlib>
#include <iterator>

using Type = VkBusTypeDescriptor;
using Direction = VkBusEventDirection;

namespace {

// Ids that types refer to.
enum : uint32_t {
    structMemberIdG = 0x10001,
    enumItemIdG = 0x10003,
    typeDescriptorIdG = 0x10005,
    eventDirectionIdG = 0x10006,
    stateTransitionIdG = 0x10007,
    protocolStateIdG = 0x10008,
    transitionBitsIdG = 0x1000A,
    pointIdG = 0x10103,
};

// A member's type, as its words.
template <uint32_t... words>
constexpr uint32_t wordsG[] = {words...};

template <uint32_t... words>
constexpr BusStructMemberDescriptor Member(const char* name) {
    return {name, sizeof...(words), wordsG<words...>};
}

constexpr BusStructMemberDescriptor structMemberMembersG[] = {
    Member<Type::STRING>("name"),
    Member<Type::SEQUENCE, Type::ENUM, typeDescriptorIdG>("vType"),
};
constexpr BusStructMemberDescriptor structMembersG[] = {
    Member<Type::UNSIGNED_LONG>("id"),
    Member<Type::STRING>("name"),
    Member<Type::UNSIGNED_LONG>("checksum"),
    Member<Type::SEQUENCE, Type::STRUCT, structMemberIdG>("vMember"),
};
constexpr BusStructMemberDescriptor enumItemMembersG[] = {
    Member<Type::STRING>("name"),
    Member<Type::LONG>("value"),
};
constexpr BusStructMemberDescriptor enumMembersG[] = {
    Member<Type::UNSIGNED_LONG>("id"),
    Member<Type::STRING>("name"),
    Member<Type::UNSIGNED_LONG>("checksum"),
    Member<Type::UNSIGNED_LONG>("flags"),
    Member<Type::SEQUENCE, Type::STRUCT, enumItemIdG>("vItem"),
};
constexpr BusStructMemberDescriptor stateTransitionMembersG[] = {
    Member<Type::ENUM, eventDirectionIdG>("direction"),
    Member<Type::UNSIGNED_LONG>("eventId"),
    Member<Type::UNSIGNED_LONG>("gotoState"),
    Member<Type::ENUM, transitionBitsIdG>("bits"),
};
constexpr BusStructMemberDescriptor protocolStateMembersG[] = {
    Member<Type::STRING>("name"),
    Member<Type::SEQUENCE, Type::STRUCT, stateTransitionIdG>("vTransition"),
};
constexpr BusStructMemberDescriptor protocolMembersG[] = {
    Member<Type::UNSIGNED_LONG>("id"),
    Member<Type::STRING>("name"),
    Member<Type::UNSIGNED_LONG>("checksum"),
    Member<Type::SEQUENCE, Type::STRUCT, protocolStateIdG>("vState"),
};
constexpr BusStructMemberDescriptor nanosecondsMembersG[] = {Member<Type::LONG_LONG>("nanoseconds")};
constexpr BusStructMemberDescriptor channelMembersG[] = {Member<Type::LONG>("xxx")};
constexpr BusStructMemberDescriptor channelNumberMembersG[] = {
    Member<Type::UNSIGNED_SHORT>("major"),
    Member<Type::UNSIGNED_SHORT>("minor"),
};
constexpr BusStructMemberDescriptor pointMembersG[] = {
    Member<Type::SHORT>("x"),
    Member<Type::SHORT>("y"),
};
constexpr BusStructMemberDescriptor rectMembersG[] = {
    Member<Type::STRUCT, pointIdG>("topLeft"),
    Member<Type::STRUCT, pointIdG>("bottomRight"),
};
constexpr BusStructMemberDescriptor marshalledMembersG[] = {Member<Type::SEQUENCE, Type::OCTET>("vByte")};
constexpr BusStructMemberDescriptor objectIdMembersG[] = {Member<Type::UNSIGNED_LONG_LONG>("id")};
constexpr BusStructMemberDescriptor channelNumberV2MembersG[] = {
    Member<Type::UNSIGNED_SHORT>("major"),
    Member<Type::OPTIONAL, Type::UNSIGNED_SHORT>("minor"),
};
constexpr BusStructMemberDescriptor stringMembersG[] = {Member<Type::STRING>("str")};
constexpr BusStructMemberDescriptor packetMembersG[] = {Member<Type::SEQUENCE, Type::OCTET>("orpcV2Packet")};
constexpr BusStructMemberDescriptor helloMembersG[] = {Member<Type::UNSIGNED_LONG>("partnerId")};
constexpr BusStructMemberDescriptor chunkMembersG[] = {
    Member<Type::UNSIGNED_LONG>("rpcId"),
    Member<Type::BOOLEAN>("lastChunk"),
    Member<Type::SEQUENCE, Type::OCTET>("orpcV2Chunk"),
};

template <size_t n>
constexpr BusStructDescriptor Struct(uint32_t id, const char* name, uint32_t checksum,
                                     const BusStructMemberDescriptor (&vMember)[n]) {
    return {id, name, checksum, n, vMember};
}
constexpr BusStructDescriptor EmptyStruct(uint32_t id, const char* name, uint32_t checksum) {
    return {id, name, checksum, 0, nullptr};
}

// In the order of their ids, for the search. Structures of the same shape have the same checksum.
constexpr BusStructDescriptor structsG[] = {
    Struct(structMemberIdG, "VkBusStructMember", 0xDAC71D, structMemberMembersG),
    Struct(BusKind::STRUCT, "VkBusStruct", 0x9D211A, structMembersG),
    Struct(enumItemIdG, "VkBusEnumItem", 0x146B50, enumItemMembersG),
    Struct(BusKind::ENUM, "VkBusEnum", 0xC423B0, enumMembersG),
    Struct(stateTransitionIdG, "VkBusProtocolStateTransition", 0xC47952, stateTransitionMembersG),
    Struct(protocolStateIdG, "VkBusProtocolState", 0x7D9A6, protocolStateMembersG),
    Struct(BusKind::PROTOCOL, "VkBusProtocol", 0xC9C55D, protocolMembersG),
    Struct(0x10100, "VkBusTime", 0x11DC481, nanosecondsMembersG),
    Struct(0x10101, "VkBusChannel", 0x85CB65, channelMembersG),
    Struct(0x10102, "VkBusChannelNumber", 0x195D1E4, channelNumberMembersG),
    Struct(pointIdG, "VkBusPoint", 0x1898439, pointMembersG),
    Struct(0x10104, "VkBusRect", 0xB873CF, rectMembersG),
    EmptyStruct(0x10105, "VkBusHello", 0x1000000),
    EmptyStruct(0x10107, "VkBusSucceeded", 0x1000000),
    EmptyStruct(0x10108, "VkBusFailed", 0x1000000),
    Struct(0x10109, "VkBusMarshalledStruct", 0x15C9DB1, marshalledMembersG),
    EmptyStruct(0x101A4, "VkBusGoodbye", 0),
    Struct(0x101A7, "VkBusObjectIdStruct", 0xD97D67, objectIdMembersG),
    Struct(0x29AA1, "VkBusDateTime", 0x11DC481, nanosecondsMembersG),
    Struct(0x29AA2, "VkBusDuration", 0x11DC481, nanosecondsMembersG),
    Struct(0x29AF1, "VkBusChannelNumberV2", 0x19E86F8, channelNumberV2MembersG),
    Struct(0x29C21, "VkBusString", 0x24D127, stringMembersG),
    EmptyStruct(0x29C8D, "VkBusReady", 0),
    Struct(0x29CFE, "VkBusMarshalledDict", 0x15C9DB1, marshalledMembersG),
    Struct(VkAesRequest::idG, "VkAesRequest", 0x6F671A, packetMembersG),
    Struct(VkAesResponse::idG, "VkAesResponse", 0x6F671A, packetMembersG),
    Struct(VkAesHello::idG, "VkAesHello", 0x229581, helloMembersG),
    Struct(VkAesResponseChunk::idG, "VkAesResponseChunk", 0x345E1F, chunkMembersG),
};
static_assert(std::is_sorted(std::begin(structsG), std::end(structsG),
                             [](const auto& a, const auto& b) { return a.id < b.id; }));

constexpr BusEnumItemDescriptor typeDescriptorItemsG[] = {
    {"ANYSTRUCT", Type::ANYSTRUCT},
    {"BOOLEAN", Type::BOOLEAN},
    {"ENUM", Type::ENUM},
    {"LONG", Type::LONG},
    {"LONG_LONG", Type::LONG_LONG},
    {"OCTET", Type::OCTET},
    {"OPTIONAL", Type::OPTIONAL},
    {"SEQUENCE", Type::SEQUENCE},
    {"SHORT", Type::SHORT},
    {"STRING", Type::STRING},
    {"STRUCT", Type::STRUCT},
    {"U32_MAX", Type::U32_MAX},
    {"UNSIGNED_LONG", Type::UNSIGNED_LONG},
    {"UNSIGNED_LONG_LONG", Type::UNSIGNED_LONG_LONG},
    {"UNSIGNED_SHORT", Type::UNSIGNED_SHORT},
};
constexpr BusEnumItemDescriptor eventDirectionItemsG[] = {
    {"RECEIVE", Direction::RECEIVE},
    {"SEND", Direction::SEND},
};
constexpr BusEnumItemDescriptor transitionBitsItemsG[] = {
    {"DROPPABLE", 2},
    {"IGNORE", 1},
};
constexpr BusEnumItemDescriptor screenResolutionItemsG[] = {
    {"NTSC_640X480", 1},
    {"NTSC_704X480", 2},
};

template <size_t n>
constexpr BusEnumDescriptor Enum(uint32_t id, const char* name, uint32_t checksum, uint32_t flags,
                                 const BusEnumItemDescriptor (&vItem)[n]) {
    return {id, name, checksum, flags, n, vItem};
}

constexpr BusEnumDescriptor enumsG[] = {
    Enum(typeDescriptorIdG, "VkBusTypeDescriptor", 0xEB3763, 0, typeDescriptorItemsG),
    Enum(eventDirectionIdG, "VkBusEventDirection", 0xEDD297, 0, eventDirectionItemsG),
    Enum(transitionBitsIdG, "VkBusTransitionBits", 0xA980A2, 0, transitionBitsItemsG),
    Enum(0x10106, "VkBusScreenResolution", 0x466A5D, 1, screenResolutionItemsG),
};

// One hello, then requests and responses in any order.
constexpr BusTransitionDescriptor startTransitionsG[] = {
    {Direction::RECEIVE, VkAesHello::idG, 1, 0},
};
constexpr BusTransitionDescriptor activeTransitionsG[] = {
    {Direction::RECEIVE, VkAesRequest::idG, 1, 0},
    {Direction::SEND, VkAesResponse::idG, 1, 0},
    {Direction::SEND, VkAesResponseChunk::idG, 1, 0},
};
constexpr BusProtocolStateDescriptor queryStatesG[] = {
    {"Start", std::size(startTransitionsG), startTransitionsG},
    {"Active", std::size(activeTransitionsG), activeTransitionsG},
};
constexpr BusProtocolDescriptor protocolsG[] = {
    {VkAesQueryProtocol::idG, "VkAesQueryProtocol", VkAesQueryProtocol::checksumG, std::size(queryStatesG),
     queryStatesG},
};

template <class T, size_t n>
const void* FindIn(const T (&vDescriptor)[n], uint32_t id) {
    const T* found = std::lower_bound(std::begin(vDescriptor), std::end(vDescriptor), id,
                                      [](const T& each, uint32_t wanted) { return each.id < wanted; });
    return found != std::end(vDescriptor) && found->id == id ? found : nullptr;
}

}  // namespace

const VkBusTypeLibrary busTypeLibrary = {
    VkBusTypeLibrary::formatG, 0, &malloc, &free, {0, 0, 0, 0, 0}, &LookupBusType,
};

BusTypeLookup LookupBusType(const void*, unsigned id, unsigned* kind) {
    BusTypeLookup found = {FindIn(structsG, id), BusKind::STRUCT};
    if (found.descriptor == nullptr) {
        found = {FindIn(enumsG, id), BusKind::ENUM};
    }
    if (found.descriptor == nullptr) {
        found = {FindIn(protocolsG, id), BusKind::PROTOCOL};
    }
    if (found.descriptor == nullptr) {
        return {nullptr, 0};
    }
    if (kind != nullptr) {
        *kind = found.kind;
    }
    return found;
}
