#pragma once

#include <cstdint>
#include <cstring>

#include "rox/RoxString.h"

namespace sorn {

/// What all SornHashTables share: the bucket counts and the hash of a run of bytes.
class SornHashTableUtil {
 public:
    /// Which form of Hash this build runs: 1 the little-endian one, 0 the big-endian one.
    static const uint8_t littleEndianG;
    static constexpr int nHashTableSizesG = 16;
    /// Bucket counts of a growing table, all primes.
    static const int32_t hashTableSizesG[nHashTableSizesG];

    /// Bob Jenkins's lookup3 hash of `length` bytes with initial value 0, but that the final mixing runs for
    /// no bytes, too. The value is the same on every host. Not keyed: for names of the schema, not for names
    /// from input.
    static uint32_t Hash(const unsigned char* bytes, int length);

    /// One form of Hash: groups of four bytes count with their first byte lowest, or highest.
    template <bool fLittleEndian>
    static uint32_t HashInOrder(const unsigned char* bytes, int length);
};

/// The functions of a SornHashTable for keys or values of type T.
template <class T>
struct SornHashTableUtilTemplate;

/// NUL-terminated texts, by their bytes; null is a key of its own.
template <>
struct SornHashTableUtilTemplate<const char*> {
    static uint32_t DefaultHash(const char* const& key) {
        if (key == nullptr) return 0;
        return SornHashTableUtil::Hash(reinterpret_cast<const unsigned char*>(key),
                                       static_cast<int>(std::strlen(key)));
    }
    static bool DefaultKeyCompare(const char* const& a, const char* const& b) {
        if (a == nullptr || b == nullptr) return a == b;
        return std::strcmp(a, b) == 0;
    }
    static void DefaultClear(const char*& key) { key = nullptr; }
};

template <>
struct SornHashTableUtilTemplate<RoxString> {
    static bool DefaultValueCompare(const RoxString& a, const RoxString& b) { return a == b; }
    static void DefaultClear(RoxString& value) { value = RoxString(); }
};

}  // namespace sorn
