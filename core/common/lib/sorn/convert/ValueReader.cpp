#include "sorn/convert/ValueReader.h"

#include "rox/VkCast.h"
#include "sorn/convert/SchemaText.h"
#include "sorn/dict/Dict.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/dict/LazyDictValue.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/dict/StringValue.h"
#include "sorn/model/ChannelNumber.h"
#include "sorn/model/Currency.h"
#include "sorn/model/Date.h"
#include "sorn/model/DateTime.h"
#include "sorn/model/Time.h"

namespace sorn {

namespace {

// Some words replace what the caller's string holds and some are appended, and single and repeated fields
// differ in theirs. All of that is fixed.
constexpr const char* notStringG = "Dictionary field is not a single string";
constexpr const char* mustBeStringG = "Field must be a single string";
constexpr const char* notConvertedG = "Cannot convert field";
constexpr const char* notConvertedMultiG =
    "Dictionary string cannot be converted to requested data type in SornObject array";
constexpr const char* badValueG = "Cannot convert value for the field.";
constexpr const char* badValueMultiG = "Bad value in field: ";

StringValue* AsString(DictValue* value) {
    return VkCast<StringValue>(value);
}

}  // namespace

bool ValueReader::Read(const FieldInfo& field, DictValue* value, const FieldTarget& target) {
    switch (field.Type()) {
        case SORN_DATA_TYPE_BOOL:
            return ReadScanned<bool, bool>(value, target);
        case SORN_DATA_TYPE_FLOAT:
            return ReadScanned<double, double>(value, target);
        case SORN_DATA_TYPE_S32:
            return ReadScanned<int, int32_t>(value, target);
        case SORN_DATA_TYPE_S64:
            return ReadScanned<long long, int64_t>(value, target);
        case SORN_DATA_TYPE_U32:
            return ReadScanned<unsigned, uint32_t>(value, target);
        case SORN_DATA_TYPE_U64:
            return ReadScanned<unsigned long long, uint64_t>(value, target);
        case SORN_DATA_TYPE_CHANNEL:
            return ReadScalar<ChannelNumber>(value, target);
        case SORN_DATA_TYPE_CURRENCY:
            return ReadScalar<Currency>(value, target);
        case SORN_DATA_TYPE_DATE:
            return ReadScalar<Date>(value, target);
        case SORN_DATA_TYPE_DATETIME:
            return ReadScalar<DateTime>(value, target);
        case SORN_DATA_TYPE_TIME:
            return ReadScalar<Time>(value, target);
        case SORN_DATA_TYPE_BYTESTRING:
            return ReadBytes(value, target);
        case SORN_DATA_TYPE_STRING:
            return ReadString(value, target);
        case SORN_DATA_TYPE_ENUM:
            return ReadEnum(field, value, target);
        case SORN_DATA_TYPE_INT_ID:
        case SORN_DATA_TYPE_LONG_ID:
        case SORN_DATA_TYPE_STRING_ID:
            return ReadId(field, value, target);
        case SORN_DATA_TYPE_ANY_DICT:
            return ReadAnyDict(value, target);
        case SORN_DATA_TYPE_KNOWN_DICT_AS_LAZY:
            return ReadLazy(value, target);
        default:
            wordsM.Append("unhandled data type: ");
            wordsM.AppendRaw(static_cast<unsigned char>(field.dataType));
            return false;
    }
}

template <class Scan, class Member>
bool ValueReader::ReadScanned(DictValue* value, const FieldTarget& target) {
    const StringValue* text = AsString(value);
    if (text == nullptr) {
        wordsM.Replace(notStringG);
        return false;
    }
    Scan scanned;
    if (!text->GetValue(scanned)) {
        wordsM.Replace(target.FMulti() ? notConvertedMultiG : notConvertedG);
        return false;
    }
    return Stored(target.StorePlain<Member>(scanned));
}

// What such a type's Parse makes of bad text goes into the object: these fields cannot refuse a text.
template <class Scalar>
bool ValueReader::ReadScalar(DictValue* value, const FieldTarget& target) {
    const StringValue* text = AsString(value);
    if (text == nullptr) {
        wordsM.Replace(notStringG);
        return false;
    }
    return Stored(target.StorePlain(Scalar::Parse(text->GetValue())));
}

bool ValueReader::ReadBytes(DictValue* value, const FieldTarget& target) {
    const StringValue* text = AsString(value);
    if (text == nullptr) {
        wordsM.Replace(notStringG);
        return false;
    }
    return Stored(target.StoreReference(Dict::ParseBytestring(pMempoolM, text->GetValue())));
}

bool ValueReader::ReadString(DictValue* value, const FieldTarget& target) {
    const StringValue* text = AsString(value);
    if (text == nullptr) return NotAccepted(notStringG);
    return Stored(target.StoreText(text->GetValue()));
}

bool ValueReader::ReadEnum(const FieldInfo& field, DictValue* value, const FieldTarget& target) {
    const StringValue* text = AsString(value);
    if (text == nullptr) return NotAccepted(mustBeStringG);
    uint32_t number = 0;
    if (!schematext::EnumValue(field, text->GetValue(), number, wordsM)) {
        wordsM.Append(target.FMulti() ? badValueMultiG : badValueG);
        return false;
    }
    return Stored(target.StorePlain(number));
}

bool ValueReader::ReadId(const FieldInfo& field, DictValue* value, const FieldTarget& target) {
    const StringValue* text = AsString(value);
    if (text == nullptr) return NotAccepted(mustBeStringG);
    const char* bare = schematext::BareId(tableM, field, text->GetValue(), wordsM);
    if (bare == nullptr) {
        wordsM.Append(target.FMulti() ? badValueMultiG : badValueG);
        return false;
    }
    return Stored(StoreId(field, text->GetValue(), bare, target));
}

bool ValueReader::StoreId(const FieldInfo& field, const RoxString& text, const char* bare,
                          const FieldTarget& target) {
    switch (field.Type()) {
        case SORN_DATA_TYPE_INT_ID:
            return target.StorePlain(schematext::BareInt(pMempoolM, text, bare));
        case SORN_DATA_TYPE_LONG_ID:
            return target.StorePlain(schematext::BareLong(pMempoolM, text, bare));
        default:
            return target.StoreText(schematext::BareString(pMempoolM, text, bare));
    }
}

bool ValueReader::ReadAnyDict(DictValue* value, const FieldTarget& target) {
    if (value == nullptr || value->GetTag() != dictvalue::DICTIONARY) {
        return NotAccepted("Field must be a Dictionary");
    }
    ref<Dictionary> dictionary(static_cast<Dictionary*>(value));
    return Stored(target.StoreReference(ref<Dict>(new (pMempoolM) Dict(dictionary))));
}

// By the tag and not by the class: a null value, which has the tag too, gives a null reference.
bool ValueReader::ReadLazy(DictValue* value, const FieldTarget& target) {
    if (value != nullptr && value->GetTag() == dictvalue::LAZY_DICT) {
        return Stored(target.StoreReference(LazyDictValue::BodyOf(*value)));
    }
    if (value == nullptr || value->GetTag() != dictvalue::DICTIONARY) {
        return NotAccepted("Field must be a LazyDict or a Dictionary");
    }
    ref<Dictionary> dictionary(static_cast<Dictionary*>(value));
    return Stored(target.StoreReference(NewLazyBody(pMempoolM, dictionary, versionM)));
}

bool ValueReader::Stored(bool isStored) {
    if (!isStored) wordsM.Append(tooManyG);
    return isStored;
}

bool ValueReader::NotAccepted(const char* text) {
    wordsM.Append(text);
    return false;
}

}  // namespace sorn
