// The packetizer: its states, its words and what it costs. Invariants for untrusted input: 2, 4, 13.

#include <gtest/gtest.h>

#include "rpc/FramingFixture.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/rpc/OrvoRpcV2Packetizer.h"

namespace sorntest {

using namespace sorn;
using namespace std::string_literals;

namespace {

const std::string cancelG = "ORPC/2 26 0\r\nRpcId: 7\r\nType: cancel\r\n\r\n";  // 39 bytes
const std::string responseG = "ORPC/2 28 4\r\nRpcId: 8\r\nType: response\r\n\r\n{ }\n";
const std::string accentsG = "ORPC/2 28 10\r\nRpcId: 9\r\nType: response\r\n\r\n{\"\xC3\xA9\": \xC3\xA9}";

/// A buffer that grows in its place, as a reader of a stream has one.
class StreamBuffer final : public rox::ByteBuffer {
 public:
    explicit StreamBuffer(uint32_t capacity) { bytesM.Realloc(capacity); }
    void Fill(const std::string& bytes) {
        bytes.copy(reinterpret_cast<char*>(bytesM.GetData()), bytes.size());
    }
    void SetLength(uint32_t n) { bytesM.SetLength(n); }
};

}  // namespace

class PacketizerTest : public FramingFixture {
 protected:
    static void Feed(OrvoRpcV2Packetizer& packetizer, const std::string& input, bool isBytes,
                     RoxMempool* in) {
        if (isBytes) {
            packetizer.UpdateInputBytestring(
                rox::ByteBuffer::New(in, input.data(), static_cast<uint32_t>(input.size())));
        } else {
            packetizer.UpdateInput(TextIn(in, input));
        }
    }
};

TEST_F(PacketizerTest, New) {
    const OrvoRpcV2Packetizer packetizer(&pool);
    EXPECT_EQ(packetizer.mempool, &pool);
    EXPECT_FALSE(packetizer.firstLineParsed);
    EXPECT_FALSE(packetizer.complete);
    EXPECT_EQ(packetizer.headerLength, 0u);
    EXPECT_EQ(packetizer.bodyLength, 0u);
    EXPECT_EQ(packetizer.firstLineLength, 0u);
    EXPECT_EQ(packetizer.packetLength, 0u);
    EXPECT_EQ(packetizer.GetPacketLength(), 0u);
    EXPECT_TRUE(packetizer.lastError.FEmpty());
}

TEST_F(PacketizerTest, ByteByByte) {
    for (const bool isBytes : {false, true}) {
        OrvoRpcV2Packetizer packetizer(&pool);
        for (size_t n = 0; n <= cancelG.size(); ++n) {
            Feed(packetizer, cancelG.substr(0, n), isBytes, &pool);
            const bool isLine = n >= 13;
            EXPECT_EQ(packetizer.firstLineParsed, isLine) << n;
            EXPECT_EQ(packetizer.headerLength, isLine ? 26u : 0u) << n;
            EXPECT_EQ(packetizer.firstLineLength, isLine ? 13u : 0u) << n;
            EXPECT_EQ(packetizer.packetLength, isLine ? 39u : 0u) << n;
            EXPECT_EQ(packetizer.complete, n == 39) << n;
            EXPECT_EQ(packetizer.GetPacketLength(), n == 39 ? 39u : 0u) << n;
        }
        Feed(packetizer, cancelG + responseG, isBytes, &pool);
        EXPECT_EQ(packetizer.GetPacketLength(), 39u);
        // Less than before is looked at as it is.
        Feed(packetizer, cancelG.substr(0, 38), isBytes, &pool);
        EXPECT_FALSE(packetizer.complete);
        EXPECT_EQ(packetizer.GetPacketLength(), 0u);
        EXPECT_TRUE(packetizer.lastError.FEmpty());
    }
}

TEST_F(PacketizerTest, BadFirstLinesAreOnePacketOfAllThatIsThere) {
    struct Case {
        std::string input;
        const char* words;
    };
    const Case cases[] = {
        {"x\r\n", "First line does not have expected number of fields (3)"},
        {"x\r\n" + cancelG, "First line does not have expected number of fields (3)"},
        {"\r\n", "First line does not have expected number of fields (3)"},
        {"ORPC/1 26 0\r\nxyz", "First line of message does not start with 'ORPC/2'"},
        {"ORPC/2 x 0\r\n", "Invalid header length - not a number"},
        {"ORPC/2 -1 0\r\n", "Declared header length too long"},
        {"ORPC/2 26 x\r\n", "Invalid body length - not a number"},
        {"ORPC/2 26 5242881\r\n", "Declared body length too long"},
        {std::string(26, 'x'), "First line too long"},
        {std::string(1000, '\r'), "First line too long"},
    };
    for (const Case& each : cases) {
        for (const bool isBytes : {false, true}) {
            SCOPED_TRACE(each.input);
            const auto length = static_cast<uint32_t>(each.input.size());
            OrvoRpcV2Packetizer packetizer(&pool);
            Feed(packetizer, each.input, isBytes, &pool);
            EXPECT_TRUE(packetizer.firstLineParsed);
            EXPECT_TRUE(packetizer.complete);
            EXPECT_EQ(packetizer.GetPacketLength(), length);
            EXPECT_EQ(Str(packetizer.lastError), each.words);
            // More of it makes no longer packet, less an incomplete one.
            Feed(packetizer, each.input + "more", isBytes, &pool);
            EXPECT_EQ(packetizer.GetPacketLength(), length);
            Feed(packetizer, each.input.substr(1), isBytes, &pool);
            EXPECT_EQ(packetizer.GetPacketLength(), 0u);
            EXPECT_EQ(Str(packetizer.lastError), each.words);
        }
        unsigned length = 1;
        RoxString error("before");
        EXPECT_TRUE(OrvoRpcV2::IsCompleteString(&pool, Text(each.input), length, error));
        EXPECT_EQ(length, each.input.size());
        EXPECT_EQ(Str(error), each.words);
    }
}

TEST_F(PacketizerTest, ResetKeepsTheLastWordsAndAGoodPacketToo) {
    OrvoRpcV2Packetizer packetizer(&pool);
    packetizer.UpdateInput(Text("ORPC/2 26 x\r\n"));
    EXPECT_EQ(packetizer.headerLength, 26u);
    packetizer.Reset();
    EXPECT_FALSE(packetizer.firstLineParsed);
    EXPECT_FALSE(packetizer.complete);
    EXPECT_EQ(packetizer.headerLength + packetizer.bodyLength, 0u);
    EXPECT_EQ(packetizer.firstLineLength + packetizer.packetLength, 0u);
    EXPECT_EQ(packetizer.GetPacketLength(), 0u);
    EXPECT_EQ(packetizer.mempool, &pool);
    EXPECT_EQ(Str(packetizer.lastError), "Invalid body length - not a number");
    packetizer.UpdateInput(Text(cancelG));
    EXPECT_EQ(packetizer.GetPacketLength(), 39u);
    EXPECT_EQ(Str(packetizer.lastError), "Invalid body length - not a number");
    packetizer.Reset();
    packetizer.UpdateInput(Text("x y z\r\n"));
    EXPECT_EQ(Str(packetizer.lastError), "First line of message does not start with 'ORPC/2'");
    packetizer.Reset();
    // An unfinished line leaves everything as it was.
    packetizer.UpdateInput(Text(std::string(25, 'x')));
    EXPECT_FALSE(packetizer.firstLineParsed);
    EXPECT_EQ(Str(packetizer.lastError), "First line of message does not start with 'ORPC/2'");
    packetizer.UpdateInput(Text(std::string(26, 'x')));
    EXPECT_EQ(packetizer.GetPacketLength(), 26u);
    EXPECT_EQ(Str(packetizer.lastError), "First line too long");
}

TEST_F(PacketizerTest, IsCompleteString) {
    struct Case {
        std::string input;
        bool isComplete;
        unsigned length;  ///< 1: untouched
        const char* words;
    };
    const Case cases[] = {
        {"", false, 1, "before"},
        {"ORPC/2 26 0\r", false, 1, "before"},
        {std::string(25, 'x'), false, 1, "before"},
        {cancelG.substr(0, 38), false, 1, "before"},
        {cancelG, true, 39, ""},
        {cancelG + "x", true, 39, ""},
        {cancelG + responseG, true, 39, ""},
        {"ORPC/2 0 0\r\n", true, 12, ""},
        {"ORPC/2 1048576 5242880\r\n", false, 1, "before"},
        {accentsG, true, 52, ""},  // bytes, not characters
        {accentsG.substr(0, accentsG.size() - 1), false, 1, "before"},
        {std::string(26, 'x'), true, 26, "First line too long"},
        {"ORPC/2  26 0\r\n12345", true, 19, "First line does not have expected number of fields (3)"},
    };
    for (const Case& each : cases) {
        SCOPED_TRACE(each.input);
        unsigned length = 1;
        RoxString error("before");
        EXPECT_EQ(OrvoRpcV2::IsCompleteString(&pool, Text(each.input), length, error), each.isComplete);
        EXPECT_EQ(length, each.length);
        EXPECT_EQ(Str(error), each.words);
    }
}

/// Every cut of a stream of messages into two pieces, and into three.
TEST_F(PacketizerTest, EverySplitOfAStream) {
    const std::string stream = cancelG + responseG + accentsG + "ORPC/2 0 0\r\n" + cancelG;
    const std::vector<std::string> expected = {cancelG, responseG, accentsG, "ORPC/2 0 0\r\n", cancelG};
    const auto packets = [&](const std::vector<size_t>& vArrivals, bool isBytes) {
        std::vector<std::string> vPackets;
        OrvoRpcV2Packetizer packetizer(&pool);
        size_t begin = 0;
        for (const size_t end : vArrivals) {
            while (begin < end) {
                Feed(packetizer, stream.substr(begin, end - begin), isBytes, &pool);
                const unsigned length = packetizer.GetPacketLength();
                if (length == 0) break;
                vPackets.push_back(stream.substr(begin, length));
                begin += length;
                packetizer.Reset();
            }
        }
        EXPECT_TRUE(packetizer.lastError.FEmpty());
        EXPECT_FALSE(packetizer.firstLineParsed);
        return vPackets;
    };
    std::vector<size_t> vEach;
    for (size_t first = 0; first <= stream.size(); ++first) {
        vEach.push_back(first);
        for (size_t second = first; second <= stream.size(); ++second) {
            const bool isBytes = (first + second) % 2 != 0;
            ASSERT_EQ(packets({first, second, stream.size()}, isBytes), expected) << first << " " << second;
        }
    }
    EXPECT_EQ(packets(vEach, false), expected);
    EXPECT_EQ(packets(vEach, true), expected);
    for (size_t piece = 1; piece < 60; ++piece) {
        std::vector<size_t> vPieces;
        for (size_t end = piece; end < stream.size(); end += piece) vPieces.push_back(end);
        vPieces.push_back(stream.size());
        EXPECT_EQ(packets(vPieces, piece % 2 != 0), expected) << piece;
    }
}

/// The largest message byte by byte: no allocation from the first line on, and no work but a comparison,
/// without which this would not end.
TEST_F(PacketizerTest, TheLargestMessageByteByByte) {
    const std::string line = "ORPC/2 1048576 5242880\r\n";
    const auto total = static_cast<uint32_t>(line.size()) + 1048576 + 5242880;
    const ref<StreamBuffer> buffer(new (&pool) StreamBuffer(total));
    buffer->Fill(line);
    RoxMempool own("packetizer");
    OrvoRpcV2Packetizer packetizer(&own);
    const size_t nUsed = pool.GetUsedBytes();
    for (uint32_t n = 0; n < total; ++n) {
        buffer->SetLength(n);
        packetizer.UpdateInputBytestring(buffer);
        if (packetizer.complete || packetizer.firstLineParsed != (n >= line.size())) {
            FAIL() << n;
        }
    }
    EXPECT_EQ(packetizer.packetLength, total);
    buffer->SetLength(total);
    packetizer.UpdateInputBytestring(buffer);
    EXPECT_EQ(packetizer.GetPacketLength(), total);
    EXPECT_EQ(own.GetUsedBytesHighWater(), 0u);
    EXPECT_EQ(pool.GetUsedBytesHighWater(), nUsed);
}

/// A million looks at a text of 5 MiB that is not complete.
TEST_F(PacketizerTest, ALongTextIsNotWalked) {
    const RoxString text = Text("ORPC/2 0 5242880\r\n" + std::string(5242879, ' '));
    OrvoRpcV2Packetizer packetizer(&pool);
    const size_t nUsed = pool.GetUsedBytesHighWater();
    for (unsigned n = 0; n < 1000000; ++n) packetizer.UpdateInput(text);
    EXPECT_TRUE(packetizer.firstLineParsed);
    EXPECT_FALSE(packetizer.complete);
    EXPECT_EQ(pool.GetUsedBytesHighWater(), nUsed);
}

/// A line that is bad for being incomplete in a first look can be good in one that comes with the rest: what
/// is there counts, however long.
TEST_F(PacketizerTest, LongLinesArriveAtOnceOrNotAtAll) {
    const std::string padded = std::string(30, ' ') + "ORPC/2 26 0\r\nRpcId: 7\r\nType: cancel\r\n\r\n";
    OrvoRpcV2Packetizer whole(&pool);
    whole.UpdateInput(Text(padded));
    EXPECT_EQ(whole.GetPacketLength(), padded.size());
    EXPECT_TRUE(whole.lastError.FEmpty());
    OrvoRpcV2Packetizer pieces(&pool);
    pieces.UpdateInput(Text(padded.substr(0, 26)));
    pieces.UpdateInput(Text(padded));
    EXPECT_EQ(pieces.GetPacketLength(), 26u);
    EXPECT_EQ(Str(pieces.lastError), "First line too long");
}

}  // namespace sorntest
