#pragma once

#include <cstdint>
#include <utility>

#include "rox/RoxGenericArray.h"
#include "rox/RoxGenericIntArray.h"
#include "rox/RoxString.h"
#include "rox/RoxStringArray.h"
#include "rox/ref.h"
#include "sorn/model/DataType.h"

/// How the walks over metadata reach the values of a field, single or repeated alike.
namespace sorn {

/// What a field's member is made of.
enum class FieldStorage : uint8_t {
    PLAIN,      ///< a value; repeated: RoxGenericIntArray
    TEXT,       ///< RoxString; repeated: RoxStringArray
    REFERENCE,  ///< ref<T>; repeated: RoxGenericArray
};

constexpr FieldStorage StorageOf(DataType type) {
    switch (type) {
        case SORN_DATA_TYPE_STRING:
        case SORN_DATA_TYPE_STRING_ID:
            return FieldStorage::TEXT;
        case SORN_DATA_TYPE_BYTESTRING:
        case SORN_DATA_TYPE_ANY_DICT:
        case SORN_DATA_TYPE_KNOWN_DICT:
        case SORN_DATA_TYPE_KNOWN_DICT_AS_LAZY:
        case SORN_DATA_TYPE_OBJECT:
            return FieldStorage::REFERENCE;
        default:
            return FieldStorage::PLAIN;
    }
}

/// Whether the field holds objects of the schema, which every walk enters.
constexpr bool FHoldsObjects(DataType type) {
    return type == SORN_DATA_TYPE_KNOWN_DICT || type == SORN_DATA_TYPE_OBJECT;
}

/// A field's member to be read: its values by position, a single one at position 0.
class FieldSource {
 public:
    FieldSource(const void* member, bool isMulti) : pMemberM(member), isMultiM(isMulti) {}

    bool FMulti() const { return isMultiM; }
    unsigned Count(DataType type) const {
        if (!isMultiM) return 1;
        switch (StorageOf(type)) {
            case FieldStorage::TEXT:
                return As<RoxStringArray>().GetCount();
            case FieldStorage::REFERENCE:
                return As<RoxGenericArray>().GetCount();
            default:
                return As<RoxGenericIntArray>().GetCount();
        }
    }

    template <class T>
    const T& PlainAt(unsigned i) const {
        return *static_cast<const T*>(isMultiM ? As<RoxGenericIntArray>().At(i) : pMemberM);
    }
    const RoxString& TextAt(unsigned i) const {
        return isMultiM ? As<RoxStringArray>().At(i) : As<RoxString>();
    }
    /// Without a reference of its own; may be null. T is what the field's data type says.
    template <class T>
    T* ReferenceAt(unsigned i) const {
        return static_cast<T*>(isMultiM ? As<RoxGenericArray>().At(i) : As<RefBase>().GetCore());
    }
    /// The same as a reference, for a T that is incomplete here. A slot of a RoxGenericArray is a ref's one
    /// word.
    template <class T>
    const ref<T>& SharedAt(unsigned i) const {
        static_assert(sizeof(ref<T>) == sizeof(RoxCore*));
        if (!isMultiM) return As<ref<T>>();
        return *reinterpret_cast<const ref<T>*>(As<RoxGenericArray>().GetData() + i);
    }

 private:
    template <class T>
    const T& As() const {
        return *static_cast<const T*>(pMemberM);
    }

    const void* pMemberM;
    bool isMultiM;
};

/// A field's member to be written: a single one is replaced, a repeated one gets a further element. The
/// operations give false, and change nothing, when a repeated one is full.
class FieldTarget {
 public:
    FieldTarget(void* member, bool isMulti) : pMemberM(member), isMultiM(isMulti) {}

    bool FMulti() const { return isMultiM; }

    template <class T>
    bool StorePlain(const T& value) const {
        if (isMultiM) return static_cast<RoxGenericIntArray*>(pMemberM)->Add(&value);
        *static_cast<T*>(pMemberM) = value;
        return true;
    }
    bool StoreText(const RoxString& text) const {
        if (isMultiM) return static_cast<RoxStringArray*>(pMemberM)->Add(text);
        *static_cast<RoxString*>(pMemberM) = text;
        return true;
    }
    bool StoreText(RoxString&& text) const {
        if (isMultiM) return static_cast<RoxStringArray*>(pMemberM)->Add(std::move(text));
        *static_cast<RoxString*>(pMemberM) = std::move(text);
        return true;
    }
    bool StoreReference(RefBase&& value) const {
        if (!isMultiM) {
            *static_cast<RefBase*>(pMemberM) = std::move(value);
            return true;
        }
        if (!static_cast<RoxGenericArray*>(pMemberM)->AddHeld(value.GetCore())) return false;
        value.TakeCore();
        return true;
    }
    bool StoreReference(const RefBase& value) const {
        if (isMultiM) return static_cast<RoxGenericArray*>(pMemberM)->Add(value.GetCore());
        *static_cast<RefBase*>(pMemberM) = value;
        return true;
    }

 private:
    void* pMemberM;
    bool isMultiM;
};

}  // namespace sorn
