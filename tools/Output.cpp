#include "tools/Output.h"

#include <fcntl.h>
#include <unistd.h>

#include <cstring>

namespace sorn::tools {

unsigned FileSink::Write(const void* bytes, unsigned count) {
    const char* p = static_cast<const char*>(bytes);
    const char* const end = p + count;
    while (asOneLineM && p < end) {
        const auto* const feed = static_cast<const char*>(std::memchr(p, '\n', static_cast<size_t>(end - p)));
        if (feed == nullptr) break;
        std::fwrite(p, 1, static_cast<size_t>(feed - p), pFileM);
        std::fputc(' ', pFileM);
        p = feed + 1;
    }
    std::fwrite(p, 1, static_cast<size_t>(end - p), pFileM);
    return std::ferror(pFileM) == 0 ? count : 0;
}

std::FILE* OpenFile(const std::string& path, const char* mode, std::FILE* standard) {
    if (path.empty()) return standard;
    std::FILE* const file = std::fopen(path.c_str(), mode);
    if (file == nullptr) std::perror(path.c_str());
    return file;
}

std::FILE* TakeStandardOutput() {
    const int descriptor = ::fcntl(STDOUT_FILENO, F_DUPFD_CLOEXEC, 3);
    std::FILE* out = descriptor >= 0 ? ::fdopen(descriptor, "wb") : nullptr;
    if (out == nullptr || ::dup2(STDERR_FILENO, STDOUT_FILENO) < 0) {
        std::perror("standard output");
        return nullptr;
    }
    std::setvbuf(stdout, nullptr, _IOLBF, 0);
    return out;
}

bool FinishOutput(std::FILE* file) {
    if (std::fflush(file) == 0 && std::ferror(file) == 0) return true;
    std::fputs("the output could not be written\n", stderr);
    return false;
}

}  // namespace sorn::tools
