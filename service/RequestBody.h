#pragma once

#include <string_view>

#include "rox/RoxMempool.h"
#include "service/Failure.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/model/SornObject.h"
#include "sorn/model/StructInfo.h"
#include "sorn/rpc/RequestWrapper.h"

namespace sorn::service {

/// The body of a request of which the type is known and the version is one of the schema's.
struct RequestBody {
    std::string_view text;  // of the request, without white space around it
    OrvoVersion version;
    const StructInfo* pType = nullptr;
    ref<Dictionary> dictionary;

    /// Looks at the request and parses its body. False and words for a body that is no JSON text of the type
    /// that the request names, and for an unknown type or version.
    bool Read(RoxMempool* pool, const RequestWrapper& request, Failure& failure);
    /// The body as an object, by the rules for versions and required fields; null and words.
    ref<SornObject> ToObject(RoxMempool* pool, Failure& failure) const;
    /// The same of what is there: required fields may lack. Fields stand in their current form.
    ref<SornObject> ToPartialObject(RoxMempool* pool, Failure& failure) const;
};

}  // namespace sorn::service
