#pragma once

#include <cstdint>
#include <random>

#include "rox/ref.h"
#include "sorn/model/SornObject.h"
#include "sorn/model/StructInfo.h"

namespace sorntest {

/// Objects of any struct with random values in all members, those of older variants included, driven by the
/// metadata alone. The values are such that a text gives them back. Required references are always set, so
/// that the records pass at every version.
class RandomRecord {
 public:
    RandomRecord(RoxMempool* pool, uint32_t seed) : pMempoolM(pool), randomM(seed) {}

    ref<sorn::SornObject> Make(const sorn::StructInfo& info) { return Make(info, 2); }

    /// Whether values of a field can be read back from their text: not those of ids without a struct and of
    /// enumerations without names. Where such a field is required it keeps its default.
    static bool FReadable(const sorn::FieldInfo& field);

 private:
    ref<sorn::SornObject> Make(const sorn::StructInfo& info, int nLevels);
    void Fill(sorn::SornObject& object, const sorn::FieldInfo& field, int nLevels);
    template <class T>
    void Store(void* member, bool isMulti, const T& value);
    void FillValue(void* member, const sorn::FieldInfo& field, int nLevels);
    ref<RoxCore> MakeReference(const sorn::FieldInfo& field, int nLevels);
    RoxString MakeText();
    uint32_t MakeEnum(const sorn::FieldInfo& field);
    const sorn::StructInfo& AnyStruct();
    uint64_t Bits() { return randomM(); }
    uint32_t Below(uint32_t n) { return static_cast<uint32_t>(randomM() % n); }

    RoxMempool* pMempoolM;
    std::mt19937_64 randomM;
};

}  // namespace sorntest
