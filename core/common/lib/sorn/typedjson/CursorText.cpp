#include "sorn/typedjson/CursorText.h"

#include "sorn/json/Json.h"

namespace sorn {

void CursorText::StartGathering() {
    if (!gatheredM.has_value()) gatheredM.emplace(pMempoolM);
    gatheredM->Clear();
}

/// Reads a text in quotes that has escapes or goes on in the next block.
template <bool isKept>
bool CursorText::ReadQuotedAcross(InputPointerBytesource& cursor) {
    if (isKept) StartGathering();
    ++cursor.pCurrentM;
    for (;;) {
        const unsigned char* const p = cursor.pCurrentM;
        const unsigned char* const stop = textscan::FindStringStop(p, cursor.pEndM);
        if (isKept) gatheredM->AppendBytes(p, static_cast<unsigned>(stop - p));
        cursor.pCurrentM = stop;
        if (stop == cursor.pEndM) {
            if (!cursor.Refill()) return false;
            continue;
        }
        if (*stop == 0) return false;
        ++cursor.pCurrentM;
        if (*stop == '"') break;
        if (!ReadEscape<isKept>(cursor)) return false;
    }
    if (isKept) SetGathered();
    return true;
}

/// Reads what stands behind a backslash.
template <bool isKept>
bool CursorText::ReadEscape(InputPointerBytesource& cursor) {
    if (!cursor.FByte()) return false;
    const char escaped = static_cast<char>(*cursor.pCurrentM++);
    // Neither the backslash nor the letter goes to the text, and the digits are ordinary bytes: required.
    if (escaped == 'u') return true;
    char byte = 0;
    if (!Json::EscapedCharToChar(escaped, byte)) return false;
    if (isKept) gatheredM->AppendChar(byte);
    return true;
}

template <bool isKept>
bool CursorText::ReadBareAcross(InputPointerBytesource& cursor) {
    if (isKept) StartGathering();
    do {
        const unsigned char* const p = cursor.pCurrentM;
        const unsigned char* const stop = textscan::FindTokenEnd(p, cursor.pEndM);
        if (isKept) gatheredM->AppendBytes(p, static_cast<unsigned>(stop - p));
        cursor.pCurrentM = stop;
    } while (cursor.pCurrentM == cursor.pEndM && cursor.Refill());
    if (isKept) SetGathered();
    return true;
}

template bool CursorText::ReadQuotedAcross<true>(InputPointerBytesource&);
template bool CursorText::ReadQuotedAcross<false>(InputPointerBytesource&);
template bool CursorText::ReadBareAcross<true>(InputPointerBytesource&);
template bool CursorText::ReadBareAcross<false>(InputPointerBytesource&);

}  // namespace sorn
