#include "sorn/model/ScalarText.h"

#include <cstring>
#include <ctime>
#include <limits>

#include "sorn/model/DecimalDigits.h"

namespace sorn::scalartext {

namespace {

constexpr int64_t secondsPerDayG = 86400;

bool FDigit(char c) {
    return c >= '0' && c <= '9';
}

/// A civil date of the proleptic Gregorian calendar.
struct CivilDate {
    int64_t year;
    int month;  // 1 to 12
    int day;    // 1 to 31
};

// Both conversions count in eras of 400 years that begin on 1 March, after H. Hinnant, "chrono-Compatible
// Low-Level Date Algorithms".
// The unsigned 32-bit days of all dates that occur are counted in their own width, which is what division
// likes.
template <class Int>
CivilDate DateOfShiftedDays(Int days, Int era) {
    const Int dayOfEra = days - era * 146097;
    const Int yearOfEra = (dayOfEra - dayOfEra / 1460 + dayOfEra / 36524 - dayOfEra / 146096) / 365;
    const Int dayOfYear = dayOfEra - (365 * yearOfEra + yearOfEra / 4 - yearOfEra / 100);
    const Int shiftedMonth = (5 * dayOfYear + 2) / 153;
    const int month = static_cast<int>(shiftedMonth < 10 ? shiftedMonth + 3 : shiftedMonth - 9);
    return {int64_t{yearOfEra} + int64_t{era} * 400 + (month <= 2 ? 1 : 0), month,
            static_cast<int>(dayOfYear - (153 * shiftedMonth + 2) / 5 + 1)};
}

CivilDate DateOfDays(int64_t days) {
    days += 719468;
    if (days >= 0 && days <= INT32_MAX) [[likely]] {
        const auto narrow = static_cast<uint32_t>(days);
        return DateOfShiftedDays<uint32_t>(narrow, narrow / 146097);
    }
    return DateOfShiftedDays<int64_t>(days, (days >= 0 ? days : days - 146096) / 146097);
}

int64_t DaysOfDate(int64_t year, int month, int day) {
    year -= month <= 2 ? 1 : 0;
    const int64_t era = (year >= 0 ? year : year - 399) / 400;
    const int64_t yearOfEra = year - era * 400;
    const int64_t dayOfYear = (153 * (month > 2 ? month - 3 : month + 9) + 2) / 5 + day - 1;
    return era * 146097 + yearOfEra * 365 + yearOfEra / 4 - yearOfEra / 100 + dayOfYear - 719468;
}

char* WriteYear(int64_t year, char* out) {
    if (year >= 1000 && year <= 9999) [[likely]]
        return decimaldigits::WriteFour(static_cast<uint32_t>(year), out);
    return WriteDecimal(year, out);  // "%Y" does not pad
}

char* WriteDate(int64_t days, char* out) {
    const CivilDate date = DateOfDays(days);
    out = WriteYear(date.year, out);
    *out++ = '-';
    out = decimaldigits::WriteTwo(static_cast<uint32_t>(date.month), out);
    *out++ = '-';
    return decimaldigits::WriteTwo(static_cast<uint32_t>(date.day), out);
}

char* WriteTime(uint32_t secondOfDay, char* out) {
    out = decimaldigits::WriteTwo(secondOfDay / 3600, out);
    *out++ = ':';
    out = decimaldigits::WriteTwo(secondOfDay / 60 % 60, out);
    *out++ = ':';
    return decimaldigits::WriteTwo(secondOfDay % 60, out);
}

/// Reads n digits at fixed places; false when one is no digit or the number lies outside low to high.
bool ReadFixed(const char* p, int n, int low, int high, int& value) {
    value = 0;
    for (int i = 0; i < n; ++i) {
        if (!FDigit(p[i])) return false;
        value = value * 10 + (p[i] - '0');
    }
    return value >= low && value <= high;
}

bool ReadCanonicalDate(const char* p, std::tm& parts) {
    int year = 0;
    int month = 0;
    if (!ReadFixed(p, 4, 0, 9999, year) || p[4] != '-' || !ReadFixed(p + 5, 2, 1, 12, month) || p[7] != '-' ||
        !ReadFixed(p + 8, 2, 1, 31, parts.tm_mday)) {
        return false;
    }
    parts.tm_year = year - 1900;
    parts.tm_mon = month - 1;
    return true;
}

bool ReadCanonicalTime(const char* p, std::tm& parts) {
    return ReadFixed(p, 2, 0, 23, parts.tm_hour) && p[2] == ':' && ReadFixed(p + 3, 2, 0, 59, parts.tm_min) &&
           p[5] == ':' && ReadFixed(p + 6, 2, 0, 59, parts.tm_sec);
}

/// The texts that the writers make, read without strptime; it takes them to the same parts.
bool ReadCanonical(const char* text, unsigned nByte, MomentParts wanted, std::tm& parts) {
    switch (wanted) {
        case DATE_ONLY:
            return nByte == 10 && ReadCanonicalDate(text, parts);
        case TIME_ONLY:
            return nByte == 8 && ReadCanonicalTime(text, parts);
        case DATE_AND_TIME:
            return nByte == 19 && (text[10] == ' ' || text[10] == 'T') && ReadCanonicalDate(text, parts) &&
                   ReadCanonicalTime(text + 11, parts);
    }
    return false;
}

bool ReadWhole(const char* text, unsigned nByte, const char* format, std::tm& parts) {
    const char* const stop = ::strptime(text, format, &parts);
    return stop != nullptr && stop == text + nByte;
}

bool ReadGeneral(const char* text, unsigned nByte, MomentParts wanted, std::tm& parts) {
    switch (wanted) {
        case DATE_ONLY:
            return ReadWhole(text, nByte, "%F", parts);
        case TIME_ONLY:
            return ReadWhole(text, nByte, "%T", parts);
        case DATE_AND_TIME:
            return ReadWhole(text, nByte, "%F %T", parts) || ReadWhole(text, nByte, "%FT%T", parts);
    }
    return false;
}

}  // namespace

bool ReadDecimal(const char*& p, const char* end, int32_t& value) {
    if (p == end || !FDigit(*p)) return false;
    constexpr int64_t highest = std::numeric_limits<int32_t>::max();
    int64_t number = 0;
    for (; p != end && FDigit(*p); ++p) {
        number = number * 10 + (*p - '0');
        if (number > highest) number = highest;
    }
    value = static_cast<int32_t>(number);
    return true;
}

char* WriteUnsigned(uint64_t value, char* out) {
    constexpr uint32_t eightDigits = 100000000;
    if (value <= UINT32_MAX) [[likely]]
        return decimaldigits::Write(static_cast<uint32_t>(value), out);
    const uint64_t high = value / eightDigits;
    const auto low = static_cast<uint32_t>(value % eightDigits);
    if (high <= UINT32_MAX) {
        out = decimaldigits::Write(static_cast<uint32_t>(high), out);
    } else {
        out = decimaldigits::Write(static_cast<uint32_t>(high / eightDigits), out);
        out = decimaldigits::WriteEight(static_cast<uint32_t>(high % eightDigits), out);
    }
    return decimaldigits::WriteEight(low, out);
}

char* WriteDecimal(int64_t value, char* out) {
    if (value >= 0) return WriteUnsigned(static_cast<uint64_t>(value), out);
    *out++ = '-';
    return WriteUnsigned(0 - static_cast<uint64_t>(value), out);
}

unsigned Copy(const char* text, char* out) {
    const size_t n = std::strlen(text);
    std::memcpy(out, text, n);
    return static_cast<unsigned>(n);
}

unsigned FormatMoment(int64_t seconds, MomentParts parts, char* out) {
    int64_t days = seconds / secondsPerDayG;
    int64_t secondOfDay = seconds % secondsPerDayG;
    if (secondOfDay < 0) {
        secondOfDay += secondsPerDayG;
        --days;
    }
    char* p = out;
    if (parts != TIME_ONLY) p = WriteDate(days, p);
    if (parts == DATE_AND_TIME) *p++ = ' ';
    if (parts != DATE_ONLY) p = WriteTime(static_cast<uint32_t>(secondOfDay), p);
    return static_cast<unsigned>(p - out);
}

bool ParseMoment(const char* text, unsigned nByte, MomentParts parts, int64_t& seconds, int& year) {
    std::tm time{};
    if (parts == TIME_ONLY) {  // strptime leaves the date alone: that of second 0
        time.tm_year = 70;
        time.tm_mday = 1;
    }
    if (!ReadCanonical(text, nByte, parts, time) && !ReadGeneral(text, nByte, parts, time)) return false;
    year = time.tm_year + 1900;
    const int64_t days = DaysOfDate(year, time.tm_mon + 1, time.tm_mday);
    seconds = ((days * 24 + time.tm_hour) * 60 + time.tm_min) * 60 + time.tm_sec;
    return true;
}

}  // namespace sorn::scalartext
