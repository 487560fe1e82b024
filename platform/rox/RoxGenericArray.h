#pragma once

#include <cstdint>

#include "rox/RoxMempoolUser.h"

class RoxCore;
class RoxMempool;

/// Array of counted objects, each slot holding a reference or null. At most 65,535 elements. Not thread-safe.
class RoxGenericArray {
 public:
    static constexpr unsigned maxCount = 65535;  // the count is 16 bits wide

    RoxGenericArray() : RoxGenericArray(nullptr, roxMempoolUserNone) {}
    explicit RoxGenericArray(RoxMempool* pool, RoxMempoolUser user = roxMempoolUserNone)
        : pMempoolM(pool), userM(user) {}
    RoxGenericArray(RoxGenericArray&& other) noexcept;
    RoxGenericArray& operator=(RoxGenericArray&& other) noexcept;
    RoxGenericArray(const RoxGenericArray&) = delete;
    RoxGenericArray& operator=(const RoxGenericArray&) = delete;
    ~RoxGenericArray() {
        if (pDataM != nullptr) {
            Destroy();
        }
    }

    /// Appends and takes a reference. False, with nothing changed, when the array is full.
    bool Add(RoxCore* p);
    /// The same with a reference that the caller holds and gives up; when the array is full it keeps it.
    bool AddHeld(RoxCore* p) {
        if (countM == capacityM && !Grow()) {
            return false;
        }
        pDataM[countM++] = p;
        return true;
    }
    /// Removes the first slot that holds this very pointer, releases it, keeps the order. False when there is
    /// none.
    bool Remove(RoxCore* p);
    /// Removes slot i < GetCount() and releases what it holds.
    void RemoveAt(unsigned i);
    /// Puts another reference into slot i < GetCount().
    void Set(unsigned i, RoxCore* p);
    /// Releases all elements and the storage. The array is empty then and can be used again.
    void Destroy();

    unsigned GetCount() const { return countM; }
    bool FEmpty() const { return countM == 0; }
    /// Element i < GetCount(), without a reference of its own.
    RoxCore* At(unsigned i) const { return pDataM[i]; }
    RoxCore* const* GetData() const { return pDataM; }
    RoxMempool* GetMempool() const { return pMempoolM; }
    RoxMempoolUser GetUser() const { return userM; }

 private:
    bool Grow();

    RoxCore** pDataM = nullptr;
    RoxMempool* pMempoolM;
    uint16_t countM = 0;
    uint16_t capacityM = 0;
    RoxMempoolUser userM;
};

static_assert(sizeof(void*) != 4 || sizeof(RoxGenericArray) == 16, "16 bytes in its owner on the target");
