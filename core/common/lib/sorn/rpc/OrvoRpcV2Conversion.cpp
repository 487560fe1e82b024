#include "sorn/dict/Dict.h"
#include "sorn/lazy/LazyDict.h"
#include "sorn/rpc/CancelWrapper.h"
#include "sorn/rpc/OrvoRpcV2.h"
#include "sorn/rpc/RequestUpdateWrapper.h"
#include "sorn/rpc/RequestWrapper.h"
#include "sorn/rpc/ResponseWrapper.h"
#include "sornschema/OrvoRpcCancel.h"
#include "sornschema/OrvoRpcHello.h"
#include "sornschema/OrvoRpcRequest.h"
#include "sornschema/OrvoRpcRequestUpdate.h"
#include "sornschema/OrvoRpcResponse.h"

namespace sorn {

namespace {

using sornschema::OrvoRpcCancel;
using sornschema::OrvoRpcHello;
using sornschema::OrvoRpcRequest;
using sornschema::OrvoRpcRequestUpdate;
using sornschema::OrvoRpcResponse;

/// A new record with the message's number, which both forms hold in 32 bits.
template <class Record>
ref<Record> NewRecord(RoxMempool* pool, const OrvoRpcWrapper& wrapper) {
    ref<Record> record(new (pool) Record);
    record->rpcId = static_cast<int32_t>(wrapper.GetRpcId());
    return record;
}

ref<SornObject> RecordOfRequest(RoxMempool* pool, const RequestWrapper& request) {
    const RequestWrapper::ResponseCount count = request.GetResponseCount();
    ref<OrvoRpcRequest> record = NewRecord<OrvoRpcRequest>(pool, request);
    record->orvoVersion = request.GetOrvoVersion().Number();
    record->request = request.GetBody();
    record->monitorFutureChanges = count == RequestWrapper::RESPONSE_COUNT_MULTIPLE;
    record->sendAndForget = count == RequestWrapper::RESPONSE_COUNT_NONE;
    record->sendAndForget_isSet = 1;
    record->headers = request.GetOptionalHeaders();
    return record;
}

ref<SornObject> RecordOfUpdate(RoxMempool* pool, const RequestUpdateWrapper& update) {
    ref<OrvoRpcRequestUpdate> record = NewRecord<OrvoRpcRequestUpdate>(pool, update);
    record->request = update.GetBody();
    record->headers = update.GetOptionalHeaders();
    return record;
}

ref<SornObject> RecordOfResponse(RoxMempool* pool, ResponseWrapper& response) {
    ref<OrvoRpcResponse> record = NewRecord<OrvoRpcResponse>(pool, response);
    record->response = response.GetBody();
    record->isFinalResponse = response.IsFinalResponse();
    record->headers = response.GetOptionalHeaders();
    return record;
}

/// A body of an older message made anew of its dictionary, and the name of its type.
struct RebuiltBody {
    RebuiltBody(RoxMempool* pool, const LazyDict& old, OrvoVersion version) {
        const ref<Dict> dict = old.ToDict();
        requestType = dict->GetString("type", 0);
        body = LazyDict::FromDict(pool, dict, static_cast<unsigned short>(version.Number()));
    }

    RoxString requestType;
    ref<LazyDict> body;
};

ref<OrvoRpcWrapper> WrapperOf(RoxMempool* pool, const OrvoRpcRequest& record) {
    if (record.request == nullptr) return nullptr;
    RequestWrapper::ResponseCount count = RequestWrapper::RESPONSE_COUNT_SINGLE;
    if (record.sendAndForget_isSet != 0 && record.sendAndForget) {
        count = RequestWrapper::RESPONSE_COUNT_NONE;
    } else if (record.monitorFutureChanges) {
        count = RequestWrapper::RESPONSE_COUNT_MULTIPLE;
    }
    const RebuiltBody rebuilt(pool, *record.request, record.orvoVersion);
    return RequestWrapper::New(pool, static_cast<uint32_t>(record.rpcId), rebuilt.requestType, count,
                               record.orvoVersion, rebuilt.body, record.headers);
}

ref<OrvoRpcWrapper> WrapperOf(RoxMempool* pool, const OrvoRpcRequestUpdate& record) {
    if (record.request == nullptr) return nullptr;
    const RebuiltBody rebuilt(pool, *record.request, record.request->GetVersion());
    return RequestUpdateWrapper::New(pool, static_cast<uint32_t>(record.rpcId), rebuilt.requestType,
                                     rebuilt.body, record.headers);
}

ref<OrvoRpcWrapper> WrapperOf(RoxMempool* pool, const OrvoRpcResponse& record) {
    if (record.response == nullptr) return nullptr;
    return ResponseWrapper::New(pool, static_cast<uint32_t>(record.rpcId), record.isFinalResponse,
                                record.response, record.headers);
}

/// The version of greetings, which stays when the schema goes on.
constexpr int helloVersionG = 7;

}  // namespace

ref<SornObject> OrvoRpcV2::OrvoRpcV2ToV1(RoxMempool* pool, const ref<OrvoRpcWrapper>& wrapper) {
    OrvoRpcWrapper* const p = wrapper.get();
    if (const auto* request = dynamic_cast<RequestWrapper*>(p)) return RecordOfRequest(pool, *request);
    // An update is a request, so this is never reached with one: they go out as requests, and peers of the
    // older form count on that.
    if (const auto* update = dynamic_cast<RequestUpdateWrapper*>(p)) return RecordOfUpdate(pool, *update);
    if (auto* response = dynamic_cast<ResponseWrapper*>(p)) return RecordOfResponse(pool, *response);
    if (const auto* cancel = dynamic_cast<CancelWrapper*>(p)) return NewRecord<OrvoRpcCancel>(pool, *cancel);
    return nullptr;
}

ref<OrvoRpcWrapper> OrvoRpcV2::OrvoRpcV1ToV2Wrapper(RoxMempool* pool, const ref<SornObject>& message) {
    if (message == nullptr) return nullptr;
    const SornObject& object = *message;
    switch (object.structId) {
        case OrvoRpcCancel::structIdG: {
            const auto& cancel = static_cast<const OrvoRpcCancel&>(object);
            return CancelWrapper::New(pool, static_cast<uint32_t>(cancel.rpcId), cancel.headers);
        }
        case OrvoRpcRequest::structIdG:
            return WrapperOf(pool, static_cast<const OrvoRpcRequest&>(object));
        case OrvoRpcResponse::structIdG:
            return WrapperOf(pool, static_cast<const OrvoRpcResponse&>(object));
        case OrvoRpcHello::structIdG:
            return RequestWrapper::New(pool, 0, RequestWrapper::RESPONSE_COUNT_NONE, helloVersionG, message,
                                       nullptr);
        case OrvoRpcRequestUpdate::structIdG:
            return WrapperOf(pool, static_cast<const OrvoRpcRequestUpdate&>(object));
        default:
            return nullptr;
    }
}

}  // namespace sorn
