#pragma once

#include <string>
#include <string_view>

namespace sorn::tools {

/// A message as a trace shows it, with a line feed at the end.
struct TraceLine {
    explicit TraceLine(std::string_view message);

    bool isMessage = false;
    std::string text;  ///< as "sorn unframe" writes it; words, when it is no message
};

/// Writes a message, or words about it, to standard error. An interrupt that is caught ends the waiting for
/// its reader, and the trace. Any thread.
void TraceMessage(bool isSent, const char* bytes, unsigned nBytes);

}  // namespace sorn::tools
