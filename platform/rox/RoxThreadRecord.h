#pragma once

#include <atomic>
#include <cstdint>

/// Says of a thread whether it still runs. Counted, so that it outlives the thread while somebody asks.
class RoxThreadRecord {
 public:
    /// Of the calling thread, made at its first call; EndedThread once the thread's own data are being
    /// destroyed.
    static RoxThreadRecord* Current() { return pCurrentM != nullptr ? pCurrentM : MakeCurrent(); }
    /// The same without making one: null before Current was called.
    static RoxThreadRecord* CurrentOrNull() { return pCurrentM; }
    /// Records that are never alive: what Current gives in a thread whose data are being destroyed, and no
    /// thread's.
    static RoxThreadRecord* EndedThread() { return &endedThreadG; }
    static RoxThreadRecord* NoThread() { return &noThreadG; }

    bool FAlive() const { return fAliveM.load(std::memory_order_acquire); }
    void UpRef() { nRefsM.fetch_add(1, std::memory_order_relaxed); }
    void DownRef();

 private:
    friend class RoxThreadEnd;
    constexpr explicit RoxThreadRecord(bool fAlive) : fAliveM(fAlive) {}
    static RoxThreadRecord* MakeCurrent();

    std::atomic<uint32_t> nRefsM{1};
    std::atomic<bool> fAliveM;

    static RoxThreadRecord endedThreadG;
    static RoxThreadRecord noThreadG;
    static __thread RoxThreadRecord* pCurrentM __attribute__((tls_model("initial-exec")));
};
