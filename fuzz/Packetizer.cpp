// A stream of messages of any bytes, cut into any pieces. Invariants 1, 2, 4 and 13.
//
// A good first line gives the same packet for every cut, by strings and by byte buffers; the message in the
// packet gets the verdict that it gets with more bytes behind it.
#include "fuzz/support/Check.h"
#include "fuzz/support/FuzzPool.h"
#include "fuzz/support/PiecedInput.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/rpc/OrvoRpcV2.h"
#include "sorn/rpc/OrvoRpcV2Packetizer.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size);

namespace {

using sorn::OrvoRpcV2Packetizer;

RoxString Text(RoxMempool* pool, const uint8_t* bytes, size_t n) {
    return RoxString::FromUtf8Bytes(pool, static_cast<unsigned>(n), bytes);
}

void CheckSame(const OrvoRpcV2Packetizer& a, const OrvoRpcV2Packetizer& b) {
    Check(a.complete == b.complete && a.GetPacketLength() == b.GetPacketLength() &&
              a.headerLength == b.headerLength && a.bodyLength == b.bodyLength &&
              a.firstLineLength == b.firstLineLength && a.lastError == b.lastError,
          "strings and byte buffers give different packets");
}

/// The verdict on the packet alone and on all that is there. Lengths are looked for as characters, so only
/// plain ASCII need give the same.
void CheckVerdict(const uint8_t* bytes, unsigned n, unsigned nPacket, RoxMempool* pool) {
    for (unsigned i = 0; i < n; ++i) {
        if (bytes[i] >= 0x80) return;
    }
    RoxString words;
    RoxString wordsOfAll;
    const bool isGood =
        sorn::OrvoRpcV2::UnmarshalFromString(pool, Text(pool, bytes, nPacket), false, words) != nullptr;
    const bool isGoodInAll =
        sorn::OrvoRpcV2::UnmarshalFromString(pool, Text(pool, bytes, n), false, wordsOfAll) != nullptr;
    Check(isGood == isGoodInAll && words == wordsOfAll, "bytes behind a message change its verdict");
}

/// Feeds the packetizers until there is a packet, or all; gives the bytes to take.
unsigned Feed(const PiecedInput& input, unsigned begin, OrvoRpcV2Packetizer& strings,
              OrvoRpcV2Packetizer& buffers, size_t& nPieces, RoxMempool* pool) {
    const uint8_t* const bytes = input.Text() + begin;
    const unsigned n = input.NText() - begin;
    for (unsigned nFed = 0; nFed < n && !strings.complete;) {
        nFed += std::min(input.PieceSize(nPieces++), n - nFed);
        strings.UpdateInput(Text(pool, bytes, nFed));
        buffers.UpdateInputBytestring(rox::ByteBuffer::New(pool, bytes, nFed));
        CheckSame(strings, buffers);
        Check(strings.GetPacketLength() <= nFed, "a packet is longer than what is there");
    }
    return strings.GetPacketLength();
}

}  // namespace

int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    FuzzPool pool;
    const PiecedInput input(data, size);
    OrvoRpcV2Packetizer strings(pool.Get());
    OrvoRpcV2Packetizer buffers(pool.Get());
    size_t nPieces = 0;
    for (unsigned begin = 0; begin < input.NText();) {
        const uint8_t* const rest = input.Text() + begin;
        const unsigned nRest = input.NText() - begin;
        unsigned nWhole = 0;
        RoxString words;
        const bool isWhole =
            sorn::OrvoRpcV2::IsCompleteString(pool.Get(), Text(pool.Get(), rest, nRest), nWhole, words);
        const unsigned nPacket = Feed(input, begin, strings, buffers, nPieces, pool.Get());
        if (strings.complete && strings.lastError.FEmpty() && words.FEmpty()) {
            Check(isWhole && nWhole == nPacket, "the cut changes a packet");
            CheckVerdict(rest, nRest, nPacket, pool.Get());
        }
        if (!strings.complete) break;
        begin += nPacket;
        strings.Reset();
        buffers.Reset();
        strings.lastError = buffers.lastError = RoxString();
    }
    return 0;
}
