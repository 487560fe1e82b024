#pragma once

#include "vkbus/BusTypes.h"

// A library with every type of member, each alone, in rows, optional and nested, and a protocol in which both
// ends may send each of its events at any time.

struct TestPoint {
    int16_t x;
    int64_t y;
};

struct TestEverything {
    int16_t aShort;
    uint16_t anUnsignedShort;
    int32_t aLong;
    uint32_t anUnsignedLong;
    int64_t aLongLong;
    uint64_t anUnsignedLongLong;
    const char* text;
    int32_t anEnum;
    uint8_t anOctet;
    bool aBoolean;
    TestPoint point;
    uint8_t empty;  // a structure without members
    BusAnyStruct any;
    BusSequence<int16_t> shorts;
    BusSequence<uint16_t> unsignedShorts;
    BusSequence<int32_t> longs;
    BusSequence<uint32_t> unsignedLongs;
    BusSequence<int64_t> longLongs;
    BusSequence<uint64_t> unsignedLongLongs;
    BusSequence<const char*> texts;
    BusSequence<int32_t> enums;
    BusSequence<uint8_t> octets;
    BusSequence<bool> booleans;
    BusSequence<TestPoint> points;
    BusSequence<uint8_t> empties;
    BusSequence<BusAnyStruct> anys;
    BusSequence<BusSequence<uint16_t>> rows;
    BusSequence<const int32_t*> optionals;
    const uint8_t* optionalOctet;
    const int64_t* optionalLongLong;
    const char* const* optionalText;
    const TestPoint* optionalPoint;
    const BusSequence<const char*>* optionalTexts;
    const bool* optionalBoolean;
    const int16_t* const* optionalOptional;
};

/// Holds another of its kind through ANYSTRUCT.
struct TestLink {
    uint32_t level;
    BusAnyStruct next;
};

struct TestOctets {
    BusSequence<uint8_t> bytes;
};

struct TestTexts {
    BusSequence<const char*> texts;
};

struct TestIds {
    enum : uint32_t {
        protocol = 1,
        everything,
        point,
        empty,
        aLink,
        octets,
        texts,
        selfHolding,    // itself, optional: without a finite signature
        malformed,      // SEQUENCE of nothing
        unknownInside,  // STRUCT of an unknown id
        unknownWord,    // a type that does not exist
        anEnum,
    };
};

extern const VkBusTypeLibrary testLibraryG;
constexpr uint32_t testChecksumG = 4242;
