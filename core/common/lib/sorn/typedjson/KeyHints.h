#pragma once

#include <cstdint>

namespace sorn {

/// Which field came last behind each field of a struct. Programs write their fields in one order, so that
/// this tells most keys before they are read. Hints and no more: whoever takes one looks whether it holds,
/// and a text whose fields come in any order costs but the look. Each thread has hints of its own, for all
/// texts.
class KeyHints {
 public:
    /// Hints of structs that have too many fields together disturb each other.
    static constexpr uint32_t nPlacesG = 4096;

    static KeyHints& OfThread();

    /// The slot that came last behind the one at a place (FieldIndex::HintPlace); 0 where none has come.
    uint16_t& At(uint32_t place) { return vSlotM[place % nPlacesG]; }

 private:
    uint16_t vSlotM[nPlacesG] = {};
};

}  // namespace sorn
