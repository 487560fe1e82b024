#include "sorn/model/DateTime.h"

#include <sys/time.h>

#include "sorn/model/ScalarText.h"

namespace sorn {

constinit const DateTime DateTime::ZERO;

DateTime DateTime::Parse(const RoxString& text) {
    return Parse(text.Utf8(), text.NByte());
}

DateTime DateTime::Parse(const char* text, unsigned nByte) {
    int64_t seconds = 0;
    int year = 0;
    if (!scalartext::ParseMoment(text, nByte, scalartext::DATE_AND_TIME, seconds, year)) return ZERO;
    return DateTime(year >= 2038 ? clampMillisecondsG : seconds * 1000);
}

DateTime DateTime::Now() {
    timeval now{};
    ::gettimeofday(&now, nullptr);
    return DateTime(int64_t{now.tv_sec} * 1000 + now.tv_usec / 1000);
}

unsigned DateTime::FormatTo(char* out) const {
    return scalartext::FormatMoment(milliseconds / 1000, scalartext::DATE_AND_TIME, out);
}

RoxString DateTime::ToString(RoxMempool* pool) const {
    char text[scalartext::maxMomentBytesG];
    const unsigned n = FormatTo(text);
    return RoxString::FromUtf8Bytes(pool, n, text);
}

}  // namespace sorn
