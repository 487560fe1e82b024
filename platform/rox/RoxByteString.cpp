#include "rox/RoxByteString.h"

#include <cstring>

#include "rox/RoxAssert.h"

const char RoxByteString::classTagG = 0;

RoxByteString::~RoxByteString() {
    RoxMempool::FreeIn(pMempoolM, pBytesM);
}

void* RoxByteString::VkCastHelper(const void* classTag) {
    return classTag == &classTagG ? this : RoxCore::VkCastHelper(classTag);
}

void RoxByteString::SetLength(uint32_t n) {
    if (n == 0) {
        RoxMempool::FreeIn(pMempoolM, pBytesM);
        pBytesM = nullptr;
    } else {
        pBytesM = static_cast<unsigned char*>(RoxMempool::ReallocIn(pMempoolM, pBytesM, n));
    }
    lengthM = n;
}

void RoxByteString::SetByte(uint32_t i, unsigned char b) {
    RoxAssert(i < lengthM, "RoxByteString::SetByte: index out of range");
    pBytesM[i] = b;
}

void RoxByteString::SetBytes(uint32_t offset, uint32_t n, const void* bytes) {
    RoxAssert(offset <= lengthM && n <= lengthM - offset, "RoxByteString::SetBytes: range out of bounds");
    if (n != 0) {
        memmove(pBytesM + offset, bytes, n);
    }
}
