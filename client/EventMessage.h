#pragma once

#include <cstdint>

#include "rox/RoxString.h"
#include "rox/ref.h"
#include "sorn/rpc/OrvoRpcWrapper.h"
#include "vkbus/BusTypes.h"

class RoxMempool;

/// The message in the packet of an event of the bus, out of its callback, to which the words were given. The
/// body is lazy. It keeps the event when it is large; of smaller ones the bytes are copied, so that not much
/// more is held than is wanted. Null and words for one that cannot be decoded.
ref<sorn::OrvoRpcWrapper> UnmarshalEventMessage(RoxMempool* pool, const BusSequence<uint8_t>& packet,
                                                uintptr_t word1, uintptr_t word2, RoxString& error);
