// The reading half of JsonSornObject.
#include <algorithm>

#include "kelbaselib/Bytesource.h"
#include "sorn/dict/Dict.h"
#include "sorn/typedjson/AnyDictReader.h"
#include "sorn/typedjson/JsonSornObject.h"
#include "sorn/typedjson/ObjectReader.h"

namespace sorn {

namespace {

/// The bytes that the first pass takes from a source. A failure right at the end of a block does not tell
/// whether the next block was asked for; this does.
__attribute__((noinline)) uint32_t CountInBlocks(RoxMempool* pool, kelbaselib::Bytesource* source) {
    InputPointerBytesource cursor(source);
    RoxString lost;
    JsonSornObject(pool).Unmarshal(0, cursor, nullptr, nullptr, lost);
    return cursor.TakenBytes();
}

}  // namespace

bool JsonSornObject::JsonToSornObject(const unsigned char* data, int length, OrvoVersion version,
                                      ref<SornObject>* out, RoxString& err) {
    const unsigned nByte = static_cast<unsigned>(std::max(length, 0));
    InputPointerBytesource first(data, nByte);
    InputPointerBytesource second(data, nByte);
    return JsonToSornObject(first, second, version, out, err);
}

bool JsonSornObject::JsonToSornObject(kelbaselib::Bytesource* source, unsigned& bytesRead,
                                      OrvoVersion version, ref<SornObject>* out, RoxString& err) {
    kelbaselib::Bytesource* const firstSource = source->NewSource();
    kelbaselib::Bytesource* const secondSource = source->NewSource();
    InputPointerBytesource first = InputPointerBytesource::Over(firstSource);
    InputPointerBytesource second = InputPointerBytesource::Over(secondSource);
    const bool isGood = JsonToSornObject(first, second, version, out, err);
    bytesRead = isGood || !first.FAtEndOfBlock() ? first.TakenBytes() : CountInBlocks(pMempoolM, firstSource);
    if (firstSource != nullptr) firstSource->Release();
    if (secondSource != nullptr) secondSource->Release();
    return isGood;
}

bool JsonSornObject::JsonToSornObject(InputPointerBytesource& first, InputPointerBytesource& second,
                                      OrvoVersion, ref<SornObject>* out, RoxString& err) {
    while (!structListM.FEmpty()) structListM.Pop();
    objectIndexM = 0;
    if (Unmarshal(0, first, nullptr, nullptr, err) && structListM[0] != nullptr) {
        objectIndexM = 0;
        ObjectReader reader(pMempoolM, second, {objectIndexM, structListM}, first.TakenBytes(), err);
        if (reader.ReadObject(structListM[0], *out)) return true;
    }
    *out = nullptr;
    return false;
}

bool JsonSornObject::Unmarshal(int, InputPointerBytesource& cursor, const StructInfo* info,
                               ref<SornObject>* out, RoxString& err) {
    ref<SornObject> object;
    if (!ObjectReader(pMempoolM, cursor, {objectIndexM, structListM}, 0, err).ReadObject(info, object)) {
        return false;
    }
    if (out != nullptr) *out = std::move(object);
    return true;
}

bool JsonSornObject::ReadFieldValue(int, InputPointerBytesource& cursor, const FieldInfo* field,
                                    ref<SornObject> object, RoxString& err) {
    return ObjectReader(pMempoolM, cursor, {objectIndexM, structListM}, 0, err)
        .ReadFieldValue(field, object.get());
}

bool JsonSornObject::ArrayValueFromJson(int, InputPointerBytesource& cursor, const FieldInfo* field,
                                        ref<SornObject> object, RoxString& err) {
    return ObjectReader(pMempoolM, cursor, {objectIndexM, structListM}, 0, err)
        .ReadArray(field, object.get());
}

bool JsonSornObject::ArrayValueReadFieldValue(int, InputPointerBytesource& cursor, const FieldInfo* field,
                                              ref<SornObject> object, RoxString& err) {
    return ObjectReader(pMempoolM, cursor, {objectIndexM, structListM}, 0, err)
        .ReadElement(field, object.get());
}

bool JsonSornObject::UnmarshalOneSingleValue(int, InputPointerBytesource& cursor, const FieldInfo* field,
                                             ref<SornObject> object, RoxString& err) {
    return ObjectReader(pMempoolM, cursor, {objectIndexM, structListM}, 0, err)
        .ReadOne(field, object.get(), false);
}

bool JsonSornObject::UnmarshalOneMultiValue(int, InputPointerBytesource& cursor, const FieldInfo* field,
                                            ref<SornObject> object, RoxString& err) {
    return ObjectReader(pMempoolM, cursor, {objectIndexM, structListM}, 0, err)
        .ReadOne(field, object.get(), true);
}

bool JsonSornObject::UnmarshalAnyDict(InputPointerBytesource& cursor, ref<Dict>* out) {
    RoxString lost;
    return UnmarshalAnyDict(0, cursor, out, lost);
}

bool JsonSornObject::UnmarshalAnyDict(int depth, InputPointerBytesource& cursor, ref<Dict>* out,
                                      RoxString& err) {
    dictvalue::Type type = dictvalue::STRING;
    RoxString text;
    return UnmarshalAnyDictValue(depth, cursor, type, text, *out, err) && type == dictvalue::LAZY_DICT;
}

bool JsonSornObject::UnmarshalAnyDictValue(int, InputPointerBytesource& cursor, dictvalue::Type& type,
                                           RoxString& text, ref<Dict>& dict, RoxString& err) {
    bool isMap = false;
    AnyDictReader reader(pMempoolM, cursor);
    const bool isGood = reader.ReadValue(isMap, text, dict);
    // A map has the tag of a lazy value here, though it is a Dictionary that is made.
    if (isGood || isMap) type = isMap ? dictvalue::LAZY_DICT : dictvalue::STRING;
    if (!isGood) err = reader.Words();
    return isGood;
}

bool JsonSornObject::UnmarshalAnyDictField(int, InputPointerBytesource& cursor, const ref<Dict>& dict,
                                           RoxString& err) {
    AnyDictReader reader(pMempoolM, cursor);
    if (reader.ReadField(*dict)) return true;
    err = reader.Words();
    return false;
}

}  // namespace sorn
