#include "sorn/dict/Rox1ByteBufferCore.h"

#include <algorithm>
#include <cstring>

#include "rox/RoxAssert.h"

namespace sorn {

const char Rox1ByteBufferCore::classTagG = 0;

namespace {

uint32_t CheckedLength(uint64_t length) {
    RoxAssert(length <= UINT32_MAX, "Rox1ByteBufferCore: too many bytes");
    return static_cast<uint32_t>(length);
}

}  // namespace

void Rox1ByteBufferCore::AppendByte(unsigned char b) {
    const uint32_t length = GetLength();
    if (length == GetCapacity()) {
        CheckedLength(uint64_t{length} + 1);
        bytesM.Realloc(static_cast<uint32_t>(std::min<uint64_t>(uint64_t{length} * 2, UINT32_MAX)));
    }
    bytesM.GetData()[length] = b;
    bytesM.SetLength(length + 1);
}

void Rox1ByteBufferCore::AppendBytes(const unsigned char* bytes, unsigned n) {
    if (n == 0) return;
    const uint32_t length = GetLength();
    bytesM.Realloc(CheckedLength(uint64_t{length} + n));
    std::memcpy(bytesM.GetData() + length, bytes, n);
    bytesM.SetLength(length + n);
}

bool Rox1ByteBufferCore::FEqual(const Rox1ByteBufferCore* other) const {
    const uint32_t length = GetLength();
    return length == other->GetLength() &&
           (length == 0 || std::memcmp(GetData(), other->GetData(), length) == 0);
}

void* Rox1ByteBufferCore::VkCastHelper(const void* classTag) {
    return classTag == &classTagG ? this : rox::ByteBuffer::VkCastHelper(classTag);
}

}  // namespace sorn
