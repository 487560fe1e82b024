#pragma once

#include <string>
#include <string_view>

namespace sorn::tools {

/// Words about some input, which they may quote, for a line on a terminal: control characters as \u00XX, what
/// is no UTF-8 as '?', and what goes beyond 1,000 bytes as "..."; without blanks and line feeds at the end.
std::string LineOfWords(std::string_view words);

}  // namespace sorn::tools
