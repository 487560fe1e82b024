#pragma once

#include "sorn/dict/ArrayValue.h"
#include "sorn/dict/DictValue.h"

/// How Dict sees what stands under a name: an array as its elements, anything else as one value, a null
/// reference as none.
namespace sorn::namedvalue {

/// The numbers that Dict::GetType gives.
enum Kind { TEXT = 0, DICT = 1, OTHER = 2 };

inline unsigned Count(const DictValue* value) {
    if (value == nullptr) return 0;
    return value->GetTag() == dictvalue::ARRAY ? static_cast<const ArrayValue*>(value)->CountValues() : 1;
}

/// Value i, or null.
inline DictValue* At(DictValue* value, unsigned i) {
    if (value == nullptr) return nullptr;
    if (value->GetTag() != dictvalue::ARRAY) return i == 0 ? value : nullptr;
    const auto* const array = static_cast<const ArrayValue*>(value);
    return i < array->CountValues() ? array->At(i) : nullptr;
}

inline Kind KindOf(const DictValue* value, bool& isLazy) {
    isLazy = false;
    if (value == nullptr) return OTHER;
    switch (value->GetTag()) {
        case dictvalue::STRING:
            return TEXT;
        case dictvalue::DICTIONARY:
            return DICT;
        case dictvalue::LAZY_DICT:
            isLazy = true;
            return DICT;
        default:
            return OTHER;
    }
}

}  // namespace sorn::namedvalue
