#pragma once

#include <cstdint>

/// Text pieces of the scalar value classes, without allocation.
namespace sorn::scalartext {

/// Bytes of the longest text of a moment: a year of up to ten characters, two-digit parts, separators and a
/// NUL.
constexpr unsigned maxMomentBytesG = 32;

/// Reads a decimal number of digits only at p, which moves behind it. False without a digit at p. A value
/// above 2147483647 is taken as 2147483647, as a 32-bit strtol does.
bool ReadDecimal(const char*& p, const char* end, int32_t& value);

/// Writes a signed decimal number; gives the position behind it.
char* WriteDecimal(int64_t value, char* out);
/// Writes an unsigned decimal number of at most 20 digits; gives the position behind it.
char* WriteUnsigned(uint64_t value, char* out);

/// Copies a NUL-terminated text without its NUL; gives its length.
unsigned Copy(const char* text, char* out);

/// Which parts of a moment a text has.
enum MomentParts { DATE_ONLY, TIME_ONLY, DATE_AND_TIME };

/// Writes a count of seconds since 1970-01-01 UTC the way strftime does with "%F", "%T" or "%F %T", without a
/// NUL and into at least maxMomentBytesG bytes; gives the length. Exact for every date of a 32-bit count of
/// days and every 64-bit count of milliseconds, whatever the width of time_t.
unsigned FormatMoment(int64_t seconds, MomentParts parts, char* out);

/// Reads such a text the way strptime does with the format of the parts ('T' or a blank between date and
/// time); it must be used up whole. `year` gets the year that the text names (1970 for TIME_ONLY).
bool ParseMoment(const char* text, unsigned nByte, MomentParts parts, int64_t& seconds, int& year);

}  // namespace sorn::scalartext
