#pragma once

#include <cstddef>

namespace sorn {

/// Follows a JSON text that comes in pieces, and knows how much of a token stands unfinished at the end of
/// what came: a string whose closing quote is missing, or a run of other bytes that the next piece may go on
/// with. What the tokens mean, and whether they are right, is not its business.
class UnfinishedToken {
 public:
    /// Goes on with the next piece. False when the piece lies wholly inside the token that was unfinished
    /// before.
    bool Read(const char* bytes, size_t n);

    /// Bytes of the token so far, a string's opening quote among them; 0 between tokens.
    size_t GetLength() const { return lengthM; }
    bool FInString() const { return stateM == IN_STRING || stateM == BEHIND_BACKSLASH; }
    /// Whether the token is a run of bytes without quotes, and the last one is a digit.
    bool FEndsInDigit() const { return stateM == IN_RUN && lastM >= '0' && lastM <= '9'; }

 private:
    enum State : unsigned char { BETWEEN, IN_RUN, IN_STRING, BEHIND_BACKSLASH };

    State stateM = BETWEEN;
    char lastM = 0;
    size_t lengthM = 0;
};

}  // namespace sorn
