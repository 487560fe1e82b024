#pragma once

#include <cstdio>

#include "kelbaselib/Bytesink.h"

namespace sorn::tools {

/// Writes to an open file, which stays the caller's. What could not be written shows at FinishOutput.
class FileSink final : public kelbaselib::Bytesink {
 public:
    /// With `asOneLine` line feeds become blanks.
    FileSink(std::FILE* file, bool asOneLine) : pFileM(file), asOneLineM(asOneLine) {}
    unsigned Write(const void* bytes, unsigned count) override;

 private:
    std::FILE* pFileM;
    bool asOneLineM;
};

/// Flushes. False, and words on standard error, when anything since the file was opened could not be written.
bool FinishOutput(std::FILE* file);

}  // namespace sorn::tools
