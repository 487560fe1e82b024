#include "sorn/rpc/OrvoRpcV2Packetizer.h"

#include <algorithm>

#include "sorn/rpc/FirstLine.h"
#include "sorn/rpc/OrvoRpcV2.h"

namespace sorn {

OrvoRpcV2Packetizer::OrvoRpcV2Packetizer(RoxMempool* pool) : mempool(pool) {
    Reset();
}

void OrvoRpcV2Packetizer::Reset() {
    firstLineParsed = false;
    complete = false;
    headerLength = 0;
    bodyLength = 0;
    firstLineLength = 0;
    packetLength = 0;
}

void OrvoRpcV2Packetizer::UpdateInput(const RoxString& input) {
    Update(input.Utf8(), input.NByte());
}

void OrvoRpcV2Packetizer::UpdateInputBytestring(const ref<rox::ByteBuffer>& input) {
    Update(reinterpret_cast<const char*>(input->GetData()), input->GetLength());
}

void OrvoRpcV2Packetizer::Update(const char* bytes, uint32_t length) {
    if (!firstLineParsed) {
        FirstLine line;
        if (!line.Parse({bytes, length}, lastError)) {
            if (line.length == 0) return;
            firstLineParsed = true;
            complete = true;
            packetLength = length;
        } else {
            firstLineParsed = true;
            const uint64_t total = uint64_t{line.bodyLength} + line.headerLength + line.length;
            packetLength = static_cast<uint32_t>(std::min<uint64_t>(total, UINT32_MAX));
        }
        headerLength = line.headerLength;
        bodyLength = line.bodyLength;
        firstLineLength = line.length;
        if (complete) return;
    }
    complete = packetLength <= length;
}

bool OrvoRpcV2::IsCompleteString(RoxMempool* pool, const RoxString& input, unsigned int& length,
                                 RoxString& error) {
    OrvoRpcV2Packetizer packetizer(pool);
    packetizer.UpdateInput(input);
    if (packetizer.complete) {
        length = packetizer.GetPacketLength();
        error = packetizer.lastError;
    }
    return packetizer.complete;
}

}  // namespace sorn
