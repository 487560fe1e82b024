#include "sorn/model/Date.h"

#include "sorn/model/ScalarText.h"

namespace sorn {

constinit const Date Date::ZERO;

Date Date::Parse(const RoxString& text) {
    return Parse(text.Utf8(), text.NByte());
}

Date Date::Parse(const char* text, unsigned nByte) {
    int64_t seconds = 0;
    int year = 0;
    if (!scalartext::ParseMoment(text, nByte, scalartext::DATE_ONLY, seconds, year)) return ZERO;
    return Date(static_cast<int32_t>(seconds / 86400));
}

unsigned Date::FormatTo(char* out) const {
    return scalartext::FormatMoment(int64_t{days} * 86400, scalartext::DATE_ONLY, out);
}

RoxString Date::ToString(RoxMempool* pool) const {
    char text[scalartext::maxMomentBytesG];
    const unsigned n = FormatTo(text);
    return RoxString::FromUtf8Bytes(pool, n, text);
}

}  // namespace sorn
