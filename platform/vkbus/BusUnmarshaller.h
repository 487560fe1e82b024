#pragma once

#include <systemd/sd-bus.h>

#include "vkbus/BusArena.h"
#include "vkbus/BusShape.h"
#include "vkbus/BusWireSize.h"

/// Reads records out of the body of a message, in the form that BusShape tells. Texts and rows of numbers
/// stay where they are, in the message; the rest is made in the arena. Belongs to one thread, which holds the
/// lock of the message's bus.
class BusUnmarshaller {
 public:
    BusUnmarshaller(const BusShape& shape, sd_bus_message* message, BusArena& arena)
        : shapeM(shape), pMessageM(message), arenaM(arena) {}

    bool ReadUnsigned(uint32_t& value);
    /// The members of a structure as a record; null when the message has something else, or has more than
    /// maxVkBusEventBytesG. The message's signature was compared with the structure's before.
    void* ReadRecord(const BusStructDescriptor& descriptor);
    const BusWireSize& Size() const { return sizeM; }

 private:
    void* MakeRecord(const BusStructDescriptor& descriptor, unsigned depth);
    bool ReadMembers(const BusStructDescriptor& descriptor, unsigned char* record, unsigned depth);
    bool ReadValue(BusTypeWords& words, unsigned char* at, unsigned depth);
    bool ReadSimple(uint32_t type, unsigned char* at);
    bool ReadSequence(BusTypeWords& words, unsigned char* at, unsigned depth);
    bool ReadRow(uint32_t type, unsigned char* at);
    bool ReadOptional(BusTypeWords& words, unsigned char* at, unsigned depth);
    bool ReadElements(BusTypeWords& words, unsigned depth, uint32_t maxCount,
                      BusSequence<unsigned char>& found);
    bool ReadStruct(const BusStructDescriptor& descriptor, unsigned char* at, unsigned depth);
    bool ReadAnyStruct(unsigned char* at, unsigned depth);
    bool Enter(char container, const char* contents);
    bool Leave();

    const BusShape& shapeM;
    sd_bus_message* pMessageM;
    BusArena& arenaM;
    BusWireSize sizeM;
};
