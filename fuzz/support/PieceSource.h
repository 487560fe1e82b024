#pragma once

#include <algorithm>
#include <cstring>

#include "fuzz/support/PiecedInput.h"
#include "kelbaselib/Bytesource.h"

/// A source over the text of an input, which stays until all sources are gone, read in its pieces. Counts are
/// shared by a source and all that are made of it.
class PieceSource final : public kelbaselib::Bytesource {
 public:
    struct Counts {
        int nSources = 0;     ///< that were made
        int nReleases = 0;    ///< that were released
        unsigned nFirst = 0;  ///< bytes that the first source made by NewSource gave
    };

    static PieceSource* New(const PiecedInput& input, Counts& counts) {
        ++counts.nSources;
        return new PieceSource(input, counts, false);
    }

    unsigned Read(void* buffer, unsigned capacity) override {
        const unsigned n = std::min({capacity, inputM.NText() - positionM, inputM.PieceSize(nReadsM++)});
        if (n > 0) std::memcpy(buffer, inputM.Text() + positionM, n);
        positionM += n;
        if (isFirstM) countsM.nFirst += n;
        return n;
    }
    Bytesource* NewSource() override {
        ++countsM.nSources;
        return new PieceSource(inputM, countsM, countsM.nSources == 2);
    }
    unsigned GetAvailable() const override { return inputM.NText() - positionM; }
    void Release() override {
        ++countsM.nReleases;
        delete this;
    }

 private:
    PieceSource(const PiecedInput& input, Counts& counts, bool isFirst)
        : inputM(input), countsM(counts), isFirstM(isFirst) {}

    const PiecedInput inputM;
    Counts& countsM;
    bool isFirstM;
    unsigned positionM = 0;
    size_t nReadsM = 0;
};
