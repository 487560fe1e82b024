#pragma once

#include <cstdint>
#include <cstring>

#include "sorn/model/EnumDef.h"

namespace sorn {

/// The names of an enumeration as they stand in JSON text, in quotes and with their lengths. One for each
/// enumeration that is asked for, made by the first question, never changed, and shared by the whole process
/// on the general heap.
class EnumTexts {
 public:
    /// Enumerations with more entries have none: their names would take too much memory.
    static constexpr uint32_t maxCountG = 1024;
    /// As many bytes are copied at once, whatever the length of a name.
    static constexpr size_t nBlockG = 32;
    /// The longest text; longer ones are left out.
    static constexpr size_t maxTextG = 255;

    /// The texts of an enumeration, null when it has too many entries. `def` must stay where it is until
    /// DestroyAll. Any thread, no lock.
    static const EnumTexts* Of(const EnumDef& def);
    /// Deletes all texts, which nobody may hold any longer: plans do, and those that are shared end first.
    static void DestroyAll();

    /// Writes the text of a value to memory with room for maxTextG + nBlockG bytes and gives its end; null,
    /// with nothing written, for a value that has none here.
    unsigned char* Put(uint32_t value, unsigned char* out) const {
        if (value >= defM.count || vOffsetM[value] == 0) [[unlikely]]
            return nullptr;
        const unsigned char* const text = pTextsM + vOffsetM[value];
        const size_t n = text[-1];
        std::memcpy(out, text, nBlockG);
        if (n > nBlockG) [[unlikely]]
            std::memcpy(out, text, n);
        return out + n;
    }

 private:
    EnumTexts(const EnumDef& def, uint32_t* vOffset, unsigned char* texts)
        : defM(def), vOffsetM(vOffset), pTextsM(texts) {}
    static EnumTexts* New(const EnumDef& def);
    static void Delete(EnumTexts* texts);
    static const EnumTexts* FindTexts(const EnumTexts* first, const EnumDef& def);
    void Fill();

    const EnumDef& defM;
    EnumTexts* pNextM = nullptr;
    uint32_t* vOffsetM;      ///< of the text behind its length, in bytes from pTextsM; 0 for none
    unsigned char* pTextsM;  ///< length and text of each name, and a block more that can be read
};

}  // namespace sorn
