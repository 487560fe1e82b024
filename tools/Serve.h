#pragma once

#include <string>
#include <vector>

namespace sorn::tools {

/// What "sorn serve" was asked for.
struct ServeOptions {
    std::string bus;                  ///< address of the bus; empty: the default
    std::string database;             ///< file of the store; empty: in memory
    std::vector<std::string> vLoads;  ///< files with a record on each line, loaded in their order
    bool trace = false;               ///< every message to standard output
};

/// Runs the development service until SIGINT or SIGTERM, which end the process at once while files are
/// loaded; gives an ExitCode: done, too, when lines of files were refused, which standard error tells, but
/// not when a file could not be read. It says "listening on" and the address on standard error as soon
/// as clients can connect.
int Serve(const ServeOptions& options);

}  // namespace sorn::tools
