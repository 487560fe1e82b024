#pragma once

#include <cstddef>
#include <cstdint>

/// The text forms of scalars without strings and allocation, for codecs; those of Dict are made of them. All
/// work as in the C locale, whatever the locale of the process is, and on any thread. Plain decimal numbers
/// are written by scalartext::WriteDecimal and WriteUnsigned.
namespace sorn::scalarformat {

/// Bytes that are enough for the writers here; nothing is written behind the text.
constexpr unsigned maxTextBytesG = 32;

/// As printf does with "%1.8g", with ".0" behind it when there is no point: 5.0, 1e+20.0, nan.0. Gives the
/// position behind.
char* WriteFloat(double value, char* out);
/// As Dict::FormatLongId. Gives the position behind the text.
char* WriteLongId(uint64_t value, char* out);

/// As sscanf does with "%lg", "%lld" and "%llu" on a NUL-terminated text: white space before the number is
/// passed, text behind it ignored, "%llu" takes a minus sign as well, and what is out of range becomes the
/// nearest value in it. False when there is no number.
bool ScanFloat(const char* text, double& value);
bool ScanS64(const char* text, long long& value);
bool ScanU64(const char* text, unsigned long long& value);

/// The strict readers of Dict over n bytes: 0 for anything else than a number.
long long ParseS64(const char* text, size_t n);              ///< as Dict::ParseS64
unsigned long long ParseU64(const char* text, size_t n);     ///< digits only; wraps modulo 2^64
int ParseS32(const char* text, size_t n);                    ///< 0 when out of range
unsigned ParseU32(const char* text, size_t n);               ///< as ParseU64, 0 when out of range
unsigned long long ParseLongId(const char* text, size_t n);  ///< as Dict::ParseLongId

}  // namespace sorn::scalarformat
