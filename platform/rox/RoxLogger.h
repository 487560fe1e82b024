#pragma once

/// The process's log.
class RoxLogger {
 public:
    /// Called with one complete message without line end. Calls never overlap, whatever the threads.
    using Sink = void (*)(void* context, int facility, int priority, const char* tag, const char* message);

    /// Writes one printf-style line. `tag` may be null. Any thread.
    static void Log(int facility, int priority, const char* tag, const char* format, ...)
        __attribute__((format(printf, 4, 5)));

    /// Replaces where lines go; null is the default, which writes "[facility.priority] tag: message" to the
    /// standard error stream. When it returns, no call into the old sink is under way (but one that called
    /// SetSink itself).
    static void SetSink(Sink sink, void* context);
};
