#pragma once

#include <random>
#include <string>
#include <vector>

#include "rpc/ModelMessage.h"

namespace sorntest {

/// Random messages and random damage to their bytes, the same in every run.
class ModelRandom {
 public:
    explicit ModelRandom(unsigned seed) : engineM(seed) {}

    unsigned Below(size_t n) { return static_cast<unsigned>(engineM() % n); }
    bool Chance(unsigned percent) { return Below(100) < percent; }
    const std::string& OneOf(const std::vector<std::string>& vTexts) { return vTexts[Below(vTexts.size())]; }

    /// A message of any kind that keeps the limits, with hostile names and values among its headers.
    ModelMessage Message();
    /// The bytes with one to three changes: bits, bytes, words that mean something to a reader, pieces
    /// taken out or doubled.
    std::string Damaged(std::string bytes);
    /// A message of a header block and a body, both damaged now and then, under a first line that is mostly
    /// right.
    std::string DamagedMessage(const std::string& headerBlock, const std::string& body);

 private:
    std::mt19937_64 engineM;
};

}  // namespace sorntest
