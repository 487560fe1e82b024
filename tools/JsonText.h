#pragma once

#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace sorn::tools {

// Plain JSON, where the library's own dialect would not give a text back exactly as it was.

/// The text between quotes; bytes from 0x80 up stand as they are.
std::string Quoted(std::string_view text);
/// The reverse for what stands at the start of `json`, up to its closing quote: false without one and for a
/// bad escape.
bool Unquote(std::string_view json, std::string& text);

using RawMembers = std::vector<std::pair<std::string, std::string_view>>;

/// The members of one object in the order in which they stand, their values as they stand. Only as much is
/// checked as is needed to tell them apart; false when that fails.
bool SplitObject(std::string_view json, RawMembers& members);
/// The elements of an array in the same way.
bool SplitArray(std::string_view json, std::vector<std::string_view>& elements);

}  // namespace sorn::tools
