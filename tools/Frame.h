#pragma once

#include <string>
#include <vector>

namespace sorn::tools {

/// What "sorn frame" was asked for.
struct FrameOptions {
    std::string kind;  ///< "request", "requestUpdate", "response" or "cancel"; empty with `lines`
    unsigned rpcId = 0;
    bool hasRpcId = false;
    std::string requestType;  ///< empty: the "type" of the body
    std::string count;        ///< empty: "single", or "multiple" for an update
    int schemaVersion = -1;   ///< -1: the default of the schema, where the kind states one
    bool isFinal = false;
    std::vector<std::string> vHeaders;  ///< NAME=VALUE
    bool lines = false;                 ///< messages as "sorn unframe" writes them
    std::string inPath;                 ///< empty: standard input
};

/// Writes a message of the body in the input, or the messages of its lines, to standard output; gives an
/// ExitCode.
int Frame(const FrameOptions& options);

}  // namespace sorn::tools
