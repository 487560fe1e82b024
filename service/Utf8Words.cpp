#include "service/Utf8Words.h"

#include "rox/RoxUtf8.h"

namespace sorn::service {

std::string Utf8Words(std::string_view text, size_t maxBytes) {
    std::string words;
    while (!text.empty()) {
        const auto* const bytes = reinterpret_cast<const unsigned char*>(text.data());
        const size_t n = RoxUtf8CharacterLength(bytes, text.size());
        if (n > maxBytes - words.size()) break;
        if (n == 1 && bytes[0] >= 0x80) {
            words += '?';
        } else {
            words += text.substr(0, n);
        }
        text.remove_prefix(n);
    }
    return words;
}

}  // namespace sorn::service
