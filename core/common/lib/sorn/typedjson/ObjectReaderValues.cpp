// The table of data types on the way from text to members, but for objects.
#include <utility>

#include "kelbaselib/Bytesource.h"
#include "sorn/dict/Dict.h"
#include "sorn/dict/LazyBody.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/json/QuotedText.h"
#include "sorn/model/ChannelNumber.h"
#include "sorn/model/Currency.h"
#include "sorn/model/Date.h"
#include "sorn/model/DateTime.h"
#include "sorn/model/Time.h"
#include "sorn/typedjson/AnyDictReader.h"
#include "sorn/typedjson/ObjectReader.h"
#include "sorn/typedjson/TextValue.h"

namespace sorn {

bool ObjectReader::ReadPlainValue(const FieldInfo& field, const FieldTarget& target) {
    switch (field.Type()) {
        case SORN_DATA_TYPE_ANY_DICT:
            return ReadAnyDict(target);
        case SORN_DATA_TYPE_KNOWN_DICT_AS_LAZY:
            return ReadLazy(target);
        default:
            return textM.Read(cursorM) && ReadText(field, textM.View(), false, target);
    }
}

/// A single value joins the Dict that is there already; a repeated one is an element of its own.
bool ObjectReader::ReadAnyDict(const FieldTarget& target) {
    objectsM.CountAnyDict();
    const Frame& frame = stackM.Top();
    ref<Dict> element;
    ref<Dict>& dict =
        target.FMulti() ? element : *static_cast<ref<Dict>*>(frame.pObject->MemberAt(*frame.pField));
    bool isMap = false;
    RoxString text;
    if (!AnyDictReader(pMempoolM, cursorM).ReadValue(isMap, text, dict) || !isMap) return false;
    return !target.FMulti() || Stored(target.StoreReference(element));
}

/// The text of the value becomes the body, byte for byte; only its syntax is tested.
bool ObjectReader::ReadLazy(const FieldTarget& target) {
    if (!cursorM.isCapturingM) cursorM.StartCapture(pMempoolM);
    if (!skipperM.SkipObject()) {
        cursorM.DropCapture();
        return wordsM.Append(target.FMulti() ? " Multi SORN_DATA_TYPE_KNOWN_DICT_AS_LAZY can't unmarshal"
                                             : " Single SORN_DATA_TYPE_KNOWN_DICT_AS_LAZY can't Unmarshal");
    }
    const ref<LazyDict> body = NewLazyBodyOfSource(pMempoolM, cursorM.FinishCapture());
    return Stored(target.StoreReference(body));
}

/// `isRoomy`: the text has as many readable bytes from its start on as NameKey::OfRoomy wants.
bool ObjectReader::ReadText(const FieldInfo& field, std::string_view text, bool isRoomy,
                            const FieldTarget& target) {
    const unsigned nText = static_cast<unsigned>(text.size());
    switch (field.Type()) {
        case SORN_DATA_TYPE_STRING:
            return StoreText(text, target);
        case SORN_DATA_TYPE_STRING_ID:
        case SORN_DATA_TYPE_INT_ID:
        case SORN_DATA_TYPE_LONG_ID:
            return StoreId(field, text, target);
        case SORN_DATA_TYPE_ENUM:
            return StoreEnum(field, isRoomy ? NameKey::OfRoomy(text) : NameKey(text), target);
        case SORN_DATA_TYPE_BOOL:
            return StoreNumber<bool>(textvalue::ToBool, text, target);
        case SORN_DATA_TYPE_S32:
            return StoreNumber<int32_t>(textvalue::ToS32, text, target);
        case SORN_DATA_TYPE_S64:
            return StoreNumber<int64_t>(textvalue::ToS64, text, target);
        case SORN_DATA_TYPE_U32:
            return StoreNumber<uint32_t>(textvalue::ToU32, text, target);
        case SORN_DATA_TYPE_U64:
            return StoreNumber<uint64_t>(textvalue::ToU64, text, target);
        case SORN_DATA_TYPE_FLOAT:
            return StoreNumber<double>(textvalue::ToFloat, text, target);
        case SORN_DATA_TYPE_BYTESTRING:
            return StoreBytes(text, target);
        case SORN_DATA_TYPE_CHANNEL:
            return StoreValid<ChannelNumber>(text, target);
        case SORN_DATA_TYPE_CURRENCY:
            return StoreValid<Currency>(text, target);
        // What is no date or time is stored as the parser gives it: these fields cannot refuse a text.
        case SORN_DATA_TYPE_DATE:
            return Stored(target.StorePlain(Date::Parse(textvalue::Terminated(text).Text(), nText)));
        case SORN_DATA_TYPE_DATETIME:
            return Stored(target.StorePlain(DateTime::Parse(textvalue::Terminated(text).Text(), nText)));
        case SORN_DATA_TYPE_TIME:
            return Stored(target.StorePlain(Time::Parse(textvalue::Terminated(text).Text(), nText)));
        default:
            return false;
    }
}

template <class Member, class Value>
inline bool ObjectReader::StoreNumber(bool (*convert)(std::string_view, Value&), std::string_view text,
                                      const FieldTarget& target) {
    Value value;
    return convert(text, value) && Stored(target.StorePlain<Member>(value));
}

template <class Scalar>
bool ObjectReader::StoreValid(std::string_view text, const FieldTarget& target) {
    const Scalar value = Scalar::Parse(Cut(text));
    return value != Scalar::INVALID && Stored(target.StorePlain(value));
}

bool ObjectReader::StoreEnum(const FieldInfo& field, const NameKey& name, const FieldTarget& target) {
    uint32_t value;
    return textvalue::ToEnum(field, name, value) && Stored(target.StorePlain(value));
}

bool ObjectReader::StoreId(const FieldInfo& field, std::string_view text, const FieldTarget& target) {
    unsigned intId;
    unsigned long long longId;
    std::string_view bare;
    switch (field.Type()) {
        case SORN_DATA_TYPE_INT_ID:
            return textvalue::ToIntId(field, text, intId) && Stored(target.StorePlain<uint32_t>(intId));
        case SORN_DATA_TYPE_LONG_ID:
            return textvalue::ToLongId(field, text, longId) && Stored(target.StorePlain<uint64_t>(longId));
        default:
            return textvalue::ToStringId(field, text, bare) && StoreText(bare, target);
    }
}

/// All values without bytes are one buffer: an element of a list takes two bytes of text.
bool ObjectReader::StoreBytes(std::string_view text, const FieldTarget& target) {
    ref<rox::ByteBuffer> bytes = textvalue::ToBytes(pMempoolM, text);
    if (bytes != nullptr) return Stored(target.StoreReference(std::move(bytes)));
    if (noBytesM == nullptr) noBytesM = rox::ByteBuffer::NewOfLength(pMempoolM, 0);
    return Stored(target.StoreReference(noBytesM));
}

RoxString ObjectReader::Cut(std::string_view text) {
    return CutText(pMempoolM, reinterpret_cast<const unsigned char*>(text.data()), text.size());
}

bool ObjectReader::StoreText(std::string_view text, const FieldTarget& target) {
    return Stored(target.StoreText(Cut(text)));
}

}  // namespace sorn
