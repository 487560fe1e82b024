#include "sorn/model/Currency.h"

#include <cstring>

#include "sorn/model/ScalarText.h"

namespace sorn {

constinit const Currency Currency::INVALID;

Currency::Currency(int amountOfMoney, const char* threeLetters) {
    Init(amountOfMoney, threeLetters);
}

void Currency::Init(int amountOfMoney, const char* threeLetters) {
    *this = Currency();
    if (threeLetters == nullptr || std::strlen(threeLetters) != codeBytesG) return;
    amount = amountOfMoney;
    std::memcpy(code, threeLetters, codeBytesG);
}

Currency Currency::Parse(const RoxString& text) {
    const char* const start = text.Utf8();
    const char* const end = start + text.NByte();
    if (text.NByte() <= codeBytesG || start[codeBytesG] != '.') return INVALID;
    const char* p = start + codeBytesG + 1;
    int32_t number = 0;
    if (!scalartext::ReadDecimal(p, end, number) || p != end) return INVALID;
    const char letters[] = {start[0], start[1], start[2], '\0'};
    return Currency(number, letters);
}

unsigned Currency::FormatTo(char* out) const {
    if (code[0] == '\0') return scalartext::Copy("invalid", out);
    const size_t nCode = ::strnlen(code, sizeof code);  // the members are open: there may be no NUL
    std::memcpy(out, code, nCode);
    char* p = out + nCode;
    *p++ = '.';
    return static_cast<unsigned>(scalartext::WriteDecimal(amount, p) - out);
}

RoxString Currency::ToString(RoxMempool* pool) const {
    char text[maxTextBytesG];
    const unsigned n = FormatTo(text);
    return RoxString::FromUtf8Bytes(pool, n, text);
}

}  // namespace sorn
