#include "sorn/rpc/RequestUpdateWrapper.h"

#include "sorn/rpc/ReservedHeaders.h"

namespace sorn {

namespace {
constexpr char wordG[] = "requestUpdate";
}

ref<RequestUpdateWrapper> RequestUpdateWrapper::New(RoxMempool* pool, uint32_t rpcId,
                                                    const RoxString& requestType, const ref<LazyDict>& body,
                                                    const ref<Dict>& headers) {
    return ref<RequestUpdateWrapper>(new (pool) RequestUpdateWrapper(rpcId, requestType, body, headers));
}

ref<RequestUpdateWrapper> RequestUpdateWrapper::New(RoxMempool* pool, uint32_t rpcId,
                                                    const ref<SornObject>& object, const ref<Dict>& headers) {
    return ref<RequestUpdateWrapper>(new (pool) RequestUpdateWrapper(rpcId, object, headers));
}

RequestUpdateWrapper::RequestUpdateWrapper(uint32_t rpcId, const RoxString& requestType,
                                           const ref<LazyDict>& body, const ref<Dict>& headers)
    : RequestWrapper(rpcId, requestType, RESPONSE_COUNT_MULTIPLE, 0, body, headers) {}

RequestUpdateWrapper::RequestUpdateWrapper(uint32_t rpcId, const ref<SornObject>& object,
                                           const ref<Dict>& headers)
    : RequestWrapper(rpcId, RESPONSE_COUNT_MULTIPLE, 0, object, headers) {}

RequestUpdateWrapper::~RequestUpdateWrapper() = default;

ref<Dict> RequestUpdateWrapper::HeadersToDict(RoxMempool* pool) const {
    ref<Dict> dict = RequestWrapper::HeadersToDict(pool);
    dict->Remove(header::typeG);
    dict->AddString(header::typeG, wordG);
    return dict;
}

void RequestUpdateWrapper::GetReservedHeaders(ReservedHeaders& headers) const {
    RequestWrapper::GetReservedHeaders(headers, wordG);
}

}  // namespace sorn
