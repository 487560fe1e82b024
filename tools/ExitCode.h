#pragma once

namespace sorn::tools {

/// What the tool's process ends with.
enum ExitCode : int {
    DONE = 0,
    SOME_REFUSED = 1,  ///< some input was refused, or output could not be written; the rest is still done
    WRONG_USAGE = 2,   ///< wrong options, an unknown name, or a file that cannot be opened
};

}  // namespace sorn::tools
