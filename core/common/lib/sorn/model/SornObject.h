#pragma once

#include <cstdint>

#include "rox/RoxCore.h"
#include "rox/RoxLockId.h"
#include "rox/RoxString.h"
#include "rox/ref.h"
#include "sorn/model/FieldInfo.h"
#include "sorn/model/OrvoVersion.h"

namespace sorn {

class Dict;
class Dictionary;
struct StructInfo;

/// The base of all records. An object is a plain block of members described by the metadata of its struct;
/// nothing here knows a field by name, and every operation walks the metadata. Objects live in a pool and are
/// made only by the Factory of their class. An object belongs to one thread at a time; only its reference
/// count is atomic.
class SornObject : public RoxCore {
 public:
    static const char classTagG;

    /// The struct's id, set by the constructor of the generated class and never changed.
    uint32_t structId;

    void* VkCastHelper(const void* classTag) override;

    /// Hook of the runtime's debug check of ownership. Does nothing in the base; generated classes forward it
    /// to their string arrays.
    virtual void SetDebugLockOwner(RoxLockId id);

    /// The schema name of the struct, as a new string.
    RoxString GetTypeName() const;

    /// The object as a dictionary in the object's pool; sub-objects become dictionaries, any-dict and lazy
    /// fields are shared. Cannot fail. A version other than 0 selects the fields.
    ref<Dictionary> ToDictionary(OrvoVersion version) const;
    /// ToDictionary, wrapped in a new Dict in the object's pool.
    ref<Dict> ToDict(OrvoVersion version) const;
    /// ToDictionary as JSON text.
    RoxString ToString(bool pretty, OrvoVersion version) const;

    /// A copy in the object's pool of all that a dictionary can express, older variants of fields not
    /// included; null on failure. Sub-objects and bytes are copied, while the dictionaries of any-dict fields
    /// and the bodies of lazy fields are shared with the original. Of a repeated lazy field only the first
    /// element that is not null is copied, and a struct's own `type` field receives the struct's name. The
    /// copy is always of this object's struct: `structIdHint` must be a valid struct id but does not change
    /// the class.
    ref<SornObject> Clone(unsigned structIdHint) const;

    /// Same struct and the same values in all current fields; older variants of fields are not compared. The
    /// odd answers below are kept for their users:
    /// - A bytestring field that is required or multi makes objects differ, even from themselves and even
    /// when
    ///   it is empty; an optional one does as soon as it is set.
    /// - Multi any-dict fields of equal length agree whatever they hold, but for null against an element.
    /// - Only the low 16 bits of an enumeration count.
    /// - NaN differs from itself, and 0.0 equals -0.0.
    bool operator==(const SornObject& other) const;
    bool operator!=(const SornObject& other) const { return !(*this == other); }

    /// Compares two single members of a field at addresses a and b, by the rules above; bytes always differ.
    /// A null reference equals only a null reference.
    static bool SingleFieldEquals(const FieldInfo* field, void* a, void* b);
    /// Compares two multi containers of a field at addresses a and b, element by element in order, by the
    /// rules above; containers of bytes always differ.
    static bool MultiFieldEquals(const FieldInfo* field, void* a, void* b);

    /// The address of a field's member.
    void* MemberAt(const FieldInfo& field) { return reinterpret_cast<char*>(this) + field.storageOffset; }
    const void* MemberAt(const FieldInfo& field) const {
        return reinterpret_cast<const char*>(this) + field.storageOffset;
    }
    /// Whether an optional field has a value: by its presence byte, or, for reference types, by its
    /// reference.
    bool FPresent(const FieldInfo& field) const;
    /// Sets the presence byte of an optional field that has one.
    void SetPresent(const FieldInfo& field) {
        if (field.presenceOffset != 0) reinterpret_cast<char*>(this)[field.presenceOffset] = 1;
    }

 protected:
    explicit SornObject(uint32_t id) : structId(id) {}
};

}  // namespace sorn
