#pragma once

#include <cstddef>

/// Bytes of the character at p, with n > 0 bytes there: the length of a well-formed UTF-8 sequence (no
/// overlong forms, no surrogates, nothing above U+10FFFF), else 1.
inline size_t RoxUtf8CharacterLength(const unsigned char* p, size_t n) {
    unsigned char lead = p[0];
    if (lead < 0xC2 || lead > 0xF4) {
        return 1;
    }
    size_t length = lead < 0xE0 ? 2 : lead < 0xF0 ? 3 : 4;
    if (n < length) {
        return 1;
    }
    // The second byte's range is narrower behind the leads at the edges of their length.
    unsigned char low = lead == 0xE0 ? 0xA0 : lead == 0xF0 ? 0x90 : 0x80;
    unsigned char high = lead == 0xED ? 0x9F : lead == 0xF4 ? 0x8F : 0xBF;
    if (p[1] < low || p[1] > high) {
        return 1;
    }
    for (size_t i = 2; i < length; ++i) {
        if ((p[i] & 0xC0) != 0x80) {
            return 1;
        }
    }
    return length;
}
