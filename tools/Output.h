#pragma once

#include <cstdio>
#include <string>

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

/// Opens the file in a mode of fopen; the standard one when the path is empty. Null, and words on standard
/// error, when that fails.
std::FILE* OpenFile(const std::string& path, const char* mode, std::FILE* standard);

/// The standard output for results alone: the library tells unknown fields of the binary form on the standard
/// output, which becomes the standard error for that, line by line. Null and words on failure. The caller
/// closes it.
std::FILE* TakeStandardOutput();

/// Flushes. False, and words on standard error, when anything since the file was opened could not be written.
bool FinishOutput(std::FILE* file);

}  // namespace sorn::tools
