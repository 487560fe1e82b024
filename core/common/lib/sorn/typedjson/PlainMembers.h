#pragma once

#include <cstddef>
#include <cstdint>
#include <string_view>

#include "sorn/typedjson/InputPointerBytesource.h"
#include "sorn/typedjson/PlainText.h"

namespace sorn {

/// Finds plain members (see plaintext) for the pass that keeps nothing of them. The quotes are found in bulk,
/// a piece of the text at a time. So the places of keys and values come from a table and not each from the
/// one before, and a processor works on several members at once; that, more than the number of instructions,
/// is what makes it fast. The pass that stores values has enough to do between two keys.
class PlainMembers {
 public:
    using Byte = plaintext::Byte;

    struct Member {
        std::string_view key;
        const Byte* pValue;     ///< where the value begins
        std::string_view text;  ///< the value, unless it is an object or an array
        const Byte* pBehind;    ///< what stands behind the text; null for an object or an array
    };

    PlainMembers() = default;
    PlainMembers(const PlainMembers&) = delete;
    PlainMembers& operator=(const PlainMembers&) = delete;

    /// Before members are looked for, whenever others may have moved the cursor, which goes forward only.
    void Enter(const InputPointerBytesource& cursor) {
        pEndM = cursor.pEndM;
        if (cursor.pCurrentM < pBeginM || cursor.pCurrentM >= pPieceEndM ||
            blockM != cursor.consumedLengthM) {
            blockM = cursor.consumedLengthM;
            FindStops(cursor.pCurrentM);
        } else {
            while (*pNextM < Offset(cursor.pCurrentM)) ++pNextM;
        }
    }
    /// The member whose key begins at p; false when there is no plain one.
    bool Read(const Byte* p, Member& member) {
        return ReadInPiece(p, member) || (FEndsPiece(p) && ReadInPiece(p, member));
    }
    /// The same for the member behind a comma; p, which stands on that, then tells where it begins. It may
    /// move when there is no plain member, too: over the comma and what is white behind it.
    bool ReadBehindComma(const Byte*& p, Member& member) {
        // Most often the key is the next quote: then it need not wait for p.
        const size_t next = *pNextM;
        const size_t comma = Offset(p);
        if ((comma + 2 == next && p[1] == ' ') || comma + 1 == next) [[likely]] {
            p = pBeginM + next;
            return ReadAtStop(member) || (FEndsPiece(p) && ReadInPiece(p, member));
        }
        p = plaintext::BehindComma(p, pEndM);
        return Read(p, member);
    }
    bool FEnds(const Byte* p) const { return pEndM - p <= plaintext::nBehindG; }

 private:
    static constexpr uint16_t nPieceG = 2048;
    static constexpr uint16_t noneG = UINT16_MAX;
    static constexpr unsigned nAheadG = 4;  ///< stops of one member

    bool ReadInPiece(const Byte* p, Member& member) { return *pNextM == Offset(p) && ReadAtStop(member); }
    bool ReadAtStop(Member& member);
    bool FEndsPiece(const Byte* p);
    void FindStops(const Byte* p);
    size_t Offset(const Byte* p) const { return static_cast<size_t>(p - pBeginM); }

    const Byte* pEndM = nullptr;  ///< of the block
    const Byte* pBeginM = nullptr;
    const Byte* pPieceEndM = nullptr;
    const uint16_t* pNextM = vStopsM;  ///< the first stop that was not passed
    uint32_t blockM = 0;               ///< which block of a source the piece belongs to
    /// Quotes, backslashes and NULs of the piece, from its begin on, in order; then some of noneG. Behind
    /// each lie more than nBehindG bytes of the block.
    uint16_t vStopsM[nPieceG + nAheadG];
};

/// The member whose key begins at the next stop.
inline bool PlainMembers::ReadAtStop(Member& member) {
    const uint16_t* const stops = pNextM;
    if (stops[1] == noneG) return false;
    const Byte* const p = pBeginM + stops[0];
    const Byte* const keyEnd = pBeginM + stops[1];
    if (*p != '"' || keyEnd[0] != '"' || keyEnd[1] != ':') return false;
    member.key = plaintext::View(p + 1, keyEnd);
    const Byte* const value = plaintext::ValueOf(keyEnd);
    member.pValue = value;
    if (*value == '"') {
        const Byte* const textEnd = pBeginM + stops[3];
        if (stops[2] != Offset(value) || stops[3] == noneG || *textEnd != '"') return false;
        member.text = plaintext::View(value + 1, textEnd);
        member.pBehind = textEnd + 1;
        pNextM = stops + 4;
        return true;
    }
    member.pBehind = nullptr;
    if (*value != '{' && *value != '[') {
        const Byte* const textEnd = plaintext::FindTokenEnd(value, pEndM);
        if (textEnd == value || pEndM - textEnd <= plaintext::nBehindG) return false;
        member.text = plaintext::View(value, textEnd);
        member.pBehind = textEnd;
    }
    pNextM = stops + 2;
    return true;
}

/// Whether a member at p was refused just since the piece ends in it. Then there is a new piece, which begins
/// with the member.
inline bool PlainMembers::FEndsPiece(const Byte* p) {
    if (p == pBeginM || pEndM - pPieceEndM <= plaintext::nBehindG) return false;
    // A look at the first stop, so that a text without quotes costs no piece for each member.
    const bool isWithin = p < pPieceEndM;
    if (isWithin && (*pNextM != Offset(p) || pNextM[nAheadG - 1] != noneG)) return false;
    FindStops(p);
    return true;
}

}  // namespace sorn
