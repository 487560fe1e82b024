#include "rox/RoxSpinLock.h"

#include <sched.h>

namespace {

// Polls before the processor is given away: about a microsecond.
constexpr unsigned nPolls = 64;

inline void Pause() {
#if defined(__x86_64__) || defined(__i386__)
    __builtin_ia32_pause();
#else
    __asm__ volatile("yield" : : : "memory");
#endif
}

}  // namespace

void RoxSpinLock::Wait() {
    for (unsigned n = 0;; ++n) {
        if (!lockedM.load(std::memory_order_relaxed) && TryAcquire()) {
            return;
        }
        if (n < nPolls) {
            Pause();
        } else {
            sched_yield();
        }
    }
}
