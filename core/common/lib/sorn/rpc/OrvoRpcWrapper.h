#pragma once

#include <cstdint>

#include "rox/RoxCore.h"
#include "rox/RoxString.h"
#include "rox/ref.h"
#include "sorn/dict/LazyBody.h"
#include "sorn/model/OrvoVersion.h"

namespace kelbaselib {
class Bytesink;
}

namespace sorn {

class ByteBuffer;
class Dict;
class Dictionary;
class ReservedHeaders;

/// One RPC message: a request, an update to a running request, a response or a cancel. It knows nothing of
/// bytes on a wire. The body stays in the form in which it came until somebody asks for another.
///
/// A message is complete when it is made. It has no lock: operations that change it, and conversions of its
/// body, must not run at the same time. Kinds are told apart by dynamic_cast; the run-time test of VkCast is
/// that of RoxCore and knows none of them.
class OrvoRpcWrapper : public RoxCore {
 public:
    ~OrvoRpcWrapper() override;

    /// The name of the body's type; "response" for a response whose type is not known yet, "Cancel" for a
    /// cancel.
    virtual RoxString GetTypeName() = 0;
    /// A new dictionary in the pool: the reserved headers of the kind, then the optional ones, whose texts it
    /// shares with the message: it must die before the message's pool.
    virtual ref<Dict> HeadersToDict(RoxMempool* pool) const = 0;
    /// The body as LazyDict::ToDict gives it; null without a body.
    virtual ref<Dict> BodyToDict();
    // The body's JSON text as the operations of LazyDict give it; nothing without a body.
    virtual RoxString BodyToJson(bool pretty) = 0;
    virtual void BodyToJsonByteBuffer(ByteBuffer& out, bool pretty) = 0;
    virtual void BodyToJsonByteSink(kelbaselib::Bytesink& out, bool pretty) = 0;

    /// The dictionary of HeadersToDict.
    ref<Dictionary> HeadersToDictionary(RoxMempool* pool) const;
    /// The dictionary of BodyToDict; null without a body.
    ref<Dictionary> BodyToDictionary();
    /// The headers, and the body under "body" if there is one.
    ref<Dict> ToDict(RoxMempool* pool);
    /// The same as compact JSON text.
    RoxString ToString(RoxMempool* pool);

    /// The number of the exchange; 0 is legal and belongs to greetings.
    uint32_t GetRpcId() const { return rpcIdM; }
    /// The schema version of the message, absent when it states none.
    OrvoVersion GetOrvoVersion() const { return orvoVersionM; }

 protected:
    OrvoRpcWrapper(uint32_t rpcId, OrvoVersion version) : rpcIdM(rpcId), orvoVersionM(version) {}

    uint32_t rpcIdM;
    OrvoVersion orvoVersionM;
};

}  // namespace sorn
