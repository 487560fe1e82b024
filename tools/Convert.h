#pragma once

#include <string>

namespace sorn::tools {

/// What "sorn convert" was asked for.
struct ConvertOptions {
    std::string from = "json";        ///< "json" or "binary"
    std::string to = "json";          ///< the same
    std::string road = "dictionary";  ///< how JSON becomes an object and back: "typed" or "dictionary"
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
