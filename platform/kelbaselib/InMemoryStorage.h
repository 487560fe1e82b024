#pragma once

#include <cstdint>

#include "rox/RoxCore.h"

namespace kelbaselib {

/// The bytes that an in-memory stream and its sources share: one block, grown geometrically.
class InMemoryStorage final : public RoxCore {
 public:
    InMemoryStorage() = default;
    ~InMemoryStorage() override;

    /// Appends and gives how many bytes were taken, fewer than `count` at the limit of 32 bits. The bytes may
    /// be the storage's own.
    unsigned Append(const void* bytes, unsigned count);
    /// Copies up to `capacity` bytes from `position` on and gives how many.
    unsigned Copy(unsigned position, void* buffer, unsigned capacity) const;

    const unsigned char* GetData() const { return pDataM; }
    uint32_t GetLength() const { return lengthM; }

 private:
    unsigned char* pDataM = nullptr;
    uint32_t lengthM = 0;
    uint32_t capacityM = 0;
};

}  // namespace kelbaselib
