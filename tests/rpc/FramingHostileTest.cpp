// Truncated, flipped and lying messages, and garbage that looks like headers, in blocks of exactly its size.
// Invariants for untrusted input: 1, 2, 3, 4, 6, 9, 10, 11, 13.

#include <gtest/gtest.h>

#include <algorithm>

#include "rpc/FramingFixture.h"
#include "rpc/ModelPacketizer.h"
#include "rpc/ModelWriter.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/rpc/OrvoRpcV2Packetizer.h"
#include "support/SmallStack.h"

namespace sorntest {

using namespace sorn;
using namespace std::string_literals;

namespace {

const std::string vMessagesG[] = {
    "ORPC/2 26 0\r\nRpcId: 7\r\nType: cancel\r\n\r\n",
    "ORPC/2 75 9\r\nContent-Type: application/json\r\nIsFinal: true\r\nRpcId: 7\r\nType: "
    "response\r\n\r\n{\"a\": 42}",
    "ORPC/2 131 2\r\nContent-Type: application/json\r\nRequestType: recordingSearch\r\nResponseCount: "
    "single\r\n"
    "RpcId: 7\r\nSchemaVersion: 42\r\nType: request\r\n\r\n{}",
    "ORPC/2 60 5\r\nAccept: x\r\nRpcId: 7\r\nRequestType: t\r\nType: requestUpdate\r\n\r\n{\"\xC3\xA9\"",
};

}  // namespace

class FramingHostileTest : public FramingFixture {
 protected:
    /// Both readings and the packetizers on the bytes; the same as by the model, and nothing stays. Whether
    /// they are a message.
    bool IsTaken(const std::string& bytes) {
        const size_t nBefore = pool.GetUsedBytes();
        const std::string answer = ByLibrary(bytes);
        EXPECT_EQ(answer, ByModel(bytes)) << bytes;
        EXPECT_EQ(ByLibrary(bytes, true, "x"), ByModel(bytes, true, "x")) << bytes;
        ModelPacketizer model;
        model.Update(bytes);
        OrvoRpcV2Packetizer packetizer(&pool);
        packetizer.UpdateInputBytestring(
            rox::ByteBuffer::New(nullptr, bytes.data(), static_cast<uint32_t>(bytes.size())));
        EXPECT_EQ(packetizer.GetPacketLength(), model.isComplete ? model.length : 0) << bytes;
        EXPECT_EQ(Str(packetizer.lastError), model.lastError) << bytes;
        EXPECT_EQ(pool.GetUsedBytes(), nBefore);
        return answer.compare(0, 5, "read:") == 0;
    }
    /// What reading takes at its height, of bytes in another pool, in a pool of its own; `words` is what it
    /// says.
    size_t PeakOfReading(const std::string& bytes, std::string& words) {
        const RoxString text = Text(bytes);
        RoxMempool fresh("reading");
        RoxString error;
        const bool isRead = OrvoRpcV2::UnmarshalFromString(&fresh, text, false, error) != nullptr;
        words = isRead ? "read" : Str(error);
        EXPECT_EQ(fresh.GetUsedBytes(), 0u);
        return fresh.GetUsedBytesHighWater();
    }
};

TEST_F(FramingHostileTest, TheMessagesThemselves) {
    for (const std::string& message : vMessagesG) EXPECT_TRUE(IsTaken(message)) << ByLibrary(message);
}

TEST_F(FramingHostileTest, TruncatedAtEveryByte) {
    for (const std::string& message : vMessagesG) {
        for (size_t n = 0; n < message.size(); ++n) EXPECT_FALSE(IsTaken(message.substr(0, n)));
    }
}

TEST_F(FramingHostileTest, EveryBitFlipped) {
    for (const std::string& message : vMessagesG) {
        size_t nTaken = 0;
        for (size_t bit = 0; bit < message.size() * 8; ++bit) {
            std::string flipped = message;
            flipped[bit / 8] = static_cast<char>(flipped[bit / 8] ^ (1 << bit % 8));
            nTaken += IsTaken(flipped) ? 1u : 0u;
        }
        EXPECT_GT(nTaken, 0u);
        EXPECT_LT(nTaken, message.size() * 8);
    }
}

TEST_F(FramingHostileTest, EveryByteTakenOutDoubledOrAtItsExtremes) {
    for (const std::string& message : vMessagesG) {
        for (size_t i = 0; i < message.size(); ++i) {
            IsTaken(message.substr(0, i) + message.substr(i + 1));
            IsTaken(message.substr(0, i) + message[i] + message.substr(i));
            for (const char value : {'\0', '\x7F', '\x80', '\xFF', '\r', '\n', ':', ' ', '0', '9'}) {
                std::string changed = message;
                changed[i] = value;
                IsTaken(changed);
            }
        }
    }
}

TEST_F(FramingHostileTest, LengthsThatLie) {
    const std::string block = "RpcId: 7\r\nType: response\r\n\r\n";  // 28
    const char* const lies[] = {"0",
                                "1",
                                "27",
                                "29",
                                "30",
                                "31",
                                "1048576",
                                "1048577",
                                "2147483647",
                                "2147483648",
                                "4294967295",
                                "4294967296",
                                "4294967324",
                                "9223372036854775807",
                                "18446744073709551615",
                                "18446744073709551644",
                                "-1",
                                "-28",
                                "-4294967268",
                                "-18446744073709551588"};
    for (const char* lie : lies) {
        EXPECT_FALSE(IsTaken("ORPC/2 " + std::string(lie) + " 2\r\n" + block + "{}") &&
                     std::string(lie) != "27" && std::string(lie) != "29")
            << lie;
        EXPECT_EQ(IsTaken("ORPC/2 28 " + std::string(lie) + "\r\n" + block + "{}"), std::string(lie) == "1")
            << lie;
    }
    EXPECT_TRUE(IsTaken("ORPC/2 28 2\r\n" + block + "{}"));
}

/// As deep as a body can be nested, read at once, written and destroyed on a small stack. Invariant 3.
TEST_F(FramingHostileTest, TheDeepestBody) {
    constexpr unsigned nLevels = (5242880 - 2) / 6;
    std::string body;
    for (unsigned i = 0; i < nLevels; ++i) body += "{\"a\":";
    body += "{}" + std::string(nLevels, '}');
    const std::string input =
        Framed({"Content-Type: ", "IsFinal: false", "RpcId: 7", "Type: response"}, body);
    RunOnSmallStack([&] {
        for (const bool isBodyParsed : {false, true}) {
            RoxString error;
            const ref<OrvoRpcWrapper> wrapper =
                OrvoRpcV2::UnmarshalFromString(&pool, Text(input), isBodyParsed, error);
            ASSERT_NE(wrapper, nullptr) << Str(error);
            const std::string text = Str(wrapper->BodyToJson(false));
            EXPECT_EQ(std::count(text.begin(), text.end(), '{'), nLevels + 1);
            const std::string expected =
                text.size() > ModelWriter::maxBodyG
                    ? "Orvo Rpc message body is too large."
                    : Framed({"Content-Type: ", "IsFinal: false", "RpcId: 7", "Type: response"}, text);
            EXPECT_TRUE(Written(wrapper) == expected);
        }
    });
}

/// Blocks as large as they may be, of the shapes that cost most.
TEST_F(FramingHostileTest, LargeBlocksTakeMemoryByTheirSize) {
    const auto block = [](const std::string& line, size_t n) {
        std::string text = "RpcId: 7\r\nType: response\r\n";
        for (size_t i = 0; i < n; ++i) text += line;
        return text;
    };
    std::string names = block("", 0);
    std::string longNames = names;
    for (unsigned i = 0; i < 65000; ++i) {
        names += std::to_string(i) + ":\r\n";
        if (i < 40000) longNames += std::to_string(100000000 + i) + "xxxxxxx: yyy\r\n";
    }
    struct Case {
        const char* name;
        std::string block;
        const char* words;
    };
    const Case cases[] = {
        {"a name with many empty values", block(":\r\n", 65000), "read"},
        {"many names", names, "read"},
        {"many longer names", longNames, "read"},
        {"many values", block("a: b\r\n", 65000), "read"},
        {"one long value", block("a: " + std::string(1048576 - 31, 'v') + "\r\n", 1), "read"},
        {"one long name", block(std::string(1048576 - 29, 'n') + ":\r\n", 1), "read"},
        {"one long line without a colon", block(std::string(1048576 - 28, 'n') + "\r\n", 1), nullptr},
        {"one long blank value", block("a:" + std::string(1048576 - 30, ' ') + "\r\n", 1), "read"},
        {"empty lines", block("\r\n", 65000), "read"},
        {"more empty lines than may be", block("\r\n", 524275), "Too many header lines"},
        {"more lines than may be", block("a:\r\n", 260000), "Too many header lines"},
        {"carriage returns", block(std::string(1048576 - 28, '\r') + "\r\n", 1), nullptr},
        {"line feeds and returns", block(std::string(524000, '\n') + std::string(524000, '\r') + "\r\n", 1),
         nullptr},
        {"colons", block(std::string(1048576 - 28, ':') + "\r\n", 1), "read"},
        {"NULs", block(std::string(1048576 - 28, '\0') + "\r\n", 1), "Invalid header line: "},
    };
    for (const Case& each : cases) {
        SCOPED_TRACE(each.name);
        ASSERT_LE(each.block.size(), 1048576u);
        const std::string input = ModelWriter::Frame(each.block, "{}");
        std::string words;
        EXPECT_LE(PeakOfReading(input, words), (64u << 10) + 64 * input.size());
        if (each.words != nullptr) {
            EXPECT_EQ(words, each.words);
        } else {
            EXPECT_EQ(words.size(), sizeof("Invalid header line: ") - 1 + each.block.size() - 26 - 2);
        }
        EXPECT_TRUE(ByLibrary(input) == ByModel(input));
        // What is read can be written: with spaces behind the colons it may be too large for that.
        RoxString error;
        const ref<OrvoRpcWrapper> wrapper = OrvoRpcV2::UnmarshalFromString(&pool, Text(input), false, error);
        if (wrapper != nullptr) {
            std::string expected;
            std::string expectedWords;
            if (!ModelWriter::Write(Look(*wrapper), expected, expectedWords)) expected = expectedWords;
            EXPECT_TRUE(Written(wrapper) == expected);
        }
    }
}

/// 5 MiB that are nothing or nothing much, whole and from the packetizer's side.
TEST_F(FramingHostileTest, GarbageOfFiveMebibytes) {
    constexpr size_t n = 5 << 20;
    std::string headers;
    // 218,454 times 24 bytes, of which a block holds 43,690 times and a bit.
    while (headers.size() < n) headers += "RpcId: 7\r\nType: cancel\r\n";
    struct Case {
        std::string input;
        const char* words;  ///< of the unmarshaller
    };
    const Case cases[] = {
        {std::string(n, 'x'), "Missing rpcId"},
        {std::string(n, '\r'), "Missing rpcId"},
        {std::string(n, ' ') + "\r\n", "First line does not have expected number of fields (3)"},
        {std::string(n, ' ') + "ORPC/2 0 0\r\n", "Missing rpcId"},
        {"ORPC/2 " + std::string(n, '0') + " 0\r\n", "Missing rpcId"},
        {"ORPC/2 " + std::string(n, '9') + " 0\r\n", "Declared header length too long"},
        {"ORPC/2 -" + std::string(n, '9') + " 0\r\n", "Declared header length too long"},
        {"ORPC/2" + std::string(n, ' ') + "0 0\r\n",
         "First line does not have expected number of fields (3)"},
        {headers, "First line does not have expected number of fields (3)"},
        {"ORPC/2 1048576 0\r\n" + headers, "Too many header lines"},
        {"ORPC/2 1048576 5242880\r\n" + headers, "Size of body (4194320) does not match expected (5242880)"},
        {"ORPC/2 1048576 0\r\n" + std::string(n, '\xC3'), "Missing rpcId"},
    };
    for (const Case& each : cases) {
        SCOPED_TRACE(each.input.substr(0, 40));
        std::string words;
        const size_t nPeak = PeakOfReading(each.input, words);
        EXPECT_LE(nPeak, (64u << 10) + 64 * std::min<size_t>(each.input.size(), 1 << 20));
        EXPECT_TRUE(ByLibrary(each.input) == ByModel(each.input));
        EXPECT_EQ(words, each.words);
        unsigned length = 0;
        RoxString error;
        ModelPacketizer model;
        model.Update(each.input);
        EXPECT_EQ(OrvoRpcV2::IsCompleteString(&pool, Text(each.input), length, error), model.isComplete);
        EXPECT_EQ(length, model.isComplete ? model.length : 0);
        EXPECT_EQ(Str(error), model.lastError);
    }
}

}  // namespace sorntest
