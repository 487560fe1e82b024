#pragma once

#include <cstddef>
#include <optional>
#include <string_view>

#include "rox/RoxString.h"
#include "sorn/dict/ByteBuffer.h"
#include "sorn/json/QuotedText.h"
#include "sorn/typedjson/InputPointerBytesource.h"

namespace sorn {

/// One text at a cursor, in quotes or bare, behind white space: a view of the cursor's block where the text
/// lies in it as it is, else of a buffer. One object serves many texts, one after the other.
class CursorText {
 public:
    explicit CursorText(RoxMempool* pool) : pMempoolM(pool) {}

    /// Reads the next text, which may be an empty bare one, even at the end of the input. False for a text in
    /// quotes that has a NUL, an unknown escape or no end. A backslash-u is dropped, both bytes.
    bool Read(InputPointerBytesource& cursor) { return ReadAs<true>(cursor); }
    /// The same for a text that nobody wants; the views are not to be asked then.
    bool Skip(InputPointerBytesource& cursor) { return ReadAs<false>(cursor); }

    // The text, until the cursor's next block or the next Read.

    std::string_view View() const { return {pBytesM, nByteM}; }
    /// As a string in the pool.
    RoxString Take(RoxMempool* pool) const {
        return CutText(pool, reinterpret_cast<const unsigned char*>(pBytesM), nByteM);
    }

 private:
    template <bool isKept>
    bool ReadAs(InputPointerBytesource& cursor);
    template <bool isKept>
    bool ReadQuotedAcross(InputPointerBytesource& cursor);
    template <bool isKept>
    bool ReadEscape(InputPointerBytesource& cursor);
    template <bool isKept>
    bool ReadBareAcross(InputPointerBytesource& cursor);
    void Set(const unsigned char* begin, const unsigned char* end) {
        pBytesM = reinterpret_cast<const char*>(begin);
        nByteM = static_cast<size_t>(end - begin);
    }
    void SetGathered() { Set(gatheredM->GetData(), gatheredM->GetData() + gatheredM->GetLength()); }
    void StartGathering();

    RoxMempool* pMempoolM;
    const char* pBytesM = "";
    size_t nByteM = 0;
    std::optional<ByteBuffer> gatheredM;
};

template <bool isKept>
inline bool CursorText::ReadAs(InputPointerBytesource& cursor) {
    if (!cursor.FSkipToByte()) {
        nByteM = 0;
        return true;
    }
    const unsigned char* const p = cursor.pCurrentM;
    const unsigned char* const end = cursor.pEndM;
    if (*p == '"') {
        const unsigned char* const stop = textscan::FindStringStop(p + 1, end);
        if (stop == end || *stop != '"') [[unlikely]]
            return ReadQuotedAcross<isKept>(cursor);
        Set(p + 1, stop);
        cursor.pCurrentM = stop + 1;
        return true;
    }
    const unsigned char* const stop = textscan::FindTokenEnd(p, end);
    if (stop == end && cursor.canRefillM) [[unlikely]]
        return ReadBareAcross<isKept>(cursor);
    Set(p, stop);
    cursor.pCurrentM = stop;
    return true;
}

}  // namespace sorn
