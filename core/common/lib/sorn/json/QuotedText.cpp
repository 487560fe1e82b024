#include "sorn/json/QuotedText.h"

#include <cstring>

#include "sorn/json/Json.h"

namespace sorn {

bool QuotedText::FindWithEscapes(const unsigned char* end) {
    const unsigned char* p = pTextEndM;
    while (p < end && *p == '\\') {
        char value;
        if (end - p < 2) return false;
        if (p[1] != 'u') {
            if (!Json::EscapedCharToChar(static_cast<char>(p[1]), value)) return false;
            ++nEscapeM;
        }
        p = textscan::FindStringStop(p + 2, end);
    }
    if (p < end && *p == 0) return false;
    // Without a closing quote too: its absence shows in where the cursor then stands.
    pTextEndM = p;
    pBehindM = p + 1;
    return true;
}

RoxString QuotedText::Decode(RoxMempool* pool) const {
    const unsigned length = static_cast<unsigned>(pTextEndM - pBeginM) - nEscapeM;
    RoxStringRepN* rep = RoxStringRepN::New(pool, length);
    char* out = rep->MutableBytes();
    const unsigned char* p = pBeginM;
    while (p < pTextEndM) {
        const void* found = std::memchr(p, '\\', static_cast<size_t>(pTextEndM - p));
        const unsigned char* stop = found == nullptr ? pTextEndM : static_cast<const unsigned char*>(found);
        std::memcpy(out, p, static_cast<size_t>(stop - p));
        out += stop - p;
        p = stop;
        if (p == pTextEndM) break;
        if (p[1] == 'u') {
            *out++ = '\\';
            *out++ = 'u';
        } else {
            Json::EscapedCharToChar(static_cast<char>(p[1]), *out);
            ++out;
        }
        p += 2;
    }
    return RoxString::AdoptRepN(rep);
}

}  // namespace sorn
