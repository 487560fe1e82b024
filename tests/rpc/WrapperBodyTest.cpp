// Bodies of messages: their forms, the whole message as a dictionary and as text.

#include <string>

#include "json/Support.h"
#include "rpc/WrapperFixture.h"
#include "sorn/dict/ByteBuffer.h"

namespace sorntest {

using namespace sorn;

class WrapperBodyTest : public WrapperFixture {
 protected:
    static std::string Buffered(OrvoRpcWrapper& wrapper, bool pretty) {
        ByteBuffer out(nullptr);
        out.AppendString("before ");
        wrapper.BodyToJsonByteBuffer(out, pretty);
        return jsontest::String(out);
    }
    static std::string Sunk(OrvoRpcWrapper& wrapper, bool pretty) {
        jsontest::StringSink sink;
        wrapper.BodyToJsonByteSink(sink, pretty);
        return sink.GetText();
    }
    /// All forms of a body's text.
    static void ExpectTexts(OrvoRpcWrapper& wrapper, const std::string& compact, const std::string& pretty,
                            const std::string& sunk) {
        EXPECT_EQ(Text(wrapper.BodyToJson(false)), compact);
        EXPECT_EQ(Text(wrapper.BodyToJson(true)), pretty);
        EXPECT_EQ(Buffered(wrapper, false), "before " + compact);
        EXPECT_EQ(Buffered(wrapper, true), "before " + pretty);
        EXPECT_EQ(Sunk(wrapper, false), sunk);
        EXPECT_EQ(Sunk(wrapper, true), pretty);
    }
};

const char* const prettyBodyG = "{\n    \"number\": 5, \n    \"type\": \"everyTypeCompanion\"\n}";
// In the order of slots, in which "type" stands between "label" and "number".
const char* const objectTextG = R"({"type": "everyTypeCompanion", "number": 5})";

TEST_F(WrapperBodyTest, TypeNames) {
    EXPECT_EQ(Text(Request()->GetTypeName()), "everyTypeCompanion");
    EXPECT_EQ(Text(Update()->GetTypeName()), "everyTypeCompanion");
    EXPECT_EQ(Text(Response()->GetTypeName()), "response");
    EXPECT_EQ(Text(Cancel()->GetTypeName()), "Cancel");
    // A request's name is what was given, whatever the body is.
    EXPECT_EQ(
        Text(RequestWrapper::New(&pool, 1, "other", RequestWrapper::RESPONSE_COUNT_NONE, 0, Body(), nullptr)
                 ->GetTypeName()),
        "other");
}

TEST_F(WrapperBodyTest, TextsOfABodyOfText) {
    for (const ref<OrvoRpcWrapper>& wrapper :
         {ref<OrvoRpcWrapper>(Request()), ref<OrvoRpcWrapper>(Update()), ref<OrvoRpcWrapper>(Response())}) {
        ExpectTexts(*wrapper, bodyTextG, prettyBodyG, bodyTextG);
        EXPECT_EQ(JsonOf(wrapper->BodyToDict()), bodySortedG);
        EXPECT_EQ(Text(wrapper->BodyToDictionary()->ToJson(false)), bodySortedG);
    }
}

TEST_F(WrapperBodyTest, TextsOfABodyOfAnObject) {
    const ref<SornObject> object = Object(bodySortedG);
    const Count single = RequestWrapper::RESPONSE_COUNT_SINGLE;
    const ref<OrvoRpcWrapper> all[] = {RequestWrapper::New(&pool, 1, single, 0, object, nullptr),
                                       RequestUpdateWrapper::New(&pool, 1, object, nullptr),
                                       ResponseWrapper::New(&pool, 1, true, object, 0, nullptr)};
    for (const ref<OrvoRpcWrapper>& wrapper : all) {
        // A sink gets the text of the dictionary: the feature for the straight road is off.
        ExpectTexts(*wrapper, objectTextG, prettyBodyG, bodySortedG);
        EXPECT_EQ(JsonOf(wrapper->BodyToDict()), bodySortedG);
    }
}

TEST_F(WrapperBodyTest, BrokenTextGoesOutAsItIs) {
    const ref<ResponseWrapper> response = ResponseWrapper::New(&pool, 1, true, Body("{oops"), nullptr);
    ExpectTexts(*response, "{oops", "", "{oops");
    EXPECT_EQ(Text(response->BodyToDict()->GetString("type", 0)), "error");
}

TEST_F(WrapperBodyTest, ACancelHasNone) {
    const ref<CancelWrapper> cancel = Cancel();
    ExpectTexts(*cancel, "", "", "");
    EXPECT_EQ(cancel->BodyToDict(), nullptr);
    EXPECT_EQ(cancel->BodyToDictionary(), nullptr);
}

TEST_F(WrapperBodyTest, ARequestWithoutBody) {
    const ref<RequestWrapper> request =
        RequestWrapper::New(&pool, 7, "t", RequestWrapper::RESPONSE_COUNT_SINGLE, 26, nullptr, nullptr);
    ExpectTexts(*request, "", "", "");
    EXPECT_EQ(request->BodyToDict(), nullptr);
    EXPECT_EQ(request->BodyToDictionary(), nullptr);
    EXPECT_EQ(request->UnmarshalToSornObject(), nullptr);
    EXPECT_EQ(request->GetBody(), nullptr);
    EXPECT_EQ(Text(request->ToString(&pool)), HeadersOf(*request));
}

TEST_F(WrapperBodyTest, TheDictOfADictBodyIsShared) {
    const ref<Dict> dict = Headers(bodySortedG);
    const ref<RequestWrapper> request =
        RequestWrapper::New(&pool, 7, "t", RequestWrapper::RESPONSE_COUNT_SINGLE, 26,
                            LazyDict::FromDict(&pool, dict, 0), nullptr);
    EXPECT_EQ(request->BodyToDict(), dict);
    EXPECT_EQ(request->BodyToDictionary(), dict->GetDictionary());
    const ref<Dict> whole = request->ToDict(&pool);
    EXPECT_EQ(whole->GetDictionary()->GetDictionary("body"), dict->GetDictionary());
}

TEST_F(WrapperBodyTest, WholeMessages) {
    const std::string body = std::string(R"(, "body": )") + bodySortedG + "}";
    struct Row {
        ref<OrvoRpcWrapper> wrapper;
        std::string text;
    };
    const Row vRows[] = {
        {Request(Headers(R"({"A": ["1", "2"]})")),
         R"({"A": ["1", "2"], "Content-Type": "application/json", "RequestType": "everyTypeCompanion", )"
         R"("ResponseCount": "single", "RpcId": "7", "SchemaVersion": "26", "Type": "request")" +
             body},
        {Update(),
         R"({"Content-Type": "application/json", "RequestType": "everyTypeCompanion", )"
         R"("ResponseCount": "multiple", "RpcId": "7", "SchemaVersion": "0", "Type": "requestUpdate")" +
             body},
        {Response(),
         R"({"Content-Type": "application/json", "IsFinal": "true", "RpcId": "7", "Type": "response")" +
             body},
        {Cancel(), R"({"RpcId": "7", "Type": "cancel"})"},
    };
    RoxMempool callers("callers");
    for (const Row& row : vRows) {
        EXPECT_EQ(Text(row.wrapper->ToString(&pool)), row.text);
        const ref<Dict> dict = row.wrapper->ToDict(&callers);
        EXPECT_EQ(dict->GetMempool(), &callers);
        EXPECT_EQ(JsonOf(dict), row.text);
    }
}

// The name is not reserved: the body stands behind a header of this name.
TEST_F(WrapperBodyTest, AHeaderNamedBody) {
    EXPECT_EQ(Text(Response(Headers(R"({"body": "x"})"))->ToString(&pool)),
              std::string(R"({"Content-Type": "application/json", "IsFinal": "true", "RpcId": "7", )"
                          R"("Type": "response", "body": ["x", )") +
                  bodySortedG + "]}");
}

}  // namespace sorntest
