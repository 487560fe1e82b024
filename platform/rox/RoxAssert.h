#pragma once

/// Reports a failed assertion on the standard error stream, printf-style, and ends the process with abort().
/// For programming errors and exhausted memory only. Safe on any thread; takes no lock and allocates nothing.
[[noreturn]] void RoxAssertFail(const char* format, ...) __attribute__((format(printf, 1, 2)));

/// Ends the process through RoxAssertFail with `what` unless `condition` holds. Checked in every build.
inline void RoxAssert(bool condition, const char* what) {
    if (__builtin_expect(!condition, 0)) {
        RoxAssertFail("%s", what);
    }
}
