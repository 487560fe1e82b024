// Messages byte by byte: the layout, the order of the lines, all forms of marshalling.

#include <gtest/gtest.h>

#include "rpc/FramingFixture.h"
#include "sorn/dict/ByteBuffer.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/rpc/CancelWrapper.h"
#include "sorn/rpc/RequestUpdateWrapper.h"
#include "sorn/rpc/RequestWrapper.h"
#include "sorn/rpc/ResponseWrapper.h"

namespace sorntest {

using namespace sorn;
using namespace std::string_literals;

class MarshalTest : public FramingFixture {
 protected:
    ref<OrvoRpcWrapper> Request(uint32_t id, int version, const ModelHeaders& headers = {},
                                const std::string& body = "{}") {
        return RequestWrapper::New(&pool, id, Text("recordingSearch"), RequestWrapper::RESPONSE_COUNT_SINGLE,
                                   version, BodyOf(body), DictOf(headers));
    }
    ref<OrvoRpcWrapper> Response(uint32_t id, bool isFinal, const std::string& body = "{}",
                                 const ModelHeaders& headers = {}) {
        return ResponseWrapper::New(&pool, id, isFinal, BodyOf(body), DictOf(headers));
    }
    ref<OrvoRpcWrapper> Cancel(uint32_t id) { return CancelWrapper::New(&pool, id, nullptr); }
};

TEST_F(MarshalTest, Cancel) {
    EXPECT_EQ(Written(Cancel(7)),
              "ORPC/2 26 0\r\n"
              "RpcId: 7\r\n"      // 10
              "Type: cancel\r\n"  // 14
              "\r\n");            // 2
    EXPECT_EQ(Written(Cancel(0)), "ORPC/2 26 0\r\nRpcId: 0\r\nType: cancel\r\n\r\n");
    EXPECT_EQ(Written(Cancel(4294967295u)), "ORPC/2 35 0\r\nRpcId: 4294967295\r\nType: cancel\r\n\r\n");
}

TEST_F(MarshalTest, Response) {
    EXPECT_EQ(Written(Response(7, true, "{\"type\": \"x\"}")),
              "ORPC/2 75 13\r\n"
              "Content-Type: application/json\r\n"  // 32
              "IsFinal: true\r\n"                   // 15
              "RpcId: 7\r\n"                        // 10
              "Type: response\r\n"                  // 16
              "\r\n"                                // 2
              "{\"type\": \"x\"}");
    EXPECT_EQ(Written(Response(7, false)),
              "ORPC/2 76 2\r\nContent-Type: application/json\r\nIsFinal: false\r\nRpcId: 7\r\n"
              "Type: response\r\n\r\n{}");
}

TEST_F(MarshalTest, ResponseStatesItsContentType) {
    const ref<ResponseWrapper> response = ResponseWrapper::New(&pool, 7, true, BodyOf("{}"), nullptr);
    response->SetContentType(RoxString());
    EXPECT_EQ(Written(response),
              "ORPC/2 59 2\r\nContent-Type: \r\nIsFinal: true\r\nRpcId: 7\r\nType: response\r\n\r\n{}");
    response->SetContentType(Text("x"));
    EXPECT_EQ(Written(response),
              "ORPC/2 60 2\r\nContent-Type: x\r\nIsFinal: true\r\nRpcId: 7\r\nType: response\r\n\r\n{}");
}

TEST_F(MarshalTest, Request) {
    EXPECT_EQ(Written(Request(7, 42)),
              "ORPC/2 131 2\r\n"
              "Content-Type: application/json\r\n"  // 32
              "RequestType: recordingSearch\r\n"    // 30
              "ResponseCount: single\r\n"           // 23
              "RpcId: 7\r\n"                        // 10
              "SchemaVersion: 42\r\n"               // 19
              "Type: request\r\n"                   // 15
              "\r\n"                                // 2
              "{}");
}

/// A request states "application/json" whatever it holds.
TEST_F(MarshalTest, RequestDoesNotStateItsContentType) {
    const ref<OrvoRpcWrapper> request = Request(7, 42);
    const std::string before = Written(request);
    static_cast<RequestWrapper*>(request.get())->SetContentType(Text("text/plain"));
    EXPECT_EQ(Written(request), before);
}

TEST_F(MarshalTest, ResponseCounts) {
    struct Case {
        RequestWrapper::ResponseCount count;
        const char* expected;
    };
    // 32 + 16 + the word and 17 + 10 + 18 + 15 + 2
    const Case cases[] = {
        {RequestWrapper::RESPONSE_COUNT_NONE,
         "ORPC/2 114 2\r\nContent-Type: application/json\r\n"
         "RequestType: t\r\nResponseCount: none\r\nRpcId: 7\r\nSchemaVersion: 0\r\nType: request\r\n\r\n{}"},
        {RequestWrapper::RESPONSE_COUNT_MULTIPLE,
         "ORPC/2 118 2\r\nContent-Type: application/json\r\n"
         "RequestType: t\r\nResponseCount: multiple\r\nRpcId: 7\r\nSchemaVersion: 0\r\nType: "
         "request\r\n\r\n{}"},
        {static_cast<RequestWrapper::ResponseCount>(3),
         "ORPC/2 110 2\r\nContent-Type: application/json\r\n"
         "RequestType: t\r\nResponseCount: \r\nRpcId: 7\r\nSchemaVersion: 0\r\nType: request\r\n\r\n{}"},
    };
    for (const Case& each : cases) {
        EXPECT_EQ(Written(RequestWrapper::New(&pool, 7, Text("t"), each.count, 0, BodyOf("{}"), nullptr)),
                  each.expected);
    }
}

TEST_F(MarshalTest, Update) {
    // 32 + 30 + 25 + 10 + 18 + 21 + 2
    EXPECT_EQ(
        Written(RequestUpdateWrapper::New(&pool, 7, Text("recordingSearch"), BodyOf("{}", 42), nullptr)),
        "ORPC/2 138 2\r\nContent-Type: application/json\r\nRequestType: recordingSearch\r\n"
        "ResponseCount: multiple\r\nRpcId: 7\r\nSchemaVersion: 0\r\nType: requestUpdate\r\n\r\n{}");
}

TEST_F(MarshalTest, LinesStandInTheOrderOfBytes) {
    const ModelHeaders headers = {{"a", {"1"}},  {"ZZ", {"2"}},     {"Accept", {"3"}},
                                  {"Rp", {"4"}}, {"type", {"5"}},   {"\xC3\xA9", {"6"}},
                                  {"", {"7"}},   {"RpcIdX", {"8"}}, {"RpcI", {"9"}}};
    EXPECT_EQ(Written(Response(7, true, "{}", headers)),
              "ORPC/2 147 2\r\n"
              ": 7\r\n"                             // 5
              "Accept: 3\r\n"                       // 11
              "Content-Type: application/json\r\n"  // 32
              "IsFinal: true\r\n"                   // 15
              "Rp: 4\r\n"                           // 7
              "RpcI: 9\r\n"                         // 9
              "RpcId: 7\r\n"                        // 10
              "RpcIdX: 8\r\n"                       // 11
              "Type: response\r\n"                  // 16
              "ZZ: 2\r\n"                           // 7
              "a: 1\r\n"                            // 6
              "type: 5\r\n"                         // 9
              "\xC3\xA9: 6\r\n"                     // 7, and 2 for the end
              "\r\n{}");
}

TEST_F(MarshalTest, ValuesOfANameStandTogetherInTheirOrder) {
    EXPECT_EQ(Written(Response(7, true, "{}", {{"Cookie", {"b", "", "a"}}, {"Accept", {"x"}}})),
              "ORPC/2 118 2\r\nAccept: x\r\nContent-Type: application/json\r\n"
              "Cookie: b\r\nCookie: \r\nCookie: a\r\nIsFinal: true\r\nRpcId: 7\r\nType: response\r\n\r\n{}");
}

/// A constructor takes headers unfiltered: a reserved name has two values then, the library's first.
TEST_F(MarshalTest, ReservedNamesAmongTheOptionalHeaders) {
    EXPECT_EQ(Written(Response(7, true, "{}", {{"RpcId", {"8", "9"}}, {"Type", {"cancel"}}})),
              "ORPC/2 109 2\r\nContent-Type: application/json\r\nIsFinal: true\r\n"
              "RpcId: 7\r\nRpcId: 8\r\nRpcId: 9\r\nType: response\r\nType: cancel\r\n\r\n{}");
    EXPECT_EQ(
        Written(RequestUpdateWrapper::New(&pool, 7, Text("t"), BodyOf("{}"),
                                          DictOf({{"Type", {"cancel"}}, {"SchemaVersion", {"9"}}}))),
        "ORPC/2 142 2\r\nContent-Type: application/json\r\nRequestType: t\r\nResponseCount: multiple\r\n"
        "RpcId: 7\r\nSchemaVersion: 0\r\nSchemaVersion: 9\r\nType: requestUpdate\r\n\r\n{}");
}

/// Nothing is escaped and nothing is checked: what breaks the framing does.
TEST_F(MarshalTest, NamesAndValuesStandAsTheyAre) {
    // 10 + 73 + 12 + 8 + 2
    EXPECT_EQ(
        Written(Response(7, true, "{}", {{" a ", {" b\t"}}, {"x\r\ny", {"\r\n\r\n"}}, {"z:", {"\0z"s}}})),
        "ORPC/2 105 2\r\n a :  b\t\r\nContent-Type: application/json\r\nIsFinal: true\r\nRpcId: 7\r\n"
        "Type: response\r\nx\r\ny: \r\n\r\n\r\nz:: \0z\r\n\r\n{}"s);
}

/// A name whose value is no text has an empty line, and one without a value none.
TEST_F(MarshalTest, HeadersThatAreNoTexts) {
    const ref<Dict> headers = MakeDict(&pool);
    headers->AddDict("Nested", DictOf({{"a", {"b"}}}));
    headers->GetDictionary()->Add(Text("None"), ref<DictValue>());
    EXPECT_EQ(Written(ResponseWrapper::New(&pool, 7, true, BodyOf("{}"), headers)),
              "ORPC/2 85 2\r\nContent-Type: application/json\r\nIsFinal: true\r\nNested: \r\nRpcId: 7\r\n"
              "Type: response\r\n\r\n{}");
}

TEST_F(MarshalTest, NoBody) {
    EXPECT_EQ(Written(RequestWrapper::New(&pool, 7, Text("t"), RequestWrapper::RESPONSE_COUNT_NONE, 0,
                                          ref<LazyDict>(), nullptr)),
              "ORPC/2 114 0\r\nContent-Type: application/json\r\nRequestType: t\r\nResponseCount: none\r\n"
              "RpcId: 7\r\nSchemaVersion: 0\r\nType: request\r\n\r\n");
}

TEST_F(MarshalTest, LengthsAreBytes) {
    // Three euro signs are nine bytes, the body's accented letter two.
    EXPECT_EQ(
        Written(Response(7, true, "{\"\xC3\xA9\": 1}", {{"E", {"\xE2\x82\xAC\xE2\x82\xAC\xE2\x82\xAC"}}})),
        "ORPC/2 89 9\r\nContent-Type: application/json\r\nE: \xE2\x82\xAC\xE2\x82\xAC\xE2\x82\xAC\r\n"
        "IsFinal: true\r\nRpcId: 7\r\nType: response\r\n\r\n{\"\xC3\xA9\": 1}");
}

TEST_F(MarshalTest, TheBufferIsAppendedToAndTheStringIsReplaced) {
    const std::string expected = "ORPC/2 26 0\r\nRpcId: 7\r\nType: cancel\r\n\r\n";
    ByteBuffer out(&pool);
    out.AppendString("there");
    RoxString error("x");
    EXPECT_TRUE(OrvoRpcV2::MarshalToString(Cancel(7), out, error, &pool, false));
    EXPECT_TRUE(OrvoRpcV2::MarshalToString(Cancel(7), out, error, &pool, false));
    EXPECT_EQ(Str(out.ToRoxString(&pool)), "there" + expected + expected);

    RoxString text("there");
    EXPECT_TRUE(OrvoRpcV2::MarshalToString(Cancel(7), text, error, &pool, false));
    EXPECT_EQ(Str(text), expected);
    EXPECT_EQ(text.GetMempool(), &pool);
    EXPECT_EQ(Str(OrvoRpcV2::MarshalToString(&pool, Cancel(7), false)), expected);
    EXPECT_EQ(Str(error), "x");
}

TEST_F(MarshalTest, OnTheGeneralHeap) {
    RoxString text;
    RoxString error;
    EXPECT_TRUE(
        OrvoRpcV2::MarshalToString(Response(7, true, "{}", {{"a", {"b"}}}), text, error, nullptr, false));
    EXPECT_EQ(Str(text),
              "ORPC/2 81 2\r\nContent-Type: application/json\r\nIsFinal: true\r\nRpcId: 7\r\n"
              "Type: response\r\na: b\r\n\r\n{}");
    EXPECT_EQ(text.GetMempool(), nullptr);
}

/// The body is the text that the body itself gives, in all its forms and in both styles.
TEST_F(MarshalTest, BodiesOfAllForms) {
    const std::string json = R"({"type": "recordingSearch", "offset": 3})";
    const ref<LazyDict> text = BodyOf(json);
    RoxString words;
    ref<SornObject> object;
    ASSERT_TRUE(text->ToSornObject(object));
    const ref<LazyDict> bodies[] = {
        text,
        LazyDict::FromDict(&pool, text->ToDict(), 0),
        LazyDict::FromDictionary(&pool, text->ToDictionary(words), 0),
        LazyDict::FromSornObject(&pool, object, 0),
        LazyDict::FromBytestring(&pool, text->ToProtobuf(), 0),
    };
    for (const ref<LazyDict>& body : bodies) {
        for (const bool pretty : {false, true}) {
            SCOPED_TRACE(std::to_string(body->GetRep()) + (pretty ? " pretty" : ""));
            const std::string bodyText = Str(body->ToJson(pretty));
            EXPECT_NE(bodyText.find("recordingSearch"), std::string::npos);
            EXPECT_EQ(bodyText.find('\n') != std::string::npos, pretty);
            const ref<OrvoRpcWrapper> response = ResponseWrapper::New(&pool, 7, true, body, nullptr);
            const std::string expected = "ORPC/2 75 " + std::to_string(bodyText.size()) +
                                         "\r\nContent-Type: application/json\r\nIsFinal: true\r\nRpcId: 7\r\n"
                                         "Type: response\r\n\r\n" +
                                         bodyText;
            EXPECT_EQ(Str(OrvoRpcV2::MarshalToString(&pool, response, pretty)), expected);
            ByteBuffer out(&pool);
            EXPECT_TRUE(OrvoRpcV2::MarshalToString(response, out, words, &pool, pretty));
            EXPECT_EQ(Str(out.ToRoxString(&pool)), expected);
        }
    }
}

}  // namespace sorntest
