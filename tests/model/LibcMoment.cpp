#include "model/LibcMoment.h"

namespace sorntest {

namespace {

bool FLeap(int year) {
    return year % 4 == 0 && (year % 100 != 0 || year % 400 == 0);
}

int DaysOfMonth(int year, int month) {
    const int days[] = {31, FLeap(year) ? 29 : 28, 31, 30, 31, 30, 31, 31, 30, 31, 30, 31};
    return days[month - 1];
}

}  // namespace

std::optional<std::tm> ReadWithLibc(const std::string& text, std::initializer_list<const char*> formats) {
    for (const char* format : formats) {
        std::tm parts{};
        parts.tm_year = 70;
        parts.tm_mday = 1;
        const char* const stop = ::strptime(text.c_str(), format, &parts);
        if (stop != nullptr && stop == text.c_str() + text.size()) return parts;
    }
    return std::nullopt;
}

int64_t DaysByCounting(int year, int month, int day) {
    int64_t days = day - 1;
    for (int each = 1970; each < year; ++each) days += FLeap(each) ? 366 : 365;
    for (int each = 1969; each >= year; --each) days -= FLeap(each) ? 366 : 365;
    for (int each = 1; each < month; ++each) days += DaysOfMonth(year, each);
    return days;
}

int64_t SecondsByCounting(const std::tm& parts) {
    const int64_t days = DaysByCounting(parts.tm_year + 1900, parts.tm_mon + 1, parts.tm_mday);
    return ((days * 24 + parts.tm_hour) * 60 + parts.tm_min) * 60 + parts.tm_sec;
}

std::string FormatWithLibc(int64_t seconds, const char* format) {
    const std::time_t moment = static_cast<std::time_t>(seconds);
    std::tm parts{};
    ::gmtime_r(&moment, &parts);
    char text[50];
    return std::string(text, ::strftime(text, sizeof text, format, &parts));
}

}  // namespace sorntest
