#include "tools/Words.h"

#include <array>
#include <cstdio>

#include "service/Utf8Words.h"

namespace sorn::tools {

namespace {

constexpr size_t maxBytesG = 1000;

void AddEscaped(unsigned char c, std::string& line) {
    std::array<char, 8> text{};
    std::snprintf(text.data(), text.size(), "\\u%04X", unsigned{c});
    line += text.data();
}

}  // namespace

std::string LineOfWords(std::string_view words) {
    words = words.substr(0, words.find_last_not_of(" \n") + 1);
    const std::string kept = service::Utf8Words(words, maxBytesG);
    std::string line;
    for (size_t i = 0; i < kept.size(); ++i) {
        const auto c = static_cast<unsigned char>(kept[i]);
        // Terminals obey U+0080 to U+009F, which begin with 0xC2, as well.
        const auto next = static_cast<unsigned char>(i + 1 < kept.size() ? kept[i + 1] : 0);
        if (c < 0x20 || c == 0x7F) {
            AddEscaped(c, line);
        } else if (c == 0xC2 && next < 0xA0) {
            AddEscaped(next, line);
            ++i;
        } else {
            line += kept[i];
        }
    }
    return kept.size() < words.size() ? line + "..." : line;
}

}  // namespace sorn::tools
