#pragma once

#include <cstddef>
#include <string>
#include <string_view>

namespace sorn::service {

/// Words that may quote any bytes, as UTF-8: the characters that maxBytes hold, and '?' for each byte that is
/// of none.
std::string Utf8Words(std::string_view text, size_t maxBytes);

}  // namespace sorn::service
