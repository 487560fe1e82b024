#pragma once

#include <functional>
#include <string>
#include <vector>

#include "binary/BinaryFixture.h"
#include "sorn/convert/FieldAccess.h"
#include "sorn/lazy/LazyDict.h"
#include "sorn/model/ChannelNumber.h"
#include "sorn/model/Currency.h"
#include "sorn/model/Date.h"
#include "sorn/model/DateTime.h"
#include "sorn/model/Time.h"
#include "sornschema/EveryType.h"
#include "sornschema/EveryTypeCompanion.h"

namespace sorntest {

/// Two values of a data type with their bytes, worked out by hand.
struct ValueRow {
    const char* name;   ///< of the fields of everyType: multiBool, optionalBool, requiredBool
    unsigned wireType;  ///< in the fields' tags
    std::function<void(const sorn::FieldTarget&)> storeFirst;
    const char* first;
    std::function<void(const sorn::FieldTarget&)> storeSecond;
    const char* second;
};

template <class T>
std::function<void(const sorn::FieldTarget&)> Plain(T value) {
    return [value](const sorn::FieldTarget& target) { target.StorePlain(value); };
}

inline std::function<void(const sorn::FieldTarget&)> StoreText(const char* text) {
    return [text](const sorn::FieldTarget& target) { target.StoreText(RoxString(text)); };
}

inline std::function<void(const sorn::FieldTarget&)> Reference(const RefBase& value) {
    return [value](const sorn::FieldTarget& target) { target.StoreReference(value); };
}

/// An everyTypeCompanion with a number, or with nothing. Its id is 5919, its tag as a known dict 5919 * 8 + 2
/// = 47354 = 0xB8FA, that is FA F1 02; the number stands in slot 7.
inline ref<sorn::SornObject> Companion(RoxMempool* pool, const int* number) {
    ref<sorn::SornObject> object = sornschema::EveryTypeCompanion::Factory(pool);
    auto& companion = static_cast<sornschema::EveryTypeCompanion&>(*object);
    if (number != nullptr) {
        companion.number_isSet = 1;
        companion.number = *number;
    }
    return object;
}

inline std::vector<ValueRow> ValueRows(RoxMempool* pool) {
    using namespace sorn;
    const int three = 3;
    const ref<SornObject> empty = Companion(pool, nullptr);
    const ref<SornObject> numbered = Companion(pool, &three);
    const ref<Dict> dict = MakeDict(pool);
    dict->AddString("a", "b");
    return {
        {"AnyDict", 2, Reference(dict), "0A 22 08 32 01 61 42 03 12 01 62", Reference(MakeDict(pool)), "00"},
        {"Bool", 0, Plain(true), "01", Plain(false), "00"},
        {"Bytes", 2, Reference(rox::ByteBuffer::New(pool, "dd", 2)), "02 64 64",
         Reference(rox::ByteBuffer::New(pool, "\0", 1)), "01 00"},
        {"Channel", 2, Plain(ChannelNumber(7, 2)), "03 37 2D 32", Plain(ChannelNumber(110)), "03 31 31 30"},
        {"Currency", 2, Plain(Currency(100, "USD")), "07 55 53 44 2E 31 30 30", Plain(Currency(0, "JPY")),
         "05 4A 50 59 2E 30"},
        {"Date", 0, Plain(Date(-1)), "01", Plain(Date(300)), "D8 04"},
        {"DateTime", 0, Plain(DateTime(-2)), "03", Plain(DateTime(int64_t{1} << 40)), "80 80 80 80 80 40"},
        {"Enum", 0, Plain(uint32_t{5}), "05", Plain(uint32_t{300}), "AC 02"},
        {"Float", 1, Plain(1.0), "00 00 00 00 00 00 F0 3F", Plain(-2.5), "00 00 00 00 00 00 04 C0"},
        {"IntId", 0, Plain(uint32_t{100}), "64", Plain(uint32_t{0xFFFFFFFF}), "FF FF FF FF 0F"},
        {"KnownDict", 2, Reference(empty), "04 FA F1 02 00", Reference(numbered), "06 FA F1 02 02 38 06"},
        {"Lazy", 2, Reference(LazyDict::FromSornObject(pool, empty, 0)), "04 FA F1 02 00",
         Reference(LazyDict::FromSornObject(pool, numbered, 0)), "06 FA F1 02 02 38 06"},
        {"LongId", 0, Plain(uint64_t{1} << 63), "80 80 80 80 80 80 80 80 80 01", Plain(uint64_t{0}), "00"},
        {"Object", 2, Reference(numbered), "02 38 06", Reference(empty), "00"},
        {"S32", 0, Plain(int32_t{-1}), "01", Plain(INT32_MIN), "FF FF FF FF 0F"},
        {"S64", 0, Plain(int64_t{-1}), "01", Plain(INT64_MIN), "FF FF FF FF FF FF FF FF FF 01"},
        {"String", 2, StoreText("d"), "01 64", StoreText(""), "00"},
        {"StringId", 2, StoreText("x1"), "02 78 31", StoreText("\xC3\xA9"), "02 C3 A9"},
        {"Time", 0, Plain(Time(86399000)), "98 B0 99 29", Plain(Time(-1)), "FF FF FF FF 0F"},
        {"U32", 0, Plain(uint32_t{0xFFFFFFFF}), "FF FF FF FF 0F", Plain(uint32_t{128}), "80 01"},
        {"U64", 0, Plain(UINT64_MAX), "FF FF FF FF FF FF FF FF FF 01", Plain(uint64_t{16384}), "80 80 01"},
    };
}

/// A struct with one field of everyType, and holes in all its other slots.
class OneFieldStruct {
 public:
    explicit OneFieldStruct(const std::string& name) : infoM(sornschema::EveryType::structInfoG) {
        const sorn::FieldInfo* const field = FindField(infoM, name);
        sorn::FieldInfo hole{};
        hole.dataType = sorn::SORN_DATA_TYPE_NONE;
        hole.arity = sorn::SORN_ARITY_NONE;
        slotM = static_cast<unsigned>(field - infoM.vFieldInfo);
        fieldsM.assign(static_cast<size_t>(infoM.nFields), hole);
        fieldsM[slotM] = *field;
        // What is written is by the object's struct, what is read by the field's: here they are one.
        if (field->Type() == sorn::SORN_DATA_TYPE_OBJECT) {
            fieldsM[slotM].typeRef = sornschema::EveryTypeCompanion::structIdG;
        }
        infoM.vFieldInfo = fieldsM.data();
    }
    OneFieldStruct(const OneFieldStruct&) = delete;
    OneFieldStruct& operator=(const OneFieldStruct&) = delete;

    const sorn::StructInfo& Info() const { return infoM; }
    const sorn::FieldInfo& Field() const { return fieldsM[slotM]; }
    /// The bytes of the field's tag.
    std::string Tag(unsigned wireType) const { return Varint(slotM * 8 + wireType); }

 private:
    sorn::StructInfo infoM;
    std::vector<sorn::FieldInfo> fieldsM;
    unsigned slotM = 0;
};

}  // namespace sorntest
