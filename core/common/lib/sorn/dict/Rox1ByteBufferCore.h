#pragma once

#include "sorn/dict/RoxByteBuffer.h"

namespace sorn {

/// A counted byte array that can be appended to. It is meant for few large appends: each run of bytes
/// reallocates.
class Rox1ByteBufferCore final : public rox::ByteBuffer {
 public:
    static const char classTagG;

    Rox1ByteBufferCore() = default;
    /// With the pool that it is allocated in at hand.
    explicit Rox1ByteBufferCore(RoxMempool* pool) : rox::ByteBuffer(pool) {}

    /// Doubles the storage when it is full, as far as 4,294,967,295 bytes; RoxAssertFail for one byte more,
    /// here and below.
    void AppendByte(unsigned char b);
    /// n bytes, which do not lie in this buffer; the capacity is exactly the new length then, 8 at least.
    void AppendBytes(const unsigned char* bytes, unsigned n);
    /// Same length and bytes; the capacity does not count. The other must not be null.
    bool FEqual(const Rox1ByteBufferCore* other) const;

    void* VkCastHelper(const void* classTag) override;
};

}  // namespace sorn
