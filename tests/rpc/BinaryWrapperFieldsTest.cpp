// The fields of requests and responses of the older form: numbers, values, order, bodies.

#include <algorithm>
#include <numeric>
#include <string>
#include <vector>

#include "rpc/BinaryWrapperFixture.h"

namespace sorntest {

class BinaryWrapperFieldsTest : public BinaryWrapperFixture {};

// An empty value behind each tag: a length or a number.
TEST_F(BinaryWrapperFieldsTest, FieldNumbers) {
    const char* const noBody = " body=error 3: ";
    struct Row {
        uint32_t number;
        std::string request;
        std::string response;
    };
    const std::string request = Line("request monitor=0 rpcId=0 version=0 partner=- forget=-");
    const std::string response = Line("response final=0 rpcId=0");
    const Row vRows[] = {
        {0, badG, badG},
        {1, request, response},
        {2,
         std::string("request monitor=0 rpcId=0 version=0 partner=- forget=-") + noBody +
             "request did not unmarshal",
         std::string("response final=0 rpcId=0") + noBody + "response did not unmarshal"},
        {3, request, response},
        {4, request, badG},
        {5, Line("request monitor=0 rpcId=0 version=0 partner=0 forget=-"), badG},
        {6, Line("request monitor=0 rpcId=0 version=0 partner=- forget=0"), badG},
        {7, badG, badG},
        {8, badG, badG},
        {9, badG, badG},
        {15, badG, badG},
        {16, badG, badG},
        {17, badG, badG},
        {256 + 3, badG, badG},
        {65536 + 3, badG, badG},
        {(1u << 28) + 3, badG, badG},
        {(1u << 29) - 1, badG, badG},
    };
    for (const Row& row : vRows) {
        for (unsigned wireType = 0; wireType < 8; ++wireType) {  // it does not count
            const std::string fields =
                Bytes(emptyBodyFieldG) + Varint(uint64_t{row.number} * 8 + wireType) + std::string(1, '\0');
            EXPECT_EQ(Read(Message(requestTagG, fields)), row.request) << row.number << " " << wireType;
            EXPECT_EQ(Read(Message(responseTagG, fields)), row.response) << row.number << " " << wireType;
        }
    }
    // Tags of more bytes than needed, up to five; bits above 32 are lost.
    const std::string body = emptyBodyFieldG;
    EXPECT_EQ(Request(body + "98 80 80 80 00 0A"),
              Line("request monitor=0 rpcId=5 version=0 partner=- forget=-"));
    EXPECT_EQ(Request(body + "98 80 80 80 10 0A"),
              Line("request monitor=0 rpcId=5 version=0 partner=- forget=-"));
    EXPECT_EQ(Request(body + "98 80 80 80 80 00 0A"), badG);
    EXPECT_EQ(Request(body + "98"), badG);
}

// Headers are the ordinary writer's, but this reader refuses them.
TEST_F(BinaryWrapperFieldsTest, HeadersAreRefused) {
    const std::string body = emptyBodyFieldG;
    EXPECT_EQ(Request(body + "3A 00"), badG);
    EXPECT_EQ(Request(body + "3A 0A 22 08 32 01 41 42 03 12 01 31"), badG);
    EXPECT_EQ(Response(body + "2A 00"), badG);
    EXPECT_EQ(Response(body + "20 34"), badG);
}

TEST_F(BinaryWrapperFieldsTest, Values) {
    struct Row {
        const char* hex;
        const char* line;  // null: refused
    };
    const Row vRows[] = {
        {"08 00", "request monitor=0 rpcId=0 version=0 partner=- forget=-"},
        {"08 01", "request monitor=1 rpcId=0 version=0 partner=- forget=-"},
        {"08 81 00", "request monitor=1 rpcId=0 version=0 partner=- forget=-"},
        {"08 02", nullptr},
        {"08 80 02", nullptr},  // 256
        {"08", nullptr},
        {"18 01", "request monitor=0 rpcId=-1 version=0 partner=- forget=-"},
        {"18 FE FF FF FF 0F", "request monitor=0 rpcId=2147483647 version=0 partner=- forget=-"},
        {"18 FF FF FF FF 0F", "request monitor=0 rpcId=-2147483648 version=0 partner=- forget=-"},
        {"18 FF FF FF FF 1F", "request monitor=0 rpcId=-2147483648 version=0 partner=- forget=-"},
        {"18 FF FF FF FF 8F 00", nullptr},
        {"18 80", nullptr},
        {"20 54", "request monitor=0 rpcId=0 version=42 partner=- forget=-"},
        {"20 01", "request monitor=0 rpcId=0 version=-1 partner=- forget=-"},
        {"20", nullptr},
        {"28 00", "request monitor=0 rpcId=0 version=0 partner=0 forget=-"},
        {"28 FF FF FF FF 0F", "request monitor=0 rpcId=0 version=0 partner=4294967295 forget=-"},
        {"28 87 80 80 80 10", "request monitor=0 rpcId=0 version=0 partner=7 forget=-"},  // 2^32 + 7
        {"28 FF FF FF FF FF FF FF FF FF 01",
         "request monitor=0 rpcId=0 version=0 partner=4294967295 forget=-"},  // 2^64 - 1
        {"28 80 80 80 80 80 80 80 80 80 80 00", nullptr},                     // eleven bytes
        {"28 80 80 80 80 80", nullptr},
        {"30 00", "request monitor=0 rpcId=0 version=0 partner=- forget=0"},
        {"30 01", "request monitor=0 rpcId=0 version=0 partner=- forget=1"},
        {"30 02", nullptr},
        {"30", nullptr},
    };
    for (const Row& row : vRows) {
        const std::string line = row.line == nullptr ? badG : Line(row.line);
        EXPECT_EQ(Request(std::string(emptyBodyFieldG) + row.hex), line) << row.hex;
    }
    EXPECT_EQ(Response(std::string(emptyBodyFieldG) + "08 02"), badG);
    EXPECT_EQ(Response(std::string(emptyBodyFieldG) + "18 FF FF FF FF 0F"),
              Line("response final=0 rpcId=-2147483648"));
}

TEST_F(BinaryWrapperFieldsTest, FieldsInAnyOrder) {
    const std::string vFields[] = {"08 01 ", emptyBodyFieldG, "18 0A ", "20 34 ", "28 07 ", "30 01 "};
    std::vector<unsigned> order(6);
    std::iota(order.begin(), order.end(), 0u);
    unsigned nOrders = 0;
    do {
        std::string hex;
        std::string ofResponse;
        for (const unsigned i : order) hex += vFields[i];
        for (const unsigned i : order) ofResponse += i < 3 ? vFields[i] : "";
        ASSERT_EQ(Request(hex), Line("request monitor=1 rpcId=5 version=26 partner=7 forget=1")) << hex;
        ASSERT_EQ(Response(ofResponse), Line("response final=1 rpcId=5")) << ofResponse;
        ++nOrders;
    } while (std::next_permutation(order.begin(), order.end()));
    EXPECT_EQ(nOrders, 720u);
}

TEST_F(BinaryWrapperFieldsTest, OfAFieldThatComesTwiceTheLastValueStays) {
    const std::string first = "08 01 12 02 00 00 18 0A 20 34 28 07 30 01 ";
    const std::string second = std::string("08 00 18 06 20 18 28 09 30 00 ") + emptyBodyFieldG;
    EXPECT_EQ(Request(first + second), Line("request monitor=0 rpcId=3 version=12 partner=9 forget=0"));
    EXPECT_EQ(Response("08 01 12 02 00 00 18 0A 08 00 18 06 " + std::string(emptyBodyFieldG)),
              Line("response final=0 rpcId=3"));
    // A later body that is bad counts, too; so does a later value that is.
    EXPECT_EQ(
        Request(std::string(emptyBodyFieldG) + "12 00"),
        "request monitor=0 rpcId=0 version=0 partner=- forget=- body=error 3: request did not unmarshal");
    EXPECT_EQ(Request(std::string(emptyBodyFieldG) + "08 01 08 02"), badG);
}

TEST_F(BinaryWrapperFieldsTest, WithoutABody) {
    EXPECT_EQ(Request(""), badG);
    EXPECT_EQ(Request("08 01 18 0A 20 34 28 07 30 01"), badG);
    EXPECT_EQ(Response(""), badG);
    EXPECT_EQ(Response("08 01 18 0A"), badG);
}

TEST_F(BinaryWrapperFieldsTest, Bodies) {
    struct Row {
        const char* hex;
        const char* body;  // null: it did not unmarshal; "bad": nor did the message
    };
    const Row vRows[] = {
        {"12 04 FA F1 02 00", emptyBodyJsonG},
        {"12 09 FA F1 02 05 32 01 78 38 03", bodyJsonG},
        {"12 06 FA F1 02 00 FF FF", emptyBodyJsonG},  // bytes behind the value
        {"12 05 FA F1 02 00 08", emptyBodyJsonG},
        {"12 00", nullptr},
        {"12 01 00", nullptr},
        {"12 03 FA F1 02", nullptr},     // no length
        {"12 04 FA F1 02 01", nullptr},  // one byte too few
        {"12 04 FA F1 02 80", nullptr},
        {"12 08 FA F1 02 80 80 80 80 08", nullptr},  // 2^31 bytes
        {"12 08 FA F1 02 FF FF FF FF 0F", nullptr},  // 2^32 - 1 bytes
        {"12 02 0A 00", nullptr},                    // struct 1, which is none
        {"12 04 82 F2 80 02", nullptr},              // no length either: a tag of four bytes
        {"12 05 82 F2 80 02 00", nullptr},           // a struct behind the table
        {"12 06 FA FF FF FF 0F 00", nullptr},        // 2^29 - 1
        {"12 06 FA F1 02 02 32 05", nullptr},        // a text that ends too soon
        {"12 7B", "bad"},
        {"12 05 FA F1 02 00", "bad"},
        {"12", "bad"},
        {"12 80", "bad"},
        {"12 80 80 80 80 08 FA F1 02 00", "bad"},
        {"12 FF FF FF FF 0F FA F1 02 00", "bad"},
    };
    for (const Row& row : vRows) {
        const std::string kind = row.body == nullptr ? "" : row.body;
        for (const bool isFirst : {false, true}) {
            if (isFirst && kind == "bad") continue;  // it would take what follows for its own
            const std::string fields =
                isFirst ? row.hex + std::string(" 18 0A") : std::string("18 0A ") + row.hex;
            std::string request = "request monitor=0 rpcId=5 version=0 partner=- forget=- body=";
            std::string response = "response final=0 rpcId=5 body=";
            request += row.body == nullptr ? "error 3: request did not unmarshal" : kind;
            response += row.body == nullptr ? "error 3: response did not unmarshal" : kind;
            EXPECT_EQ(Request(fields), kind == "bad" ? badG : request) << fields;
            EXPECT_EQ(Response(fields), kind == "bad" ? badG : response) << fields;
        }
    }
}

}  // namespace sorntest
