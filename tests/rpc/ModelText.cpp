#include "rpc/ModelText.h"

namespace sorntest {

namespace {

bool IsBlank(char c) {
    return c == ' ' || (c >= 9 && c <= 13);
}

/// How long the character at `from` is, by decoding it and asking whether its number needs that many bytes.
size_t CharacterLength(const std::string& text, size_t from) {
    const auto byte = [&text](size_t i) {
        return static_cast<unsigned>(static_cast<unsigned char>(text[i]));
    };
    const unsigned lead = byte(from);
    size_t length = 1;
    if ((lead & 0xE0) == 0xC0) length = 2;
    if ((lead & 0xF0) == 0xE0) length = 3;
    if ((lead & 0xF8) == 0xF0) length = 4;
    if (length == 1 || from + length > text.size()) return 1;
    uint32_t number = lead & (0xFFu >> (length + 1));
    for (size_t i = 1; i < length; ++i) {
        if ((byte(from + i) & 0xC0) != 0x80) return 1;
        number = number * 64 + (byte(from + i) & 0x3F);
    }
    const uint32_t least = length == 2 ? 0x80 : length == 3 ? 0x800 : 0x10000;
    const bool isSurrogate = number >= 0xD800 && number <= 0xDFFF;
    return number < least || number > 0x10FFFF || isSurrogate ? 1 : length;
}

}  // namespace

std::string ModelTrim(const std::string& text) {
    size_t begin = 0;
    size_t end = text.size();
    while (begin < end && IsBlank(text[begin])) ++begin;
    while (end > begin && IsBlank(text[end - 1])) --end;
    return text.substr(begin, end - begin);
}

std::vector<std::string> ModelSplit(const std::string& text, const std::string& delimiter) {
    std::vector<std::string> vPieces;
    size_t begin = 0;
    for (size_t at; (at = text.find(delimiter, begin)) != std::string::npos; begin = at + delimiter.size()) {
        vPieces.push_back(text.substr(begin, at - begin));
    }
    if (!vPieces.empty()) vPieces.push_back(text.substr(begin));
    return vPieces;
}

size_t ModelAdvance(const std::string& text, size_t from, uint64_t n) {
    for (; n != 0 && from < text.size(); --n) from += CharacterLength(text, from);
    return from;
}

std::string ModelPrinted(const std::string& text) {
    return text.c_str();
}

uint32_t ModelNumber(const std::string& text) {
    const std::string digits = text.c_str();
    uint64_t number = 0;
    for (const char c : digits) {
        if (c < '0' || c > '9') return 0;
        number = number * 10 + static_cast<uint64_t>(c - '0');
    }
    return number > UINT32_MAX ? 0 : static_cast<uint32_t>(number);
}

}  // namespace sorntest
