#include "tools/Progress.h"

#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <string>

namespace sorn::tools {

namespace {

constexpr std::chrono::milliseconds firstShowG{1000};
constexpr std::chrono::milliseconds intervalG{100};
constexpr size_t barColumnsG = 40;

}  // namespace

Progress::Progress(std::FILE* in, std::FILE* out) : nextShowM(Clock::now() + firstShowG) {
    struct stat status {};
    if (::isatty(STDERR_FILENO) == 1 && ::isatty(::fileno(out)) == 0 && ::fstat(::fileno(in), &status) == 0 &&
        S_ISREG(status.st_mode)) {
        totalM = static_cast<size_t>(status.st_size);
    }
}

void Progress::Hide() {
    if (fShownM) std::fputs("\r\033[K", stderr);
    fShownM = false;
}

void Progress::Advance(size_t nByte) {
    doneM += nByte;
    if (totalM == 0 || Clock::now() < nextShowM) return;
    nextShowM = Clock::now() + intervalG;
    Show();
}

void Progress::Show() {
    const double share = std::min(1.0, static_cast<double>(doneM) / static_cast<double>(totalM));
    const size_t filled = static_cast<size_t>(share * static_cast<double>(barColumnsG));
    const std::string bar = std::string(filled, '#') + std::string(barColumnsG - filled, '.');
    std::fprintf(stderr, "\r[%s] %3.0f %%", bar.c_str(), share * 100);
    fShownM = true;
}

}  // namespace sorn::tools
