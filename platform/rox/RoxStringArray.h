#pragma once

#include <cstdint>
#include <new>
#include <utility>

#include "rox/RoxLockId.h"
#include "rox/RoxString.h"

class RoxMempool;

/// Array of strings. At most 65,535 elements. Not thread-safe.
class RoxStringArray {
 public:
    static constexpr unsigned maxCount = 65535;  // the count is 16 bits wide

    RoxStringArray() : RoxStringArray(nullptr) {}
    explicit RoxStringArray(RoxMempool* pool) : pMempoolM(pool) {}
    RoxStringArray(RoxStringArray&& other) noexcept;
    RoxStringArray& operator=(RoxStringArray&& other) noexcept;
    RoxStringArray(const RoxStringArray&) = delete;
    RoxStringArray& operator=(const RoxStringArray&) = delete;
    ~RoxStringArray() {
        if (pDataM != nullptr) {
            Destroy();
        }
    }

    /// Appends; the string may be an element of this array. False, with nothing changed, when the array is
    /// full.
    bool Add(const RoxString& text);
    /// The same, taking the text over, which must not be an element of this array.
    bool Add(RoxString&& text) {
        if (countM == capacityM && !Grow()) {
            return false;
        }
        new (&pDataM[countM]) RoxString(std::move(text));
        ++countM;
        return true;
    }
    /// Overwrites element i < GetCount().
    void Set(unsigned i, const RoxString& text);
    /// Removes `count` elements from `first` on; what lies behind the end is nothing to remove.
    void Remove(unsigned first, unsigned count);

    /// Negative, 0 or positive, as strcmp.
    using Compare = int (*)(const RoxString* a, const RoxString* b);
    /// Sorts ascending in O(n log n) without recursion, whatever `compare` answers; not stable.
    void Sort(Compare compare);
    /// The order of strcmp over the bytes, NUL bytes included; for Sort.
    static int CompareBytes(const RoxString* a, const RoxString* b);

    /// Releases all strings and the storage. The array is empty then and can be used again.
    void Destroy();
    /// Debug bookkeeping only.
    void SetDebugLockOwner(RoxLockId id) { debugLockOwnerM = id; }
    RoxLockId GetDebugLockOwner() const { return debugLockOwnerM; }

    unsigned GetCount() const { return countM; }
    bool FEmpty() const { return countM == 0; }
    /// Element i < GetCount(); the reference holds until the next change of the array.
    const RoxString& At(unsigned i) const { return pDataM[i]; }
    const RoxString& operator[](unsigned i) const { return pDataM[i]; }
    const RoxString* GetData() const { return pDataM; }
    RoxMempool* GetMempool() const { return pMempoolM; }

 private:
    bool Grow();

    RoxString* pDataM = nullptr;
    RoxMempool* pMempoolM;
    uint16_t countM = 0;
    uint16_t capacityM = 0;
    RoxLockId debugLockOwnerM = 0;
};

static_assert(sizeof(void*) != 4 || sizeof(RoxStringArray) == 16, "16 bytes in its owner on the target");
