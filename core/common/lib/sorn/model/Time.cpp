#include "sorn/model/Time.h"

#include "sorn/model/ScalarText.h"

namespace sorn {

constinit const Time Time::ZERO;

Time Time::Parse(const RoxString& text) {
    return Parse(text.Utf8(), text.NByte());
}

Time Time::Parse(const char* text, unsigned nByte) {
    int64_t seconds = 0;
    int year = 0;
    if (!scalartext::ParseMoment(text, nByte, scalartext::TIME_ONLY, seconds, year)) return ZERO;
    return Time(static_cast<int32_t>(seconds * 1000));
}

unsigned Time::FormatTo(char* out) const {
    return scalartext::FormatMoment(milliseconds / 1000, scalartext::TIME_ONLY, out);
}

RoxString Time::ToString(RoxMempool* pool) const {
    char text[scalartext::maxMomentBytesG];
    const unsigned n = FormatTo(text);
    return RoxString::FromUtf8Bytes(pool, n, text);
}

}  // namespace sorn
