#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <utility>

#include "rox/RoxGenericArray.h"
#include "rox/RoxGenericIntArray.h"
#include "rox/RoxStringArray.h"
#include "rox/ref.h"
#include "sorn/convert/StructTable.h"
#include "sorn/model/FieldInfo.h"
#include "sorn/model/OrvoVersion.h"
#include "sorn/model/SornObject.h"
#include "sorn/model/StructInfo.h"

namespace sorn {

class EnumTexts;

/// What the writer of text needs of a struct, in the order and the shape in which it needs it: a step for
/// each field, with its key as it stands in the text, and where "type" goes. Never changed once it is made.
class WriterPlan {
 public:
    /// How a step is written: a single value that is no reference by the number of its data type, all others
    /// by these.
    enum Form : uint8_t {
        SINGLE_REFERENCE = 32,
        MULTI_PLAIN,
        MULTI_TEXT,
        MULTI_REFERENCE,
        NOTHING,   ///< repeated values of a data type that does not exist
        LONG_NAME  ///< the key is longer than maxNameG and is not in the plan; the value is as StepOf has it
    };

    /// As many bytes are copied at once of keys and of what stands in front of ids, whatever their length.
    static constexpr size_t nKeyBlockG = 32;
    static constexpr size_t nPrefixBlockG = 16;
    static constexpr size_t nTypeBlockG = 48;
    /// Bytes of the longest name that has a key in the plan, and of the longest key.
    static constexpr size_t maxNameG = 200;
    static constexpr size_t maxKeyG = maxNameG + 6;
    /// Bytes at the front of a key that the first entry of an object goes without.
    static constexpr unsigned nSeparatorG = 2;

    struct Step {
        const FieldInfo* pField;
        const unsigned char* pKey;  ///< separator, name in quotes, colon and blank
        union {
            const EnumTexts* pTexts;       ///< of an enumeration; null when it has none
            const unsigned char* pPrefix;  ///< of an id: quote and prefix; null when they have no short form
        };
        uint16_t storageOffset;
        uint8_t nKey;
        uint8_t nPrefix;
        uint8_t form;  ///< a Form or a DataType

        DataType Type() const { return pField->Type(); }
        /// Whether the step writes a single value that is no reference.
        bool FSimple() const { return form < SINGLE_REFERENCE; }
        const void* MemberOf(const SornObject& object) const {
            return reinterpret_cast<const char*>(&object) + storageOffset;
        }
        /// Whether there is anything to write for a candidate, its key included.
        bool FHasValue(const SornObject& object) const {
            const void* const member = MemberOf(object);
            switch (form) {
                case SINGLE_REFERENCE:
                    return static_cast<const RefBase*>(member)->GetCore() != nullptr;
                case MULTI_PLAIN:
                    return !static_cast<const RoxGenericIntArray*>(member)->FEmpty();
                case MULTI_TEXT:
                    return !static_cast<const RoxStringArray*>(member)->FEmpty();
                case MULTI_REFERENCE:
                    return !static_cast<const RoxGenericArray*>(member)->FEmpty();
                case NOTHING:
                    return false;
                default:
                    return true;
            }
        }
        /// Writes the key, without its separator if `isFirst`, to memory with room for a block behind it;
        /// gives the end. Not for LONG_NAME.
        unsigned char* PutKey(bool isFirst, unsigned char* out) const {
            const unsigned nSkipped = isFirst ? nSeparatorG : 0;
            const unsigned char* const key = pKey + nSkipped;
            const size_t n = nKey - nSkipped;
            std::memcpy(out, key, nKeyBlockG);  // whatever its length: most are shorter, and none alike
            if (n > nKeyBlockG) std::memcpy(out, key, n);
            return out + n;
        }
    };

    /// A plan on the general heap, with the ids of structs as they are in the table; Delete ends it.
    static WriterPlan* New(const StructInfo& info, StructTable table);
    static void Delete(WriterPlan* plan);

    /// A step for a field with a name of the caller's, which is not in its key.
    static Step StepOf(const FieldInfo& field, bool isMulti);

    const StructInfo& Info() const { return infoM; }
    unsigned CountSteps() const { return nStepsM; }
    unsigned CountGroups() const { return (nStepsM + nGroupG - 1) / nGroupG; }
    const Step* StepsFrom(unsigned first) const { return vStepsM + first; }
    /// The entry of the struct's name, as a key with its value; nTypeBlockG bytes can be read behind the
    /// separator.
    const unsigned char* TypeEntry() const { return pTypeEntryM; }
    size_t TypeEntryBytes() const { return nTypeEntryM; }

    /// Which fields hold in a version.
    struct View {
        const uint32_t* vHolds;  ///< a bit for each step, by group
        /// The step that has "type" in front, whether or not it has a value; CountSteps() for none.
        unsigned anchor;
    };
    /// The view of the newest version and of none at all; null for all others.
    const View* ViewOf(OrvoVersion version) const {
        if (version == newestM) [[likely]]
            return &newestViewM;
        return version.FAbsent() ? &wholeViewM : nullptr;
    }
    /// The anchor of a version that has no view.
    unsigned FindAnchor(OrvoVersion version) const;

    /// Steps are looked at in groups.
    static constexpr unsigned nGroupG = 32;
    /// Which steps of a group may have something to write: a bit for each. All that have no presence byte
    /// may. Without branches: which fields are present is hard to tell.
    uint32_t FindCandidates(const SornObject& object, unsigned group) const {
        const Group& steps = vGroupsM[group];
        const auto* const bytes = reinterpret_cast<const unsigned char*>(&object);
        uint32_t present = 0;
        for (unsigned i = steps.nPresence; i != 0;) {
            i -= nUnrolledG;
            AddPresent(bytes, steps.vPresence + i, present, std::make_index_sequence<nUnrolledG>());
        }
        // Steps without a presence byte have looked at what lies at offset 0.
        return steps.withoutByte | (present & steps.withByte);
    }

 private:
    static constexpr unsigned nUnrolledG = 8;

    struct Group {
        uint32_t withByte;            // the steps with a presence byte
        uint32_t withoutByte;         // those without
        uint32_t nPresence;           // offsets in use, a multiple of nUnrolledG
        uint16_t vPresence[nGroupG];  // by step; 0 for none
    };

    /// Shifts a bit into `present` for each of the offsets, the last one first.
    template <size_t... i>
    static void AddPresent(const unsigned char* bytes, const uint16_t* vOffset, uint32_t& present,
                           std::index_sequence<i...>) {
        ((present = present * 2 + (bytes[vOffset[nUnrolledG - 1 - i]] != 0 ? 1 : 0)), ...);
    }

    explicit WriterPlan(const StructInfo& info) : infoM(info) {}
    void FillSteps(StructTable table, unsigned char* texts);
    void FillGroups();
    View MakeView(OrvoVersion version, uint32_t* vHolds) const;

    const StructInfo& infoM;
    Step* vStepsM = nullptr;
    Group* vGroupsM = nullptr;
    const unsigned char* pTypeEntryM = nullptr;
    size_t nTypeEntryM = 0;
    unsigned nStepsM = 0;
    OrvoVersion newestM;
    View newestViewM{};
    View wholeViewM{};
};

}  // namespace sorn
