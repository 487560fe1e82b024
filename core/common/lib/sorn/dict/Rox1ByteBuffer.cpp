#include "sorn/dict/Rox1ByteBuffer.h"

#include <algorithm>

#include "rox/RoxAssert.h"

namespace sorn {

void Rox1ByteBuffer::Grow(unsigned n) {
    constexpr uint64_t maxLength = UINT32_MAX;
    if (uint64_t{lengthM} + n > maxLength) {
        RoxAssertFail("Rox1ByteBuffer: %lu bytes and %u more are too many",
                      static_cast<unsigned long>(lengthM), n);
    }
    const uint64_t capacity = storageM->GetLength();
    const uint64_t growth = std::max<uint64_t>(capacity / 5, 256);
    storageM->SetLength(static_cast<uint32_t>(std::min(n + capacity + growth, maxLength)));
}

}  // namespace sorn
