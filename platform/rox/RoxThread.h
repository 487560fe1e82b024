#pragma once

/// Threads of the runtime.
class RoxThread {
 public:
    /// How a thread ranks among those of the process. Whether the system grants more than NORMAL is its
    /// business.
    enum Priority : int { PRIORITY_IDLE = 0, PRIORITY_LOW = 1, PRIORITY_NORMAL = 2, PRIORITY_HIGH = 3 };

    /// Runs main(context) on a new thread which nobody joins. All signals are blocked there but those that a
    /// fault of its own raises. The system shows the first 15 bytes of `name`. RoxAssertFail when the system
    /// gives no thread.
    static void Start(const char* name, void (*main)(void* context), void* context);
    /// Of the calling thread.
    static void SetPriority(Priority priority);
    /// Longer times, of 31 years and more, are as good as for ever; a moment that far ahead still fits 32
    /// bits of seconds.
    static constexpr long long longestMillisecondsG = 1000000000000;

    /// At least so long; 0 and less: not at all. Signals do not shorten it.
    static void SleepMilliseconds(long long milliseconds);
};
