#pragma once

#include <cstddef>
#include <cstdint>

#include "vkbus/VkBus.h"

/// Counts the bytes of a message's body as it is written or read, padding included, so that both ends hold it
/// against the same limit.
class BusWireSize {
 public:
    uint32_t Get() const { return nBytesM; }
    /// Whether an addition went beyond the limit.
    bool FExceeded() const { return fExceededM; }
    /// Adds so many bytes at a multiple of `align`; false beyond the limit.
    bool Add(size_t align, uint64_t n) {
        const uint64_t sum = (nBytesM + align - 1) / align * align + n;
        if (sum > maxVkBusEventBytesG) {
            fExceededM = true;
            return false;
        }
        nBytesM = static_cast<uint32_t>(sum);
        return true;
    }
    bool AddText(size_t length) { return Add(4, uint64_t{4} + length + 1); }
    bool AddSignature(size_t length) { return Add(1, uint64_t{1} + length + 1); }

 private:
    uint32_t nBytesM = 0;
    bool fExceededM = false;
};
