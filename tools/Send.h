#pragma once

#include <string>

namespace sorn::tools {

/// What "sorn send" was asked for.
struct SendOptions {
    enum Way { WAIT, FORGET, WATCH };

    std::string bus;  ///< address; empty: the default
    Way way = WAIT;
    bool trace = false;
    std::string inPath;  ///< empty: standard input
};

/// Sends one request through the client and writes the bodies of its responses, a line each, to standard
/// output; gives an ExitCode. Watching ends with the last response, with SIGINT or SIGTERM, whether or
/// not somebody reads the output, or when the connection is lost.
int Send(const SendOptions& options);

}  // namespace sorn::tools
