#include "tools/Interrupt.h"

#include <poll.h>
#include <unistd.h>

#include <algorithm>
#include <atomic>
#include <cerrno>
#include <climits>
#include <csignal>

namespace sorn::tools {

namespace {

constexpr int lookMillisecondsG = 50;

std::atomic<bool> isInterruptedG{false};

/// Waits until the descriptor has room for PIPE_BUF bytes, or would tell what is wrong with it.
bool FRoom(int descriptor) {
    for (;;) {
        const bool isLast = FInterrupted();
        pollfd state = {descriptor, POLLOUT, 0};
        if (::poll(&state, 1, isLast ? 0 : lookMillisecondsG) > 0) return true;
        if (isLast) return false;
    }
}

}  // namespace

void CatchInterrupts() {
    std::signal(SIGINT, [](int) { isInterruptedG = true; });
    std::signal(SIGTERM, [](int) { isInterruptedG = true; });
}

bool FInterrupted() {
    return isInterruptedG;
}

bool WriteUnlessInterrupted(int descriptor, std::string_view text) {
    while (!text.empty()) {
        if (!FRoom(descriptor)) return false;
        const ssize_t n = ::write(descriptor, text.data(), std::min<size_t>(text.size(), PIPE_BUF));
        if (n < 0 && errno != EINTR && errno != EAGAIN) return false;
        text.remove_prefix(static_cast<size_t>(std::max<ssize_t>(n, 0)));
    }
    return true;
}

}  // namespace sorn::tools
