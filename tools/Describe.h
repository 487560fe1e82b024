#pragma once

#include <string>

namespace sorn::tools {

/// What "sorn describe" was asked for.
struct DescribeOptions {
    std::string nameOrId;  ///< empty: everything
    bool json = false;
};

/// Prints metadata on standard output; gives an ExitCode.
int Describe(const DescribeOptions& options);

}  // namespace sorn::tools
