#include "sorn/dict/ScalarFormat.h"

#include <clocale>
#include <cstdio>
#include <cstring>
#include <limits>

#include <locale.h>
#include <charconv>

#include "sorn/model/ScalarText.h"

namespace sorn::scalarformat {

namespace {

struct IdNamespace {
    const char* name;
    uint64_t code;
};

constexpr IdNamespace idNamespacesG[] = {
    {"rs", 1},     {"ts", 2},     {"bs", 3}, {"tms.ep", 5}, {"tms.sh", 6},
    {"tms.mv", 7}, {"tms.sp", 8}, {"vp", 9}, {"dlna", 10},  {"vod", 16384},
};

constexpr unsigned idNumberBitsG = 48;
constexpr uint64_t idNumberMaskG = (uint64_t{1} << idNumberBitsG) - 1;

bool FSpace(char c) {
    return c == ' ' || (c >= '\t' && c <= '\r');
}

bool FDigit(char c) {
    return c >= '0' && c <= '9';
}

const char* SkipDigits(const char* p) {
    while (FDigit(*p)) ++p;
    return p;
}

/// A sign and a run of digits with the number clipped to 2^64 - 1.
struct Scanned {
    bool fNegative = false;
    bool fClipped = false;
    uint64_t magnitude = 0;
    const char* pEnd = nullptr;  // null without a digit
};

/// Reads digits up to `end`, or, when that is null, as far as there are any.
Scanned ScanDigits(const char* p, const char* end, bool fNegative) {
    Scanned result;
    result.fNegative = fNegative;
    if (p == end || !FDigit(*p)) return result;
    for (; p != end && FDigit(*p); ++p) {
        const unsigned digit = static_cast<unsigned>(*p - '0');
        if (result.fClipped) continue;
        if (__builtin_mul_overflow(result.magnitude, uint64_t{10}, &result.magnitude) ||
            __builtin_add_overflow(result.magnitude, uint64_t{digit}, &result.magnitude)) {
            result.fClipped = true;
            result.magnitude = UINT64_MAX;
        }
    }
    result.pEnd = p;
    return result;
}

Scanned ScanNumber(const char* p) {
    while (FSpace(*p)) ++p;
    const bool fNegative = *p == '-';
    if (*p == '-' || *p == '+') ++p;
    return ScanDigits(p, nullptr, fNegative);
}

/// The number as strtoll gives it.
long long ToS64(const Scanned& scanned) {
    constexpr uint64_t highest = INT64_MAX;
    if (scanned.fNegative) {
        return scanned.magnitude > highest ? INT64_MIN : -static_cast<long long>(scanned.magnitude);
    }
    return scanned.magnitude > highest ? INT64_MAX : static_cast<long long>(scanned.magnitude);
}

/// Where a number of digits, point and exponent ends, all that sscanf would look at; null when the text is of
/// another kind: infinite, hexadecimal, without digits or with half an exponent.
const char* EndOfPlainFloat(const char* p) {
    const char* const first = p;
    if (p[0] == '0' && (p[1] == 'x' || p[1] == 'X')) return nullptr;
    p = SkipDigits(p);
    size_t nDigits = static_cast<size_t>(p - first);
    if (*p == '.') {
        const char* const fraction = ++p;
        p = SkipDigits(p);
        nDigits += static_cast<size_t>(p - fraction);
    }
    if (nDigits == 0) return nullptr;
    if (*p != 'e' && *p != 'E') return p;
    ++p;
    if (*p == '-' || *p == '+') ++p;
    const char* const end = SkipDigits(p);
    return end == p ? nullptr : end;
}

/// The C locale for the calling thread as long as it lives.
class CLocale {
 public:
    CLocale() : previousM(uselocale(Get())) {}
    ~CLocale() { uselocale(previousM); }
    CLocale(const CLocale&) = delete;
    CLocale& operator=(const CLocale&) = delete;

 private:
    static locale_t Get() {
        static const locale_t locale = newlocale(LC_ALL_MASK, "C", nullptr);
        return locale;
    }

    locale_t previousM;
};

bool ScanFloatByLibrary(const char* text, double& value) {
    const CLocale locale;
    double scanned = 0;
    if (std::sscanf(text, "%lg", &scanned) != 1) return false;
    value = scanned;
    return true;
}

}  // namespace

char* WriteFloat(double value, char* out) {
    constexpr int precision = 8;
    char* const end =
        std::to_chars(out, out + maxTextBytesG, value, std::chars_format::general, precision).ptr;
    if (std::memchr(out, '.', static_cast<size_t>(end - out)) != nullptr) return end;
    // Behind an exponent too: the required form.
    end[0] = '.';
    end[1] = '0';
    return end + 2;
}

char* WriteLongId(uint64_t value, char* out) {
    const uint64_t code = value >> idNumberBitsG;
    if (code == 0) return scalartext::WriteUnsigned(value, out);
    const char* name = "xxx";
    for (const IdNamespace& row : idNamespacesG) {
        if (row.code == code) name = row.name;
    }
    out += scalartext::Copy(name, out);
    *out++ = '.';
    return scalartext::WriteUnsigned(value & idNumberMaskG, out);
}

bool ScanFloat(const char* text, double& value) {
    const char* p = text;
    while (FSpace(*p)) ++p;
    const bool fNegative = *p == '-';
    if (*p == '-' || *p == '+') ++p;
    const char* const end = EndOfPlainFloat(p);
    if (end == nullptr) return ScanFloatByLibrary(text, value);
    double scanned = 0;
    const std::from_chars_result result = std::from_chars(p, end, scanned);
    if (result.ec != std::errc() || result.ptr != end) return ScanFloatByLibrary(text, value);
    value = fNegative ? -scanned : scanned;
    return true;
}

bool ScanS64(const char* text, long long& value) {
    const Scanned scanned = ScanNumber(text);
    if (scanned.pEnd == nullptr) return false;
    value = ToS64(scanned);
    return true;
}

bool ScanU64(const char* text, unsigned long long& value) {
    const Scanned scanned = ScanNumber(text);
    if (scanned.pEnd == nullptr) return false;
    value = scanned.fNegative && !scanned.fClipped ? 0 - scanned.magnitude : scanned.magnitude;
    return true;
}

long long ParseS64(const char* text, size_t n) {
    if (n == 0) return 0;
    const bool fNegative = *text == '-';
    const char* const end = text + n;
    const Scanned scanned = ScanDigits(fNegative ? text + 1 : text, end, fNegative);
    return scanned.pEnd == end ? ToS64(scanned) : 0;
}

unsigned long long ParseU64(const char* text, size_t n) {
    unsigned long long value = 0;
    for (size_t i = 0; i < n; ++i) {
        if (!FDigit(text[i])) return 0;
        value = value * 10 + static_cast<unsigned>(text[i] - '0');
    }
    return value;
}

int ParseS32(const char* text, size_t n) {
    const long long value = ParseS64(text, n);
    return value < std::numeric_limits<int>::min() || value > std::numeric_limits<int>::max()
               ? 0
               : static_cast<int>(value);
}

unsigned ParseU32(const char* text, size_t n) {
    const unsigned long long value = ParseU64(text, n);
    return value > std::numeric_limits<unsigned>::max() ? 0 : static_cast<unsigned>(value);
}

unsigned long long ParseLongId(const char* text, size_t n) {
    const void* const point = memrchr(text, '.', n);
    if (point == nullptr) return ParseU64(text, n);
    const size_t nName = static_cast<size_t>(static_cast<const char*>(point) - text);
    for (const IdNamespace& row : idNamespacesG) {
        if (std::strlen(row.name) != nName || std::memcmp(row.name, text, nName) != 0) continue;
        return ParseU64(text + nName + 1, n - nName - 1) + (row.code << idNumberBitsG);
    }
    return 0;
}

}  // namespace sorn::scalarformat
