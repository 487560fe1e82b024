#include "client/EventMessage.h"

#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/rpc/OrvoRpcV2.h"
#include "vkbus/VkBus.h"

namespace {

/// Bytes from which a packet is kept.
constexpr uint32_t minKeptG = 64u << 10;

}  // namespace

ref<sorn::OrvoRpcWrapper> UnmarshalEventMessage(RoxMempool* pool, const BusSequence<uint8_t>& packet,
                                                uintptr_t word1, uintptr_t word2, RoxString& error) {
    if (packet.count >= minKeptG) {
        const ref<RoxCore> event = VkMarshal_KeepSerialEvent(word2, word1);
        if (event != nullptr) {
            return sorn::OrvoRpcV2::UnmarshalFromBytes(
                pool, rox::ByteBuffer::NewKept(pool, event, packet.vElement, packet.count), false, error);
        }
    }
    return sorn::OrvoRpcV2::UnmarshalFromString(
        pool, RoxString::FromUtf8Bytes(pool, packet.count, packet.vElement), false, error);
}
