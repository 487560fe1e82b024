#pragma once

#include <cstdio>

#include "kelbaselib/Bytesink.h"

namespace sorn::tools {

/// Writes to an open file, which stays the caller's. What could not be written shows at FinishOutput.
class FileSink final : public kelbaselib::Bytesink {
 public:
    explicit FileSink(std::FILE* file) : pFileM(file) {}
    unsigned Write(const void* bytes, unsigned count) override {
        return static_cast<unsigned>(std::fwrite(bytes, 1, count, pFileM));
    }

 private:
    std::FILE* pFileM;
};

/// Flushes. False, and words on standard error, when anything since the file was opened could not be written.
bool FinishOutput(std::FILE* file);

}  // namespace sorn::tools
