#pragma once

#include "vkbus/BusTypes.h"

/// What the client and the service tell the bus: their protocol, its events, and the bus's own vocabulary.
extern const VkBusTypeLibrary busTypeLibrary;

/// The descriptor of an id, and its kind; the kind goes to `*kind` too. For an unknown id the descriptor is
/// null and `*kind` is left alone. `kind` may be null. Any thread.
BusTypeLookup LookupBusType(const void* ignored, unsigned id, unsigned* kind);

/// Ids of the protocol and its events, and the protocol's checksum.
struct VkAesQueryProtocol {
    static constexpr uint32_t idG = 171754;
    static constexpr uint32_t checksumG = 8678623;
};

/// The first event of a session, from the client.
struct VkAesHello {
    static constexpr uint32_t idG = 172967;
    uint32_t partnerId;
};

/// One ORPC/2 message from the client.
struct VkAesRequest {
    static constexpr uint32_t idG = 171750;
    BusSequence<uint8_t> orpcV2Packet;
};

/// One ORPC/2 message from the service.
struct VkAesResponse {
    static constexpr uint32_t idG = 171752;
    BusSequence<uint8_t> orpcV2Packet;
};

/// A piece of a message from the service.
struct VkAesResponseChunk {
    static constexpr uint32_t idG = 173082;
    uint32_t rpcId;
    bool lastChunk;
    BusSequence<uint8_t> orpcV2Chunk;
};
