#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <string_view>

#include "sorn/json/TextScan.h"
#include "sorn/model/FieldInfo.h"

namespace sorn {

/// A key as programs write it, the name in quotes and the colon behind it, and the field that it stands for.
class FieldKey {
 public:
    /// Bytes of the longest key; as many are looked at.
    static constexpr size_t maxBytesG = 32;

    /// A key without text, which is found nowhere.
    explicit constexpr FieldKey(const FieldInfo* field)
        : pFieldM(field), isTextM(field != nullptr && FHoldsText(*field)) {}
    /// The key of a name, without text if that is too long. The name has nothing that would be escaped.
    FieldKey(std::string_view name, const FieldInfo* field) : FieldKey(field) {
        if (name.size() + 3 > maxBytesG) return;
        nByteM = static_cast<uint8_t>(name.size() + 3);
        vByteM[0] = '"';
        std::copy(name.begin(), name.end(), vByteM + 1);
        vByteM[nByteM - 2] = '"';
        vByteM[nByteM - 1] = ':';
    }

    /// Whether it stands at p, from where on maxBytesG bytes can be read.
    bool FAt(const unsigned char* p) const {
#if defined(__SSE2__)
        const uint64_t equal = EqualBytes(p, vByteM) | EqualBytes(p + 16, vByteM + 16) << 16;
        // The lowest byte that differs lies behind the key.
        return nByteM != 0 && ((~equal) << (64 - nByteM)) == 0;
#else
        uint64_t difference = 0;
        size_t i = 0;
        for (; i + 8 < nByteM; i += 8)
            difference |= textscan::Word::Load(p + i) ^ textscan::Word::Load(vByteM + i);
        const uint64_t last = textscan::Word::Load(p + i) ^ textscan::Word::Load(vByteM + i);
        return nByteM != 0 && (difference | last << (8 * (8 - (nByteM - i)))) == 0;
#endif
    }
    size_t Bytes() const {
        return nByteM;
    }
    /// Null for a key that is known and has no field.
    const FieldInfo* Field() const {
        return pFieldM;
    }
    /// Whether a value of the field is one text or token.
    bool FText() const {
        return isTextM;
    }

 private:
    static constexpr bool FHoldsText(const FieldInfo& field) {
        constexpr uint32_t othersG = 1u << SORN_DATA_TYPE_ANY_DICT | 1u << SORN_DATA_TYPE_KNOWN_DICT |
                                     1u << SORN_DATA_TYPE_KNOWN_DICT_AS_LAZY | 1u << SORN_DATA_TYPE_OBJECT;
        return field.arity != SORN_ARITY_MULTI && field.dataType < SORN_DATA_TYPE_NONE &&
               (othersG >> field.dataType & 1) == 0;
    }

#if defined(__SSE2__)
    static uint64_t EqualBytes(const unsigned char* a, const unsigned char* b) {
        const __m128i equal = _mm_cmpeq_epi8(_mm_loadu_si128(reinterpret_cast<const __m128i*>(a)),
                                             _mm_loadu_si128(reinterpret_cast<const __m128i*>(b)));
        return static_cast<unsigned>(_mm_movemask_epi8(equal));
    }
#endif

    unsigned char vByteM[maxBytesG] = {};
    const FieldInfo* pFieldM;
    uint8_t nByteM = 0;  ///< 0 for none
    bool isTextM;
};

}  // namespace sorn
