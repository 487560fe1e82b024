#include "rox/RoxGenericArray.h"

#include <algorithm>
#include <cstring>
#include <utility>

#include "rox/RoxAssert.h"
#include "rox/RoxCore.h"
#include "rox/RoxMempool.h"

namespace {

/// Asks the processor for an object that dies soon: its destructor looks at most of its members.
void Prefetch(const RoxCore* object) {
    if (object == nullptr) {
        return;
    }
    constexpr unsigned nLines = 8;
    constexpr unsigned nLine = 64;
    for (unsigned i = 0; i < nLines; ++i) {
        __builtin_prefetch(reinterpret_cast<const char*>(object) + i * nLine, 1);
    }
}

}  // namespace

RoxGenericArray::RoxGenericArray(RoxGenericArray&& other) noexcept
    : pDataM(std::exchange(other.pDataM, nullptr)),
      pMempoolM(other.pMempoolM),
      countM(std::exchange(other.countM, uint16_t{0})),
      capacityM(std::exchange(other.capacityM, uint16_t{0})),
      userM(other.userM) {}

RoxGenericArray& RoxGenericArray::operator=(RoxGenericArray&& other) noexcept {
    RoxGenericArray taken(std::move(other));
    std::swap(pDataM, taken.pDataM);
    std::swap(pMempoolM, taken.pMempoolM);
    std::swap(countM, taken.countM);
    std::swap(capacityM, taken.capacityM);
    std::swap(userM, taken.userM);
    return *this;
}

bool RoxGenericArray::Grow() {
    if (countM == maxCount) {
        return false;
    }
    // Most arrays hold one element, most others a few.
    unsigned capacity = capacityM == 0 ? 1 : std::clamp(2u * capacityM, 4u, maxCount);
    pDataM = static_cast<RoxCore**>(RoxMempool::ReallocIn(pMempoolM, pDataM, capacity * sizeof(RoxCore*)));
    capacityM = static_cast<uint16_t>(capacity);
    return true;
}

bool RoxGenericArray::Add(RoxCore* p) {
    if (countM == capacityM && !Grow()) {
        return false;
    }
    if (p != nullptr) {
        p->UpRef();
    }
    pDataM[countM++] = p;
    return true;
}

bool RoxGenericArray::Remove(RoxCore* p) {
    RoxCore** end = pDataM + countM;
    RoxCore** found = std::find(pDataM, end, p);
    if (found == end) {
        return false;
    }
    RemoveAt(static_cast<unsigned>(found - pDataM));
    return true;
}

void RoxGenericArray::RemoveAt(unsigned i) {
    RoxAssert(i < countM, "RoxGenericArray::RemoveAt: index out of range");
    RoxCore* removed = pDataM[i];
    memmove(pDataM + i, pDataM + i + 1, (countM - i - 1) * sizeof(RoxCore*));
    --countM;
    RoxCore::DownRef(removed);
}

void RoxGenericArray::Set(unsigned i, RoxCore* p) {
    RoxAssert(i < countM, "RoxGenericArray::Set: index out of range");
    if (p != nullptr) {
        p->UpRef();
    }
    RoxCore::DownRef(std::exchange(pDataM[i], p));
}

void RoxGenericArray::Destroy() {
    RoxCore** data = std::exchange(pDataM, nullptr);
    unsigned n = std::exchange(countM, uint16_t{0});
    capacityM = 0;
    constexpr unsigned nAhead = 2;
    for (unsigned i = 0; i < n; ++i) {
        if (i + nAhead < n) {
            Prefetch(data[i + nAhead]);
        }
        RoxCore::DownRef(data[i]);
    }
    RoxMempool::FreeIn(pMempoolM, data);
}
