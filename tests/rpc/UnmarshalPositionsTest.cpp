// Where the header block and the body begin and end: lengths are bytes, looked for as characters, and checked
// as bytes. Invariants for untrusted input: 1, 2.

#include <gtest/gtest.h>

#include "rpc/FramingFixture.h"
#include "rpc/ModelWriter.h"

namespace sorntest {

using namespace sorn;
using namespace std::string_literals;

class UnmarshalPositionsTest : public FramingFixture {
 protected:
    void Check(const std::string& input, const std::string& expected) {
        SCOPED_TRACE(input.substr(0, 200));
        EXPECT_EQ(ByLibrary(input, false, "before"), expected);
        EXPECT_EQ(ByModel(input, false, "before"), expected);
    }
    /// A response with number 7 and this body.
    static std::string Response(const std::string& body) {
        return Framed({"RpcId: 7", "Type: response"}, body);
    }
    static std::string Read(const std::string& body) {
        return "read: response 7, version 0, body's 0, not final, content ''\n" + body;
    }
};

TEST_F(UnmarshalPositionsTest, WhatStandsBehindTheBodyIsIgnored) {
    const std::string cancel = "ORPC/2 26 0\r\nRpcId: 7\r\nType: cancel\r\n\r\n";
    for (const std::string& behind :
         {""s, "x"s, "\r\n"s, "\0"s, "\xC3\xA9"s, cancel, std::string(100000, '\xFF')}) {
        Check(cancel + behind, "read: cancel 7");
        Check(Response("{}") + behind, Read("{}"));
    }
}

TEST_F(UnmarshalPositionsTest, BodiesOfSeveralBytesToACharacter) {
    const std::string body = "{\"\xC3\xA9\": \xE2\x82\xAC}";
    ASSERT_EQ(body.size(), 11u);  // eight characters, of which one has two bytes and one three
    // Alone the text ends where the body does, and the position stops there.
    Check(Response(body), Read(body));
    // It has eight characters: three more belong to it, as far as there are any.
    Check(Response(body) + "x", "refused: Size of body (12) does not match expected (11)");
    Check(Response(body) + "xy", "refused: Size of body (13) does not match expected (11)");
    Check(Response(body) + "xyz", "refused: Size of body (14) does not match expected (11)");
    Check(Response(body) + "xyz!", "refused: Size of body (14) does not match expected (11)");
    Check(Response(body) + "xy\xC3\xA9!", "refused: Size of body (15) does not match expected (11)");
}

TEST_F(UnmarshalPositionsTest, Characters) {
    struct Case {
        std::string text;
        size_t nCharacters;
    };
    const Case cases[] = {
        {"a", 1},
        {"\x7F", 1},
        {"\0"s, 1},
        {"\xC2\x80", 1},
        {"\xDF\xBF", 1},
        {"\xE0\xA0\x80", 1},
        {"\xED\x9F\xBF", 1},
        {"\xEF\xBF\xBF", 1},
        {"\xF0\x90\x80\x80", 1},
        {"\xF4\x8F\xBF\xBF", 1},
        // Bytes that are part of no character count one by one.
        {"\x80", 1},
        {"\xC3", 1},
        {"\xC0\x80", 2},
        {"\xC1\xBF", 2},
        {"\xE0\x9F\xBF", 3},
        {"\xED\xA0\x80", 3},
        {"\xF0\x8F\xBF\xBF", 4},
        {"\xF4\x90\x80\x80", 4},
        {"\xF5\x80\x80\x80", 4},
        {"\xFF\xFE", 2},
        {"\xE2\x82", 2},
        {"\xC3\xC3\xA9", 2},
        {"\xE2\x82\xC3\xA9", 3},
    };
    for (const Case& each : cases) {
        SCOPED_TRACE(each.text);
        const std::string body = "{" + each.text + "}";
        Check(Response(body), Read(body));
        // Behind it stand more single bytes than the body has too many.
        const size_t nTooMany = each.text.size() - each.nCharacters;
        Check(Response(body) + "xxxxxx",
              nTooMany == 0 ? Read(body)
                            : "refused: Size of body (" + std::to_string(body.size() + nTooMany) +
                                  ") does not match expected (" + std::to_string(body.size()) + ")");
    }
}

TEST_F(UnmarshalPositionsTest, HeadersOfSeveralBytesToACharacter) {
    // 10 + 16 + 7 + 2 bytes are one character less: the block takes one byte of what follows.
    const std::vector<std::string> vLines = {"RpcId: 7", "Type: response", "a: \xC3\xA9"};
    Check(Framed(vLines, "{}"), "refused: Size of header (36) does not match expected (35)");
    Check(Framed({"RpcId: 7", "Type: response", "a: \xE2\x82\xAC\xF0\x9F\x98\x80"}, "{}"),
          "refused: Size of header (42) does not match expected (40)");  // 5 too many, of which there are 2
    // Without anything behind it the position stops at the end.
    Check(Framed({"RpcId: 7", "Type: cancel", "a: \xC3\xA9"}), "read: cancel 7");
    Check(Framed({"RpcId: 7", "Type: cancel", "a: \xC3\xA9"}) + "x",
          "refused: Size of header (34) does not match expected (33)");
    // Bytes that are no characters do no harm.
    Check(Framed({"RpcId: 7", "Type: response", "a: \xE9"}, "{}"),
          "read: response 7, version 0, body's 0, not final, content ''\n'a' = '\xE9'\n{}");
}

/// A length that ends inside a character: the whole character counts.
TEST_F(UnmarshalPositionsTest, LengthsThatCutACharacter) {
    Check("ORPC/2 28 2\r\nRpcId: 7\r\nType: response\r\n\r\n{\xC3\xA9",
          "refused: Size of body (3) does not match expected (2)");
    Check("ORPC/2 28 1\r\nRpcId: 7\r\nType: response\r\n\r\n\xE2\x82\xAC",
          "refused: Size of body (3) does not match expected (1)");
    // The block ends inside a three-byte character.
    Check("ORPC/2 29 2\r\nRpcId: 7\r\nType: response\r\n\r\n\xE2\x82\xAC{}",
          "refused: Size of header (31) does not match expected (29)");
}

/// Each declared length, one off, and the end of the input at each place around.
TEST_F(UnmarshalPositionsTest, LengthsThatAreOff) {
    const std::string block = "RpcId: 7\r\nType: response\r\n\r\n";
    const std::string body = "{\"a\": 1}";
    for (size_t nBlock = 0; nBlock <= block.size() + body.size() + 2; ++nBlock) {
        for (size_t nBody = 0; nBody <= body.size() + 2; ++nBody) {
            const std::string input =
                "ORPC/2 " + std::to_string(nBlock) + " " + std::to_string(nBody) + "\r\n" + block + body;
            const std::string answer = ByLibrary(input);
            EXPECT_EQ(answer, ByModel(input));
            if (nBlock > block.size() + body.size()) {
                EXPECT_EQ(answer, "refused: Size of header (36) does not match expected (" +
                                      std::to_string(nBlock) + ")");
            } else if (nBlock + nBody > block.size() + body.size()) {
                EXPECT_EQ(answer, "refused: Size of body (" + std::to_string(36 - nBlock) +
                                      ") does not match expected (" + std::to_string(nBody) + ")");
            }
        }
    }
}

TEST_F(UnmarshalPositionsTest, TheLargestMessage) {
    // 10 + 16 + 3 + 2 + 2 bytes stand around the value.
    const std::string value(1048576 - 33, 'v');
    const std::string block = "RpcId: 7\r\nType: response\r\na: " + value + "\r\n\r\n";
    ASSERT_EQ(block.size(), 1048576u);
    const std::string body(5242880, ' ');
    const std::string expected =
        "read: response 7, version 0, body's 0, not final, content ''\n'a' = '" + value + "'\n" + body;
    EXPECT_TRUE(ByLibrary(ModelWriter::Frame(block, body)) == expected);
    EXPECT_TRUE(ByLibrary(ModelWriter::Frame(block, body) + "\xE2\x82\xAC") == expected);
    EXPECT_EQ(ByLibrary(ModelWriter::Frame(block, body + " ")), "refused: Declared body length too long");
    EXPECT_EQ(ByLibrary(ModelWriter::Frame("a:\r\n" + block, body)),
              "refused: Declared header length too long");
    const std::string whole = ModelWriter::Frame(block, body);
    EXPECT_EQ(ByLibrary(whole.substr(0, whole.size() - 1)),
              "refused: Size of body (5242879) does not match expected (5242880)");
}

}  // namespace sorntest
