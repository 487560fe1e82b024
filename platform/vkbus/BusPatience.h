#pragma once

#include <atomic>
#include <cstdint>

/// Whether a wait looks for a while before it sleeps. A peer that runs answers in less time than it takes to
/// be put to sleep and woken; but to look costs a processor's time, so it is done only after waits that were
/// short, and seldom while it is in vain. Any thread; threads that wait at once share what they learn.
class BusPatience {
 public:
    /// Nanoseconds for which a wait looks.
    static constexpr int64_t lookG = 50'000;

    /// Nanoseconds up to which a wait was short: what one with a sleep takes until a peer that runs answers.
    static constexpr int64_t shortG = 4 * lookG;
    /// Most waits without a look after one in vain; each that is in vain doubles them, from one on.
    static constexpr uint32_t maxSkippedG = 63;

    BusPatience() : BusPatience(FSeveralProcessors()) {}
    /// With a single processor, on which no peer could run meanwhile, no wait looks.
    explicit BusPatience(bool severalProcessors) : fSeveralProcessorsM(severalProcessors) {}

    /// At the start of a wait: whether it is to look.
    bool FLook();
    /// At its end: whether it looked, and how long it took until something came; INT64_MAX when nothing did.
    void Note(bool looked, int64_t nanoseconds);

 private:
    static bool FSeveralProcessors();

    const bool fSeveralProcessorsM;
    std::atomic<bool> fShortM{false};   // the last wait was
    std::atomic<uint32_t> nToSkipM{0};  // waits that do not look
    std::atomic<uint32_t> nLastSkippedM{0};
};
