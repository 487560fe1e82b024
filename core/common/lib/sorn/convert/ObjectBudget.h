#pragma once

#include <cstdint>

#include "sorn/model/StructInfo.h"

namespace sorn {

/// What a reading may spend on objects. Two bytes of input can make an object of two thousand, so that input
/// of a few million bytes could take gigabytes; a reading counts the bytes of the objects that it makes and
/// fails when they pass the budget. Lists of ten thousands of records that carry next to nothing pass. One
/// thread at a time.
class ObjectBudget {
 public:
    /// Free for every reading, however short its input: 16,000 empty objects of the largest struct.
    static constexpr uint64_t freeBytesG = 32 * 1024 * 1024;
    /// And for each byte of input: with the slots and texts around the objects a reading stays within 64
    /// times its input.
    static constexpr uint64_t bytesPerInputByteG = 48;

    explicit ObjectBudget(uint64_t nInputBytes) { AddInput(nInputBytes); }

    /// Raises the budget by n more bytes of input.
    void AddInput(uint64_t n) { nLeftM += static_cast<int64_t>(n * bytesPerInputByteG); }
    /// Counts one object of a struct; false when that passes the budget.
    bool Take(const StructInfo& info) { return TakeBytes(SizeOf(info)); }
    /// The same for n bytes of anything else.
    bool TakeBytes(uint32_t n) {
        nLeftM -= n;
        return nLeftM >= 0;
    }

    /// An upper estimate of an object's bytes by the struct's metadata alone: up to the member that lies
    /// furthest and the most that a member takes. May be called from any thread.
    static uint32_t SizeOf(const StructInfo& info);

 private:
    int64_t nLeftM = freeBytesG;
};

}  // namespace sorn
