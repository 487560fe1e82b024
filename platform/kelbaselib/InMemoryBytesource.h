#pragma once

#include <cstdint>

#include "kelbaselib/Bytesource.h"
#include "kelbaselib/InMemoryStorage.h"
#include "rox/ref.h"

namespace kelbaselib {

/// Reads the bytes of an in-memory stream, those written later, too, or a range of them that stands. It only
/// reads: those who share bytes cannot disturb each other, and what is appended to the stream goes behind all
/// ranges. Holds the storage, whole. Lives on the general heap.
class InMemoryBytesource final : public Bytesource {
 public:
    static InMemoryBytesource* New(const ref<InMemoryStorage>& storage);
    /// A source of its own over a range of the bytes that this one has not given yet, numbered from 0; what
    /// goes beyond them is left out. The caller releases it.
    InMemoryBytesource* NewRange(unsigned begin, unsigned end) const;

    unsigned Read(void* buffer, unsigned capacity) override;
    Bytesource* NewSource() override;
    unsigned GetAvailable() const override;
    void Release() override;

    /// The GetAvailable() bytes that this source has not given yet, where they lie: until the next write to
    /// the stream. May be null when there are none.
    const unsigned char* GetData() const;
    /// What the source keeps alive; it may be shared with sources and streams of any thread.
    const InMemoryStorage& GetStorage() const { return *storageM; }

 private:
    static constexpr unsigned openEndG = UINT32_MAX;  ///< the end is wherever the storage's is

    InMemoryBytesource(const ref<InMemoryStorage>& storage, unsigned begin, unsigned end)
        : storageM(storage), beginM(begin), endM(end), positionM(begin) {}
    ~InMemoryBytesource() override;
    static InMemoryBytesource* New(const ref<InMemoryStorage>& storage, unsigned begin, unsigned end);

    ref<InMemoryStorage> storageM;
    unsigned beginM;
    unsigned endM;
    unsigned positionM;  ///< all three count from the storage's start
};

}  // namespace kelbaselib
