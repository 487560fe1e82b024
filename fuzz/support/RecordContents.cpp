#include "fuzz/support/RecordContents.h"

#include <cstring>
#include <vector>

#include "rox/RoxString.h"
#include "rox/RoxStringArray.h"
#include "sorn/convert/FieldAccess.h"
#include "sorn/dict/Dict.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/lazy/LazyDict.h"
#include "sorn/model/ChannelNumber.h"
#include "sorn/model/Currency.h"
#include "sorn/model/Schema.h"

namespace {

struct Object {
    ref<sorn::SornObject> object;
    bool isInLazy;
};
using Pending = std::vector<Object>;

bool FHoldsMap(const sorn::Dict& dict) {
    RoxStringArray names;
    dict.GetSortedNames(names);
    for (unsigned i = 0; i < names.GetCount(); ++i) {
        const RoxString& name = names.At(i);
        for (unsigned value = 0; value < dict.CountValues(name); ++value) {
            if (dict.GetType(name, value) == sorn::dictvalue::LAZY_DICT) return true;
        }
    }
    return false;
}

bool FReadable(const sorn::LazyDict& body) {
    RoxString error;
    return body.ToDictionary(error) != nullptr && error.FEmpty();
}

void LookAtReference(const sorn::FieldInfo& field, RoxCore* value, bool isInLazy, RecordContents& found,
                     Pending& pending) {
    // Inside lazy bodies nothing is told but where objects go on.
    RecordContents ignored;
    RecordContents& contents = isInLazy ? ignored : found;
    switch (field.Type()) {
        case sorn::SORN_DATA_TYPE_ANY_DICT:
            contents.hasAnyDict = true;
            if (FHoldsMap(*static_cast<sorn::Dict*>(value))) contents.hasNestedAnyDict = true;
            break;
        case sorn::SORN_DATA_TYPE_KNOWN_DICT_AS_LAZY:
            contents.hasLazy = true;
            if (!FReadable(*static_cast<sorn::LazyDict*>(value))) contents.hasUnreadableLazy = true;
            pending.push_back({static_cast<sorn::LazyDict*>(value)->ToSornObjectOrError(), true});
            break;
        case sorn::SORN_DATA_TYPE_KNOWN_DICT:
        case sorn::SORN_DATA_TYPE_OBJECT: {
            auto* object = static_cast<sorn::SornObject*>(value);
            const bool isDeclared = field.Type() == sorn::SORN_DATA_TYPE_OBJECT;
            if (isDeclared && object->structId != field.typeRef) contents.hasForeignObject = true;
            pending.push_back({ref<sorn::SornObject>(object), isInLazy});
            break;
        }
        default:
            break;
    }
}

template <class Scalar>
bool FReadable(const Scalar& value) {
    return value != Scalar::INVALID && Scalar::Parse(value.ToString()) == value;
}

void LookAtField(const sorn::FieldInfo& field, const Object& object, RecordContents& contents,
                 Pending& pending) {
    const sorn::DataType type = field.Type();
    const bool isMulti = field.arity == sorn::SORN_ARITY_MULTI;
    const sorn::FieldSource source(object.object->MemberAt(field), isMulti);
    for (unsigned i = 0; i < source.Count(type); ++i) {
        if (type == sorn::SORN_DATA_TYPE_CHANNEL) {
            if (!FReadable(source.PlainAt<sorn::ChannelNumber>(i))) contents.hasUnreadableScalar = true;
        } else if (type == sorn::SORN_DATA_TYPE_CURRENCY) {
            if (!FReadable(source.PlainAt<sorn::Currency>(i))) contents.hasUnreadableScalar = true;
        } else if (sorn::StorageOf(type) == sorn::FieldStorage::REFERENCE) {
            RoxCore* const value = source.ReferenceAt<RoxCore>(i);
            if (value != nullptr) {
                LookAtReference(field, value, object.isInLazy, contents, pending);
            } else if (isMulti && !object.isInLazy) {
                contents.hasNullElement = true;
            }
        }
    }
}

void LookAtObject(const Object& object, RecordContents& contents, Pending& pending) {
    const sorn::StructInfo& info = *sorn::Schema::FindStruct(object.object->structId);
    for (int slot = 0; slot < info.nFields; ++slot) {
        const sorn::FieldInfo& field = info.vFieldInfo[slot];
        if (field.FHole()) continue;
        if (!object.isInLazy && std::strcmp(info.FieldName(field), "type") == 0) contents.hasTypeField = true;
        if (field.arity == sorn::SORN_ARITY_OPTIONAL && !object.object->FPresent(field)) continue;
        LookAtField(field, object, contents, pending);
    }
}

}  // namespace

RecordContents RecordContents::Of(const ref<sorn::SornObject>& record) {
    RecordContents contents;
    Pending pending{{record, false}};
    while (!pending.empty()) {
        const Object object = pending.back();
        pending.pop_back();
        LookAtObject(object, contents, pending);
    }
    return contents;
}
