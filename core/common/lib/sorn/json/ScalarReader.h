#pragma once

#include <new>
#include <utility>

#include "sorn/dict/NullValue.h"
#include "sorn/dict/StringValue.h"
#include "sorn/json/QuotedText.h"

namespace sorn {

/// A new T in the pool, without a holder. T's constructor takes the pool first.
template <class T, class... Arguments>
T* NewValue(RoxMempool* pool, Arguments&&... arguments) {
    return ::new (RoxMempool::MallocIn(pool, sizeof(T))) T(pool, std::forward<Arguments>(arguments)...);
}

/// Reads one scalar from p on, where no white space stands, into a new value, which has no holder yet, and
/// gives the place behind it; null, with what was wrong in `words`, when there is none.
inline const unsigned char* ReadScalarAt(const unsigned char* p, const unsigned char* end, RoxMempool* pool,
                                         DictValue*& out, const char*& words) {
    if (p < end && *p == '"') {
        QuotedText text;
        if (!text.Find(p + 1, end)) {
            words = "Can't parse scalar field";
            return nullptr;
        }
        out = NewValue<StringValue>(pool, text.Take(pool), true);
        return text.Behind();
    }
    const unsigned char* const tokenEnd = textscan::FindTokenEnd(p, end);
    const size_t length = static_cast<size_t>(tokenEnd - p);
    if (length == 0) {
        words = "Empty scalar value";
        return nullptr;
    }
    if (length == 4 && std::memcmp(p, "null", 4) == 0) {
        out = NewValue<NullValue>(pool);
    } else {
        out = NewValue<StringValue>(pool, CutText(pool, p, length), false);
    }
    return tokenEnd;
}

}  // namespace sorn
