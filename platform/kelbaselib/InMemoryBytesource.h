#pragma once

#include "kelbaselib/Bytesource.h"
#include "kelbaselib/InMemoryStorage.h"
#include "rox/ref.h"

namespace kelbaselib {

/// Reads the bytes of an in-memory stream from their start. Lives on the general heap.
class InMemoryBytesource final : public Bytesource {
 public:
    static InMemoryBytesource* New(const ref<InMemoryStorage>& storage);

    unsigned Read(void* buffer, unsigned capacity) override;
    Bytesource* NewSource() override;
    unsigned GetAvailable() const override;
    void Release() override;

 private:
    explicit InMemoryBytesource(const ref<InMemoryStorage>& storage) : storageM(storage) {}
    ~InMemoryBytesource() override;

    ref<InMemoryStorage> storageM;
    unsigned positionM = 0;
};

}  // namespace kelbaselib
