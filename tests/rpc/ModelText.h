#pragma once

#include <cstdint>
#include <string>
#include <vector>

// Text operations of the model, written over std::string alone.
namespace sorntest {

/// Without blanks, tabs, line ends, vertical tabs and form feeds at both ends.
std::string ModelTrim(const std::string& text);
/// The pieces between the delimiters; none at all for a text without one.
std::vector<std::string> ModelSplit(const std::string& text, const std::string& delimiter);
/// The byte offset of the place n characters behind another, the text's end at most. A character is a
/// well-formed UTF-8 sequence or one byte that is part of none.
size_t ModelAdvance(const std::string& text, size_t from, uint64_t n);
/// As printf's %s shows it: up to the first NUL.
std::string ModelPrinted(const std::string& text);
/// Digits only, at least one, up to the first NUL, modulo 2^64; 0 for anything else and above 32 bits.
uint32_t ModelNumber(const std::string& text);

}  // namespace sorntest
