#pragma once

#include <cstdint>
#include <string_view>

#include "rox/RoxString.h"

namespace sorn {

/// The first line of an ORPC/2 message.
struct FirstLine {
    static constexpr char magicG[] = "ORPC/2";
    /// An input of so many bytes without CR, LF may still become a line, a longer one may not: a line that
    /// keeps the limits takes 24 bytes with its end, and one is to spare.
    static constexpr uint32_t maxUnfinishedG = 25;

    uint32_t headerLength = 0;
    uint32_t bodyLength = 0;
    uint32_t length = 0;  ///< bytes of the line with its CR, LF; 0 while there is none

    /// Reads the line at the start of the input. False with `length` 0 and nothing else changed: more input
    /// is needed. False with a length: a bad line, words replace `error`, lengths read before the fault stay.
    /// An input that is too long for one without CR, LF is one line of all its bytes: true, with words and
    /// the other lengths as they were.
    bool Parse(std::string_view input, RoxString& error);
};

}  // namespace sorn
