#pragma once

#include <cstdarg>
#include <cstdio>
#include <cstring>
#include <string>

namespace sorntest {

/// The bytes at p as a T.
template <class T>
T Read(const void* p) {
    T value;
    memcpy(&value, p, sizeof value);
    return value;
}

/// What printf gives, of at most 399 bytes.
inline std::string Format(const char* format, ...) __attribute__((format(printf, 1, 2)));
inline std::string Format(const char* format, ...) {
    char text[400];
    va_list args;
    va_start(args, format);
    vsnprintf(text, sizeof text, format, args);
    va_end(args);
    return text;
}

}  // namespace sorntest
