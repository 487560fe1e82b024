// Messages to records of the older form.

#include <string>

#include "rpc/WrapperFixture.h"
#include "sorn/rpc/OrvoRpcV2.h"
#include "sornschema/OrvoRpcCancel.h"
#include "sornschema/OrvoRpcRequest.h"
#include "sornschema/OrvoRpcRequestUpdate.h"
#include "sornschema/OrvoRpcResponse.h"

namespace sorntest {

using namespace sorn;
using sornschema::OrvoRpcCancel;
using sornschema::OrvoRpcRequest;
using sornschema::OrvoRpcRequestUpdate;
using sornschema::OrvoRpcResponse;

class ConversionToV1Test : public WrapperFixture {
 protected:
    /// The record of a message, which must be of the given struct.
    template <class Record>
    ref<Record> RecordOf(const ref<OrvoRpcWrapper>& wrapper) {
        const ref<SornObject> object = OrvoRpcV2::OrvoRpcV2ToV1(&pool, wrapper);
        EXPECT_NE(object, nullptr);
        EXPECT_EQ(object->structId, Record::structIdG);
        EXPECT_EQ(object->GetMempool(), &pool);
        return ref<Record>(static_cast<Record*>(object.get()));
    }
};

/// A kind of message that the library does not know.
class OtherWrapper final : public OrvoRpcWrapper {
 public:
    OtherWrapper() : OrvoRpcWrapper(1, 0) {}
    RoxString GetTypeName() override { return "other"; }
    ref<Dict> HeadersToDict(RoxMempool* pool) const override { return MakeDict(pool); }
    RoxString BodyToJson(bool) override { return RoxString(); }
    void BodyToJsonByteBuffer(ByteBuffer&, bool) override {}
    void BodyToJsonByteSink(kelbaselib::Bytesink&, bool) override {}
};

/// A response that says itself whether it is the last.
class OwnFinalResponse final : public ResponseWrapper {
 public:
    using ResponseWrapper::ResponseWrapper;
    bool IsFinalResponse() override { return true; }
};

TEST_F(ConversionToV1Test, Nothing) {
    EXPECT_EQ(OrvoRpcV2::OrvoRpcV2ToV1(&pool, nullptr), nullptr);
    EXPECT_EQ(OrvoRpcV2::OrvoRpcV2ToV1(&pool, ref<OrvoRpcWrapper>(new (&pool) OtherWrapper)), nullptr);
}

TEST_F(ConversionToV1Test, RequestByResponseCount) {
    struct Row {
        int count;
        bool monitorFutureChanges;
        bool sendAndForget;
    };
    for (const Row& row : {Row{0, false, true}, Row{1, false, false}, Row{2, true, false},
                           Row{3, false, false}, Row{-1, false, false}, Row{256, false, false}}) {
        const ref<OrvoRpcRequest> record =
            RecordOf<OrvoRpcRequest>(Request(nullptr, static_cast<Count>(row.count)));
        EXPECT_EQ(record->monitorFutureChanges, row.monitorFutureChanges) << row.count;
        EXPECT_EQ(record->sendAndForget, row.sendAndForget) << row.count;
        EXPECT_EQ(record->sendAndForget_isSet, 1) << row.count;
    }
}

TEST_F(ConversionToV1Test, RequestSharesBodyAndHeaders) {
    const ref<RequestWrapper> request = Request(Headers(R"({"A": "1"})"));
    const ref<OrvoRpcRequest> record = RecordOf<OrvoRpcRequest>(request);
    EXPECT_EQ(record->rpcId, 7);
    EXPECT_EQ(record->orvoVersion, 26);
    EXPECT_EQ(record->request, request->GetBody());
    EXPECT_EQ(record->request->GetRep(), LazyDict::REP_JSON);
    EXPECT_EQ(record->headers, request->GetOptionalHeaders());
    EXPECT_EQ(record->partnerId_isSet, 0);
    EXPECT_EQ(record->partnerId, 0u);
    EXPECT_EQ(record->GetRefCount(), 1u);
}

TEST_F(ConversionToV1Test, EmptyHeadersAreThere) {
    const ref<Dict> headers = RecordOf<OrvoRpcRequest>(Request())->headers;
    ASSERT_NE(headers, nullptr);
    EXPECT_EQ(JsonOf(headers), "{}");
    EXPECT_NE(RecordOf<OrvoRpcResponse>(Response())->headers, nullptr);
}

TEST_F(ConversionToV1Test, ARequestWithoutBody) {
    const ref<RequestWrapper> request =
        RequestWrapper::New(&pool, 7, "t", RequestWrapper::RESPONSE_COUNT_SINGLE, 26, nullptr, nullptr);
    EXPECT_EQ(RecordOf<OrvoRpcRequest>(request)->request, nullptr);
}

// Numbers have 32 bits in both forms.
TEST_F(ConversionToV1Test, Numbers) {
    const Count single = RequestWrapper::RESPONSE_COUNT_SINGLE;
    struct Row {
        uint32_t inMessage;
        int32_t inRecord;
    };
    for (const Row& row :
         {Row{0, 0}, Row{2147483647, 2147483647}, Row{2147483648u, -2147483647 - 1}, Row{4294967295u, -1}}) {
        EXPECT_EQ(RecordOf<OrvoRpcRequest>(
                      RequestWrapper::New(&pool, row.inMessage, "t", single, 0, Body(), nullptr))
                      ->rpcId,
                  row.inRecord);
        EXPECT_EQ(RecordOf<OrvoRpcResponse>(ResponseWrapper::New(&pool, row.inMessage, true, Body(), nullptr))
                      ->rpcId,
                  row.inRecord);
        EXPECT_EQ(RecordOf<OrvoRpcCancel>(CancelWrapper::New(&pool, row.inMessage, nullptr))->rpcId,
                  row.inRecord);
    }
    for (const int version : {0, -1, 65562, 2147483647}) {
        EXPECT_EQ(
            RecordOf<OrvoRpcRequest>(RequestWrapper::New(&pool, 1, "t", single, version, Body(), nullptr))
                ->orvoVersion,
            version);
    }
}

// An update is a request, and that is what it becomes; never an OrvoRpcRequestUpdate.
TEST_F(ConversionToV1Test, UpdateBecomesARequest) {
    const ref<RequestUpdateWrapper> update = Update(Headers(R"({"A": "1"})"));
    const ref<OrvoRpcRequest> record = RecordOf<OrvoRpcRequest>(update);
    EXPECT_EQ(record->rpcId, 7);
    EXPECT_EQ(record->orvoVersion, 0);
    EXPECT_TRUE(record->monitorFutureChanges);
    EXPECT_FALSE(record->sendAndForget);
    EXPECT_EQ(record->sendAndForget_isSet, 1);
    EXPECT_EQ(record->request, update->GetBody());
    EXPECT_EQ(record->headers, update->GetOptionalHeaders());
    EXPECT_EQ(record->partnerId_isSet, 0);
}

TEST_F(ConversionToV1Test, ResponseHasNoVersion) {
    for (const bool isFinal : {true, false}) {
        const ref<ResponseWrapper> response = Response(Headers(R"({"A": "1"})"), isFinal);
        const ref<OrvoRpcResponse> record = RecordOf<OrvoRpcResponse>(response);
        EXPECT_EQ(record->rpcId, 7);
        EXPECT_EQ(record->isFinalResponse, isFinal);
        EXPECT_EQ(record->response, response->GetBody());
        EXPECT_EQ(record->headers, response->GetOptionalHeaders());
        EXPECT_EQ(response->GetOrvoVersion().Number(), 26);
        EXPECT_EQ(record->orvoVersion_isSet, 0);
        EXPECT_EQ(record->orvoVersion, 0);
    }
}

TEST_F(ConversionToV1Test, TheResponseIsAskedWhetherItIsFinal) {
    const ref<OrvoRpcWrapper> response(new (&pool) OwnFinalResponse(7, false, Body(), nullptr));
    EXPECT_TRUE(RecordOf<OrvoRpcResponse>(response)->isFinalResponse);
}

TEST_F(ConversionToV1Test, CancelHasNoHeaders) {
    const ref<OrvoRpcCancel> record =
        RecordOf<OrvoRpcCancel>(CancelWrapper::New(&pool, 9, Headers(R"({"A": "1"})")));
    EXPECT_EQ(record->rpcId, 9);
    EXPECT_EQ(record->headers, nullptr);
}

// The whole record, by its dictionary.
TEST_F(ConversionToV1Test, AsText) {
    EXPECT_EQ(Text(RecordOf<OrvoRpcRequest>(Request(Headers(R"({"A": "1"})")))->ToString(false, 0)),
              std::string(R"({"headers": {"A": "1"}, "monitorFutureChanges": false, "orvoVersion": 26, )"
                          R"("request": )") +
                  bodyTextG + R"(, "rpcId": 7, "sendAndForget": false, "type": "orvoRpcRequest"})");
    EXPECT_EQ(Text(RecordOf<OrvoRpcResponse>(Response())->ToString(false, 0)),
              std::string(R"({"headers": {}, "isFinalResponse": true, "response": )") + bodyTextG +
                  R"(, "rpcId": 7, "type": "orvoRpcResponse"})");
    EXPECT_EQ(Text(RecordOf<OrvoRpcCancel>(Cancel())->ToString(false, 0)),
              R"({"rpcId": 7, "type": "orvoRpcCancel"})");
}

}  // namespace sorntest
