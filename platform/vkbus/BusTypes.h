#pragma once

#include <cstddef>
#include <cstdint>

// What a program tells the bus about the records, enumerations and protocols that it knows: constant tables
// of 32-bit words and pointers. The bus keeps pointers into them, so they live as long as the process uses
// it.

/// Numbers of which a member's type is made, in prefix form: SEQUENCE and OPTIONAL are followed by the type
/// of the element, STRUCT and ENUM by the id of the structure or enumeration; all others stand alone. In
/// memory, each aligned as the compiler aligns it:
///
///   SHORT, UNSIGNED_SHORT           int16_t, uint16_t
///   LONG, UNSIGNED_LONG             int32_t, uint32_t
///   LONG_LONG, UNSIGNED_LONG_LONG   int64_t, uint64_t
///   STRING                          const char*, ends in a zero; UTF-8; null is sent as the empty text
///   SEQUENCE                        BusSequence<element>: a count, then a pointer to the elements in a row
///   OPTIONAL                        pointer to the element, or null
///   STRUCT                          the structure in place; one without members takes a byte, as in C++
///   ENUM                            int32_t; that it is one of the items is not checked
///   OCTET                           uint8_t
///   BOOLEAN                         bool, one byte
///   ANYSTRUCT                       BusAnyStruct: id of a structure, then a pointer to it; 0 and null for
///   none
struct VkBusTypeDescriptor {
    enum : uint32_t {
        SHORT = 1,
        UNSIGNED_SHORT = 2,
        LONG = 3,
        UNSIGNED_LONG = 4,
        LONG_LONG = 5,
        UNSIGNED_LONG_LONG = 6,
        STRING = 7,
        SEQUENCE = 8,
        OPTIONAL = 9,
        STRUCT = 10,
        ENUM = 11,
        OCTET = 12,
        BOOLEAN = 13,
        ANYSTRUCT = 14,
        U32_MAX = 0x7FFFFFFF,
    };
};

template <class T>
struct BusSequence {
    uint32_t count;
    const T* vElement;
};

struct BusAnyStruct {
    uint32_t id;
    const void* pStruct;
};

struct BusStructMemberDescriptor {
    const char* name;
    uint32_t nTypeWords;
    const uint32_t* vTypeWord;
};

struct BusStructDescriptor {
    uint32_t id;
    const char* name;
    uint32_t checksum;
    uint32_t nMembers;
    const BusStructMemberDescriptor* vMember;
};

struct BusEnumItemDescriptor {
    const char* name;
    int32_t value;
};

// The order of the words is fixed. NOLINTNEXTLINE(clang-analyzer-optin.performance.Padding)
struct BusEnumDescriptor {
    uint32_t id;
    const char* name;
    uint32_t checksum;
    uint32_t flags;
    uint32_t nItems;
    const BusEnumItemDescriptor* vItem;
};

/// Seen from the service's end.
struct VkBusEventDirection {
    enum : uint32_t { SEND = 1, RECEIVE = 2 };
};

/// An event that may pass in a state of a protocol, and the state that follows. The bits are carried along
/// and mean nothing to this bus.
struct BusTransitionDescriptor {
    uint32_t direction;  // VkBusEventDirection
    uint32_t eventId;    // a structure
    uint32_t nextState;  // index
    uint32_t bits;
};

struct BusProtocolStateDescriptor {
    const char* name;
    uint32_t nTransitions;
    const BusTransitionDescriptor* vTransition;
};

/// A session begins in state 0.
struct BusProtocolDescriptor {
    uint32_t id;
    const char* name;
    uint32_t checksum;
    uint32_t nStates;
    const BusProtocolStateDescriptor* vState;
};

/// What a descriptor is: the id of the record that describes its kind.
struct BusKind {
    enum : uint32_t { STRUCT = 0x10002, ENUM = 0x10004, PROTOCOL = 0x10009 };
};

struct BusTypeLookup {
    const void* descriptor;  // null for an unknown id
    uint32_t kind;           // of BusKind; 0 for an unknown id
};

/// All that a program tells the bus; ten words on the 32-bit target.
struct VkBusTypeLibrary {
    static constexpr uint32_t formatG = 0x0F010001;

    uint32_t format;  // formatG
    uint32_t reserved;
    void* (*allocate)(size_t nBytes);  // for decoded records; aligned for any of their members; any thread
    void (*release)(void* block);
    uint32_t vReserved[5];
    /// The descriptor of an id, and its kind, which goes to `*kind` too unless that is null or the id
    /// unknown. Any thread; the first argument says nothing.
    BusTypeLookup (*lookup)(const void* ignored, unsigned id, unsigned* kind);
};

static_assert(sizeof(void*) != 4 || sizeof(VkBusTypeLibrary) == 40);
static_assert(sizeof(void*) != 4 || sizeof(BusSequence<uint8_t>) == 8);
