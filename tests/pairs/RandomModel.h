#pragma once

#include <random>

#include "pairs/Record.h"

namespace sorntest {

/// Records of any struct with random values in all fields, older forms included, driven by the metadata
/// alone. Required references are always set. Fields that no text can give back (ids without a struct,
/// enumerations without names) are filled too, so that some records are refused on the roads that go through
/// text.
class RandomModel {
 public:
    explicit RandomModel(uint32_t seed) : randomM(seed) {}

    Record Make(const sorn::StructInfo& info) { return Make(info, 2); }

 private:
    Record Make(const sorn::StructInfo& info, int nLevels);
    Value MakeValue(const sorn::FieldInfo& field, int nLevels);
    int64_t MakeNumber(const sorn::FieldInfo& field);
    Tree MakeAnyDict(int nLevels);
    Tree MakeAnyValue(int nLevels);
    std::shared_ptr<const Body> MakeBody();
    std::string MakeText(unsigned maxPieces);
    const sorn::StructInfo& AnyStruct();
    uint64_t Bits() { return randomM(); }
    uint32_t Below(uint32_t n) { return static_cast<uint32_t>(randomM() % n); }

    std::mt19937_64 randomM;
};

}  // namespace sorntest
