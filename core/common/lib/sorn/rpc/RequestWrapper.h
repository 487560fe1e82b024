#pragma once

#include <cstdint>
#include <string_view>

#include "sorn/dict/Dict.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/model/SornObject.h"
#include "sorn/rpc/OrvoRpcWrapper.h"
#include "sorn/rpc/WrapperBody.h"

namespace sorn {

/// A request. RequestUpdateWrapper derives from it, so that a test for a request succeeds on an update, too.
class RequestWrapper : public OrvoRpcWrapper {
 public:
    /// How many responses the sender expects. Other numbers are held, too: their word is empty.
    enum ResponseCount : uint32_t {
        RESPONSE_COUNT_NONE = 0,      ///< none: send and forget
        RESPONSE_COUNT_SINGLE = 1,    ///< exactly one
        RESPONSE_COUNT_MULTIPLE = 2,  ///< a stream, ended by a final one
    };

    /// The word on the wire, "none", "single" or "multiple"; empty for any other number.
    static const char* ResponseCountWord(ResponseCount count);
    /// The reverse; false, and `count` as it was, for any other word.
    static bool ParseResponseCount(std::string_view word, ResponseCount& count);

    // In all of them the body is shared, and so is the dictionary of optional headers, in which nothing is
    // filtered; null stands for a new empty one.

    /// The body as it is, and the name of its type.
    static ref<RequestWrapper> New(RoxMempool* pool, uint32_t rpcId, const RoxString& requestType,
                                   ResponseCount count, OrvoVersion version, const ref<LazyDict>& body,
                                   const ref<Dict>& headers);
    /// The body is the object, which is not null, at the version; its struct gives the type's name.
    static ref<RequestWrapper> New(RoxMempool* pool, uint32_t rpcId, ResponseCount count, OrvoVersion version,
                                   const ref<SornObject>& object, const ref<Dict>& headers);
    RequestWrapper(uint32_t rpcId, const RoxString& requestType, ResponseCount count, OrvoVersion version,
                   const ref<LazyDict>& body, const ref<Dict>& headers);
    RequestWrapper(uint32_t rpcId, ResponseCount count, OrvoVersion version, const ref<SornObject>& object,
                   const ref<Dict>& headers);
    ~RequestWrapper() override;

    RoxString GetTypeName() override;
    /// "Type", "RpcId", "SchemaVersion", "ResponseCount", "Content-Type", "RequestType", then the optional
    /// headers. "Content-Type" is always "application/json", whatever GetContentType says.
    ref<Dict> HeadersToDict(RoxMempool* pool) const override;
    ref<Dict> BodyToDict() override;
    RoxString BodyToJson(bool pretty) override;
    void BodyToJsonByteBuffer(ByteBuffer& out, bool pretty) override;
    void BodyToJsonByteSink(kelbaselib::Bytesink& out, bool pretty) override;

    /// The schema name of the body's type.
    const RoxString& GetRequestType() const { return requestTypeM; }
    ResponseCount GetResponseCount() const { return responseCountM; }
    const ref<LazyDict>& GetBody() const { return bodyM.Get(); }
    /// "application/json", or what the message said that the request was read from.
    const RoxString& GetContentType() const { return contentTypeM; }
    void SetContentType(const RoxString& contentType) { contentTypeM = contentType; }

    /// Never null.
    const ref<Dict>& GetOptionalHeaders() const { return optionalHeadersM; }
    const ref<Dictionary>& GetOptionalHeadersDictionary() const { return optionalHeadersM->GetDictionary(); }
    /// Removes the reserved names "RequestType", "SchemaVersion", "ResponseCount", "Type", "type", "RpcId"
    /// and "Content-Type" from the dictionary, which the caller still holds, and takes it in place of the old
    /// one.
    void SetOptionalHeaders(const ref<Dict>& headers);
    void SetOptionalHeaders(const ref<Dictionary>& headers);
    /// Whether it removes the name.
    static bool FReserved(std::string_view name);
    /// False, and no change, for a reserved name; "type" is none here.
    bool AddOptionalHeader(const RoxString& name, const RoxString& value);

    /// The body as an object, which is the body from now on; null, and no change, when it does not convert.
    ref<SornObject> UnmarshalToSornObject();

    /// All that was given, the body by LazyDict::operator==.
    bool operator==(const RequestWrapper& other) const;
    bool operator!=(const RequestWrapper& other) const { return !(*this == other); }

    /// What HeadersToDict adds before the optional headers; views of this object.
    void GetReservedHeaders(ReservedHeaders& headers) const { GetReservedHeaders(headers, "request"); }

 protected:
    void GetReservedHeaders(ReservedHeaders& headers, const char* type) const;

    RoxString requestTypeM;
    ResponseCount responseCountM;
    WrapperBody bodyM;
    RoxString contentTypeM;
    ref<Dict> optionalHeadersM;
};

}  // namespace sorn
