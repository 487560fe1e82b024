// Random messages, whole and damaged, through the library and the model of the test tree. Invariants for
// untrusted input: 1, 2, 9, 13, 14.

#include <gtest/gtest.h>

#include <set>

#include "kelbaselib/InMemoryBytestream.h"
#include "rpc/FramingFixture.h"
#include "rpc/ModelPacketizer.h"
#include "rpc/ModelRandom.h"
#include "rpc/ModelWriter.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/rpc/OrvoRpcV2Packetizer.h"

namespace sorntest {

using namespace sorn;

class FramingModelTest : public FramingFixture {
 protected:
    /// The words of a refusal without what follows the first quote, brace or colon in them.
    static std::string Kind(const std::string& answer) {
        if (answer.compare(0, 9, "refused: ") != 0) return "read";
        std::string words = answer.substr(9);
        if (words.compare(0, 7, "Missing") == 0 || words.compare(0, 8, "'cancel'") == 0) return words;
        return words.substr(0, words.find_first_of(words[0] == 'S' || words[0] == 'U' ? "('" : ":('"));
    }
    /// The packetizer and IsCompleteString on the pieces of a text, against the model.
    void ComparePacketizers(const std::string& bytes, ModelRandom& random) {
        OrvoRpcV2Packetizer byText(&pool);
        OrvoRpcV2Packetizer byBytes(&pool);
        ModelPacketizer model;
        for (size_t n = 0; n <= bytes.size(); n += 1 + random.Below(30)) {
            const std::string input = bytes.substr(0, n);
            byText.UpdateInput(Text(input));
            byBytes.UpdateInputBytestring(
                rox::ByteBuffer::New(&pool, input.data(), static_cast<uint32_t>(n)));
            model.Update(input);
            Compare(byText, model);
            Compare(byBytes, model);
        }
        ModelPacketizer whole;
        whole.Update(bytes);
        unsigned length = 123;
        RoxString error("before");
        EXPECT_EQ(OrvoRpcV2::IsCompleteString(&pool, Text(bytes), length, error), whole.isComplete);
        EXPECT_EQ(length, whole.isComplete ? whole.length : 123);
        EXPECT_EQ(Str(error), whole.isComplete ? whole.lastError : "before");
    }
    static void Compare(const OrvoRpcV2Packetizer& packetizer, const ModelPacketizer& model) {
        EXPECT_EQ(packetizer.firstLineParsed, model.isLineRead);
        EXPECT_EQ(packetizer.complete, model.isComplete);
        EXPECT_EQ(packetizer.headerLength, model.line.headerLength);
        EXPECT_EQ(packetizer.bodyLength, model.line.bodyLength);
        EXPECT_EQ(packetizer.firstLineLength, model.line.length);
        EXPECT_EQ(packetizer.packetLength, model.length);
        EXPECT_EQ(packetizer.GetPacketLength(), model.isComplete ? model.length : 0);
        EXPECT_EQ(Str(packetizer.lastError), model.lastError);
    }
};

TEST_F(FramingModelTest, MessagesAreWrittenAsByTheModel) {
    ModelRandom random(1);
    std::set<std::string> kinds;
    for (unsigned n = 0; n < 5000; ++n) {
        const ModelMessage message = random.Message();
        kinds.insert(message.kind);
        std::string expected;
        std::string words;
        ASSERT_TRUE(ModelWriter::Write(message, expected, words));
        const ref<OrvoRpcWrapper> wrapper = Wrap(message);
        ASSERT_EQ(Written(wrapper), expected);

        RoxString text;
        RoxString error;
        ASSERT_TRUE(OrvoRpcV2::MarshalToString(wrapper, text, error, &pool, false));
        ASSERT_EQ(Str(text), expected);
        ASSERT_EQ(Str(OrvoRpcV2::MarshalToString(&pool, wrapper, false)), expected);
        kelbaselib::InMemoryBytestream sink(&pool);
        ASSERT_TRUE(OrvoRpcV2::MarshalToBytesink(wrapper, sink, error, &pool, false));
        ASSERT_EQ(std::string(reinterpret_cast<const char*>(sink.GetData()), sink.GetLength()), expected);
        ASSERT_TRUE(error.FEmpty());

        ASSERT_EQ(ByLibrary(expected), ByModel(expected));
    }
    EXPECT_EQ(kinds, (std::set<std::string>{"cancel", "request", "requestUpdate", "response"}));
}

TEST_F(FramingModelTest, DamagedMessagesAreReadAsByTheModel) {
    ModelRandom random(2);
    std::set<std::string> seen;
    for (unsigned n = 0; n < 30000; ++n) {
        const ModelMessage message = random.Message();
        const std::string bytes = random.DamagedMessage(ModelWriter::HeaderBlock(message), message.body);
        const bool isBodyParsed = random.Chance(30);
        const char* const before = random.Chance(20) ? "before" : "";
        const std::string expected = ByModel(bytes, isBodyParsed, before);
        ASSERT_EQ(ByLibrary(bytes, isBodyParsed, before), expected) << bytes;
        seen.insert(Kind(expected));
    }
    // The damage reaches every answer but those that take a million bytes.
    for (const char* kind : {"read",
                             "First line does not have expected number of fields ",
                             "First line of message does not start with ",
                             "Invalid header length - not a number",
                             "Declared header length too long",
                             "Invalid body length - not a number",
                             "Declared body length too long",
                             "Size of header ",
                             "Size of body ",
                             "Invalid header line",
                             "beforeInvalid header line",
                             "Missing rpcId",
                             "Unsupported Content-Type: ",
                             "Missing ResponseCount in request",
                             "Invalid value for ResponseCount header",
                             "Missing RequestType in request",
                             "Missing RequestType header.",
                             "Missing message body",
                             "Cannot convert JSON to Dict",
                             "'cancel' should not have a body",
                             "Missing 'Type' header",
                             "Error in unmarshalling "}) {
        EXPECT_EQ(seen.count(kind), 1u) << kind;
    }
}

/// What both read is written by both alike, and read again it is the same.
TEST_F(FramingModelTest, WhatIsReadIsWrittenAgain) {
    ModelRandom random(3);
    unsigned nRead = 0;
    for (unsigned n = 0; n < 10000; ++n) {
        const ModelMessage message = random.Message();
        const std::string bytes = random.DamagedMessage(ModelWriter::HeaderBlock(message), message.body);
        RoxString error;
        const ref<OrvoRpcWrapper> wrapper = OrvoRpcV2::UnmarshalFromString(&pool, Text(bytes), false, error);
        if (wrapper == nullptr) continue;
        const ModelMessage read = Look(*wrapper);
        // Text that opens with anything but a blank or a brace is no lazy text: its conversion is its own.
        if (!read.body.empty() && read.body[0] != ' ' && read.body[0] != '{') continue;
        ++nRead;
        std::string expected;
        std::string words;
        ASSERT_TRUE(ModelWriter::Write(read, expected, words));
        ASSERT_EQ(Written(wrapper), expected);
    }
    EXPECT_GT(nRead, 1000u);
}

TEST_F(FramingModelTest, PacketizersAgreeWithTheModel) {
    ModelRandom random(4);
    for (unsigned n = 0; n < 5000; ++n) {
        const ModelMessage message = random.Message();
        const std::string bytes = random.Chance(50)
                                      ? random.DamagedMessage(ModelWriter::HeaderBlock(message), message.body)
                                      : random.Damaged("ORPC/2 26 0\r\nRpcId: 7\r\nType: cancel\r\n\r\n");
        ComparePacketizers(bytes, random);
        ASSERT_FALSE(HasFailure()) << bytes;
    }
}

}  // namespace sorntest
