#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>

/// An input whose first four bytes tell into which pieces the text behind them is cut: the sizes are taken in
/// turn. Bytes below 0x80 are sizes from 1 to 32, by their low five bits, so that a seed's head can be typed;
/// higher ones are multiples of 16 up to 2,048.
class PiecedInput {
 public:
    static constexpr size_t nHeadG = 4;

    PiecedInput(const uint8_t* data, size_t size)
        : headM(data),
          nHeadM(std::min(size, nHeadG)),
          textM(data + std::min(size, nHeadG)),
          nTextM(size - nHeadM) {}

    /// A text without a head, which is not cut.
    static PiecedInput Whole(const uint8_t* text, size_t size) {
        PiecedInput input(text, 0);
        input.nTextM = size;
        input.isWholeM = true;
        return input;
    }

    const uint8_t* Text() const { return textM; }
    unsigned NText() const { return static_cast<unsigned>(nTextM); }
    /// The first byte, for a target's own choices.
    unsigned Choice() const { return nHeadM > 0 ? headM[0] : 0; }
    unsigned PieceSize(size_t number) const {
        if (isWholeM) return NText();
        if (nHeadM == 0) return 1;
        const unsigned byte = headM[number % nHeadM];
        return byte < 0x80 ? (byte & 0x1F) + 1 : (byte - 0x7F) * 16;
    }

 private:
    const uint8_t* headM;
    size_t nHeadM;
    const uint8_t* textM;
    size_t nTextM;
    bool isWholeM = false;
};
