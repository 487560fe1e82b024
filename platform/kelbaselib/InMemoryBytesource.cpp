#include "kelbaselib/InMemoryBytesource.h"

#include <algorithm>
#include <new>

namespace kelbaselib {

InMemoryBytesource* InMemoryBytesource::New(const ref<InMemoryStorage>& storage, unsigned begin,
                                            unsigned end) {
    void* memory = RoxMempool::MallocIn(nullptr, sizeof(InMemoryBytesource));
    return new (memory) InMemoryBytesource(storage, begin, end);
}

InMemoryBytesource* InMemoryBytesource::New(const ref<InMemoryStorage>& storage) {
    return New(storage, 0, openEndG);
}

InMemoryBytesource* InMemoryBytesource::NewRange(unsigned begin, unsigned end) const {
    const unsigned nEnd = std::min(end, GetAvailable());
    return New(storageM, positionM + std::min(begin, nEnd), positionM + nEnd);
}

InMemoryBytesource::~InMemoryBytesource() = default;

unsigned InMemoryBytesource::Read(void* buffer, unsigned capacity) {
    unsigned n = storageM->Copy(positionM, buffer, std::min(capacity, GetAvailable()));
    positionM += n;
    return n;
}

Bytesource* InMemoryBytesource::NewSource() {
    return New(storageM, beginM, endM);
}

unsigned InMemoryBytesource::GetAvailable() const {
    return std::min(endM, storageM->GetLength()) - positionM;
}

const unsigned char* InMemoryBytesource::GetData() const {
    const unsigned char* const data = storageM->GetData();
    return data != nullptr ? data + positionM : nullptr;
}

void InMemoryBytesource::Release() {
    this->~InMemoryBytesource();
    RoxMempool::FreeIn(nullptr, this);
}

}  // namespace kelbaselib
