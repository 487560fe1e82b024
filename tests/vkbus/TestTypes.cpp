#include "TestTypes.h"

#include <cstdlib>
#include <iterator>

namespace {

using Type = VkBusTypeDescriptor;

template <uint32_t... words>
constexpr uint32_t wordsG[] = {words...};

template <uint32_t... words>
constexpr BusStructMemberDescriptor Member(const char* name) {
    return {name, sizeof...(words), wordsG<words...>};
}

constexpr BusStructMemberDescriptor everythingG[] = {
    Member<Type::SHORT>("aShort"),
    Member<Type::UNSIGNED_SHORT>("anUnsignedShort"),
    Member<Type::LONG>("aLong"),
    Member<Type::UNSIGNED_LONG>("anUnsignedLong"),
    Member<Type::LONG_LONG>("aLongLong"),
    Member<Type::UNSIGNED_LONG_LONG>("anUnsignedLongLong"),
    Member<Type::STRING>("text"),
    Member<Type::ENUM, TestIds::anEnum>("anEnum"),
    Member<Type::OCTET>("anOctet"),
    Member<Type::BOOLEAN>("aBoolean"),
    Member<Type::STRUCT, TestIds::point>("point"),
    Member<Type::STRUCT, TestIds::empty>("empty"),
    Member<Type::ANYSTRUCT>("any"),
    Member<Type::SEQUENCE, Type::SHORT>("shorts"),
    Member<Type::SEQUENCE, Type::UNSIGNED_SHORT>("unsignedShorts"),
    Member<Type::SEQUENCE, Type::LONG>("longs"),
    Member<Type::SEQUENCE, Type::UNSIGNED_LONG>("unsignedLongs"),
    Member<Type::SEQUENCE, Type::LONG_LONG>("longLongs"),
    Member<Type::SEQUENCE, Type::UNSIGNED_LONG_LONG>("unsignedLongLongs"),
    Member<Type::SEQUENCE, Type::STRING>("texts"),
    Member<Type::SEQUENCE, Type::ENUM, TestIds::anEnum>("enums"),
    Member<Type::SEQUENCE, Type::OCTET>("octets"),
    Member<Type::SEQUENCE, Type::BOOLEAN>("booleans"),
    Member<Type::SEQUENCE, Type::STRUCT, TestIds::point>("points"),
    Member<Type::SEQUENCE, Type::STRUCT, TestIds::empty>("empties"),
    Member<Type::SEQUENCE, Type::ANYSTRUCT>("anys"),
    Member<Type::SEQUENCE, Type::SEQUENCE, Type::UNSIGNED_SHORT>("rows"),
    Member<Type::SEQUENCE, Type::OPTIONAL, Type::LONG>("optionals"),
    Member<Type::OPTIONAL, Type::OCTET>("optionalOctet"),
    Member<Type::OPTIONAL, Type::LONG_LONG>("optionalLongLong"),
    Member<Type::OPTIONAL, Type::STRING>("optionalText"),
    Member<Type::OPTIONAL, Type::STRUCT, TestIds::point>("optionalPoint"),
    Member<Type::OPTIONAL, Type::SEQUENCE, Type::STRING>("optionalTexts"),
    Member<Type::OPTIONAL, Type::BOOLEAN>("optionalBoolean"),
    Member<Type::OPTIONAL, Type::OPTIONAL, Type::SHORT>("optionalOptional"),
};
constexpr BusStructMemberDescriptor pointG[] = {Member<Type::SHORT>("x"), Member<Type::LONG_LONG>("y")};
constexpr BusStructMemberDescriptor linkG[] = {Member<Type::UNSIGNED_LONG>("level"),
                                               Member<Type::ANYSTRUCT>("next")};
constexpr BusStructMemberDescriptor octetsG[] = {Member<Type::SEQUENCE, Type::OCTET>("bytes")};
constexpr BusStructMemberDescriptor textsG[] = {Member<Type::SEQUENCE, Type::STRING>("texts")};
constexpr BusStructMemberDescriptor selfHoldingG[] = {
    Member<Type::OPTIONAL, Type::STRUCT, TestIds::selfHolding>("one"),
    Member<Type::OPTIONAL, Type::STRUCT, TestIds::selfHolding>("other"),
};
constexpr BusStructMemberDescriptor malformedG[] = {Member<Type::SEQUENCE>("nothing")};
constexpr BusStructMemberDescriptor unknownInsideG[] = {Member<Type::STRUCT, 999>("unknown")};
constexpr BusStructMemberDescriptor unknownWordG[] = {Member<15>("unknown")};

constexpr BusStructDescriptor structsG[] = {
    {TestIds::everything, "Everything", 1, std::size(everythingG), everythingG},
    {TestIds::point, "Point", 2, std::size(pointG), pointG},
    {TestIds::empty, "Empty", 3, 0, nullptr},
    {TestIds::aLink, "Link", 4, std::size(linkG), linkG},
    {TestIds::octets, "Octets", 5, std::size(octetsG), octetsG},
    {TestIds::texts, "Texts", 6, std::size(textsG), textsG},
    {TestIds::selfHolding, "SelfHolding", 7, std::size(selfHoldingG), selfHoldingG},
    {TestIds::malformed, "Malformed", 8, std::size(malformedG), malformedG},
    {TestIds::unknownInside, "UnknownInside", 9, std::size(unknownInsideG), unknownInsideG},
    {TestIds::unknownWord, "UnknownWord", 10, std::size(unknownWordG), unknownWordG},
};

constexpr BusEnumDescriptor enumG = {TestIds::anEnum, "AnEnum", 11, 0, 0, nullptr};

constexpr BusTransitionDescriptor Both(bool send, uint32_t id) {
    return {send ? VkBusEventDirection::SEND : VkBusEventDirection::RECEIVE, id, 0, 0};
}
constexpr BusTransitionDescriptor transitionsG[] = {
    Both(false, TestIds::everything),
    Both(true, TestIds::everything),
    Both(false, TestIds::point),
    Both(true, TestIds::point),
    Both(false, TestIds::empty),
    Both(true, TestIds::empty),
    Both(false, TestIds::aLink),
    Both(true, TestIds::aLink),
    Both(false, TestIds::octets),
    Both(true, TestIds::octets),
    Both(false, TestIds::texts),
    Both(true, TestIds::texts),
    Both(false, TestIds::selfHolding),
    Both(false, TestIds::malformed),
    Both(false, TestIds::unknownInside),
    Both(false, TestIds::unknownWord),
    Both(false, 998),
};
constexpr BusProtocolStateDescriptor stateG = {"Only", std::size(transitionsG), transitionsG};
constexpr BusProtocolDescriptor protocolG = {TestIds::protocol, "Test", testChecksumG, 1, &stateG};

BusTypeLookup Lookup(const void*, unsigned id, unsigned* kind) {
    BusTypeLookup found = {nullptr, 0};
    for (const BusStructDescriptor& each : structsG) {
        if (each.id == id) found = {&each, BusKind::STRUCT};
    }
    if (id == TestIds::protocol) found = {&protocolG, BusKind::PROTOCOL};
    if (id == TestIds::anEnum) found = {&enumG, BusKind::ENUM};
    if (kind != nullptr && found.descriptor != nullptr) *kind = found.kind;
    return found;
}

}  // namespace

const VkBusTypeLibrary testLibraryG = {
    VkBusTypeLibrary::formatG, 0, &malloc, &free, {0, 0, 0, 0, 0}, &Lookup,
};
