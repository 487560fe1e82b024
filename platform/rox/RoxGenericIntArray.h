#pragma once

#include <cstddef>
#include <cstdint>

#include "rox/RoxMempoolUser.h"

class RoxMempool;

/// Array of plain elements of one size. At most 65,535 elements. Few small elements lie in the data pointer's
/// own word and cost no allocation, so readers must ask FExternal (At and GetData do). Not thread-safe.
class RoxGenericIntArray {
 public:
    static constexpr unsigned maxCount = 65535;  // the count is 16 bits wide

    /// `elementSize`: bytes of one element and distance of two, 1 to 32,767.
    explicit RoxGenericIntArray(int elementSize, RoxMempool* pool = nullptr,
                                RoxMempoolUser user = roxMempoolUserNone);
    RoxGenericIntArray(RoxGenericIntArray&& other) noexcept;
    RoxGenericIntArray& operator=(RoxGenericIntArray&& other) noexcept;
    RoxGenericIntArray(const RoxGenericIntArray&) = delete;
    RoxGenericIntArray& operator=(const RoxGenericIntArray&) = delete;
    ~RoxGenericIntArray() {
        if (FExternal()) {
            Destroy();
        }
    }

    /// Copies one element to the end; `element` may lie in this array. False, with nothing changed, when it
    /// is full.
    bool Add(const void* element);
    /// Overwrites element i < GetCount().
    void Set(unsigned i, const void* element);
    /// Frees the storage. The array is empty then and can be used again.
    void Destroy();

    uint16_t GetCount() const { return countM; }
    /// Where the count lies in the array, as a number of 16 bits, for walks over metadata.
    static constexpr size_t CountOffset() { return offsetof(RoxGenericIntArray, countM); }
    bool FEmpty() const { return countM == 0; }
    int16_t GetElementSize() const { return elementSizeM; }
    /// True: the elements lie behind the data pointer; false: in its word.
    bool FExternal() const { return externalM != 0; }
    const void* GetData() const { return FExternal() ? dataM.pExternal : dataM.inlineBytes; }
    /// Address of element i < GetCount(), until the next change of the array. Inline elements are aligned as
    /// a word of the host only; 8-byte elements are never inline on a 32-bit host.
    const void* At(unsigned i) const {
        return static_cast<const unsigned char*>(GetData()) + i * static_cast<size_t>(elementSizeM);
    }
    RoxMempool* GetMempool() const { return pMempoolM; }
    RoxMempoolUser GetUser() const { return userM; }

 private:
    unsigned char* MutableAt(unsigned i);
    void Grow();
    unsigned InlineCapacity() const {
        return static_cast<unsigned>(sizeof(dataM)) / static_cast<unsigned>(elementSizeM);
    }

    union {
        unsigned char* pExternal;
        unsigned char inlineBytes[sizeof(void*)];
    } dataM{};
    RoxMempool* pMempoolM;
    uint16_t countM = 0;
    int16_t elementSizeM;
    uint8_t externalM = 0;
    RoxMempoolUser userM;
    uint16_t capacityM = 0;  // of the external storage
};

static_assert(sizeof(RoxGenericIntArray) == (sizeof(void*) == 4 ? 16 : 24),
              "16 bytes in its owner on the target");
