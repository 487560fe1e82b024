#pragma once

#include <atomic>

/// Spin lock for short sections; not recursive. Waits by polling, then yields the processor.
class RoxSpinLock {
 public:
    /// `level` tells readers the order of locks: a thread takes them ascending. Nothing checks it.
    constexpr explicit RoxSpinLock(unsigned level) : levelM(level) {}
    RoxSpinLock(const RoxSpinLock&) = delete;
    RoxSpinLock& operator=(const RoxSpinLock&) = delete;

    void Acquire() {
        if (lockedM.exchange(true, std::memory_order_acquire)) {
            Wait();
        }
    }
    /// True when the lock was free and is now the caller's.
    bool TryAcquire() { return !lockedM.exchange(true, std::memory_order_acquire); }
    void Release() { lockedM.store(false, std::memory_order_release); }
    unsigned GetLevel() const { return levelM; }

 private:
    void Wait();

    std::atomic<bool> lockedM{false};
    unsigned levelM;
};
