#pragma once

#include <string>

#include "convert/ConvertFixture.h"
#include "sorn/dict/Dict.h"
#include "sorn/lazy/LazyDict.h"
#include "sorn/rpc/CancelWrapper.h"
#include "sorn/rpc/RequestUpdateWrapper.h"
#include "sorn/rpc/RequestWrapper.h"
#include "sorn/rpc/ResponseWrapper.h"

namespace sorntest {

// The body of most messages: as it arrives, as a dictionary's text, and as the typed writer's.
inline constexpr char bodyTextG[] = R"({"type":"everyTypeCompanion","number":5})";
inline constexpr char bodySortedG[] = R"({"number": 5, "type": "everyTypeCompanion"})";

/// A test that makes messages in a pool of its own.
class WrapperFixture : public ConvertFixture {
 protected:
    using Count = sorn::RequestWrapper::ResponseCount;

    /// A body of JSON text.
    ref<sorn::LazyDict> Body(const std::string& json = bodyTextG, int version = 0) {
        return sorn::LazyDict::FromJsonString(&pool, RoxString(&pool, json.c_str()), version);
    }
    /// Headers of a JSON text: arrays are several values of a name.
    ref<sorn::Dict> Headers(const std::string& json) {
        return ref<sorn::Dict>(new (&pool) sorn::Dict(Parse(json)));
    }
    ref<sorn::RequestWrapper> Request(const ref<sorn::Dict>& headers = nullptr,
                                      Count count = sorn::RequestWrapper::RESPONSE_COUNT_SINGLE) {
        return sorn::RequestWrapper::New(&pool, 7, "everyTypeCompanion", count, 26, Body(), headers);
    }
    ref<sorn::RequestUpdateWrapper> Update(const ref<sorn::Dict>& headers = nullptr) {
        return sorn::RequestUpdateWrapper::New(&pool, 7, "everyTypeCompanion", Body(), headers);
    }
    ref<sorn::ResponseWrapper> Response(const ref<sorn::Dict>& headers = nullptr, bool isFinal = true) {
        return sorn::ResponseWrapper::New(&pool, 7, isFinal, Body(bodyTextG, 26), headers);
    }
    ref<sorn::CancelWrapper> Cancel() { return sorn::CancelWrapper::New(&pool, 7, nullptr); }

    static std::string JsonOf(const ref<sorn::Dict>& dict) {
        return dict == nullptr ? "null" : Text(dict->ToString(false));
    }
    std::string HeadersOf(const sorn::OrvoRpcWrapper& wrapper) {
        return JsonOf(wrapper.HeadersToDict(&pool));
    }
};

}  // namespace sorntest
