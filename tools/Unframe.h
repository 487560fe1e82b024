#pragma once

#include <string>

namespace sorn::tools {

/// What "sorn unframe" was asked for.
struct UnframeOptions {
    bool parseBody = false;
    std::string inPath;  ///< empty: standard input
};

/// Takes a stream of messages apart, each to a line as soon as it is complete; gives an ExitCode. After a bad
/// first line it goes on at the next text that looks like one.
int Unframe(const UnframeOptions& options);

}  // namespace sorn::tools
