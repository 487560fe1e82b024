#pragma once

#include <cstddef>

#include "kelbaselib/Bytesink.h"
#include "kelbaselib/Bytesource.h"
#include "rox/ref.h"

class RoxMempool;

namespace kelbaselib {

class InMemoryStorage;

/// A sink whose bytes can be read back as a source: the stream itself reads from its start on, and NewSource
/// gives independent sources over the same bytes, which share the storage and so outlive the stream. A source
/// also sees what is written after it was made. Holds at most 4,294,967,295 bytes; a write beyond takes what
/// fits.
///
/// A stream on the stack is used as it is; one that is handed on as a Bytesource is made with `new` (general
/// heap) and ends with Release. One thread at a time, but sources of a stream that is no longer written may
/// be made and read on different threads.
class InMemoryBytestream final : public Bytesink, public Bytesource {
 public:
    /// The bytes lie in `pool`, null for the general heap.
    explicit InMemoryBytestream(RoxMempool* pool = nullptr);
    ~InMemoryBytestream() override;

    unsigned Write(const void* bytes, unsigned count) override;
    unsigned Read(void* buffer, unsigned capacity) override;
    Bytesource* NewSource() override;
    unsigned GetAvailable() const override;
    void Release() override;

    /// All bytes written so far, from the first; the pointer holds until the next Write, null while there are
    /// none.
    const unsigned char* GetData() const;
    unsigned GetLength() const;

    static void* operator new(size_t size);
    static void operator delete(void* p);

 private:
    ref<InMemoryStorage> storageM;
    unsigned positionM = 0;
};

}  // namespace kelbaselib
