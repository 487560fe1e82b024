#pragma once

#include <cstring>

#include "rox/RoxString.h"
#include "sorn/json/TextScan.h"

class RoxMempool;

namespace sorn {

/// n bytes of input as a string in the pool.
inline RoxString CutText(RoxMempool* pool, const unsigned char* bytes, size_t n) {
    if (n == 0) return RoxString();
    RoxStringRepN* const rep = RoxStringRepN::New(pool, static_cast<uint32_t>(n));
    std::memcpy(rep->MutableBytes(), bytes, n);
    return RoxString::AdoptRepN(rep);
}

/// A text in quotes, found in the input but not yet taken out of it.
class QuotedText {
 public:
    /// Looks from p on, the byte behind the opening quote, for the end of the text. False for an unknown
    /// escape, a NUL, and a backslash at the end of the input. Inlined for texts without a backslash.
    bool Find(const unsigned char* p, const unsigned char* end) {
        pBeginM = p;
        pTextEndM = textscan::FindStringStop(p, end);
        nEscapeM = 0;
        pBehindM = pTextEndM + 1;
        if (pTextEndM < end && *pTextEndM == '"') [[likely]]
            return true;
        return FindWithEscapes(end);
    }

    const unsigned char* Begin() const { return pBeginM; }
    const unsigned char* TextEnd() const { return pTextEndM; }
    /// Behind the closing quote; one byte behind the end of the input when there is none.
    const unsigned char* Behind() const { return pBehindM; }
    /// Whether the text is just the bytes from Begin to TextEnd.
    bool FPlain() const { return nEscapeM == 0; }

    /// The text as a string in the pool.
    RoxString Take(RoxMempool* pool) const {
        if (FPlain()) return CutText(pool, pBeginM, static_cast<size_t>(pTextEndM - pBeginM));
        return Decode(pool);
    }

 private:
    bool FindWithEscapes(const unsigned char* end);
    RoxString Decode(RoxMempool* pool) const;

    const unsigned char* pBeginM;
    const unsigned char* pTextEndM;
    const unsigned char* pBehindM;
    unsigned nEscapeM;  // those that become one byte
};

}  // namespace sorn
