#include "sorn/rpc/CancelWrapper.h"

#include "sorn/dict/Dict.h"
#include "sorn/rpc/ReservedHeaders.h"

namespace sorn {

ref<CancelWrapper> CancelWrapper::New(RoxMempool* pool, uint32_t rpcId, const ref<Dict>& headers) {
    return ref<CancelWrapper>(new (pool) CancelWrapper(rpcId, headers));
}

CancelWrapper::CancelWrapper(uint32_t rpcId, const ref<Dict>&) : OrvoRpcWrapper(rpcId, 0) {}

CancelWrapper::~CancelWrapper() = default;

RoxString CancelWrapper::GetTypeName() {
    return RoxString(GetMempool(), "Cancel");
}

void CancelWrapper::GetReservedHeaders(ReservedHeaders& headers) const {
    headers.Add(header::typeG, "cancel");
    headers.AddNumber(header::rpcIdG, rpcIdM);
}

ref<Dict> CancelWrapper::HeadersToDict(RoxMempool* pool) const {
    ReservedHeaders reserved;
    GetReservedHeaders(reserved);
    return reserved.ToDict(pool, nullptr);
}

RoxString CancelWrapper::BodyToJson(bool) {
    return RoxString();
}

void CancelWrapper::BodyToJsonByteBuffer(ByteBuffer&, bool) {}

void CancelWrapper::BodyToJsonByteSink(kelbaselib::Bytesink&, bool) {}

}  // namespace sorn
