#pragma once

#include <cstdint>

#include "rox/RoxCore.h"

/// Growable array of bytes, reference counted, in the pool of the object. Not thread-safe.
class RoxByteString : public RoxCore {
 public:
    static const char classTagG;

    RoxByteString() = default;
    ~RoxByteString() override;
    void* VkCastHelper(const void* classTag) override;

    uint32_t GetLength() const { return lengthM; }
    /// Null while the length is 0; changes when the length does.
    const unsigned char* GetBytes() const { return pBytesM; }
    unsigned char* MutableBytes() { return pBytesM; }

    /// Resizes to exactly n bytes. Bytes that are added are undefined until stored.
    void SetLength(uint32_t n);
    /// Stores at i < GetLength().
    void SetByte(uint32_t i, unsigned char b);
    /// Stores n bytes at `offset`; offset + n <= GetLength(). `bytes` may overlap this string's own.
    void SetBytes(uint32_t offset, uint32_t n, const void* bytes);

 private:
    unsigned char* pBytesM = nullptr;
    uint32_t lengthM = 0;
};
