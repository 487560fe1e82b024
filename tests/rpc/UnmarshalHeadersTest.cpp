// Header lines: their grammar, what each kind makes of them, how many there may be.

#include <gtest/gtest.h>

#include "rpc/FramingFixture.h"
#include "rpc/ModelWriter.h"

namespace sorntest {

using namespace sorn;
using namespace std::string_literals;

class UnmarshalHeadersTest : public FramingFixture {
 protected:
    /// The optional headers of a response that has these lines more.
    ModelHeaders Optional(const std::vector<std::string>& vMore) {
        std::vector<std::string> vLines = {"RpcId: 7", "Type: response"};
        vLines.insert(vLines.end(), vMore.begin(), vMore.end());
        return Message(vLines, "{}").optional;
    }
    /// A message that must be read, by the library and the model alike.
    ModelMessage Message(const std::vector<std::string>& vLines, const std::string& body) {
        return MessageOf(Framed(vLines, body));
    }
    ModelMessage MessageOf(const std::string& input) {
        RoxString error;
        const ref<OrvoRpcWrapper> wrapper = OrvoRpcV2::UnmarshalFromString(&pool, Text(input), false, error);
        EXPECT_TRUE(ByLibrary(input) == ByModel(input)) << input.substr(0, 300);
        EXPECT_NE(wrapper, nullptr) << Str(error) << "\n" << input.substr(0, 300);
        return wrapper == nullptr ? ModelMessage() : Look(*wrapper);
    }
};

TEST_F(UnmarshalHeadersTest, OneLine) {
    struct Case {
        std::string line;
        ModelHeaders expected;
    };
    const Case cases[] = {
        {"Foo:bar", {{"Foo", {"bar"}}}},
        {"Foo: bar", {{"Foo", {"bar"}}}},
        {"Foo:   bar  ", {{"Foo", {"bar"}}}},
        {"Foo:\t\v\f\n bar\n\t\r", {{"Foo", {"bar"}}}},
        {"Foo: two  words ", {{"Foo", {"two  words"}}}},
        {" Foo: bar", {{" Foo", {"bar"}}}},
        {"Foo : bar", {{"Foo ", {"bar"}}}},
        {"Foo:", {{"Foo", {""}}}},
        {"Foo:   ", {{"Foo", {""}}}},
        {":", {{"", {""}}}},
        {": bar", {{"", {"bar"}}}},
        {"::", {{"", {":"}}}},
        {"a:b:c", {{"a", {"b:c"}}}},
        {"a: :b", {{"a", {":b"}}}},
        {"A: a: b", {{"A", {"a: b"}}}},
        {"a\nb: c\nd", {{"a\nb", {"c\nd"}}}},
        {"a\rb: c\rd", {{"a\rb", {"c\rd"}}}},
        {"a\0b: c\0d"s, {{"a\0b"s, {"c\0d"s}}}},
        {"\0: \0"s, {{"\0"s, {"\0"s}}}},
        {"a: \0 "s, {{"a", {"\0"s}}}},
        {"\xFF: \xC3", {{"\xFF", {"\xC3"}}}},
        {"a: \"quoted\\\"", {{"a", {"\"quoted\\\""}}}},
        {"", {}},
    };
    for (const Case& each : cases) {
        SCOPED_TRACE(each.line);
        EXPECT_EQ(Optional({each.line}), each.expected);
        EXPECT_EQ(Optional({"", each.line, "", ""}), each.expected);
    }
}

TEST_F(UnmarshalHeadersTest, Blocks) {
    struct Case {
        std::string block;
        const char* expected;
    };
    const Case cases[] = {
        // Empty lines anywhere; the last one may be missing, and so may the end of the last line.
        {"\r\n\r\nRpcId: 7\r\n\r\n\r\nType: cancel\r\n\r\n\r\n", "read: cancel 7"},
        {"RpcId: 7\r\nType: cancel\r\n", "read: cancel 7"},
        {"RpcId: 7\r\nType: cancel", "read: cancel 7"},
        {"Type: cancel\r\nRpcId: 7", "read: cancel 7"},
        // Without any line end nothing is a line, good or bad.
        {"RpcId: 7", "refused: Missing rpcId"},
        {"no colon", "refused: Missing rpcId"},
        {"", "refused: Missing rpcId"},
        {"\r\n", "refused: Missing rpcId"},
        {"\r\nRpcId: 7", "refused: Missing 'Type' header"},
        // Bare line feeds and carriage returns end none.
        {"RpcId: 7\nType: cancel\n\r\n", "refused: Missing 'Type' header"},
        {"RpcId: 7\rType: cancel\r\r\n", "refused: Missing 'Type' header"},
        {"Type: cancel\n\rRpcId: 7\r\n", "refused: Missing rpcId"},
        // A name that opens with a line feed is another name.
        {"RpcId: 7\r\r\n\nType: cancel\r\n", "refused: Missing 'Type' header"},
    };
    for (const Case& each : cases) {
        const std::string input = ModelWriter::Frame(each.block, "");
        EXPECT_EQ(ByModel(input), ByLibrary(input)) << each.block;
        EXPECT_EQ(ByLibrary(input), each.expected) << each.block;
    }
}

TEST_F(UnmarshalHeadersTest, SeveralValues) {
    EXPECT_EQ(Optional({"a: 1", "b: x", "a: 2", "A: 3", "a:", "a: 1"}),
              (ModelHeaders{{"A", {"3"}}, {"a", {"1", "2", "", "1"}}, {"b", {"x"}}}));
    // Of a reserved name the first value counts, and none is kept.
    const ModelMessage response =
        Message({"RpcId: 7", "RpcId: 8", "Type: response", "Type: cancel", "IsFinal: true", "IsFinal: false",
                 "Content-Type:", "Content-Type: x", "SchemaVersion: 21", "SchemaVersion: 22"},
                "{}");
    EXPECT_EQ(response.Describe(),
              "response 7, version 21, body's 21, final, content ''\n"
              "'SchemaVersion' = '21'\n'SchemaVersion' = '22'\n{}");
    const ModelMessage request =
        Message({"RpcId: x", "RpcId: 8", "Type: request", "ResponseCount: none", "ResponseCount: bad",
                 "RequestType:", "RequestType: t", "SchemaVersion: 9", "SchemaVersion: 22"},
                "{}");
    EXPECT_EQ(request.Describe(), "request 0, version 9, body's 9, of '', none, content ''\n{}");
}

/// What each kind keeps among its optional headers: everything that is not its own.
TEST_F(UnmarshalHeadersTest, ReservedNames) {
    const std::vector<std::string> vAll = {"RpcId: 7",          "RequestType: t",
                                           "SchemaVersion: 42", "ResponseCount: single",
                                           "type: lower",       "Content-Type: application/json",
                                           "IsFinal: true",     "Accept: x",
                                           "rpcid: y",          "REQUESTTYPE: z"};
    const auto with = [&vAll](const std::string& type) {
        std::vector<std::string> vLines = vAll;
        vLines.push_back("Type: " + type);
        return vLines;
    };
    EXPECT_EQ(Message(with("request"), "{}").Describe(),
              "request 7, version 42, body's 42, of 't', single, content 'application/json'\n"
              "'Accept' = 'x'\n'IsFinal' = 'true'\n'REQUESTTYPE' = 'z'\n'rpcid' = 'y'\n{}");
    // An update has many responses and no version, whatever the headers say; its body has.
    EXPECT_EQ(Message(with("requestUpdate"), "{}").Describe(),
              "requestUpdate 7, version 0, body's 42, of 't', multiple, content 'application/json'\n"
              "'Accept' = 'x'\n'IsFinal' = 'true'\n'REQUESTTYPE' = 'z'\n'rpcid' = 'y'\n{}");
    EXPECT_EQ(Message(with("response"), "{}").Describe(),
              "response 7, version 42, body's 42, final, content 'application/json'\n"
              "'Accept' = 'x'\n'REQUESTTYPE' = 'z'\n'RequestType' = 't'\n'ResponseCount' = 'single'\n"
              "'SchemaVersion' = '42'\n'rpcid' = 'y'\n'type' = 'lower'\n{}");
    EXPECT_EQ(Message(with("cancel"), "").Describe(), "cancel 7");
}

/// Numbers are digits and nothing else, up to 32 bits; anything else is 0 and no fault.
TEST_F(UnmarshalHeadersTest, Numbers) {
    struct Case {
        std::string text;
        uint32_t expected;
    };
    const Case cases[] = {
        {"7", 7},
        {"  7  ", 7},
        {"007", 7},
        {"0", 0},
        {"4294967295", 4294967295u},
        {"4294967296", 0},
        {"99999999999", 0},
        {"", 0},
        {"abc", 0},
        {"7a", 0},
        {"-7", 0},
        {"+7", 0},
        {"7 8", 0},
        {"0x7", 0},
        {"7.0", 0},
        {"\xD9", 0},
        {"7\0a"s, 7},
        {"\0007"s, 0},
        {"18446744073709551623", 7},  // 2^64 + 7: 64 bits wrap without notice
    };
    for (const Case& each : cases) {
        SCOPED_TRACE(each.text);
        EXPECT_EQ(Message({"RpcId: " + each.text, "Type: cancel"}, "").rpcId, each.expected);
        const ModelMessage response =
            Message({"RpcId: 1", "Type: response", "SchemaVersion: " + each.text}, "{}");
        EXPECT_EQ(response.version, each.expected);
        EXPECT_EQ(response.bodyVersion, each.expected);
    }
    EXPECT_EQ(Message({"RpcId: 1", "Type: response"}, "{}").version, 0u);
}

TEST_F(UnmarshalHeadersTest, Words) {
    for (const char* text : {"True", "TRUE", "1", "", "false", "true x", "tru"}) {
        EXPECT_FALSE(Message({"RpcId: 1", "Type: response", std::string("IsFinal: ") + text}, "{}").isFinal)
            << text;
    }
    EXPECT_FALSE(Message({"RpcId: 1", "Type: response"}, "{}").isFinal);
    EXPECT_TRUE(Message({"RpcId: 1", "Type:response", "IsFinal:\ttrue "}, "{}").isFinal);
    for (const char* word : {"none", "single", "multiple"}) {
        const ModelMessage request = Message(
            {"RpcId: 1", "Type: request", "RequestType: t\xE9", std::string("ResponseCount: ") + word},
            "{}\n");
        EXPECT_EQ(request.responseCount, word);
        EXPECT_EQ(request.requestType, "t\xE9");
    }
}

TEST_F(UnmarshalHeadersTest, ContentType) {
    struct Case {
        const char* line;
        const char* expected;
    };
    const Case cases[] = {
        {"Content-Type: application/json", "application/json"},
        {"Content-Type:application/json \t", "application/json"},
        {"Content-Type:", ""},
        {"content-type: text/plain", ""},  // another name
        {"", ""},
    };
    for (const Case& each : cases) {
        EXPECT_EQ(Message({"RpcId: 1", "Type: response", each.line}, "{}").contentType, each.expected);
        EXPECT_EQ(
            Message({"RpcId: 1", "Type: request", "ResponseCount: none", "RequestType: t", each.line}, "{}")
                .contentType,
            each.expected);
        EXPECT_EQ(Message({"RpcId: 1", "Type: requestUpdate", "RequestType: t", each.line}, "{}").contentType,
                  each.expected);
        EXPECT_EQ(Message({"RpcId: 1", "Type: cancel", each.line}, "").Describe(), "cancel 1");
    }
}

/// A block of 65,535 pieces is the largest; the last one may be empty, or a line without its end. Names and
/// values count alike. Invariant for untrusted input: 6.
TEST_F(UnmarshalHeadersTest, HowManyLines) {
    for (const bool isOneName : {false, true}) {
        std::string block = "RpcId: 7\r\nType: response\r\n";
        for (unsigned i = 2; i < 65534; ++i) block += (isOneName ? "a" : std::to_string(i)) + ":\r\n";
        const ModelMessage most = MessageOf(ModelWriter::Frame(block, "{}"));
        EXPECT_EQ(isOneName ? most.optional.at("a").size() : most.optional.size(), 65532u);
        const ModelMessage more = MessageOf(ModelWriter::Frame(block + "a:", "{}"));
        EXPECT_EQ(more.optional.at("a").size(), isOneName ? 65533u : 1u);
        for (const char* tooMany : {"\r\n", "a:\r\n", "no colon\r\n"}) {
            const std::string input = ModelWriter::Frame(block + tooMany, "{}");
            EXPECT_EQ(ByLibrary(input, false, "before"), "refused: Too many header lines");
            EXPECT_EQ(ByModel(input, false, "before"), "refused: Too many header lines");
        }
        EXPECT_EQ(ByLibrary(ModelWriter::Frame(block + "no colon", "{}")),
                  "refused: Invalid header line: no colon");
    }
    EXPECT_EQ(ByLibrary(ModelWriter::Frame(std::string(1048576, '\n'), "")), "refused: Missing rpcId");
    std::string ends;
    for (unsigned i = 0; i < 524288; ++i) ends += "\r\n";
    EXPECT_EQ(ByLibrary(ModelWriter::Frame(ends, "")), "refused: Too many header lines");
}

}  // namespace sorntest
