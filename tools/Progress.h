#pragma once

#include <chrono>
#include <cstddef>
#include <cstdio>

namespace sorn::tools {

/// A line on standard error that tells how much of an input file is done: only on a terminal, only when the
/// file's size is known, and only once the work has taken a second.
class Progress {
 public:
    Progress(std::FILE* in, std::FILE* out);
    /// Hides the line.
    ~Progress() { Hide(); }
    Progress(const Progress&) = delete;
    Progress& operator=(const Progress&) = delete;

    void Advance(size_t nByte);
    /// Clears the line if it is shown; to be called before anything else is written on standard error. It
    /// comes back by itself.
    void Hide();

 private:
    using Clock = std::chrono::steady_clock;

    void Show();

    size_t totalM = 0;  // 0: nothing is shown
    size_t doneM = 0;
    Clock::time_point nextShowM;
    bool fShownM = false;
};

}  // namespace sorn::tools
