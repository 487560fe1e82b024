#include "service/Answers.h"

#include "service/Utf8Words.h"
#include "sorn/dict/ByteBuffer.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/lazy/LazyDict.h"
#include "sorn/rpc/OrvoRpcV2.h"
#include "sorn/rpc/ResponseWrapper.h"
#include "sornschema/Error.h"
#include "sornschema/Success.h"

namespace sorn::service {

namespace {

/// Bytes of words in an error; what goes beyond says no more.
constexpr size_t maxWordsBytesG = 4096;

RoxString ToText(RoxMempool& pool, std::string_view text) {
    return RoxString::FromUtf8Bytes(&pool, static_cast<unsigned>(text.size()), text.data());
}

}  // namespace

void Answers::SendMessage(uint32_t session, const ref<OrvoRpcWrapper>& message) {
    ByteBuffer bytes(&poolM);
    RoxString words;
    unsigned begin = 0;
    if (!OrvoRpcV2::MarshalInPlace(message, bytes, begin, words, &poolM)) return;
    sendM(session, {reinterpret_cast<const char*>(bytes.GetData()) + begin, bytes.GetLength() - begin});
}

void Answers::SendText(uint32_t session, uint32_t rpcId, bool isFinal, std::string_view text) {
    const ref<rox::ByteBuffer> bytes =
        rox::ByteBuffer::New(&poolM, text.data(), static_cast<uint32_t>(text.size()));
    const ref<LazyDict> body = LazyDict::FromBytestring(&poolM, bytes, OrvoVersion());
    SendMessage(session, ResponseWrapper::New(&poolM, rpcId, isFinal, body, nullptr));
}

void Answers::SendSuccess(uint32_t session, uint32_t rpcId) {
    SendMessage(session, ResponseWrapper::New(&poolM, rpcId, true, sornschema::Success::Factory(&poolM),
                                              OrvoVersion(), nullptr));
}

void Answers::SendError(uint32_t session, uint32_t rpcId, const Failure& failure) {
    const ref<SornObject> object = sornschema::Error::Factory(&poolM);
    auto& error = static_cast<sornschema::Error&>(*object);
    error.code = failure.code;
    error.text = ToText(poolM, Utf8Words(failure.text, maxWordsBytesG));
    SendMessage(session, ResponseWrapper::New(&poolM, rpcId, true, object, OrvoVersion(), nullptr));
}

}  // namespace sorn::service
