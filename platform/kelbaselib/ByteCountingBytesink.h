#pragma once

#include <cstdint>

#include "kelbaselib/Bytesink.h"

namespace kelbaselib {

/// Keeps nothing and counts the bytes given to it.
class ByteCountingBytesink final : public Bytesink {
 public:
    ByteCountingBytesink() = default;
    ~ByteCountingBytesink() override;

    unsigned Write(const void* bytes, unsigned count) override;
    uint64_t GetWrittenBytes() const { return writtenBytesM; }

 private:
    uint64_t writtenBytesM = 0;
};

}  // namespace kelbaselib
