#include "kelbaselib/InMemoryBytesource.h"

#include <new>

namespace kelbaselib {

InMemoryBytesource* InMemoryBytesource::New(const ref<InMemoryStorage>& storage) {
    void* memory = RoxMempool::MallocIn(nullptr, sizeof(InMemoryBytesource));
    return new (memory) InMemoryBytesource(storage);
}

InMemoryBytesource::~InMemoryBytesource() = default;

unsigned InMemoryBytesource::Read(void* buffer, unsigned capacity) {
    unsigned n = storageM->Copy(positionM, buffer, capacity);
    positionM += n;
    return n;
}

Bytesource* InMemoryBytesource::NewSource() {
    return New(storageM);
}

unsigned InMemoryBytesource::GetAvailable() const {
    return storageM->GetLength() - positionM;
}

void InMemoryBytesource::Release() {
    this->~InMemoryBytesource();
    RoxMempool::FreeIn(nullptr, this);
}

}  // namespace kelbaselib
