#include "sorn/json/UnfinishedToken.h"

#include "sorn/json/TextScan.h"

namespace sorn {

namespace {

bool FBetweenTokens(unsigned char byte) {
    switch (byte) {
        case ' ':
        case '\t':
        case '\n':
        case '\v':  // white space to yajl, this one and the next
        case '\f':
        case '\r':
        case '{':
        case '}':
        case '[':
        case ']':
        case ',':
        case ':':
            return true;
        default:
            return false;
    }
}

}  // namespace

bool UnfinishedToken::Read(const char* bytes, size_t n) {
    if (n == 0) return stateM == BETWEEN;
    const unsigned char* p = reinterpret_cast<const unsigned char*>(bytes);
    const unsigned char* const end = p + n;
    const unsigned char* begin = p;  // of the token, as far as it lies in this piece
    bool fLeftOldToken = stateM == BETWEEN;
    while (p < end) {
        switch (stateM) {
            case BETWEEN:
                fLeftOldToken = true;
                begin = p;
                if (*p == '"') {
                    stateM = IN_STRING;
                } else if (!FBetweenTokens(*p)) {
                    stateM = IN_RUN;
                }
                ++p;
                break;
            case IN_RUN:
                if (*p == '"' || FBetweenTokens(*p)) {
                    stateM = BETWEEN;
                } else {
                    ++p;
                }
                break;
            case IN_STRING:
                p = textscan::FindStringStop(p, end);
                if (p == end) break;
                if (*p == '"') stateM = BETWEEN;
                if (*p == '\\') stateM = BEHIND_BACKSLASH;
                ++p;
                break;
            case BEHIND_BACKSLASH:
                stateM = IN_STRING;
                ++p;
                break;
        }
    }
    if (stateM == BETWEEN) {
        lengthM = 0;
        fLeftOldToken = true;
    } else if (fLeftOldToken) {
        lengthM = static_cast<size_t>(end - begin);
    } else {
        lengthM += n;
    }
    lastM = bytes[n - 1];
    return fLeftOldToken;
}

}  // namespace sorn
