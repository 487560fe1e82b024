#pragma once

#include <cstddef>

#include "rox/RoxString.h"
#include "sorn/json/JsonOutput.h"

/// Texts on their way out, for the writers of this library.
namespace sorn::stringwriter {

/// The n bytes in quotes, escaped.
void WriteQuoted(const char* bytes, size_t n, JsonOutput& out);

/// The text in quotes if `fQuote`, else in quotes only if a byte before its first NUL is no ASCII letter,
/// digit or '-'. Escaped in both cases. Without quotes the empty text writes nothing.
void WriteText(const RoxString& text, bool fQuote, JsonOutput& out);

}  // namespace sorn::stringwriter
