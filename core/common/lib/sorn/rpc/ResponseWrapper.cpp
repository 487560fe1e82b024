#include "sorn/rpc/ResponseWrapper.h"

#include "rox/RoxAssert.h"
#include "sorn/lazy/LazyDict.h"
#include "sorn/rpc/OptionalHeaders.h"
#include "sorn/rpc/ReservedHeaders.h"

namespace sorn {

namespace {

constexpr const char* vReservedG[] = {header::isFinalG, header::typeG, header::rpcIdG, header::contentTypeG};

const RoxString& UnknownTypeName() {
    static const RoxString text("response");
    return text;
}

OrvoVersion VersionOf(const ref<LazyDict>& body) {
    RoxAssert(body != nullptr, "ResponseWrapper: no body");
    return body->GetVersion();
}

}  // namespace

ref<ResponseWrapper> ResponseWrapper::New(RoxMempool* pool, uint32_t rpcId, bool isFinal,
                                          const ref<LazyDict>& body, const ref<Dict>& headers) {
    return ref<ResponseWrapper>(new (pool) ResponseWrapper(rpcId, isFinal, body, headers));
}

ref<ResponseWrapper> ResponseWrapper::New(RoxMempool* pool, uint32_t rpcId, bool isFinal,
                                          const ref<SornObject>& object, OrvoVersion version,
                                          const ref<Dict>& headers) {
    return ref<ResponseWrapper>(new (pool) ResponseWrapper(rpcId, isFinal, object, version, headers));
}

ResponseWrapper::ResponseWrapper(uint32_t rpcId, bool isFinal, const ref<LazyDict>& body,
                                 const ref<Dict>& headers)
    : OrvoRpcWrapper(rpcId, VersionOf(body)),
      bodyM(body),
      contentTypeM(ApplicationJson()),
      isFinalM(isFinal),
      typeNameM(UnknownTypeName()),
      optionalHeadersM(HeadersOrEmpty(GetMempool(), headers)) {}

ResponseWrapper::ResponseWrapper(uint32_t rpcId, bool isFinal, const ref<SornObject>& object,
                                 OrvoVersion version, const ref<Dict>& headers)
    : OrvoRpcWrapper(rpcId, version),
      bodyM(LazyDict::FromSornObject(GetMempool(), object, version)),
      contentTypeM(ApplicationJson()),
      isFinalM(isFinal),
      typeNameM(object->GetTypeName()),
      optionalHeadersM(HeadersOrEmpty(GetMempool(), headers)) {}

ResponseWrapper::~ResponseWrapper() = default;

RoxString ResponseWrapper::GetTypeName() {
    return typeNameM;
}

void ResponseWrapper::GetReservedHeaders(ReservedHeaders& headers) const {
    headers.Add(header::typeG, "response");
    headers.AddNumber(header::rpcIdG, rpcIdM);
    headers.Add(header::isFinalG, isFinalM ? "true" : "false");
    headers.Add(header::contentTypeG, contentTypeM.View());
}

ref<Dict> ResponseWrapper::HeadersToDict(RoxMempool* pool) const {
    ReservedHeaders reserved;
    GetReservedHeaders(reserved);
    return reserved.ToDict(pool, optionalHeadersM.get());
}

ref<Dict> ResponseWrapper::BodyToDict() {
    return bodyM.ToDict();
}

RoxString ResponseWrapper::BodyToJson(bool pretty) {
    return bodyM.ToJson(pretty);
}

void ResponseWrapper::BodyToJsonByteBuffer(ByteBuffer& out, bool pretty) {
    bodyM.ToJsonByteBuffer(out, pretty);
}

void ResponseWrapper::BodyToJsonByteSink(kelbaselib::Bytesink& out, bool pretty) {
    bodyM.ToJsonBytesink(out, pretty);
}

bool ResponseWrapper::IsFinalResponse() {
    return isFinalM;
}

bool ResponseWrapper::FReserved(std::string_view name) {
    return FOneOf(name, vReservedG);
}

void ResponseWrapper::SetOptionalHeaders(const ref<Dict>& headers) {
    RemoveHeaders(*headers, vReservedG);
    optionalHeadersM = headers;
}

void ResponseWrapper::SetOptionalHeaders(const ref<Dictionary>& headers) {
    SetOptionalHeaders(ref<Dict>(new (GetMempool()) Dict(headers)));
}

bool ResponseWrapper::AddOptionalHeader(const RoxString& name, const RoxString& value) {
    return AddHeaderUnless(*optionalHeadersM, name, value, vReservedG);
}

ref<SornObject> ResponseWrapper::UnmarshalToSornObject() {
    return TakeTypeName(bodyM.Unmarshal(GetMempool(), orvoVersionM));
}

ref<SornObject> ResponseWrapper::UnmarshalToSornObject(OrvoVersion version, RoxString& error) {
    return TakeTypeName(bodyM.Unmarshal(GetMempool(), orvoVersionM, version, error));
}

ref<SornObject> ResponseWrapper::TakeTypeName(const ref<SornObject>& object) {
    if (object != nullptr) typeNameM = object->GetTypeName();
    return object;
}

bool ResponseWrapper::operator==(const ResponseWrapper& other) const {
    return rpcIdM == other.rpcIdM && bodyM == other.bodyM && contentTypeM == other.contentTypeM &&
           isFinalM == other.isFinalM && *optionalHeadersM == *other.optionalHeadersM;
}

}  // namespace sorn
