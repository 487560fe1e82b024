#include "rox/RoxLogger.h"

#include <cstdarg>
#include <cstdio>
#include <mutex>
#include <new>

#include "rox/RoxMempool.h"

namespace {

void WriteToStandardError(void*, int facility, int priority, const char* tag, const char* message) {
    fprintf(stderr, "[%d.%d] %s: %s\n", facility, priority, tag, message);
}

struct LogState {
    std::recursive_mutex mutex;  // a sink may log or change the sink
    RoxLogger::Sink sink = &WriteToStandardError;
    void* context = nullptr;
};

LogState& State() {
    // Never destroyed: threads may log until the very end of the process.
    alignas(LogState) static unsigned char memory[sizeof(LogState)];
    static LogState* const state = new (memory) LogState;
    return *state;
}

}  // namespace

void RoxLogger::Log(int facility, int priority, const char* tag, const char* format, ...) {
    char text[512];
    va_list args;
    va_list again;
    va_start(args, format);
    va_copy(again, args);
    int n = vsnprintf(text, sizeof(text), format, args);
    va_end(args);
    void* longText = nullptr;
    if (n >= static_cast<int>(sizeof(text))) {
        size_t size = static_cast<size_t>(n) + 1;
        longText = RoxMempool::MallocIn(nullptr, size);
        vsnprintf(static_cast<char*>(longText), size, format, again);
    }
    va_end(again);
    {
        LogState& state = State();
        std::lock_guard<std::recursive_mutex> hold(state.mutex);
        const char* message = longText != nullptr ? static_cast<char*>(longText) : n >= 0 ? text : format;
        state.sink(state.context, facility, priority, tag != nullptr ? tag : "", message);
    }
    RoxMempool::FreeIn(nullptr, longText);
}

void RoxLogger::SetSink(Sink sink, void* context) {
    LogState& state = State();
    std::lock_guard<std::recursive_mutex> hold(state.mutex);
    state.sink = sink != nullptr ? sink : &WriteToStandardError;
    state.context = context;
}
