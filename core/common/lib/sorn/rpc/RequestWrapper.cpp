#include "sorn/rpc/RequestWrapper.h"

#include "sorn/lazy/LazyDict.h"
#include "sorn/rpc/OptionalHeaders.h"
#include "sorn/rpc/ReservedHeaders.h"

namespace sorn {

namespace {

// Not the same: "type" never survives being set and can be added. Both are required.
constexpr const char* vRemovedG[] = {header::requestTypeG, header::schemaVersionG, header::responseCountG,
                                     header::typeG,        header::lowerTypeG,     header::rpcIdG,
                                     header::contentTypeG};
constexpr const char* vRefusedG[] = {header::requestTypeG, header::schemaVersionG, header::responseCountG,
                                     header::typeG,        header::rpcIdG,         header::contentTypeG};

constexpr const char* vResponseCountWordsG[] = {"none", "single", "multiple"};

}  // namespace

const char* RequestWrapper::ResponseCountWord(ResponseCount count) {
    const auto number = static_cast<unsigned>(count);
    return number < std::size(vResponseCountWordsG) ? vResponseCountWordsG[number] : "";
}

bool RequestWrapper::ParseResponseCount(std::string_view word, ResponseCount& count) {
    for (unsigned i = 0; i < std::size(vResponseCountWordsG); ++i) {
        if (word == vResponseCountWordsG[i]) {
            count = static_cast<ResponseCount>(i);
            return true;
        }
    }
    return false;
}

ref<RequestWrapper> RequestWrapper::New(RoxMempool* pool, uint32_t rpcId, const RoxString& requestType,
                                        ResponseCount count, OrvoVersion version, const ref<LazyDict>& body,
                                        const ref<Dict>& headers) {
    return ref<RequestWrapper>(new (pool) RequestWrapper(rpcId, requestType, count, version, body, headers));
}

ref<RequestWrapper> RequestWrapper::New(RoxMempool* pool, uint32_t rpcId, ResponseCount count,
                                        OrvoVersion version, const ref<SornObject>& object,
                                        const ref<Dict>& headers) {
    return ref<RequestWrapper>(new (pool) RequestWrapper(rpcId, count, version, object, headers));
}

RequestWrapper::RequestWrapper(uint32_t rpcId, const RoxString& requestType, ResponseCount count,
                               OrvoVersion version, const ref<LazyDict>& body, const ref<Dict>& headers)
    : OrvoRpcWrapper(rpcId, version),
      requestTypeM(requestType),
      responseCountM(count),
      bodyM(body),
      contentTypeM(ApplicationJson()),
      optionalHeadersM(HeadersOrEmpty(GetMempool(), headers)) {}

RequestWrapper::RequestWrapper(uint32_t rpcId, ResponseCount count, OrvoVersion version,
                               const ref<SornObject>& object, const ref<Dict>& headers)
    : OrvoRpcWrapper(rpcId, version),
      requestTypeM(object->GetTypeName()),
      responseCountM(count),
      bodyM(LazyDict::FromSornObject(GetMempool(), object, version)),
      contentTypeM(ApplicationJson()),
      optionalHeadersM(HeadersOrEmpty(GetMempool(), headers)) {}

RequestWrapper::~RequestWrapper() = default;

RoxString RequestWrapper::GetTypeName() {
    return requestTypeM;
}

void RequestWrapper::GetReservedHeaders(ReservedHeaders& headers, const char* type) const {
    headers.Add(header::typeG, type);
    headers.AddNumber(header::rpcIdG, rpcIdM);
    headers.AddNumber(header::schemaVersionG, static_cast<uint32_t>(orvoVersionM.Number()));
    headers.Add(header::responseCountG, ResponseCountWord(responseCountM));
    headers.Add(header::contentTypeG, header::applicationJsonG);
    headers.Add(header::requestTypeG, requestTypeM.View());
}

ref<Dict> RequestWrapper::HeadersToDict(RoxMempool* pool) const {
    ReservedHeaders reserved;
    GetReservedHeaders(reserved);
    return reserved.ToDict(pool, optionalHeadersM.get());
}

ref<Dict> RequestWrapper::BodyToDict() {
    return bodyM.ToDict();
}

RoxString RequestWrapper::BodyToJson(bool pretty) {
    return bodyM.ToJson(pretty);
}

void RequestWrapper::BodyToJsonByteBuffer(ByteBuffer& out, bool pretty) {
    bodyM.ToJsonByteBuffer(out, pretty);
}

void RequestWrapper::BodyToJsonByteSink(kelbaselib::Bytesink& out, bool pretty) {
    bodyM.ToJsonBytesink(out, pretty);
}

bool RequestWrapper::FReserved(std::string_view name) {
    return FOneOf(name, vRemovedG);
}

void RequestWrapper::SetOptionalHeaders(const ref<Dict>& headers) {
    RemoveHeaders(*headers, vRemovedG);
    optionalHeadersM = headers;
}

void RequestWrapper::SetOptionalHeaders(const ref<Dictionary>& headers) {
    SetOptionalHeaders(ref<Dict>(new (GetMempool()) Dict(headers)));
}

bool RequestWrapper::AddOptionalHeader(const RoxString& name, const RoxString& value) {
    return AddHeaderUnless(*optionalHeadersM, name, value, vRefusedG);
}

ref<SornObject> RequestWrapper::UnmarshalToSornObject() {
    return bodyM.Unmarshal(GetMempool(), orvoVersionM);
}

bool RequestWrapper::operator==(const RequestWrapper& other) const {
    return rpcIdM == other.rpcIdM && requestTypeM == other.requestTypeM &&
           responseCountM == other.responseCountM && orvoVersionM == other.orvoVersionM &&
           contentTypeM == other.contentTypeM && bodyM == other.bodyM &&
           *optionalHeadersM == *other.optionalHeadersM;
}

}  // namespace sorn
