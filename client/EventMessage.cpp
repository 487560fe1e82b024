#include "client/EventMessage.h"

#include <algorithm>
#include <string_view>

#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/rpc/FirstLine.h"
#include "sorn/rpc/OrvoRpcV2.h"
#include "vkbus/VkBus.h"

namespace {

/// Bytes from which a packet is kept.
constexpr uint32_t minKeptG = 64u << 10;

/// The bytes of the message that stands in front.
uint32_t LengthOf(std::string_view packet) {
    sorn::FirstLine line;
    RoxString words;
    if (!line.Parse(packet, words)) return static_cast<uint32_t>(packet.size());
    const uint64_t n = uint64_t{line.length} + line.headerLength + line.bodyLength;
    return static_cast<uint32_t>(std::min<uint64_t>(n, packet.size()));
}

}  // namespace

ref<sorn::OrvoRpcWrapper> UnmarshalEventMessage(RoxMempool* pool, const BusSequence<uint8_t>& packet,
                                                uintptr_t word1, uintptr_t word2, RoxString& error) {
    ref<RoxCore> event;
    if (packet.count >= minKeptG) event = VkMarshal_KeepSerialEvent(word2, word1);
    if (event == nullptr) {
        return sorn::OrvoRpcV2::UnmarshalFromString(
            pool, RoxString::FromUtf8Bytes(pool, packet.count, packet.vElement), false, error);
    }
    ref<sorn::OrvoRpcWrapper> message = sorn::OrvoRpcV2::UnmarshalFromBytes(
        pool, rox::ByteBuffer::NewKept(pool, event, packet.vElement, packet.count), false, error);
    const uint32_t n = LengthOf({reinterpret_cast<const char*>(packet.vElement), packet.count});
    if (message == nullptr || n >= packet.count / 2) return message;
    // Much stands behind it, which is not to be held with it.
    return sorn::OrvoRpcV2::UnmarshalFromString(pool, RoxString::FromUtf8Bytes(pool, n, packet.vElement),
                                                false, error);
}
