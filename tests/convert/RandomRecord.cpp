#include "convert/RandomRecord.h"

#include <algorithm>
#include <cstring>
#include <string>

#include "rox/RoxGenericArray.h"
#include "rox/RoxGenericIntArray.h"
#include "rox/RoxStringArray.h"
#include "sorn/dict/Dict.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/lazy/LazyDict.h"
#include "sorn/model/ChannelNumber.h"
#include "sorn/model/Currency.h"
#include "sorn/model/Date.h"
#include "sorn/model/DateTime.h"
#include "sorn/model/Schema.h"
#include "sorn/model/Time.h"

namespace sorntest {

using namespace sorn;

bool RandomRecord::FReadable(const FieldInfo& field) {
    bool isId = field.dataType >= 9 && field.dataType <= 11;
    if (isId) return Schema::FindStruct(field.typeRef) != nullptr;
    if (field.dataType != 7) return true;
    const EnumDef& def = *Schema::FindEnum(field.typeRef);
    return std::any_of(def.names, def.names + def.count, [](const char* name) { return name != nullptr; });
}

ref<SornObject> RandomRecord::Make(const StructInfo& info, int nLevels) {
    ref<SornObject> object = info.Factory(pMempoolM);
    for (int slot = 0; slot < info.nFields; ++slot) {
        if (info.vFieldInfo[slot].FHole()) continue;
        const FieldInfoHistory& history = info.vFieldInfoHistory[slot];
        for (int i = 0; i < history.nVariants; ++i) Fill(*object, history.vVariants[i], nLevels);
        Fill(*object, info.vFieldInfo[slot], nLevels);
    }
    return object;
}

void RandomRecord::Fill(SornObject& object, const FieldInfo& field, int nLevels) {
    if (!FReadable(field)) return;
    void* member = object.MemberAt(field);
    bool isObject = field.dataType == 12 || field.dataType == 14;
    if (isObject && nLevels <= 0 && field.arity != 1) return;
    if (field.arity == 2) {
        for (uint32_t n = Below(4); n != 0; --n) FillValue(member, field, nLevels);
    } else if (field.arity == 1 || Below(2) == 0) {
        object.SetPresent(field);
        FillValue(member, field, nLevels);
    }
}

template <class T>
void RandomRecord::Store(void* member, bool isMulti, const T& value) {
    if (isMulti) {
        static_cast<RoxGenericIntArray*>(member)->Add(&value);
    } else {
        *static_cast<T*>(member) = value;
    }
}

void RandomRecord::FillValue(void* member, const FieldInfo& field, int nLevels) {
    bool isMulti = field.arity == 2;
    switch (field.dataType) {
        case 0:
            Store<bool>(member, isMulti, Below(2) != 0);
            break;
        case 2: {
            ChannelNumber channel(static_cast<int>(Bits() & 0x7FFFFFFF));
            if (Below(2) != 0) channel.subNumber = static_cast<int>(Below(100));
            Store(member, isMulti, channel);
            break;
        }
        case 3:
            Store(member, isMulti,
                  Currency(static_cast<int>(Bits() & 0x7FFFFFFF), Below(2) != 0 ? "USD" : "JPY"));
            break;
        case 4:
            Store(member, isMulti, Date(static_cast<int32_t>(Below(24837))));
            break;  // before 2038
        case 5:
            Store(member, isMulti, DateTime(static_cast<int64_t>(Below(2145916800)) * 1000));
            break;  // before 2038
        case 7:
            Store<uint32_t>(member, isMulti, MakeEnum(field));
            break;
        case 8:
            Store<double>(member, isMulti,
                          static_cast<double>(static_cast<int32_t>(Below(2000000)) - 1000000) / 4);
            break;  // 8 digits at most
        case 15:
            Store<int64_t>(member, isMulti, static_cast<int64_t>(Bits() >> Below(64)));
            break;
        case 16:
            Store<int32_t>(member, isMulti, static_cast<int32_t>(Bits()));
            break;
        case 18:
            Store(member, isMulti, Time(static_cast<int32_t>(Below(86400) * 1000)));
            break;
        case 9:
        case 19:
            Store<uint32_t>(member, isMulti, static_cast<uint32_t>(Bits() >> Below(64)));
            break;
        case 10:
            Store<uint64_t>(member, isMulti, (uint64_t{Below(2) != 0 ? 9u : 0u} << 48) + (Bits() >> 16));
            break;
        case 20:
            Store<uint64_t>(member, isMulti, Bits() >> Below(64));
            break;
        case 11:
        case 17:
            if (isMulti) {
                static_cast<RoxStringArray*>(member)->Add(MakeText());
            } else {
                *static_cast<RoxString*>(member) = MakeText();
            }
            break;
        default: {
            ref<RoxCore> value = MakeReference(field, nLevels);
            if (isMulti) {
                static_cast<RoxGenericArray*>(member)->Add(value.get());
            } else {
                *static_cast<RefBase*>(member) = value;
            }
        }
    }
}

ref<RoxCore> RandomRecord::MakeReference(const FieldInfo& field, int nLevels) {
    switch (field.dataType) {
        case 1: {
            unsigned char bytes[8];
            for (unsigned char& byte : bytes) byte = static_cast<unsigned char>(Bits());
            return rox::ByteBuffer::New(pMempoolM, bytes, 1 + Below(8));
        }
        case 6: {
            ref<Dict> dict = MakeDict(pMempoolM);
            for (uint32_t n = Below(3); n != 0; --n) dict->AddString(MakeText(), MakeText());
            return dict;
        }
        case 13:
            return LazyDict::FromSornObject(pMempoolM, Make(AnyStruct(), 0), 0);
        case 14:
            return Make(*Schema::FindStruct(field.typeRef), nLevels - 1);
        default:
            return Make(AnyStruct(), nLevels - 1);
    }
}

RoxString RandomRecord::MakeText() {
    static const char* const pieces[] = {"a", "Z", "9", " ", "\"", "\\", "\n", "\xC3\xA9", ".", ","};
    std::string text;
    for (uint32_t n = Below(12); n != 0; --n) text += pieces[Below(10)];
    return RoxString(pMempoolM, text.c_str());
}

uint32_t RandomRecord::MakeEnum(const FieldInfo& field) {
    const EnumDef& def = *Schema::FindEnum(field.typeRef);
    uint32_t start = Below(def.count);
    for (uint32_t i = 0; i < def.count; ++i) {
        uint32_t value = (start + i) % def.count;
        if (def.names[value] != nullptr) return value;
    }
    return 0;
}

/// Any struct that requires no other one and can be read back.
const StructInfo& RandomRecord::AnyStruct() {
    for (;;) {
        const StructInfo* info = Schema::FindStruct(Below(Schema::nStructDefG));
        if (info == nullptr) continue;
        bool isLeaf = true;
        for (int i = 0; i < info->nFields; ++i) {
            const FieldInfo& field = info->vFieldInfo[i];
            if (field.FHole()) continue;
            bool isReference = field.dataType == 12 || field.dataType == 13 || field.dataType == 14;
            if ((isReference || !FReadable(field)) && field.arity == 1) isLeaf = false;
            // Such a field is not read back: its name is the one of the entry with the struct's name.
            if (strcmp(info->FieldName(field), "type") == 0) isLeaf = false;
        }
        if (isLeaf) return *info;
    }
}

}  // namespace sorntest
