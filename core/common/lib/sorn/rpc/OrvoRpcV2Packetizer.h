#pragma once

#include <cstdint>

#include "rox/RoxString.h"
#include "rox/ref.h"
#include "sorn/dict/RoxByteBuffer.h"

class RoxMempool;

namespace sorn {

/// Tells a reader of a stream when a whole message has come and how long it is. Hand it all that came since
/// the first byte of the message, after each piece; when `complete` is set take GetPacketLength bytes and
/// call Reset. A bad first line makes one packet of all that is there, and OrvoRpcV2::UnmarshalFromString on
/// it tells what is wrong. After the first line an update is one comparison. One reader, no lock.
class OrvoRpcV2Packetizer {
 public:
    explicit OrvoRpcV2Packetizer(RoxMempool* pool);

    /// `input` begins at the first byte of the message.
    void UpdateInput(const RoxString& input);
    void UpdateInputBytestring(const ref<rox::ByteBuffer>& input);
    /// Bytes of the message, 0 as long as it is not complete.
    unsigned int GetPacketLength() const { return complete ? packetLength : 0; }
    /// Ready for the next message. `lastError` stays.
    void Reset();

    RoxMempool* mempool;
    bool firstLineParsed;      ///< the first line was seen, good or bad
    bool complete;             ///< a whole packet is there
    uint32_t headerLength;     ///< bytes, as the first line declares
    uint32_t bodyLength;       ///< bytes, as the first line declares
    uint32_t firstLineLength;  ///< bytes, with CR, LF
    uint32_t packetLength;     ///< bytes of the whole message
    RoxString lastError;       ///< the words about the last bad first line; a good one does not clear them

 private:
    void Update(const char* bytes, uint32_t length);
};

}  // namespace sorn
