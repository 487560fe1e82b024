// Records of the older form to messages, and both ways in turn.

#include <string>
#include <typeinfo>

#include "rox/RoxStringArray.h"
#include "rpc/WrapperFixture.h"
#include "sorn/rpc/OrvoRpcV2.h"
#include "sornschema/Error.h"
#include "sornschema/OrvoRpcCancel.h"
#include "sornschema/OrvoRpcHello.h"
#include "sornschema/OrvoRpcRequest.h"
#include "sornschema/OrvoRpcRequestUpdate.h"
#include "sornschema/OrvoRpcResponse.h"
#include "support/SmallStack.h"

namespace sorntest {

using namespace sorn;
using sornschema::OrvoRpcCancel;
using sornschema::OrvoRpcHello;
using sornschema::OrvoRpcRequest;
using sornschema::OrvoRpcRequestUpdate;
using sornschema::OrvoRpcResponse;

class ConversionToV2Test : public WrapperFixture {
 protected:
    template <class Record>
    ref<Record> New() {
        return ref<Record>(static_cast<Record*>(Record::Factory(&pool).get()));
    }
    ref<OrvoRpcRequest> RequestRecord() {
        ref<OrvoRpcRequest> record = New<OrvoRpcRequest>();
        record->rpcId = 7;
        record->orvoVersion = 26;
        record->request = Body(bodyTextG, 9);
        return record;
    }
    ref<OrvoRpcRequestUpdate> UpdateRecord() {
        ref<OrvoRpcRequestUpdate> record = New<OrvoRpcRequestUpdate>();
        record->rpcId = 7;
        record->request = Body(bodyTextG, 9);
        return record;
    }
    /// The message of a record, which must be of exactly the given kind.
    template <class Wrapper>
    ref<Wrapper> MessageOf(const ref<SornObject>& record) {
        const ref<OrvoRpcWrapper> wrapper = OrvoRpcV2::OrvoRpcV1ToV2Wrapper(&pool, record);
        auto* const kind = dynamic_cast<Wrapper*>(wrapper.get());
        EXPECT_NE(kind, nullptr);
        EXPECT_EQ(typeid(*kind), typeid(Wrapper));
        EXPECT_EQ(wrapper->GetMempool(), &pool);
        EXPECT_EQ(wrapper->GetRefCount(), 1u);
        return ref<Wrapper>(kind);
    }
};

TEST_F(ConversionToV2Test, Nothing) {
    EXPECT_EQ(OrvoRpcV2::OrvoRpcV1ToV2Wrapper(&pool, nullptr), nullptr);
    for (const char* json : {R"({"type": "everyTypeCompanion", "number": 5})", R"({"type": "success"})",
                             R"({"type": "error", "code": "badArgument", "text": ""})"}) {
        testing::internal::CaptureStdout();
        testing::internal::CaptureStderr();
        EXPECT_EQ(OrvoRpcV2::OrvoRpcV1ToV2Wrapper(&pool, Object(json)), nullptr) << json;
        EXPECT_EQ(testing::internal::GetCapturedStdout(), "");
        EXPECT_EQ(testing::internal::GetCapturedStderr(), "");
    }
}

// A body is needed; without one there is no message rather than a fault.
TEST_F(ConversionToV2Test, RecordsWithoutTheirBody) {
    EXPECT_EQ(OrvoRpcV2::OrvoRpcV1ToV2Wrapper(&pool, OrvoRpcRequest::Factory(&pool)), nullptr);
    EXPECT_EQ(OrvoRpcV2::OrvoRpcV1ToV2Wrapper(&pool, OrvoRpcResponse::Factory(&pool)), nullptr);
    EXPECT_EQ(OrvoRpcV2::OrvoRpcV1ToV2Wrapper(&pool, OrvoRpcRequestUpdate::Factory(&pool)), nullptr);
}

TEST_F(ConversionToV2Test, CancelDropsItsHeaders) {
    const ref<OrvoRpcCancel> record = New<OrvoRpcCancel>();
    record->rpcId = -1;
    record->headers = Headers(R"({"A": "1"})");
    const ref<CancelWrapper> cancel = MessageOf<CancelWrapper>(record);
    EXPECT_EQ(cancel->GetRpcId(), 4294967295u);
    EXPECT_EQ(HeadersOf(*cancel), R"({"RpcId": "4294967295", "Type": "cancel"})");
    EXPECT_EQ(record->headers->GetRefCount(), 1u);
}

TEST_F(ConversionToV2Test, ResponseCount) {
    struct Row {
        bool isSet;
        bool sendAndForget;
        bool monitorFutureChanges;
        const char* word;
    };
    const Row vRows[] = {
        {false, false, false, "single"}, {false, false, true, "multiple"}, {false, true, false, "single"},
        {false, true, true, "multiple"}, {true, false, false, "single"},   {true, false, true, "multiple"},
        {true, true, false, "none"},     {true, true, true, "none"},
    };
    for (const Row& row : vRows) {
        const ref<OrvoRpcRequest> record = RequestRecord();
        record->sendAndForget_isSet = row.isSet ? 1 : 0;
        record->sendAndForget = row.sendAndForget;
        record->monitorFutureChanges = row.monitorFutureChanges;
        const ref<RequestWrapper> request = MessageOf<RequestWrapper>(record);
        EXPECT_STREQ(RequestWrapper::ResponseCountWord(request->GetResponseCount()), row.word)
            << row.isSet << row.sendAndForget << row.monitorFutureChanges;
    }
}

TEST_F(ConversionToV2Test, RequestGetsANewBodyOfTheDictionary) {
    const ref<OrvoRpcRequest> record = RequestRecord();
    record->headers = Headers(R"({"A": "1", "RpcId": "x"})");
    record->partnerId = 5;
    record->partnerId_isSet = 1;
    const ref<RequestWrapper> request = MessageOf<RequestWrapper>(record);
    EXPECT_EQ(request->GetRpcId(), 7u);
    EXPECT_EQ(Text(request->GetRequestType()), "everyTypeCompanion");
    EXPECT_EQ(request->GetOrvoVersion().Number(), 26);
    EXPECT_EQ(Text(request->GetContentType()), "application/json");
    EXPECT_NE(request->GetBody(), record->request);
    EXPECT_EQ(request->GetBody()->GetRep(), LazyDict::REP_DICT);
    EXPECT_EQ(request->GetBody()->GetVersion().Number(), 26);
    EXPECT_EQ(request->GetBody()->GetMempool(), &pool);
    EXPECT_EQ(Text(request->BodyToJson(false)), bodySortedG);
    EXPECT_EQ(request->GetOptionalHeaders(), record->headers);
    EXPECT_EQ(JsonOf(record->headers), R"({"A": "1", "RpcId": "x"})") << "nothing is filtered";
    EXPECT_EQ(record->request->GetRep(), LazyDict::REP_JSON);
    EXPECT_EQ(record->request->GetVersion().Number(), 9);
}

TEST_F(ConversionToV2Test, ADictBodySharesItsDict) {
    const ref<OrvoRpcRequest> record = RequestRecord();
    const ref<Dict> dict = Headers(bodySortedG);
    record->request = LazyDict::FromDict(&pool, dict, 9);
    const ref<RequestWrapper> request = MessageOf<RequestWrapper>(record);
    EXPECT_NE(request->GetBody(), record->request);
    EXPECT_EQ(request->GetBody()->GetStoredDict(), dict);
}

TEST_F(ConversionToV2Test, WithoutHeadersThereAreEmptyOnes) {
    const ref<OrvoRpcResponse> response = New<OrvoRpcResponse>();
    response->response = Body();
    EXPECT_EQ(JsonOf(MessageOf<RequestWrapper>(RequestRecord())->GetOptionalHeaders()), "{}");
    EXPECT_EQ(JsonOf(MessageOf<RequestUpdateWrapper>(UpdateRecord())->GetOptionalHeaders()), "{}");
    EXPECT_EQ(JsonOf(MessageOf<ResponseWrapper>(response)->GetOptionalHeaders()), "{}");
}

TEST_F(ConversionToV2Test, RequestTypeIsTheTextUnderType) {
    struct Row {
        const char* json;
        const char* type;
    };
    const Row vRows[] = {
        {R"({"type":"nosuch"})", "nosuch"},
        {R"({"number":5})", ""},
        {R"({"type":["a","b"]})", "a"},
        {R"({"type":{"a":"b"}})", ""},
        {R"({"type":""})", ""},
        {R"({oops)", "error"},  // the dictionary of a body that does not parse is that of an error
    };
    for (const Row& row : vRows) {
        const ref<OrvoRpcRequest> request = RequestRecord();
        request->request = Body(row.json);
        EXPECT_EQ(Text(MessageOf<RequestWrapper>(request)->GetRequestType()), row.type) << row.json;
        const ref<OrvoRpcRequestUpdate> update = UpdateRecord();
        update->request = Body(row.json);
        EXPECT_EQ(Text(MessageOf<RequestUpdateWrapper>(update)->GetRequestType()), row.type) << row.json;
    }
}

// The body's version has 16 bits, the message's all 32. 65562 = 65536 + 26.
TEST_F(ConversionToV2Test, VersionsOfRequests) {
    struct Row {
        int version;
        int ofBody;
    };
    for (const Row& row :
         {Row{0, 0}, Row{42, 42}, Row{65535, 65535}, Row{65536, 0}, Row{65562, 26}, Row{-1, 65535}}) {
        const ref<OrvoRpcRequest> record = RequestRecord();
        record->orvoVersion = row.version;
        const ref<RequestWrapper> request = MessageOf<RequestWrapper>(record);
        EXPECT_EQ(request->GetOrvoVersion().Number(), row.version);
        EXPECT_EQ(request->GetBody()->GetVersion().Number(), row.ofBody);

        const ref<OrvoRpcRequestUpdate> updateRecord = UpdateRecord();
        updateRecord->request->SetVersion(row.version);
        const ref<RequestUpdateWrapper> update = MessageOf<RequestUpdateWrapper>(updateRecord);
        EXPECT_EQ(update->GetOrvoVersion().Number(), 0);
        EXPECT_EQ(update->GetBody()->GetVersion().Number(), row.ofBody);
    }
}

TEST_F(ConversionToV2Test, Update) {
    const ref<OrvoRpcRequestUpdate> record = UpdateRecord();
    record->headers = Headers(R"({"A": "1"})");
    const ref<RequestUpdateWrapper> update = MessageOf<RequestUpdateWrapper>(record);
    EXPECT_EQ(update->GetRpcId(), 7u);
    EXPECT_EQ(Text(update->GetRequestType()), "everyTypeCompanion");
    EXPECT_EQ(update->GetResponseCount(), RequestWrapper::RESPONSE_COUNT_MULTIPLE);
    EXPECT_NE(update->GetBody(), record->request);
    EXPECT_EQ(update->GetBody()->GetRep(), LazyDict::REP_DICT);
    EXPECT_EQ(update->GetBody()->GetVersion().Number(), 9);
    EXPECT_EQ(update->GetOptionalHeaders(), record->headers);
}

TEST_F(ConversionToV2Test, ResponseSharesItsBodyAndItsVersion) {
    for (const bool isFinal : {true, false}) {
        const ref<OrvoRpcResponse> record = New<OrvoRpcResponse>();
        record->rpcId = -2;
        record->isFinalResponse = isFinal;
        record->response = Body(bodyTextG, 65562);
        record->orvoVersion = 12;  // not read
        record->orvoVersion_isSet = 1;
        record->headers = Headers(R"({"A": "1"})");
        const ref<ResponseWrapper> response = MessageOf<ResponseWrapper>(record);
        EXPECT_EQ(response->GetRpcId(), 4294967294u);
        EXPECT_EQ(response->IsFinalResponse(), isFinal);
        EXPECT_EQ(response->GetBody(), record->response);
        EXPECT_EQ(response->GetBody()->GetRep(), LazyDict::REP_JSON);
        EXPECT_EQ(response->GetOrvoVersion().Number(), 65562);
        EXPECT_EQ(Text(response->GetTypeName()), "response");
        EXPECT_EQ(response->GetOptionalHeaders(), record->headers);
    }
}

TEST_F(ConversionToV2Test, HelloIsARequestWithoutResponse) {
    const ref<OrvoRpcHello> hello = New<OrvoRpcHello>();
    hello->identity.Add(RoxString(&pool, "a"));
    const ref<RequestWrapper> request = MessageOf<RequestWrapper>(hello);
    EXPECT_EQ(HeadersOf(*request),
              R"({"Content-Type": "application/json", "RequestType": "orvoRpcHello", )"
              R"("ResponseCount": "none", "RpcId": "0", "SchemaVersion": "7", "Type": "request"})");
    EXPECT_EQ(request->GetBody()->GetRep(), LazyDict::REP_OBJECT);
    EXPECT_EQ(request->GetBody()->GetStoredObject(), ref<SornObject>(hello));
    EXPECT_EQ(request->GetBody()->GetVersion().Number(), 7);
    EXPECT_EQ(JsonOf(request->GetOptionalHeaders()), "{}");
}

TEST_F(ConversionToV2Test, RequestsThereAndBack) {
    for (const int count : {0, 1, 2}) {
        const ref<RequestWrapper> first = Request(Headers(R"({"A": "1"})"), static_cast<Count>(count));
        const ref<RequestWrapper> back = MessageOf<RequestWrapper>(OrvoRpcV2::OrvoRpcV2ToV1(&pool, first));
        EXPECT_TRUE(*first == *back);
        EXPECT_EQ(back->GetResponseCount(), first->GetResponseCount());
        EXPECT_NE(back->GetBody(), first->GetBody());
        EXPECT_EQ(back->GetOptionalHeaders(), first->GetOptionalHeaders());
    }
    // A number that is no count comes back as "single".
    const ref<RequestWrapper> back =
        MessageOf<RequestWrapper>(OrvoRpcV2::OrvoRpcV2ToV1(&pool, Request(nullptr, static_cast<Count>(3))));
    EXPECT_EQ(back->GetResponseCount(), RequestWrapper::RESPONSE_COUNT_SINGLE);
}

TEST_F(ConversionToV2Test, UpdatesComeBackAsRequests) {
    const ref<RequestWrapper> back = MessageOf<RequestWrapper>(OrvoRpcV2::OrvoRpcV2ToV1(&pool, Update()));
    EXPECT_EQ(HeadersOf(*back),
              R"({"Content-Type": "application/json", "RequestType": "everyTypeCompanion", )"
              R"("ResponseCount": "multiple", "RpcId": "7", "SchemaVersion": "0", "Type": "request"})");
}

TEST_F(ConversionToV2Test, ResponsesKeepTheirVersionInTheirBody) {
    const ref<ResponseWrapper> first = Response(Headers(R"({"A": "1"})"));
    const ref<SornObject> record = OrvoRpcV2::OrvoRpcV2ToV1(&pool, first);
    EXPECT_EQ(static_cast<OrvoRpcResponse&>(*record).orvoVersion_isSet, 0);
    const ref<ResponseWrapper> back = MessageOf<ResponseWrapper>(record);
    EXPECT_TRUE(*first == *back);
    EXPECT_EQ(back->GetOrvoVersion().Number(), 26);
    EXPECT_EQ(back->GetBody(), first->GetBody());
}

TEST_F(ConversionToV2Test, CancelsKeepTheirNumberOnly) {
    const ref<CancelWrapper> back = MessageOf<CancelWrapper>(
        OrvoRpcV2::OrvoRpcV2ToV1(&pool, CancelWrapper::New(&pool, 9, Headers(R"({"A": "1"})"))));
    EXPECT_EQ(HeadersOf(*back), R"({"RpcId": "9", "Type": "cancel"})");
}

// Messages with a body as deep as no thread's stack would bear a recursion.
TEST_F(ConversionToV2Test, DeepBodies) {
    RunOnSmallStack([this] {
        constexpr unsigned nLevels = 100'000;
        std::string json = R"({"type":"everyTypeCompanion")";
        for (unsigned i = 0; i < nLevels; ++i) json += R"(,"child":{"type":"everyTypeCompanion")";
        json.append(nLevels + 1, '}');
        const ref<RequestWrapper> request = RequestWrapper::New(
            &pool, 7, "everyTypeCompanion", RequestWrapper::RESPONSE_COUNT_SINGLE, 0, Body(json), nullptr);
        const ref<RequestWrapper> back = MessageOf<RequestWrapper>(OrvoRpcV2::OrvoRpcV2ToV1(&pool, request));
        EXPECT_TRUE(*request == *back);
        EXPECT_GT(request->ToString(&pool).NByte(), json.size());
        const ref<SornObject> object = request->UnmarshalToSornObject();
        ASSERT_NE(object, nullptr);
        EXPECT_TRUE(*request == *back);
        const ref<ResponseWrapper> response = ResponseWrapper::New(&pool, 7, true, Body(json), nullptr);
        RoxString error;
        EXPECT_NE(response->UnmarshalToSornObject(26, error), nullptr);
        EXPECT_EQ(Text(error), "");
    });
}

}  // namespace sorntest
