#include "rox/RoxStringArray.h"

#include <algorithm>
#include <cstring>

#include "rox/RoxAssert.h"
#include "rox/RoxMempool.h"

RoxStringArray::RoxStringArray(RoxStringArray&& other) noexcept
    : pDataM(std::exchange(other.pDataM, nullptr)),
      pMempoolM(other.pMempoolM),
      countM(std::exchange(other.countM, uint16_t{0})),
      capacityM(std::exchange(other.capacityM, uint16_t{0})),
      debugLockOwnerM(other.debugLockOwnerM) {}

RoxStringArray& RoxStringArray::operator=(RoxStringArray&& other) noexcept {
    RoxStringArray taken(std::move(other));
    std::swap(pDataM, taken.pDataM);
    std::swap(pMempoolM, taken.pMempoolM);
    std::swap(countM, taken.countM);
    std::swap(capacityM, taken.capacityM);
    std::swap(debugLockOwnerM, taken.debugLockOwnerM);
    return *this;
}

bool RoxStringArray::Grow() {
    if (countM == maxCount) {
        return false;
    }
    unsigned capacity = capacityM == 0 ? 1 : std::clamp(2u * capacityM, 4u, maxCount);
    // A string is one word without an address of its own, so it may be moved as bytes.
    pDataM = static_cast<RoxString*>(RoxMempool::ReallocIn(pMempoolM, pDataM, capacity * sizeof(RoxString)));
    capacityM = static_cast<uint16_t>(capacity);
    return true;
}

bool RoxStringArray::Add(const RoxString& text) {
    return Add(RoxString(text));
}

void RoxStringArray::Set(unsigned i, const RoxString& text) {
    RoxAssert(i < countM, "RoxStringArray::Set: index out of range");
    pDataM[i] = text;
}

void RoxStringArray::Remove(unsigned first, unsigned count) {
    unsigned begin = std::min<unsigned>(first, countM);
    unsigned n = std::min<unsigned>(count, countM - begin);
    std::move(pDataM + begin + n, pDataM + countM, pDataM + begin);
    std::destroy(pDataM + countM - n, pDataM + countM);
    countM = static_cast<uint16_t>(countM - n);
}

void RoxStringArray::Sort(Compare compare) {
    // The heap's bounds do not depend on what `compare` answers.
    auto fLess = [compare](const RoxString& a, const RoxString& b) { return compare(&a, &b) < 0; };
    std::make_heap(pDataM, pDataM + countM, fLess);
    std::sort_heap(pDataM, pDataM + countM, fLess);
}

int RoxStringArray::CompareBytes(const RoxString* a, const RoxString* b) {
    return a->View().compare(b->View());
}

void RoxStringArray::Destroy() {
    RoxString* data = std::exchange(pDataM, nullptr);
    unsigned n = std::exchange(countM, uint16_t{0});
    capacityM = 0;
    std::destroy(data, data + n);
    RoxMempool::FreeIn(pMempoolM, data);
}
