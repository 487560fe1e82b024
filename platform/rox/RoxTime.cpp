#include "rox/RoxTime.h"

namespace {

struct Unit {
    uint64_t nanoseconds;
    int nDecimals;
    const char* name;
};

constexpr Unit vUnit[] = {{1'000'000'000, 9, "s"}, {1'000'000, 6, "ms"}, {1'000, 3, "us"}};

}  // namespace

RoxString RoxTime::DebugStringAsInterval() const {
    const char* sign = nanosecondsM < 0 ? "-" : "";
    uint64_t n =
        nanosecondsM < 0 ? 0 - static_cast<uint64_t>(nanosecondsM) : static_cast<uint64_t>(nanosecondsM);
    for (const Unit& unit : vUnit) {
        if (n >= unit.nanoseconds) {
            return RoxString::Format("%s%llu.%0*llu %s", sign,
                                     static_cast<unsigned long long>(n / unit.nanoseconds), unit.nDecimals,
                                     static_cast<unsigned long long>(n % unit.nanoseconds), unit.name);
        }
    }
    return RoxString::Format("%s%llu ns", sign, static_cast<unsigned long long>(n));
}
