#include "vkbus/BusPatience.h"

#include <algorithm>
#include <thread>

// The members are hints: a count that two threads change at once may go wrong by one.
constexpr std::memory_order relaxedG = std::memory_order_relaxed;

bool BusPatience::FSeveralProcessors() {
    static const bool fSeveral = std::thread::hardware_concurrency() > 1;
    return fSeveral;
}

bool BusPatience::FLook() {
    if (!fSeveralProcessorsM || !fShortM.load(relaxedG)) {
        return false;
    }
    const uint32_t nToSkip = nToSkipM.load(relaxedG);
    if (nToSkip > 0) {
        nToSkipM.store(nToSkip - 1, relaxedG);
    }
    return nToSkip == 0;
}

void BusPatience::Note(bool looked, int64_t nanoseconds) {
    fShortM.store(nanoseconds < shortG, relaxedG);
    if (!looked) {
        return;
    }
    const bool found = nanoseconds < lookG;
    const uint32_t nToSkip = found ? 0 : std::min(nLastSkippedM.load(relaxedG) * 2 + 1, maxSkippedG);
    nLastSkippedM.store(nToSkip, relaxedG);
    nToSkipM.store(nToSkip, relaxedG);
}
