#pragma once

#include <cstddef>
#include <cstring>

namespace sorn {

/// Copies a block at each end of the n bytes, which are at least one block and at most two.
template <size_t nBlock>
void CopyEnds(const char* bytes, size_t n, unsigned char* out) {
    unsigned char first[nBlock];
    unsigned char last[nBlock];
    std::memcpy(first, bytes, nBlock);
    std::memcpy(last, bytes + n - nBlock, nBlock);
    std::memcpy(out, first, nBlock);
    std::memcpy(out + n - nBlock, last, nBlock);
}

/// Copies n bytes, which are few as a rule: without a call then. Gives the end of what is written; nothing
/// else is read or written.
inline unsigned char* CopyShort(const char* bytes, size_t n, unsigned char* out) {
    if (n > 32) {
        std::memcpy(out, bytes, n);
    } else if (n >= 16) {
        CopyEnds<16>(bytes, n, out);
    } else if (n >= 8) {
        CopyEnds<8>(bytes, n, out);
    } else if (n >= 4) {
        CopyEnds<4>(bytes, n, out);
    } else {
        for (size_t i = 0; i < n; ++i) out[i] = static_cast<unsigned char>(bytes[i]);
    }
    return out + n;
}

}  // namespace sorn
