#pragma once

#include <algorithm>
#include <cstring>
#include <string>

#include "kelbaselib/Bytesource.h"

namespace sorntest {

/// A source over a text that counts what is done to it and to the sources made of it.
class TextSource final : public kelbaselib::Bytesource {
 public:
    struct Counts {
        int reads = 0;
        int newSources = 0;
        int releases = 0;
        unsigned largestRead = 0;
    };
    TextSource(Counts& counts, std::string text) : countsM(counts), textM(std::move(text)) {}

    unsigned Read(void* buffer, unsigned capacity) override {
        ++countsM.reads;
        countsM.largestRead = std::max(countsM.largestRead, capacity);
        const size_t n = std::min<size_t>(capacity, textM.size() - positionM);
        std::memcpy(buffer, textM.data() + positionM, n);
        positionM += n;
        return static_cast<unsigned>(n);
    }
    Bytesource* NewSource() override {
        ++countsM.newSources;
        return new TextSource(countsM, textM);
    }
    unsigned GetAvailable() const override { return static_cast<unsigned>(textM.size() - positionM); }
    void Release() override {
        ++countsM.releases;
        delete this;
    }

 private:
    Counts& countsM;
    std::string textM;
    size_t positionM = 0;
};

}  // namespace sorntest
