#include "kelbaselib/InMemoryBytestream.h"

#include "kelbaselib/InMemoryBytesource.h"
#include "kelbaselib/InMemoryStorage.h"
#include "rox/RoxMempool.h"

namespace kelbaselib {

InMemoryBytestream::InMemoryBytestream(RoxMempool* pool) : storageM(new (pool) InMemoryStorage) {}

InMemoryBytestream::~InMemoryBytestream() = default;

unsigned InMemoryBytestream::Write(const void* bytes, unsigned count) {
    return storageM->Append(bytes, count);
}

unsigned InMemoryBytestream::Read(void* buffer, unsigned capacity) {
    unsigned n = storageM->Copy(positionM, buffer, capacity);
    positionM += n;
    return n;
}

Bytesource* InMemoryBytestream::NewSource() {
    return InMemoryBytesource::New(storageM);
}

unsigned InMemoryBytestream::GetAvailable() const {
    return storageM->GetLength() - positionM;
}

void InMemoryBytestream::Release() {
    delete this;
}

const unsigned char* InMemoryBytestream::GetData() const {
    return storageM->GetData();
}

unsigned InMemoryBytestream::GetLength() const {
    return storageM->GetLength();
}

void* InMemoryBytestream::operator new(size_t size) {
    return RoxMempool::MallocIn(nullptr, size);
}

void InMemoryBytestream::operator delete(void* p) {
    RoxMempool::FreeIn(nullptr, p);
}

}  // namespace kelbaselib
