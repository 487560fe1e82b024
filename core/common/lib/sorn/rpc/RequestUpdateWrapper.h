#pragma once

#include "sorn/rpc/RequestWrapper.h"

namespace sorn {

/// A new query for a running request that has many responses.
class RequestUpdateWrapper : public RequestWrapper {
 public:
    // Response count "multiple" and no schema version; a body made of an object therefore has none either.
    // The rest is as for requests.

    static ref<RequestUpdateWrapper> New(RoxMempool* pool, uint32_t rpcId, const RoxString& requestType,
                                         const ref<LazyDict>& body, const ref<Dict>& headers);
    static ref<RequestUpdateWrapper> New(RoxMempool* pool, uint32_t rpcId, const ref<SornObject>& object,
                                         const ref<Dict>& headers);
    RequestUpdateWrapper(uint32_t rpcId, const RoxString& requestType, const ref<LazyDict>& body,
                         const ref<Dict>& headers);
    RequestUpdateWrapper(uint32_t rpcId, const ref<SornObject>& object, const ref<Dict>& headers);
    ~RequestUpdateWrapper() override;

    /// As of a request, with "requestUpdate" as the only "Type", added last.
    ref<Dict> HeadersToDict(RoxMempool* pool) const override;

    void GetReservedHeaders(ReservedHeaders& headers) const;
};

}  // namespace sorn
