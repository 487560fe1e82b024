// Headers as dictionaries: the entries of each kind, and optional headers that are copied behind them.

#include <string>

#include "rpc/WrapperFixture.h"

namespace sorntest {

using namespace sorn;

class WrapperHeadersTest : public WrapperFixture {};

const char* const requestHeadersG =
    R"({"Content-Type": "application/json", "RequestType": "everyTypeCompanion", "ResponseCount": "single", )"
    R"("RpcId": "7", "SchemaVersion": "26", "Type": "request"})";
const char* const updateHeadersG =
    R"({"Content-Type": "application/json", "RequestType": "everyTypeCompanion", "ResponseCount": "multiple", )"
    R"("RpcId": "7", "SchemaVersion": "0", "Type": "requestUpdate"})";
const char* const responseHeadersG =
    R"({"Content-Type": "application/json", "IsFinal": "true", "RpcId": "7", "Type": "response"})";
const char* const cancelHeadersG = R"({"RpcId": "7", "Type": "cancel"})";

TEST_F(WrapperHeadersTest, OfEachKind) {
    EXPECT_EQ(HeadersOf(*Request()), requestHeadersG);
    EXPECT_EQ(HeadersOf(*Update()), updateHeadersG);
    EXPECT_EQ(HeadersOf(*Response()), responseHeadersG);
    EXPECT_EQ(HeadersOf(*Cancel()), cancelHeadersG);
    EXPECT_EQ(
        HeadersOf(*Response(nullptr, false)),
        R"({"Content-Type": "application/json", "IsFinal": "false", "RpcId": "7", "Type": "response"})");
}

TEST_F(WrapperHeadersTest, UpdateOfAnObject) {
    const ref<RequestUpdateWrapper> update =
        RequestUpdateWrapper::New(&pool, 7, Object(bodySortedG), nullptr);
    EXPECT_EQ(HeadersOf(*update), updateHeadersG);
}

TEST_F(WrapperHeadersTest, ResponseCount) {
    const char* const words[] = {"none", "single", "multiple", "", ""};
    for (int number = 0; number < 5; ++number) {
        const ref<Dict> headers = Request(nullptr, static_cast<Count>(number))->HeadersToDict(&pool);
        EXPECT_EQ(headers->CountValues("ResponseCount"), 1u);
        EXPECT_EQ(Text(headers->GetString("ResponseCount", 0)), words[number]) << number;
    }
}

TEST_F(WrapperHeadersTest, NumbersAreUnsigned) {
    const Count none = RequestWrapper::RESPONSE_COUNT_NONE;
    const ref<Dict> headers =
        RequestWrapper::New(&pool, 4294967295u, "t", none, -1, Body(), nullptr)->HeadersToDict(&pool);
    EXPECT_EQ(Text(headers->GetString("RpcId", 0)), "4294967295");
    EXPECT_EQ(Text(headers->GetString("SchemaVersion", 0)), "4294967295");
    EXPECT_EQ(HeadersOf(*CancelWrapper::New(&pool, 0, nullptr)), R"({"RpcId": "0", "Type": "cancel"})");
}

// A request says the constant, a response its member.
TEST_F(WrapperHeadersTest, ContentType) {
    for (const char* type : {"text/plain", ""}) {
        const ref<RequestWrapper> request = Request();
        const ref<RequestUpdateWrapper> update = Update();
        const ref<ResponseWrapper> response = Response();
        request->SetContentType(type);
        update->SetContentType(type);
        response->SetContentType(type);
        EXPECT_EQ(HeadersOf(*request), requestHeadersG);
        EXPECT_EQ(HeadersOf(*update), updateHeadersG);
        EXPECT_EQ(HeadersOf(*response), std::string(R"({"Content-Type": ")") + type +
                                            R"(", "IsFinal": "true", "RpcId": "7", "Type": "response"})");
        EXPECT_EQ(Text(request->GetContentType()), type);
    }
}

TEST_F(WrapperHeadersTest, OptionalHeadersAreCopiedWithAllTheirValues) {
    const char* const headers = R"({"X": "1", "A": ["3", "2", "3"], "type": "small", "": "nameless"})";
    const std::string added = R"({"": "nameless", "A": ["3", "2", "3"], )";
    EXPECT_EQ(HeadersOf(*Request(Headers(headers))),
              added + R"("Content-Type": "application/json", "RequestType": "everyTypeCompanion", )"
                      R"("ResponseCount": "single", "RpcId": "7", "SchemaVersion": "26", "Type": "request", )"
                      R"("X": "1", "type": "small"})");
    EXPECT_EQ(HeadersOf(*Update(Headers(headers))),
              added + R"("Content-Type": "application/json", "RequestType": "everyTypeCompanion", )"
                      R"("ResponseCount": "multiple", "RpcId": "7", "SchemaVersion": "0", )"
                      R"("Type": "requestUpdate", "X": "1", "type": "small"})");
    EXPECT_EQ(HeadersOf(*Response(Headers(headers))),
              added + R"("Content-Type": "application/json", "IsFinal": "true", "RpcId": "7", )"
                      R"("Type": "response", "X": "1", "type": "small"})");
}

// Only texts are headers: other values count, as empty texts. An empty array has no value at all.
TEST_F(WrapperHeadersTest, ValuesThatAreNoTextsAreEmpty) {
    const char* const headers = R"({"D": {"a": "b"}, "N": [["q"]], "E": [], "M": ["x", {"a": "b"}, "y"]})";
    EXPECT_EQ(HeadersOf(*Response(Headers(headers))),
              R"({"Content-Type": "application/json", "D": "", "IsFinal": "true", "M": ["x", "", "y"], )"
              R"("N": "", "RpcId": "7", "Type": "response"})");
}

// A header's text is quoted whatever it was made of.
TEST_F(WrapperHeadersTest, BareValuesBecomeTexts) {
    EXPECT_EQ(HeadersOf(*Response(Headers(R"({"B": true, "N": 5})"))),
              R"({"B": "true", "Content-Type": "application/json", "IsFinal": "true", "N": "5", )"
              R"("RpcId": "7", "Type": "response"})");
}

// A constructor filters nothing: the reserved value stands first, those given behind it.
TEST_F(WrapperHeadersTest, ReservedNamesThatAConstructorWasGiven) {
    const char* const headers =
        R"({"Type": ["a", "b"], "RpcId": "8", "Content-Type": "c", "SchemaVersion": "9", )"
        R"("ResponseCount": "none", "RequestType": "t", "IsFinal": "maybe"})";
    EXPECT_EQ(HeadersOf(*Request(Headers(headers))),
              R"({"Content-Type": ["application/json", "c"], "IsFinal": "maybe", )"
              R"("RequestType": ["everyTypeCompanion", "t"], "ResponseCount": ["single", "none"], )"
              R"("RpcId": ["7", "8"], "SchemaVersion": ["26", "9"], "Type": ["request", "a", "b"]})");
    // Of an update all values of "Type" go.
    EXPECT_EQ(HeadersOf(*Update(Headers(headers))),
              R"({"Content-Type": ["application/json", "c"], "IsFinal": "maybe", )"
              R"("RequestType": ["everyTypeCompanion", "t"], "ResponseCount": ["multiple", "none"], )"
              R"("RpcId": ["7", "8"], "SchemaVersion": ["0", "9"], "Type": "requestUpdate"})");
    EXPECT_EQ(HeadersOf(*Response(Headers(headers))),
              R"({"Content-Type": ["application/json", "c"], "IsFinal": ["true", "maybe"], )"
              R"("RequestType": "t", "ResponseCount": "none", "RpcId": ["7", "8"], "SchemaVersion": "9", )"
              R"("Type": ["response", "a", "b"]})");
    EXPECT_EQ(HeadersOf(*CancelWrapper::New(&pool, 7, Headers(headers))), cancelHeadersG);
}

TEST_F(WrapperHeadersTest, TheDictionaryIsNewAndInThePoolOfTheCall) {
    RoxMempool callers("callers");
    const ref<OrvoRpcWrapper> all[] = {Request(Headers(R"({"A": ["1", "2"]})")), Update(), Response(),
                                       Cancel()};
    for (const ref<OrvoRpcWrapper>& wrapper : all) {
        const std::string before = HeadersOf(*wrapper);
        const size_t nOwn = pool.GetUsedBytes();
        {
            const ref<Dict> dict = wrapper->HeadersToDict(&callers);
            EXPECT_EQ(dict->GetMempool(), &callers);
            EXPECT_EQ(dict->GetDictionary()->GetMempool(), &callers);
            dict->AddString("A", "3");
            dict->Remove("RpcId");
            const ref<Dictionary> dictionary = wrapper->HeadersToDictionary(&callers);
            EXPECT_EQ(Text(dictionary->ToJson(false)), before);
        }
        EXPECT_EQ(pool.GetUsedBytes(), nOwn);
        EXPECT_EQ(callers.GetUsedBytes(), 0u);
        EXPECT_EQ(HeadersOf(*wrapper), before);
    }
}

}  // namespace sorntest
