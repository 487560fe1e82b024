// Messages of the older form, read from bytes worked out by hand.

#include <string>

#include "rpc/BinaryWrapperFixture.h"

namespace sorntest {

using namespace sorn;

class BinaryWrapperTest : public BinaryWrapperFixture {};

TEST_F(BinaryWrapperTest, WholeMessages) {
    const std::string body = std::string(" body=") + bodyJsonG;
    const std::string b = bodyG;
    struct Row {
        std::string hex;
        std::string line;
    };
    const Row vRows[] = {
        // 08 1, 12 the body, 18 zigzag of 5, 20 zigzag of 26: 2 + 11 + 2 + 2 bytes.
        {"FA 3C 11 08 01 12 09 " + b + "18 0A 20 34",
         "request monitor=1 rpcId=5 version=26 partner=- forget=-" + body},
        // And 28 150, 30 1: 5 bytes more.
        {"FA 3C 16 08 00 12 09 " + b + "18 0A 20 34 28 96 01 30 01",
         "request monitor=0 rpcId=5 version=26 partner=150 forget=1" + body},
        {"82 3D 0F 08 01 12 09 " + b + "18 0A", "response final=1 rpcId=5" + body},
        // Nothing but a body: defaults.
        {"FA 3C 06 12 04 FA F1 02 00", Line("request monitor=0 rpcId=0 version=0 partner=- forget=-")},
        {"82 3D 06 12 04 FA F1 02 00", Line("response final=0 rpcId=0")},
        {"F2 3C 02 08 0A", R"({"rpcId": 5, "type": "orvoRpcCancel"})"},
        {"F2 3C 00", R"({"rpcId": 0, "type": "orvoRpcCancel"})"},
        // Headers: 12, length; one entry 22, length; name 32 "A"; value 42, length; text 12 "1".
        {"F2 3C 0E 08 0A 12 0A 22 08 32 01 41 42 03 12 01 31",
         R"({"headers": {"A": "1"}, "rpcId": 5, "type": "orvoRpcCancel"})"},
    };
    for (const Row& row : vRows) EXPECT_EQ(ReadHex(row.hex), row.line) << row.hex;
}

TEST_F(BinaryWrapperTest, Hello) {
    const ExactBytes bytes(Bytes("CA 5A 03 0A 01 61"));
    const ref<SornObject> object = Codec().UnmarshalWrapper(bytes.Begin(), bytes.Size());
    ASSERT_EQ(object->structId, sornschema::OrvoRpcHello::structIdG);
    const auto& hello = static_cast<const sornschema::OrvoRpcHello&>(*object);
    ASSERT_EQ(hello.identity.GetCount(), 1u);
    EXPECT_EQ(Text(hello.identity[0]), "a");
    EXPECT_EQ(ReadHex("CA 5A 00"), R"({"type": "orvoRpcHello"})");
}

TEST_F(BinaryWrapperTest, ErrorsAreWholeRecords) {
    const ExactBytes bytes(Bytes("07"));
    const ref<SornObject> object = Codec().UnmarshalWrapper(bytes.Begin(), bytes.Size());
    EXPECT_EQ(object->GetMempool(), &pool);
    EXPECT_EQ(Text(object->ToString(false, 0)),
              R"({"code": "badArgument", "text": "bad object type: 0", "type": "error"})");
}

TEST_F(BinaryWrapperTest, Starts) {
    struct Row {
        const char* hex;
        const char* line;
    };
    const char* const noNumber = "error 3: does not start with valid int";
    const Row vRows[] = {
        {"", noNumber},
        {"80", noNumber},
        {"FA", noNumber},
        {"FF FF FF FF", noNumber},
        {"FA BC 80 80 80 00", noNumber},  // six bytes
        {"00", "error 3: bad object type: 0"},
        {"07", "error 3: bad object type: 0"},
        {"08", "error 3: bad object type: 1"},
        {"F2 8B 01", "error 3: bad object type: 2238"},  // 2238 * 8 + 2 = 17906
        {"F2 8B 01 02 18 0A", "error 3: bad object type: 2238"},
        {"D2 15 00", "error 3: bad object type: 346"},   // an error itself: 346 * 8 + 2 = 2770
        {"EF 3C 00", "error 3: bad object type: 973"},   // 973 * 8 + 7 = 7791
        {"88 3D 00", "error 3: bad object type: 977"},   // 977 * 8 = 7816
        {"C7 5A 00", "error 3: bad object type: 1448"},  // 1448 * 8 + 7 = 11591
        {"D0 5A 00", "error 3: bad object type: 1450"},  // 1450 * 8 = 11600
        {"FF FF FF FF 0F", "error 3: bad object type: 536870911"},
        {"FF FF FF FF FF", noNumber},
    };
    for (const Row& row : vRows) EXPECT_EQ(ReadHex(row.hex), row.line) << row.hex;
    EXPECT_EQ(Shown(Codec().UnmarshalWrapper(nullptr, 0)), noNumber);
    const ExactBytes cancel(Bytes("F2 3C 02 08 0A"));
    EXPECT_EQ(Shown(Codec().UnmarshalWrapper(cancel.Begin(), -1)), noNumber);
}

// The low three bits of the first tag do not count, nor zeros above it, nor bits above 32.
TEST_F(BinaryWrapperTest, FormsOfTheFirstTag) {
    struct Row {
        unsigned structId;
        const char* rest;
        std::string line;
    };
    const Row vRows[] = {
        {974, "02 08 0A", R"({"rpcId": 5, "type": "orvoRpcCancel"})"},
        {975, "06 12 04 FA F1 02 00", Line("request monitor=0 rpcId=0 version=0 partner=- forget=-")},
        {976, "06 12 04 FA F1 02 00", Line("response final=0 rpcId=0")},
        {1449, "00", R"({"type": "orvoRpcHello"})"},
    };
    for (const Row& row : vRows) {
        for (unsigned bits = 0; bits < 8; ++bits) {
            const std::string tag = Varint(row.structId * 8 + bits);
            ASSERT_EQ(tag.size(), 2u);
            EXPECT_EQ(Read(tag + Bytes(row.rest)), row.line);
            const std::string open = tag.substr(0, 1) + static_cast<char>(tag[1] | '\x80');
            for (const char* end : {"00", "80 00", "80 80 00", "80 80 10"}) {
                EXPECT_EQ(Read(open + Bytes(end) + Bytes(row.rest)), row.line) << row.structId << " " << end;
            }
        }
    }
}

TEST_F(BinaryWrapperTest, Lengths) {
    struct Row {
        const char* hex;
        const char* line;
    };
    for (const std::string tag : {requestTagG, responseTagG}) {
        const std::string good = tag == requestTagG
                                     ? Line("request monitor=0 rpcId=0 version=0 partner=- forget=-")
                                     : Line("response final=0 rpcId=0");
        const Row vRows[] = {
            {"", badG},
            {"80", badG},
            {"86 80 80 80 80 00 12 04 FA F1 02 00", badG},  // six bytes
            {"00", badG},                                   // a length, but no body
            {"00 12 04 FA F1 02 00", badLengthG},
            {"05 12 04 FA F1 02 00", badLengthG},
            {"06 12 04 FA F1 02 00", nullptr},
            {"86 80 00 12 04 FA F1 02 00", nullptr},
            {"86 80 80 80 10 12 04 FA F1 02 00", nullptr},  // 2^32 more, which is lost
            {"07 12 04 FA F1 02 00", badLengthG},
            {"06 12 04 FA F1 02 00 00", badLengthG},
            {"06 12 04 FA F1 02", badLengthG},
            {"01", badLengthG},
            {"80 80 80 80 08 12 04 FA F1 02 00", badLengthG},  // 2^31
            {"86 80 80 80 08 12 04 FA F1 02 00", badLengthG},  // and 6
            {"FF FF FF FF 07 12 04 FA F1 02 00", badLengthG},  // 2^31 - 1
            {"FF FF FF FF 0F 12 04 FA F1 02 00", badLengthG},  // 2^32 - 1
            {"FA FF FF FF 0F 12 04 FA F1 02 00", badLengthG},  // 2^32 - 6
        };
        for (const Row& row : vRows) {
            EXPECT_EQ(ReadHex(tag + row.hex), row.line == nullptr ? good : row.line) << tag << row.hex;
        }
    }
    for (const char* hex : {"F2 3C", "F2 3C 01 08 0A", "F2 3C 03 08 0A", "F2 3C 02 08 0A 00", "F2 3C 01 08",
                            "F2 3C 02 08", "CA 5A 80", "CA 5A 02 0A 05", "CA 5A 01 0A 00",
                            "F2 3C FF FF FF FF 0F 08 0A", "F2 3C 80 80 80 80 08 08 0A"}) {
        EXPECT_EQ(ReadHex(hex), "error 3: failed to unmarshal") << hex;
    }
}

// The body of a message is decoded at once; that of a message inside it is not.
TEST_F(BinaryWrapperTest, AMessageAsTheBody) {
    const std::string inner = Message(requestTagG, Bytes(std::string(emptyBodyFieldG) + "18 06"));
    const ExactBytes bytes(Message(requestTagG, Bytes("18 0A 12") + Section(inner)));
    const ref<SornObject> object = Codec().UnmarshalWrapper(bytes.Begin(), bytes.Size());
    ASSERT_EQ(object->structId, 975u);
    const ref<LazyDict> body = static_cast<const sornschema::OrvoRpcRequest&>(*object).request;
    ASSERT_EQ(body->GetRep(), LazyDict::REP_OBJECT);
    ASSERT_EQ(body->GetStoredObject()->structId, 975u);
    const auto& within = static_cast<const sornschema::OrvoRpcRequest&>(*body->GetStoredObject());
    EXPECT_EQ(within.rpcId, 3);
    EXPECT_EQ(within.request->GetRep(), LazyDict::REP_PROTOBUF);
    EXPECT_EQ(Hex(*within.request->GetStoredBytes()), "FA F1 02 00");
    EXPECT_EQ(body->GetMempool(), &pool);
}

// The other kinds are read as any record is: what they do not know is told and skipped.
TEST_F(BinaryWrapperTest, UnknownFieldsOfCancelsAndGreetings) {
    struct Row {
        const char* hex;
        const char* line;
        const char* told;
    };
    const Row vRows[] = {
        {"F2 3C 04 08 0A 18 01", R"({"rpcId": 5, "type": "orvoRpcCancel"})",
         "field number '3' out of range in 'orvoRpcCancel'\n"},
        {"F2 3C 06 00 01 08 0A 00 05", R"({"rpcId": 5, "type": "orvoRpcCancel"})",
         "field number '0' undefined in 'orvoRpcCancel'\nfield number '0' undefined in 'orvoRpcCancel'\n"},
        {"CA 5A 04 12 02 61 62", R"({"type": "orvoRpcHello"})",
         "field number '2' out of range in 'orvoRpcHello'\n"},
        {"CA 5A 01 1D", "error 3: failed to unmarshal", "field number '3' out of range in 'orvoRpcHello'\n"},
    };
    for (const Row& row : vRows) {
        testing::internal::CaptureStdout();
        const std::string line = ReadHex(row.hex);
        EXPECT_EQ(testing::internal::GetCapturedStdout(), row.told) << row.hex;
        EXPECT_EQ(line, row.line) << row.hex;
    }
    // Requests and responses tell nothing.
    testing::internal::CaptureStdout();
    EXPECT_EQ(Request(std::string(emptyBodyFieldG) + "40 01"), badG);
    EXPECT_EQ(testing::internal::GetCapturedStdout(), "");
}

// The two readers begin behind the struct's tag.
TEST_F(BinaryWrapperTest, BehindTheTag) {
    const ExactBytes bytes(Bytes("08 12 04 FA F1 02 00 18 0A"));
    const unsigned char* cursor = bytes.Begin();
    EXPECT_EQ(Shown(Codec().UnmarshalRequestWrapper(&cursor, bytes.End())),
              Line("request monitor=0 rpcId=5 version=0 partner=- forget=-"));
    EXPECT_EQ(cursor, bytes.End());
    cursor = bytes.Begin();
    EXPECT_EQ(Shown(Codec().UnmarshalResponseWrapper(&cursor, bytes.End())),
              Line("response final=0 rpcId=5"));
    EXPECT_EQ(cursor, bytes.End());
    cursor = bytes.End();
    EXPECT_EQ(Shown(Codec().UnmarshalRequestWrapper(&cursor, bytes.End())), badG);
    cursor = bytes.End();
    EXPECT_EQ(Shown(Codec().UnmarshalResponseWrapper(&cursor, bytes.End())), badG);
}

}  // namespace sorntest
