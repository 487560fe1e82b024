#pragma once

#include <cstddef>

#include "rox/RoxString.h"
#include "sorn/json/JsonOutput.h"
#include "sorn/json/PlainCopy.h"

/// Texts on their way out, for the writers of this library.
namespace sorn::stringwriter {

/// The n bytes in quotes, escaped.
void WriteQuoted(const char* bytes, size_t n, JsonOutput& out);

/// Short texts go straight to memory, in which there is room for maxEscapedG bytes for each of theirs: the n
/// bytes, at most maxShortG, escaped and without quotes. Gives the end of what is written.
constexpr size_t maxEscapedG = 6;  ///< bytes that one byte becomes at most
constexpr size_t maxShortG = 128;
unsigned char* PutWithEscapes(const char* bytes, size_t n, unsigned char* out);
inline unsigned char* PutEscaped(const char* bytes, size_t n, unsigned char* out) {
    if (plaincopy::Copy(bytes, n, out)) [[likely]]
        return out + n;
    return PutWithEscapes(bytes, n, out);
}

/// The text in quotes if `fQuote`, else in quotes only if a byte before its first NUL is no ASCII letter,
/// digit or '-'. Escaped in both cases. Without quotes the empty text writes nothing.
void WriteText(const RoxString& text, bool fQuote, JsonOutput& out);

}  // namespace sorn::stringwriter
