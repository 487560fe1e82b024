#pragma once

#include <systemd/sd-bus.h>

#include "vkbus/BusShape.h"
#include "vkbus/BusWireSize.h"

/// Writes records into the body of a message, in the form that BusShape tells. Belongs to one thread, which
/// holds the lock of the message's bus.
class BusMarshaller {
 public:
    BusMarshaller(const BusShape& shape, sd_bus_message* message) : shapeM(shape), pMessageM(message) {}

    bool AddUnsigned(uint32_t value);
    /// Adds the members of a record. A failure leaves the message unusable.
    bool AddMembers(const BusStructDescriptor& descriptor, const void* record) {
        return AddMembers(descriptor, static_cast<const unsigned char*>(record), 0);
    }
    /// The bytes of the body so far; more than maxVkBusEventBytesG are a failure.
    const BusWireSize& Size() const { return sizeM; }

 private:
    bool AddMembers(const BusStructDescriptor& descriptor, const unsigned char* record, unsigned depth);
    bool AddValue(BusTypeWords& words, const unsigned char* at, unsigned depth);
    bool AddSimple(uint32_t type, const unsigned char* at);
    bool AddSequence(BusTypeWords& words, const unsigned char* at, unsigned depth);
    bool AddOptional(BusTypeWords& words, const unsigned char* at, unsigned depth);
    bool AddElements(BusTypeWords& words, const unsigned char* vElement, uint32_t count, unsigned depth);
    bool AddStruct(const BusStructDescriptor& descriptor, const unsigned char* at, unsigned depth);
    bool AddAnyStruct(const BusAnyStruct& any, unsigned depth);
    bool Open(char container, const char* contents);
    bool Close();

    const BusShape& shapeM;
    sd_bus_message* pMessageM;
    BusWireSize sizeM;
};
