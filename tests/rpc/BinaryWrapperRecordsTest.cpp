// Records of messages through the ordinary writer, and what the reader of messages makes of its bytes.

#include <string>

#include "rox/RoxStringArray.h"
#include "rpc/BinaryWrapperFixture.h"
#include "sorn/rpc/CancelWrapper.h"
#include "sorn/rpc/OrvoRpcV2.h"
#include "sorn/rpc/RequestWrapper.h"
#include "sorn/rpc/ResponseWrapper.h"
#include "sornschema/OrvoRpcRequestUpdate.h"

namespace sorntest {

using namespace sorn;
using sornschema::OrvoRpcCancel;
using sornschema::OrvoRpcHello;
using sornschema::OrvoRpcRequest;
using sornschema::OrvoRpcRequestUpdate;
using sornschema::OrvoRpcResponse;

class BinaryWrapperRecordsTest : public BinaryWrapperFixture {
 protected:
    template <class Record>
    ref<Record> New() {
        return ref<Record>(static_cast<Record*>(Record::Factory(&pool).get()));
    }
    std::string Written(const ref<SornObject>& record) {
        return Hex(*Codec().MarshalKnownDict(record.get()));
    }
    /// A body with the contents of bodyG, in two representations.
    ref<LazyDict> ObjectBody() { return LazyDict::FromSornObject(&pool, Object(bodyJsonG), 0); }
    ref<LazyDict> TextBody() { return LazyDict::FromJsonString(&pool, RoxString(&pool, bodyJsonG), 0); }
    ref<SornObject> RecordOf(const ref<OrvoRpcWrapper>& wrapper) {
        return OrvoRpcV2::OrvoRpcV2ToV1(&pool, wrapper);
    }
};

TEST_F(BinaryWrapperRecordsTest, Request) {
    for (const ref<LazyDict>& body : {ObjectBody(), TextBody()}) {
        const ref<OrvoRpcRequest> record = New<OrvoRpcRequest>();
        record->monitorFutureChanges = true;
        record->request = body;
        record->rpcId = 5;
        record->orvoVersion = 26;
        // A number and its tag for each field, in the order of slots.
        const std::string hex = std::string("FA 3C 11 08 01 12 09 ") + bodyG + "18 0A 20 34";
        EXPECT_EQ(Written(record), hex);
        EXPECT_EQ(ReadHex(hex),
                  std::string("request monitor=1 rpcId=5 version=26 partner=- forget=- body=") + bodyJsonG);
        record->partnerId = 150;
        record->partnerId_isSet = 1;
        record->sendAndForget_isSet = 1;
        const std::string longer =
            std::string("FA 3C 16 08 01 12 09 ") + bodyG + "18 0A 20 34 28 96 01 30 00";
        EXPECT_EQ(Written(record), longer);
        EXPECT_EQ(ReadHex(longer),
                  std::string("request monitor=1 rpcId=5 version=26 partner=150 forget=0 body=") + bodyJsonG);
    }
}

TEST_F(BinaryWrapperRecordsTest, RequestWithHeadersIsNotReadBack) {
    const ref<OrvoRpcRequest> record = New<OrvoRpcRequest>();
    record->request = ObjectBody();
    record->headers = DictOf(R"({"A": "1"})");
    const std::string hex =
        std::string("FA 3C 1D 08 00 12 09 ") + bodyG + "18 00 20 00 3A 0A 22 08 32 01 41 42 03 12 01 31";
    EXPECT_EQ(Written(record), hex);
    EXPECT_EQ(ReadHex(hex), badG);
    record->headers = DictOf("{}");
    const std::string empty = std::string("FA 3C 13 08 00 12 09 ") + bodyG + "18 00 20 00 3A 00";
    EXPECT_EQ(Written(record), empty);
    EXPECT_EQ(ReadHex(empty), badG);
}

TEST_F(BinaryWrapperRecordsTest, Response) {
    const ref<OrvoRpcResponse> record = New<OrvoRpcResponse>();
    record->isFinalResponse = true;
    record->response = TextBody();
    record->rpcId = 5;
    const std::string hex = std::string("82 3D 0F 08 01 12 09 ") + bodyG + "18 0A";
    EXPECT_EQ(Written(record), hex);
    EXPECT_EQ(ReadHex(hex), std::string("response final=1 rpcId=5 body=") + bodyJsonG);
    record->orvoVersion = 26;
    record->orvoVersion_isSet = 1;
    EXPECT_EQ(Written(record), std::string("82 3D 11 08 01 12 09 ") + bodyG + "18 0A 20 34");
    EXPECT_EQ(ReadHex(Written(record)), badG);
    record->orvoVersion_isSet = 0;
    record->headers = DictOf("{}");
    EXPECT_EQ(Written(record), std::string("82 3D 11 08 01 12 09 ") + bodyG + "18 0A 2A 00");
    EXPECT_EQ(ReadHex(Written(record)), badG);
}

TEST_F(BinaryWrapperRecordsTest, CancelAndHello) {
    const ref<OrvoRpcCancel> cancel = New<OrvoRpcCancel>();
    cancel->rpcId = 5;
    EXPECT_EQ(Written(cancel), "F2 3C 02 08 0A");
    EXPECT_EQ(ReadHex("F2 3C 02 08 0A"), R"({"rpcId": 5, "type": "orvoRpcCancel"})");
    cancel->headers = DictOf(R"({"A": "1"})");
    EXPECT_EQ(Written(cancel), "F2 3C 0E 08 0A 12 0A 22 08 32 01 41 42 03 12 01 31");
    EXPECT_EQ(ReadHex(Written(cancel)), R"({"headers": {"A": "1"}, "rpcId": 5, "type": "orvoRpcCancel"})");

    const ref<OrvoRpcHello> hello = New<OrvoRpcHello>();
    hello->identity.Add(RoxString(&pool, "a"));
    EXPECT_EQ(Written(hello), "CA 5A 03 0A 01 61");
    hello->identity.Add(RoxString(&pool, "b"));
    EXPECT_EQ(Written(hello), "CA 5A 06 0A 01 61 0A 01 62");
    EXPECT_EQ(ReadHex(Written(hello)), R"({"identity": ["a", "b"], "type": "orvoRpcHello"})");
}

TEST_F(BinaryWrapperRecordsTest, UpdateIsNotReadBack) {
    const ref<OrvoRpcRequestUpdate> record = New<OrvoRpcRequestUpdate>();
    record->request = ObjectBody();
    record->rpcId = 5;
    const std::string hex = std::string("F2 8B 01 0D 12 09 ") + bodyG + "18 0A";
    EXPECT_EQ(Written(record), hex);
    EXPECT_EQ(ReadHex(hex), "error 3: bad object type: 2238");
}

// A message has headers, if empty ones, and so its record is not read back. Without them it is.
TEST_F(BinaryWrapperRecordsTest, MessagesByWayOfTheirRecords) {
    const ref<RequestWrapper> request =
        RequestWrapper::New(&pool, 5, "t", RequestWrapper::RESPONSE_COUNT_NONE, 26, TextBody(), nullptr);
    const ref<SornObject> record = RecordOf(request);
    EXPECT_EQ(ReadHex(Written(record)), badG);
    static_cast<OrvoRpcRequest&>(*record).headers = nullptr;
    EXPECT_EQ(ReadHex(Written(record)),
              std::string("request monitor=0 rpcId=5 version=26 partner=- forget=1 body=") + bodyJsonG);

    const ref<SornObject> answer = RecordOf(ResponseWrapper::New(&pool, 5, true, ObjectBody(), nullptr));
    EXPECT_EQ(ReadHex(Written(answer)), badG);
    static_cast<OrvoRpcResponse&>(*answer).headers = nullptr;
    EXPECT_EQ(ReadHex(Written(answer)), std::string("response final=1 rpcId=5 body=") + bodyJsonG);

    EXPECT_EQ(ReadHex(Written(RecordOf(CancelWrapper::New(&pool, 5, nullptr)))),
              R"({"rpcId": 5, "type": "orvoRpcCancel"})");
}

// What was read becomes a message, and an error none.
TEST_F(BinaryWrapperRecordsTest, ReadMessagesBecomeWrappers) {
    struct Row {
        std::string hex;
        std::string headers;  // "" for no message
    };
    const Row vRows[] = {
        {std::string("FA 3C 0F 12 09 ") + bodyG + "18 0A 30 01",
         R"({"Content-Type": "application/json", "RequestType": "everyTypeCompanion", "ResponseCount": "none", )"
         R"("RpcId": "5", "SchemaVersion": "0", "Type": "request"})"},
        {"FA 3C 06 12 02 0A 00 18 0A",
         R"({"Content-Type": "application/json", "RequestType": "error", "ResponseCount": "single", )"
         R"("RpcId": "5", "SchemaVersion": "0", "Type": "request"})"},
        {std::string("82 3D 0D 12 09 ") + bodyG + "18 0A",
         R"({"Content-Type": "application/json", "IsFinal": "false", "RpcId": "5", "Type": "response"})"},
        {"F2 3C 02 08 0A", R"({"RpcId": "5", "Type": "cancel"})"},
        {"CA 5A 03 0A 01 61",
         R"({"Content-Type": "application/json", "RequestType": "orvoRpcHello", "ResponseCount": "none", )"
         R"("RpcId": "0", "SchemaVersion": "7", "Type": "request"})"},
        {"FA 3C 00", ""},
        {"00", ""},
    };
    for (const Row& row : vRows) {
        const ExactBytes bytes(Bytes(row.hex));
        const ref<OrvoRpcWrapper> wrapper =
            OrvoRpcV2::OrvoRpcV1ToV2Wrapper(&pool, Codec().UnmarshalWrapper(bytes.Begin(), bytes.Size()));
        EXPECT_EQ(wrapper == nullptr ? "" : JsonOf(wrapper->HeadersToDict(&pool)), row.headers) << row.hex;
    }
}

}  // namespace sorntest
