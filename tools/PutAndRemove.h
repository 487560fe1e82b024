#pragma once

#include <string>

namespace sorn::tools {

/// What "sorn put" or "sorn rm" was asked for.
struct PutAndRemoveOptions {
    std::string bus;     ///< address; empty: the default
    const char* action;  ///< what the development service is told: "put" or "remove"
    bool trace = false;
    std::string inPath;  ///< empty: standard input
};

/// Takes the records of the input, one a line, to the development service, each in a request of its own;
/// gives an ExitCode. What is refused is told on standard error, and the rest is done; after an
/// answer that does not come nothing more is sent.
int PutOrRemove(const PutAndRemoveOptions& options);

}  // namespace sorn::tools
