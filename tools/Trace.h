#pragma once

namespace sorn::tools {

/// Writes a message to standard error as a line, as "sorn unframe" does; one that is none as words.
void TraceMessage(bool isSent, const char* bytes, unsigned nBytes);

}  // namespace sorn::tools
