#include "kelbaselib/InMemoryStorage.h"

#include <algorithm>
#include <cstring>

namespace kelbaselib {

InMemoryStorage::~InMemoryStorage() {
    RoxMempool::FreeIn(pMempoolM, pDataM);
}

unsigned InMemoryStorage::Append(const void* bytes, unsigned count) {
    unsigned n = std::min(count, UINT32_MAX - lengthM);
    if (n == 0) {
        return 0;
    }
    if (n > capacityM - lengthM) {
        // Growing moves the storage, and with it bytes that are its own.
        uintptr_t offset = reinterpret_cast<uintptr_t>(bytes) - reinterpret_cast<uintptr_t>(pDataM);
        bool fOwn = offset < lengthM;
        uint64_t doubled = std::min<uint64_t>(uint64_t{2} * capacityM, UINT32_MAX);
        capacityM = static_cast<uint32_t>(std::max<uint64_t>(uint64_t{lengthM} + n, doubled));
        pDataM = static_cast<unsigned char*>(RoxMempool::ReallocIn(pMempoolM, pDataM, capacityM));
        bytes = fOwn ? pDataM + offset : bytes;
    }
    memcpy(pDataM + lengthM, bytes, n);
    lengthM += n;
    return n;
}

unsigned InMemoryStorage::Copy(unsigned position, void* buffer, unsigned capacity) const {
    unsigned n = std::min(capacity, lengthM - position);
    if (n != 0) {
        memcpy(buffer, pDataM + position, n);
    }
    return n;
}

}  // namespace kelbaselib
