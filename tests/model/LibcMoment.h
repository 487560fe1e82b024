#pragma once

#include <cstdint>
#include <ctime>
#include <initializer_list>
#include <optional>
#include <string>

/// Dates and times by the C library and by counting, as the other side of comparisons.
namespace sorntest {

/// Whether the C library of this build knows seconds outside 1901 to 2038.
constexpr bool fWideTime = sizeof(std::time_t) == 8;

/// A text read by strptime into a structure whose date is second 0, whole; the formats one after another.
std::optional<std::tm> ReadWithLibc(const std::string& text, std::initializer_list<const char*> formats);

/// Days from 1970-01-01 to a date with a year of 0 or later, by adding the lengths of years and months. Days
/// beyond a month's end run on into the next.
int64_t DaysByCounting(int year, int month, int day);

/// Seconds of a broken-down time, by DaysByCounting.
int64_t SecondsByCounting(const std::tm& parts);

/// strftime of a moment. `seconds` must be within the C library's time_t.
std::string FormatWithLibc(int64_t seconds, const char* format);

/// Every text that comes from `text` by changing one byte, leaving one out or putting one in, with the bytes
/// that matter in dates and times; calls `check` with each.
template <class Check>
void ForEachNeighbour(const std::string& text, const Check& check) {
    const std::string bytes = "0123456789-:T .+tZ/a\t\xC2";
    for (size_t i = 0; i <= text.size(); ++i) {
        for (const char byte : bytes) {
            std::string changed = text;
            check(changed.insert(i, 1, byte));
            if (i == text.size()) continue;
            changed = text;
            changed[i] = byte;
            check(changed);
        }
        if (i < text.size()) check(std::string(text).erase(i, 1));
    }
}

}  // namespace sorntest
