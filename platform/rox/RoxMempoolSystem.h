#pragma once

#include <cstddef>

/// Memory from the operating system, in mappings aligned to roxmempool::chunkBytes. Thread-safe.
class RoxMempoolSystem {
 public:
    /// n rounded up to what can be mapped.
    static size_t RoundUp(size_t n);
    /// n bytes (a result of RoundUp), cleared, or null. `fWillBeUsed`: all of it will be touched soon.
    static void* Map(size_t n, bool fWillBeUsed);
    static void Unmap(void* p, size_t n);
    /// Resizes a mapping, moving it if it must, without touching the bytes; null (nothing changed) if that
    /// cannot be.
    static void* Remap(void* p, size_t oldBytes, size_t newBytes);
    /// Bytes mapped at this moment.
    static size_t GetMappedBytes();
};
