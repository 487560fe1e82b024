#pragma once

#include <cstdint>
#include <cstring>

#include "rox/RoxStringRepN.h"
#include "sorn/json/TextScan.h"

namespace sorn {

/// The keys that a parse met lately, so that a key which comes again shares one representation, and its hash.
/// A key that another one has put out of its place is made anew: a cache, not an index. It holds no
/// references: the keys in it belong to the tree that the parse builds, which only grows meanwhile.
class KeyCache {
 public:
    /// Opens the cache, which must come before all else, for a parse of nInput bytes: a short text does not
    /// pay for many places, and one without keys for none.
    void Open(size_t nInput) {
        while (nBitsM < maxBitsG && nInput >> (nBitsM + 4) != 0) ++nBitsM;
        std::memset(vKeyM, 0, sizeof vKeyM[0] << nBitsM);
    }

    /// The key of these bytes, if it came lately, else null; n > 0. Keep may follow.
    RoxStringRepN* Find(const unsigned char* bytes, size_t n) {
        pPlaceM = &vKeyM[Index(bytes, n)];
        RoxStringRepN* const key = *pPlaceM;
        return key != nullptr && key->GetLength() == n && std::memcmp(key->GetBytes(), bytes, n) == 0
                   ? key
                   : nullptr;
    }
    /// Keeps the key that Find looked for last, once it belongs to the tree.
    void Keep(RoxStringRepN* key) { *pPlaceM = key; }

 private:
    static constexpr unsigned maxBitsG = 10;

    unsigned Index(const unsigned char* bytes, size_t n) const {
        constexpr uint64_t mixer = 0x9E3779B97F4A7C15;
        return static_cast<unsigned>((Fold(bytes, n) * mixer) >> (64 - nBitsM));
    }
    /// The length with the first and last bytes, eight of each at most.
    static uint64_t Fold(const unsigned char* bytes, size_t n) {
        using textscan::Word;
        if (n >= 8) return Word::Load(bytes) + 31 * Word::Load(bytes + n - 8) + n;
        uint64_t word = n;
        for (size_t i = 0; i < n; ++i) word = (word << 8) | bytes[i];
        return word;
    }

    RoxStringRepN** pPlaceM = vKeyM;
    unsigned nBitsM = 4;
    RoxStringRepN* vKeyM[1u << maxBitsG];  // 2^nBitsM of them are in use
};

}  // namespace sorn
