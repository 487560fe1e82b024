#pragma once

#include <string_view>

#include "sorn/dict/Dict.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/model/SornObject.h"
#include "sorn/rpc/OrvoRpcWrapper.h"
#include "sorn/rpc/WrapperBody.h"

namespace sorn {

class ResponseWrapper : public OrvoRpcWrapper {
 public:
    // Bodies and headers are shared as for requests.

    /// The body as it is, never null; its version is the message's.
    static ref<ResponseWrapper> New(RoxMempool* pool, uint32_t rpcId, bool isFinal, const ref<LazyDict>& body,
                                    const ref<Dict>& headers);
    /// The body is the object, which is not null, at the version; its struct gives the type's name.
    static ref<ResponseWrapper> New(RoxMempool* pool, uint32_t rpcId, bool isFinal,
                                    const ref<SornObject>& object, OrvoVersion version,
                                    const ref<Dict>& headers);
    ResponseWrapper(uint32_t rpcId, bool isFinal, const ref<LazyDict>& body, const ref<Dict>& headers);
    ResponseWrapper(uint32_t rpcId, bool isFinal, const ref<SornObject>& object, OrvoVersion version,
                    const ref<Dict>& headers);
    ~ResponseWrapper() override;

    RoxString GetTypeName() override;
    /// "Type", "RpcId", "IsFinal", "Content-Type", then the optional headers. The version is no header of a
    /// response.
    ref<Dict> HeadersToDict(RoxMempool* pool) const override;
    ref<Dict> BodyToDict() override;
    RoxString BodyToJson(bool pretty) override;
    void BodyToJsonByteBuffer(ByteBuffer& out, bool pretty) override;
    void BodyToJsonByteSink(kelbaselib::Bytesink& out, bool pretty) override;
    /// Whether it is the last response of its exchange.
    virtual bool IsFinalResponse();

    const ref<LazyDict>& GetBody() const { return bodyM.Get(); }
    /// "application/json", or what the message said that the response was read from, which may be nothing.
    const RoxString& GetContentType() const { return contentTypeM; }
    void SetContentType(const RoxString& contentType) { contentTypeM = contentType; }

    /// Never null.
    const ref<Dict>& GetOptionalHeaders() const { return optionalHeadersM; }
    const ref<Dictionary>& GetOptionalHeadersDictionary() const { return optionalHeadersM->GetDictionary(); }
    /// Removes the reserved names "IsFinal", "Type", "RpcId" and "Content-Type" from the dictionary, which
    /// the caller still holds, and takes it in place of the old one.
    void SetOptionalHeaders(const ref<Dict>& headers);
    void SetOptionalHeaders(const ref<Dictionary>& headers);
    /// Whether it removes the name.
    static bool FReserved(std::string_view name);
    /// False, and no change, for a reserved name.
    bool AddOptionalHeader(const RoxString& name, const RoxString& value);

    /// The body as an object, which is the body from now on and gives the type's name; null, and no change,
    /// when it does not convert.
    ref<SornObject> UnmarshalToSornObject();
    /// The same of a body that is given the version first. The new body has the message's version, not this
    /// one. On failure null and words, as LazyDict::ToSornObjectOrErrorString gives them.
    ref<SornObject> UnmarshalToSornObject(OrvoVersion version, RoxString& error);

    /// By number, body, content type, final mark and optional headers; not by version or type name.
    bool operator==(const ResponseWrapper& other) const;
    bool operator!=(const ResponseWrapper& other) const { return !(*this == other); }

    /// What HeadersToDict adds before the optional headers; views of this object.
    void GetReservedHeaders(ReservedHeaders& headers) const;

 private:
    ref<SornObject> TakeTypeName(const ref<SornObject>& object);

    WrapperBody bodyM;
    RoxString contentTypeM;
    bool isFinalM;
    RoxString typeNameM;
    ref<Dict> optionalHeadersM;
};

}  // namespace sorn
