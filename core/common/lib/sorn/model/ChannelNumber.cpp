#include "sorn/model/ChannelNumber.h"

#include "sorn/model/ScalarText.h"

namespace sorn {

constinit const ChannelNumber ChannelNumber::INVALID;

ChannelNumber ChannelNumber::Parse(const RoxString& text) {
    const char* p = text.Utf8();
    const char* const end = p + text.NByte();
    int32_t number = 0;
    if (!scalartext::ReadDecimal(p, end, number)) return INVALID;
    if (p == end) return ChannelNumber(number);
    int32_t subNumber = 0;
    if (*p++ != '-' || !scalartext::ReadDecimal(p, end, subNumber) || p != end) return INVALID;
    return ChannelNumber(number, subNumber);
}

unsigned ChannelNumber::FormatTo(char* out) const {
    if (number == noneG && subNumber == noneG) return scalartext::Copy("invalid", out);
    char* p = scalartext::WriteDecimal(number, out);
    if (subNumber != noneG) {
        *p++ = '-';
        p = scalartext::WriteDecimal(subNumber, p);
    }
    return static_cast<unsigned>(p - out);
}

RoxString ChannelNumber::ToString(RoxMempool* pool) const {
    char text[maxTextBytesG];
    const unsigned n = FormatTo(text);
    return RoxString::FromUtf8Bytes(pool, n, text);
}

}  // namespace sorn
