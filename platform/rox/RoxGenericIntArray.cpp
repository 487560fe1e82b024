#include "rox/RoxGenericIntArray.h"

#include <algorithm>
#include <cstring>
#include <functional>
#include <utility>

#include "rox/RoxAssert.h"
#include "rox/RoxMempool.h"

RoxGenericIntArray::RoxGenericIntArray(int elementSize, RoxMempool* pool, RoxMempoolUser user)
    : pMempoolM(pool), elementSizeM(static_cast<int16_t>(elementSize)), userM(user) {
    RoxAssert(elementSize > 0 && elementSize <= INT16_MAX, "RoxGenericIntArray: element size out of range");
}

RoxGenericIntArray::RoxGenericIntArray(RoxGenericIntArray&& other) noexcept
    : dataM(other.dataM),
      pMempoolM(other.pMempoolM),
      countM(std::exchange(other.countM, uint16_t{0})),
      elementSizeM(other.elementSizeM),
      externalM(std::exchange(other.externalM, uint8_t{0})),
      userM(other.userM),
      capacityM(std::exchange(other.capacityM, uint16_t{0})) {}

RoxGenericIntArray& RoxGenericIntArray::operator=(RoxGenericIntArray&& other) noexcept {
    RoxGenericIntArray taken(std::move(other));
    std::swap(dataM, taken.dataM);
    std::swap(pMempoolM, taken.pMempoolM);
    std::swap(countM, taken.countM);
    std::swap(elementSizeM, taken.elementSizeM);
    std::swap(externalM, taken.externalM);
    std::swap(userM, taken.userM);
    std::swap(capacityM, taken.capacityM);
    return *this;
}

unsigned char* RoxGenericIntArray::MutableAt(unsigned i) {
    return (FExternal() ? dataM.pExternal : dataM.inlineBytes) + i * static_cast<size_t>(elementSizeM);
}

void RoxGenericIntArray::Grow() {
    size_t elementSize = static_cast<size_t>(elementSizeM);
    unsigned capacity = std::clamp(2u * countM, 4u, maxCount);
    if (FExternal()) {
        dataM.pExternal = static_cast<unsigned char*>(
            RoxMempool::ReallocIn(pMempoolM, dataM.pExternal, capacity * elementSize));
    } else {
        void* block = RoxMempool::MallocIn(pMempoolM, capacity * elementSize);
        memcpy(block, dataM.inlineBytes, countM * elementSize);
        dataM.pExternal = static_cast<unsigned char*>(block);
        externalM = 1;
    }
    capacityM = static_cast<uint16_t>(capacity);
}

bool RoxGenericIntArray::Add(const void* element) {
    if (countM == maxCount) {
        return false;
    }
    size_t elementSize = static_cast<size_t>(elementSizeM);
    if (countM == (FExternal() ? capacityM : InlineCapacity())) {
        const unsigned char* source = static_cast<const unsigned char*>(element);
        const unsigned char* begin = MutableAt(0);
        bool fOwn = countM != 0 && !std::less<>()(source, begin) &&
                    std::less<>()(source, begin + countM * elementSize);
        size_t offset = fOwn ? static_cast<size_t>(source - begin) : 0;
        Grow();
        element = fOwn ? MutableAt(0) + offset : element;
    }
    memcpy(MutableAt(countM), element, elementSize);
    ++countM;
    return true;
}

void RoxGenericIntArray::Set(unsigned i, const void* element) {
    RoxAssert(i < countM, "RoxGenericIntArray::Set: index out of range");
    memmove(MutableAt(i), element, static_cast<size_t>(elementSizeM));
}

void RoxGenericIntArray::Destroy() {
    if (FExternal()) {
        RoxMempool::FreeIn(pMempoolM, dataM.pExternal);
    }
    dataM.pExternal = nullptr;
    externalM = 0;
    countM = 0;
    capacityM = 0;
}
