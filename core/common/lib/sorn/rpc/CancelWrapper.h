#pragma once

#include "sorn/rpc/OrvoRpcWrapper.h"

namespace sorn {

/// Ends a running request. It has no body and no optional headers.
class CancelWrapper : public OrvoRpcWrapper {
 public:
    /// The headers are accepted and dropped.
    static ref<CancelWrapper> New(RoxMempool* pool, uint32_t rpcId, const ref<Dict>& headers);
    CancelWrapper(uint32_t rpcId, const ref<Dict>& headers);
    ~CancelWrapper() override;

    RoxString GetTypeName() override;
    /// "Type" and "RpcId".
    ref<Dict> HeadersToDict(RoxMempool* pool) const override;
    RoxString BodyToJson(bool pretty) override;
    void BodyToJsonByteBuffer(ByteBuffer& out, bool pretty) override;
    void BodyToJsonByteSink(kelbaselib::Bytesink& out, bool pretty) override;

    /// By number only.
    bool operator==(const CancelWrapper& other) const { return rpcIdM == other.rpcIdM; }
    bool operator!=(const CancelWrapper& other) const { return !(*this == other); }

    /// What HeadersToDict adds; views of this object.
    void GetReservedHeaders(ReservedHeaders& headers) const;
};

}  // namespace sorn
