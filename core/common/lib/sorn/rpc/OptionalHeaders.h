#pragma once

#include <algorithm>
#include <iterator>
#include <string_view>

#include "rox/RoxString.h"
#include "rox/ref.h"
#include "sorn/dict/Dict.h"

namespace sorn {

/// "application/json", shared by all messages.
const RoxString& ApplicationJson();

/// The given headers, or a new empty Dict in the pool for null.
inline ref<Dict> HeadersOrEmpty(RoxMempool* pool, const ref<Dict>& headers) {
    return headers != nullptr ? headers : MakeDict(pool);
}

template <size_t n>
void RemoveHeaders(Dict& headers, const char* const (&vNames)[n]) {
    for (const char* name : vNames) headers.Remove(name);
}

template <size_t n>
bool FOneOf(std::string_view name, const char* const (&vNames)[n]) {
    return std::find(std::begin(vNames), std::end(vNames), name) != std::end(vNames);
}

/// Adds a header unless its name, compared exactly, is one of the given; tells whether it did. False, too,
/// when the name has 65,535 values.
template <size_t n>
bool AddHeaderUnless(Dict& headers, const RoxString& name, const RoxString& value,
                     const char* const (&vNames)[n]) {
    return !FOneOf(name.View(), vNames) && headers.AddString(name, value);
}

}  // namespace sorn
