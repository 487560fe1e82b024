#pragma once

#include <string_view>

namespace sorn {

inline constexpr std::string_view whiteSpaceG = " \t\n\v\f\r";

/// The text without white space at both ends, as RoxString::Trim leaves it.
inline std::string_view TrimmedView(std::string_view text) {
    const size_t begin = text.find_first_not_of(whiteSpaceG);
    if (begin == std::string_view::npos) return {};
    return text.substr(begin, text.find_last_not_of(whiteSpaceG) - begin + 1);
}

}  // namespace sorn
