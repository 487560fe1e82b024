#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>

#include "rox/RoxString.h"

namespace sorn {

/// KeyCache for a parse whose keys come as copies: it holds the texts itself, since the tree of a stream may
/// lose what was built before the parse ends.
class KeyTexts {
 public:
    RoxString Get(RoxMempool* pool, const unsigned char* bytes, uint32_t n) {
        // Long keys are rare, and would be kept for nothing.
        if (n > maxBytesG) return RoxString::FromUtf8Bytes(pool, n, bytes);
        RoxString& text = vTextM[Index(bytes, n)];
        if (text.NByte() != n || std::memcmp(text.Utf8(), bytes, n) != 0) {
            text = RoxString::FromUtf8Bytes(pool, n, bytes);
        }
        return text;
    }

 private:
    static constexpr uint32_t maxBytesG = 64;
    static constexpr unsigned nBitsG = 8;

    static uint32_t Index(const unsigned char* bytes, uint32_t n) {
        uint32_t sum = n;
        for (uint32_t i = 0; i < n; ++i) sum = sum * 31 + bytes[i];
        return (sum * 0x9E3779B1u) >> (32 - nBitsG);
    }

    RoxString vTextM[1u << nBitsG];
};

}  // namespace sorn
