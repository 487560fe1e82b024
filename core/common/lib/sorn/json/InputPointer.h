#pragma once

namespace sorn {

/// A cursor over bytes in memory that belong to the caller. It only moves forward, and may come to stand one
/// byte behind the end after a string without its closing quote: every test asks whether the cursor is below
/// the end.
class InputPointer {
 public:
    const unsigned char* pCurrentM;
    const unsigned char* pEndM;

    bool FAtEnd() const { return pCurrentM >= pEndM; }
};

}  // namespace sorn
