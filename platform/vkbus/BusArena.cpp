#include "vkbus/BusArena.h"

#include <algorithm>
#include <cstring>
#include <new>

#include "rox/RoxAssert.h"

BusArena::~BusArena() {
    while (pFirstM != nullptr) {
        Block* next = pFirstM->pNext;
        pLibraryM->release(pFirstM);
        pFirstM = next;
    }
}

void* BusArena::Take(size_t nBytes) {
    const size_t n = (nBytes + 7) / 8 * 8;
    if (n > nFreeM) {
        const size_t nBlock = std::max(n, blockBytesG - headG);
        void* memory = pLibraryM->allocate(headG + nBlock);
        if (memory == nullptr) {
            RoxAssertFail("bus: no memory for a record of %zu bytes", nBlock);
        }
        pFirstM = new (memory) Block{pFirstM};
        pFreeM = static_cast<unsigned char*>(memory) + headG;
        nFreeM = nBlock;
    }
    void* taken = pFreeM;
    pFreeM += n;
    nFreeM -= n;
    return memset(taken, 0, n);
}
