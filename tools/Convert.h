#pragma once

#include <string>

namespace sorn::tools {

/// What "sorn convert" was asked for.
struct ConvertOptions {
    std::string from = "json";
    std::string to = "json";
    std::string road = "dictionary";
    int schemaVersion = 0;
    bool pretty = false;
    bool lines = false;
    std::string inPath;   ///< empty: standard input
    std::string outPath;  ///< empty: standard output
};

/// Converts one record, or one on each line; gives an ExitCode. Words of what was refused go to standard
/// error.
int Convert(const ConvertOptions& options);

}  // namespace sorn::tools
