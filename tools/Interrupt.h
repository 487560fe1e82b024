#pragma once

#include <string_view>

namespace sorn::tools {

// SIGINT and SIGTERM for commands that end their work on their own. Until they are caught they end the
// process at once. Any thread may call the operations.

/// From now on they are only noted.
void CatchInterrupts();
bool FInterrupted();

/// Writes the text to an open descriptor and waits for room while no interrupt was noted; then only what
/// there is room for is written. False when that was not all, or writing failed.
bool WriteUnlessInterrupted(int descriptor, std::string_view text);

}  // namespace sorn::tools
