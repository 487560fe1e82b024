#include "rox/RoxAssert.h"

#include <unistd.h>

#include <algorithm>
#include <cstdarg>
#include <cstddef>
#include <cstdio>
#include <cstdlib>

void RoxAssertFail(const char* format, ...) {
    char text[1024];
    static constexpr char prefix[] = "assertion failed: ";
    constexpr size_t prefixLength = sizeof(prefix) - 1;
    std::copy_n(prefix, prefixLength, text);
    va_list args;
    va_start(args, format);
    int n = vsnprintf(text + prefixLength, sizeof(text) - prefixLength, format, args);
    va_end(args);
    size_t length = prefixLength + static_cast<size_t>(std::max(n, 0));
    length = std::min(length, sizeof(text) - 1);
    text[length] = '\n';
    // One write, past the stream's buffer and lock: whoever holds them may be the one that fails.
    if (write(STDERR_FILENO, text, length + 1) < 0) {
        // Nobody is left to be told.
    }
    abort();
}
