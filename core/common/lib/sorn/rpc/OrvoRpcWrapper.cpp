#include "sorn/rpc/OrvoRpcWrapper.h"

#include "sorn/dict/Dict.h"
#include "sorn/dict/Dictionary.h"

namespace sorn {

OrvoRpcWrapper::~OrvoRpcWrapper() = default;

ref<Dict> OrvoRpcWrapper::BodyToDict() {
    return nullptr;
}

ref<Dictionary> OrvoRpcWrapper::HeadersToDictionary(RoxMempool* pool) const {
    return HeadersToDict(pool)->GetDictionary();
}

ref<Dictionary> OrvoRpcWrapper::BodyToDictionary() {
    const ref<Dict> body = BodyToDict();
    return body == nullptr ? nullptr : body->GetDictionary();
}

ref<Dict> OrvoRpcWrapper::ToDict(RoxMempool* pool) {
    ref<Dict> dict = HeadersToDict(pool);
    if (const ref<Dict> body = BodyToDict(); body != nullptr) dict->AddDict("body", body);
    return dict;
}

RoxString OrvoRpcWrapper::ToString(RoxMempool* pool) {
    return ToDict(pool)->ToString(false);
}

}  // namespace sorn
