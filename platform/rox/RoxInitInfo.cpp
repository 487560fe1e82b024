#include "rox/RoxInitInfo.h"

#include <cstdio>
#include <cstring>

#include "rox/RoxAssert.h"
#include "rox/RoxLogger.h"
#include "rox/RoxSpinLock.h"
#include "rox/RoxSpinLockHold.h"

namespace {

// All of it is set before any constructor runs: records enter themselves while libraries load.
constinit RoxSpinLock lockG{1};
constinit RoxInitInfo* pFirstG = nullptr;
constinit RoxInitInfo* pLastStartedG = nullptr;

constexpr int logPriorityError = 3;

}  // namespace

RoxInitInfo::RoxInitInfo(const char* name, Start start, Stop stop, unsigned nDependencies,
                         RoxInitInfo* const* vDependencies, int, void*)
    : nameM(name), startM(start), stopM(stop), nDependenciesM(nDependencies), vDependenciesM(vDependencies) {
    RoxSpinLockHold hold(lockG);
    RoxInitInfo** link = &pFirstG;
    while (*link != nullptr && strcmp((*link)->nameM, name) <= 0) {
        link = &(*link)->pNextM;
    }
    pNextM = *link;
    *link = this;
}

RoxInitInfo::~RoxInitInfo() {
    RoxSpinLockHold hold(lockG);
    for (RoxInitInfo** link = &pFirstG; *link != nullptr; link = &(*link)->pNextM) {
        if (*link == this) {
            *link = pNextM;
            break;
        }
    }
    for (RoxInitInfo** link = &pLastStartedG; *link != nullptr; link = &(*link)->pStartedBeforeM) {
        if (*link == this) {
            *link = pStartedBeforeM;
            break;
        }
    }
}

/// By address alone: a record that is not in the list may be gone.
bool RoxInitInfo::FListed() const {
    const RoxInitInfo* each = pFirstG;
    while (each != nullptr && each != this) {
        each = each->pNextM;
    }
    return each == this;
}

/// The first dependency that does not run; null when all do.
const RoxInitInfo* RoxInitInfo::FirstMissing() const {
    for (unsigned i = 0; i < nDependenciesM; ++i) {
        const RoxInitInfo* dependency = vDependenciesM[i];
        if (!dependency->FListed()) {
            RoxAssertFail("RoxInitInfo: %s depends on a module that is not loaded", nameM);
        }
        if (!dependency->fRunningM) {
            return dependency;
        }
    }
    return nullptr;
}

RoxInitInfo* RoxInitInfo::FirstThatWaits() {
    RoxInitInfo* each = pFirstG;
    while (each != nullptr && each->fRunningM) {
        each = each->pNextM;
    }
    return each;
}

/// The first record by name that could be started now, or null when none is left.
RoxInitInfo* RoxInitInfo::FirstReady() {
    for (RoxInitInfo* each = pFirstG; each != nullptr; each = each->pNextM) {
        if (!each->fRunningM && each->FirstMissing() == nullptr) {
            return each;
        }
    }
    const RoxInitInfo* waiting = FirstThatWaits();
    if (waiting != nullptr) {
        FailOverRing(waiting);
    }
    return nullptr;
}

/// Every record that waits does so for another one that waits: after as many steps as there are records the
/// walk is in a ring.
void RoxInitInfo::FailOverRing(const RoxInitInfo* waiting) {
    for (const RoxInitInfo* each = pFirstG; each != nullptr; each = each->pNextM) {
        waiting = waiting->FirstMissing();
    }
    char names[512] = "";
    size_t n = 0;
    const RoxInitInfo* each = waiting;
    do {
        n += static_cast<size_t>(snprintf(names + n, sizeof names - n, "%s needs ", each->nameM));
        each = each->FirstMissing();
    } while (each != waiting && n < sizeof names);
    RoxAssertFail("RoxInitInfo: modules depend on each other in a ring: %s%s", names, waiting->nameM);
}

unsigned RoxInitInfo::StartAll(RoxMempool* pool) {
    const RoxInitInfo* before = pLastStartedG;
    for (;;) {
        RoxInitInfo* next = nullptr;
        {
            RoxSpinLockHold hold(lockG);
            next = FirstReady();
        }
        if (next == nullptr) {
            return 0;
        }
        const unsigned result = next->startM != nullptr ? next->startM(pool) : 0;
        if (result != 0) {
            RoxLogger::Log(0, logPriorityError, "RoxInitInfo", "%s did not start: %u", next->nameM, result);
            StopDownTo(before);
            return result;
        }
        RoxSpinLockHold hold(lockG);
        next->fRunningM = true;
        next->pStartedBeforeM = pLastStartedG;
        pLastStartedG = next;
    }
}

void RoxInitInfo::StopAll() {
    StopDownTo(nullptr);
}

void RoxInitInfo::StopDownTo(const RoxInitInfo* last) {
    for (;;) {
        RoxInitInfo* next = nullptr;
        {
            RoxSpinLockHold hold(lockG);
            next = pLastStartedG;
            if (next == nullptr || next == last) {
                return;
            }
            pLastStartedG = next->pStartedBeforeM;
            next->fRunningM = false;
        }
        if (next->stopM != nullptr) {
            next->stopM();
        }
    }
}
