// Every refusal of a message: its words, what they do to words that were there, and which of two faults wins.

#include <gtest/gtest.h>

#include <functional>

#include "rpc/FramingFixture.h"

namespace sorntest {

using namespace sorn;
using namespace std::string_literals;

class UnmarshalWordsTest : public FramingFixture {
 protected:
    /// By the library and by the model.
    void Check(const std::string& input, const std::string& expected, bool isBodyParsed = false,
               const char* before = "before") {
        SCOPED_TRACE(input.substr(0, 300));
        EXPECT_EQ(ByLibrary(input, isBodyParsed, before), expected);
        EXPECT_EQ(ByModel(input, isBodyParsed, before), expected);
    }
};

TEST_F(UnmarshalWordsTest, EveryRefusal) {
    struct Case {
        std::string input;
        const char* words;
    };
    const Case cases[] = {
        // More input is needed: no words.
        {"", "before"},
        {"ORPC/2 26 0", "before"},
        {std::string(25, 'x'), "before"},
        // An overlong line counts as read, with nothing behind it.
        {std::string(26, 'x'), "Missing rpcId"},
        // First lines; another test has their grammar.
        {"ORPC/2 26\r\n", "First line does not have expected number of fields (3)"},
        {"ORPC/1 26 0\r\n", "First line of message does not start with 'ORPC/2'"},
        {"ORPC/2 a 0\r\n", "Invalid header length - not a number"},
        {"ORPC/2 1048577 0\r\n", "Declared header length too long"},
        {"ORPC/2 0 a\r\n", "Invalid body length - not a number"},
        {"ORPC/2 0 5242881\r\n", "Declared body length too long"},
        // Sizes.
        {"ORPC/2 26 0\r\n", "Size of header (0) does not match expected (26)"},
        {"ORPC/2 26 0\r\nRpcId: 7\r\nType: cancel\r\n\r", "Size of header (25) does not match expected (26)"},
        {"ORPC/2 1048576 5242880\r\n", "Size of header (0) does not match expected (1048576)"},
        {"ORPC/2 26 1\r\nRpcId: 7\r\nType: cancel\r\n\r\n", "Size of body (0) does not match expected (1)"},
        {"ORPC/2 26 5\r\nRpcId: 7\r\nType: cancel\r\n\r\n{} }",
         "Size of body (4) does not match expected (5)"},
        {"ORPC/2 0 5242880\r\n{}", "Size of body (2) does not match expected (5242880)"},
        // Lines; these words go behind what was there.
        {Framed({"RpcId"}), "beforeInvalid header line: RpcId"},
        {Framed({"RpcId: 7", "a b", "c d"}), "beforeInvalid header line: a b"},
        {Framed({"RpcId: 7", " "}), "beforeInvalid header line:  "},
        {Framed({"RpcId: 7", "%s%n"}), "beforeInvalid header line: %s%n"},
        {Framed({"RpcId: 7", "a\0b"s}), "beforeInvalid header line: a"},
        {Framed({"RpcId: 7", "\xFF\xC3"}), "beforeInvalid header line: \xFF\xC3"},
        {Framed({"RpcId: 7", "a\nb"}), "beforeInvalid header line: a\nb"},
        {Framed({"RpcId: 7", "a\r"}), "beforeInvalid header line: a\r"},
        // Headers that all kinds have.
        {Framed({}), "Missing rpcId"},
        {Framed({"Type: cancel"}), "Missing rpcId"},
        {Framed({"Type: unheard of"}), "Missing rpcId"},
        {Framed({"rpcid: 7", "RPCID: 7", "RpcId : 7", " RpcId: 7", "Type: cancel"}), "Missing rpcId"},
        {Framed({"RpcId: 7", "Content-Type: text/plain", "Type: cancel"}),
         "Unsupported Content-Type: 'text/plain'"},
        {Framed({"RpcId: 7", "Content-Type: application/json; charset=utf-8", "Type: response"}, "{}"),
         "Unsupported Content-Type: 'application/json; charset=utf-8'"},
        {Framed({"RpcId: 7", "Content-Type: Application/JSON", "Type: response"}, "{}"),
         "Unsupported Content-Type: 'Application/JSON'"},
        {Framed({"RpcId: 7", "Content-Type: %s"}), "Unsupported Content-Type: '%s'"},
        {Framed({"RpcId: 7", "Content-Type: a\0b"s}), "Unsupported Content-Type: 'a'"},
        {Framed({"RpcId: 7", "Content-Type: application/json\0"s}),
         "Unsupported Content-Type: 'application/json'"},
        {Framed({"RpcId: 7"}), "Missing 'Type' header"},
        {Framed({"RpcId: 7", "Type:"}), "Missing 'Type' header"},
        {Framed({"RpcId: 7", "Type: ", "Type: cancel"}), "Missing 'Type' header"},
        {Framed({"RpcId: 7", "type: cancel"}), "Missing 'Type' header"},
        {Framed({"RpcId: 7", "Type: Request"}, "{}"), "Error in unmarshalling : Unknown Type: Request"},
        {Framed({"RpcId: 7", "Type: requestupdate"}), "Error in unmarshalling : Unknown Type: requestupdate"},
        {Framed({"RpcId: 7", "Type: cancel x"}), "Error in unmarshalling : Unknown Type: cancel x"},
        {Framed({"RpcId: 7", "Type: cancel\0"s}), "Error in unmarshalling : Unknown Type: cancel"},
        {Framed({"RpcId: 7", "Type: x", "Type: cancel"}), "Error in unmarshalling : Unknown Type: x"},
        // A request.
        {Framed({"RpcId: 7", "Type: request", "RequestType: t"}, "{}"), "Missing ResponseCount in request"},
        {Framed({"RpcId: 7", "Type: request", "RequestType: t", "ResponseCount:"}, "{}"),
         "Invalid value for ResponseCount header"},
        {Framed({"RpcId: 7", "Type: request", "RequestType: t", "ResponseCount: 1"}, "{}"),
         "Invalid value for ResponseCount header"},
        {Framed({"RpcId: 7", "Type: request", "RequestType: t", "ResponseCount: Single"}, "{}"),
         "Invalid value for ResponseCount header"},
        {Framed({"RpcId: 7", "Type: request", "RequestType: t", "ResponseCount: x", "ResponseCount: none"},
                "{}"),
         "Invalid value for ResponseCount header"},
        {Framed({"RpcId: 7", "Type: request", "ResponseCount: none"}, "{}"),
         "Missing RequestType in request"},
        {Framed({"RpcId: 7", "Type: request", "ResponseCount: none", "RequestType: t"}),
         "Missing message body"},
        // An update; its words about its type differ.
        {Framed({"RpcId: 7", "Type: requestUpdate"}, "{}"), "Missing RequestType header."},
        {Framed({"RpcId: 7", "Type: requestUpdate", "ResponseCount: none"}, "{}"),
         "Missing RequestType header."},
        {Framed({"RpcId: 7", "Type: requestUpdate", "RequestType: t"}), "Missing message body"},
        // A response and a cancel.
        {Framed({"RpcId: 7", "Type: response"}), "Missing message body"},
        {Framed({"RpcId: 7", "Type: response"}, "\0{}"s), "Missing message body"},  // no lazy body opens so
        {Framed({"RpcId: 7", "Type: cancel"}, " "), "'cancel' should not have a body"},
        {Framed({"RpcId: 7", "Type: cancel"}, "\0"s), "'cancel' should not have a body"},
    };
    for (const Case& each : cases) Check(each.input, std::string("refused: ") + each.words);
}

TEST_F(UnmarshalWordsTest, BodiesThatAreReadAtOnce) {
    const std::vector<std::string> vLines = {"RpcId: 7", "Type: response"};
    for (const std::string& body : {"{"s, "[]"s, "{} {"s, "x"s, " "s, "\0{}"s, "{\"a\": {}"s}) {
        const std::string answer = ByLibrary(Framed(vLines, body), true, "before");
        const std::string start = "refused: Cannot convert JSON to Dict: ";
        EXPECT_EQ(answer.substr(0, start.size()), start) << body;
        EXPECT_GT(answer.size(), start.size()) << body;  // the parser's words follow
        EXPECT_EQ(answer, ByModel(Framed(vLines, body), true, "before"));
        // Left as it is, text that opens with a brace is a body, whatever it says.
        if (body[0] == '{') {
            EXPECT_EQ(ByLibrary(Framed(vLines, body)).substr(0, 6), "read: ");
        }
    }
    Check(Framed(vLines), "refused: Missing message body", true);
    Check(Framed({"RpcId: 7", "Type: cancel"}, "{"), "refused: 'cancel' should not have a body", true);
    EXPECT_EQ(ByLibrary(Framed(vLines, "{}"), true).substr(0, 6), "read: ");
}

/// Each pair of faults that one message can have: the one that is looked for first gives the words.
TEST_F(UnmarshalWordsTest, TheFirstOfTwoFaultsWins) {
    struct Draft {
        std::string magic = "ORPC/2";
        std::string headerLength;  ///< empty: the right one
        std::string bodyLength;
        std::vector<std::string> vLines;
        std::string body = "{}";
    };
    struct Fault {
        std::function<void(Draft&)> make;
        std::string words;  ///< how they begin
    };
    const auto drop = [](std::string name) {
        return [name](Draft& draft) {
            std::vector<std::string> vKept;
            for (const std::string& line : draft.vLines) {
                if (line.compare(0, name.size(), name) != 0) vKept.push_back(line);
            }
            draft.vLines = vKept;
        };
    };
    const auto replace = [drop](std::string name, std::string line) {
        return [=](Draft& draft) {
            drop(name)(draft);
            draft.vLines.push_back(line);
        };
    };
    const std::vector<Fault> vAlways = {
        {[](Draft& draft) { draft.magic = "ORPC/2 0"; }, "First line does not have"},
        {[](Draft& draft) { draft.magic = "x"; }, "First line of message"},
        {[](Draft& draft) { draft.headerLength = "x"; }, "Invalid header length"},
        {[](Draft& draft) { draft.headerLength = "1048577"; }, "Declared header length"},
        {[](Draft& draft) { draft.bodyLength = "x"; }, "Invalid body length"},
        {[](Draft& draft) { draft.bodyLength = "5242881"; }, "Declared body length"},
        {[](Draft& draft) { draft.headerLength = "1000000"; }, "Size of header"},
        {[](Draft& draft) { draft.bodyLength = "1000000"; }, "Size of body"},
        {[](Draft& draft) { draft.vLines.push_back("no colon"); }, "Invalid header line: no colon"},
        {drop("RpcId"), "Missing rpcId"},
        {replace("Content-Type", "Content-Type: x"), "Unsupported Content-Type: 'x'"},
    };
    const Fault noBody = {[](Draft& draft) { draft.body = ""; }, "Missing message body"};
    const Fault badJson = {[](Draft& draft) { draft.body = "{"; }, "Cannot convert JSON"};
    struct Kind {
        std::vector<std::string> vLines;
        std::string body;
        std::vector<Fault> vFaults;  ///< in the order in which they are looked for
    };
    const Kind kinds[] = {
        {{"RpcId: 7", "Type: request", "ResponseCount: none", "RequestType: t"},
         "{}",
         {{drop("ResponseCount"), "Missing ResponseCount in request"},
          {replace("ResponseCount", "ResponseCount: x"), "Invalid value for ResponseCount"},
          {drop("RequestType"), "Missing RequestType in request"},
          noBody,
          badJson}},
        {{"RpcId: 7", "Type: requestUpdate", "RequestType: t"},
         "{}",
         {{drop("RequestType"), "Missing RequestType header."}, noBody, badJson}},
        {{"RpcId: 7", "Type: response"}, "{}", {noBody, badJson}},
        {{"RpcId: 7", "Type: cancel"},
         "",
         {{[](Draft& d) { d.body = "{"; }, "'cancel' should not have a body"}}},
        {{"RpcId: 7", "Type: cancel"}, "", {{drop("Type"), "Missing 'Type' header"}}},
        {{"RpcId: 7", "Type: cancel"},
         "",
         {{replace("Type", "Type: x"), "Error in unmarshalling : Unknown Type: x"}}},
    };
    const auto framed = [](const Draft& draft) {
        std::string block;
        for (const std::string& line : draft.vLines) block += line + "\r\n";
        block += "\r\n";
        return draft.magic + " " +
               (draft.headerLength.empty() ? std::to_string(block.size()) : draft.headerLength) + " " +
               (draft.bodyLength.empty() ? std::to_string(draft.body.size()) : draft.bodyLength) + "\r\n" +
               block + draft.body;
    };
    unsigned nPairs = 0;
    for (const Kind& kind : kinds) {
        std::vector<Fault> vFaults = vAlways;
        vFaults.insert(vFaults.end(), kind.vFaults.begin(), kind.vFaults.end());
        Draft good;
        good.vLines = kind.vLines;
        good.body = kind.body;
        EXPECT_EQ(ByLibrary(framed(good), true).substr(0, 6), "read: ");
        for (size_t first = 0; first < vFaults.size(); ++first) {
            for (size_t second = first; second < vFaults.size(); ++second) {
                Draft draft = good;
                vFaults[second].make(draft);
                vFaults[first].make(draft);
                const std::string expected = "refused: " + vFaults[first].words;
                const std::string answer = ByLibrary(framed(draft), true);
                EXPECT_EQ(answer.substr(0, expected.size()), expected) << vFaults[second].words;
                EXPECT_EQ(answer, ByModel(framed(draft), true));
                ++nPairs;
            }
        }
    }
    EXPECT_EQ(nPairs, 16 * 17 / 2 + 14 * 15 / 2 + 13 * 14 / 2 + 3 * 12 * 13 / 2u);
}

/// A fault leaves nothing of a message behind, and success leaves the string for the words alone: the fixture
/// checks both, with the pool and with words that were there before.
TEST_F(UnmarshalWordsTest, SuccessTouchesNoWords) {
    for (const std::string& input :
         {Framed({"RpcId: 7", "Type: cancel"}), Framed({"RpcId: 7", "Type: response"}, "{}"),
          Framed({"RpcId: 7", "Type: requestUpdate", "RequestType: t"}, "{}"),
          Framed({"RpcId: 7", "Type: request", "ResponseCount: none", "RequestType: t"}, "{}")}) {
        for (const bool isBodyParsed : {false, true}) {
            EXPECT_EQ(ByLibrary(input, isBodyParsed, "before").substr(0, 6), "read: ");
        }
    }
}

}  // namespace sorntest
