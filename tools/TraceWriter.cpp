#include "tools/TraceWriter.h"

#include <poll.h>
#include <signal.h>
#include <unistd.h>

#include <algorithm>
#include <atomic>
#include <cerrno>
#include <chrono>
#include <climits>
#include <condition_variable>
#include <cstdint>
#include <deque>
#include <mutex>
#include <string>
#include <thread>
#include <utility>

#include "tools/Trace.h"

namespace sorn::tools {

namespace {

/// Bytes that wait; a longer line alone is taken, too.
constexpr size_t maxWaitingBytesG = 16u << 20;
constexpr std::chrono::seconds patienceG{1};

std::string LeftOut(uint64_t nMessages) {
    return std::to_string(nMessages) + " messages of the trace were not shown\n";
}

bool FRoom(int descriptor, int milliseconds) {
    pollfd state = {descriptor, POLLOUT, 0};
    return ::poll(&state, 1, milliseconds) > 0;
}

}  // namespace

struct TraceWriter::State {
    std::mutex mutex;
    std::condition_variable isChanged;
    std::deque<TraceLine> lines;
    size_t nWaitingBytes = 0;           // of the line that is being written, too
    uint64_t nWaiting = 0;              // lines, likewise
    uint64_t nLeftOut = 0;              // and not told yet
    bool isOutputLost = false;          // nothing can be written to standard output any more
    bool isEnding = false;              // no line comes any more
    bool isEnded = false;               // the thread writes nothing any more
    std::atomic<bool> isMoving{false};  // something was taken since the last look

    /// Waits for the reader. False when writing fails.
    bool Write(int descriptor, std::string_view text) {
        while (!text.empty()) {
            const ssize_t n = ::write(descriptor, text.data(), std::min<size_t>(text.size(), PIPE_BUF));
            if (n < 0 && errno == EAGAIN) FRoom(descriptor, -1);
            if (n < 0 && errno != EINTR && errno != EAGAIN) return false;
            text.remove_prefix(static_cast<size_t>(std::max<ssize_t>(n, 0)));
            isMoving = true;
        }
        return true;
    }

    /// Writes the first line; the lock is open meanwhile.
    void WriteFirst(std::unique_lock<std::mutex>& lock) {
        const TraceLine line = std::move(lines.front());
        lines.pop_front();
        const bool isTried = !line.isMessage || !isOutputLost;
        lock.unlock();
        const bool isWritten = isTried && Write(line.isMessage ? STDOUT_FILENO : STDERR_FILENO, line.text);
        lock.lock();
        nWaitingBytes -= line.text.size();
        --nWaiting;
        if (isWritten) return;
        ++nLeftOut;
        isOutputLost = isOutputLost || line.isMessage;
    }
};

TraceWriter::TraceWriter() : stateM(std::make_shared<State>()) {
    sigset_t all;
    sigset_t before;
    sigfillset(&all);
    pthread_sigmask(SIG_SETMASK, &all, &before);  // signals are for the thread that serves
    std::thread([state = stateM] { Run(state); }).detach();
    pthread_sigmask(SIG_SETMASK, &before, nullptr);
}

TraceWriter::~TraceWriter() {
    std::unique_lock<std::mutex> lock(stateM->mutex);
    stateM->isEnding = true;
    stateM->isChanged.notify_all();
    do {
        stateM->isMoving = false;
        stateM->isChanged.wait_for(lock, patienceG, [this] { return stateM->isEnded; });
    } while (!stateM->isEnded && stateM->isMoving);
    const uint64_t nLeftOut = stateM->nLeftOut + stateM->nWaiting;
    if (nLeftOut == 0 || !FRoom(STDERR_FILENO, 0)) return;
    const std::string words = LeftOut(nLeftOut);
    [[maybe_unused]] const ssize_t n = ::write(STDERR_FILENO, words.data(), words.size());
}

void TraceWriter::Show(std::string_view message) {
    TraceLine line(message);
    const std::lock_guard<std::mutex> lock(stateM->mutex);
    const bool isRoom =
        stateM->nWaiting == 0 ||
        line.text.size() <= maxWaitingBytesG - std::min(maxWaitingBytesG, stateM->nWaitingBytes);
    if (!isRoom || (line.isMessage && stateM->isOutputLost)) {
        ++stateM->nLeftOut;
        return;
    }
    stateM->nWaitingBytes += line.text.size();
    ++stateM->nWaiting;
    stateM->lines.push_back(std::move(line));
    stateM->isChanged.notify_all();
}

void TraceWriter::Run(const std::shared_ptr<State>& state) {
    std::unique_lock<std::mutex> lock(state->mutex);
    for (;;) {
        state->isChanged.wait(lock, [&] { return !state->lines.empty() || state->isEnding; });
        if (state->lines.empty()) break;
        state->WriteFirst(lock);
        // A reader that has gone does not catch up: that is told once, at the end.
        if (!state->lines.empty() || state->nLeftOut == 0 || state->isOutputLost || state->isEnding) continue;
        const std::string words = LeftOut(std::exchange(state->nLeftOut, 0));
        lock.unlock();
        state->Write(STDERR_FILENO, words);
        lock.lock();
    }
    state->isEnded = true;
    state->isChanged.notify_all();
}

}  // namespace sorn::tools
