#include "sorn/binary/AnyDictDecoder.h"
#include "sorn/binary/CheckGiven.h"
#include "sorn/binary/ObjectDecoder.h"
#include "sorn/binary/ProtoBuf.h"
#include "sorn/binary/UnknownField.h"
#include "sorn/binary/Varint.h"
#include "sorn/convert/DictionarySornObject.h"
#include "sorn/convert/ObjectBudget.h"
#include "sorn/dict/Dict.h"
#include "sorn/dict/MempoolNew.h"
#include "sorn/dict/RoxByteBuffer.h"

namespace sorn {

namespace {

/// Whether a result in a pool may hold bytes of a buffer: those of another pool would go with that pool.
bool FShares(RoxMempool* pool, const rox::ByteBuffer& bytes) {
    const rox::ByteBuffer* const owner = bytes.GetOwner() != nullptr ? bytes.GetOwner().get() : &bytes;
    return owner->GetMempool() == pool || owner->GetMempool() == nullptr;
}

/// No bytes need no address.
void CheckBytes(const unsigned char* data, int length) {
    if (length != 0) CheckGiven(data);
}

}  // namespace

/// Lets `decode` read from the cursor on, and moves the cursor to where that ends.
template <class Decode>
bool ProtoBuf::Read(const unsigned char** cursor, const unsigned char* end, Decode decode) const {
    if (*cursor > end) return false;
    ObjectDecoder decoder(pMempoolM, tableM, *cursor, end);
    const bool isRead = decode(decoder);
    *cursor = decoder.Cursor();
    return isRead;
}

bool ProtoBuf::Unmarshal(const unsigned char* data, int length, unsigned structId,
                         ref<SornObject>* out) const {
    if (length < 0) return false;
    CheckBytes(data, length);
    return UnmarshalDict(&data, data + length, structId, out);
}

bool ProtoBuf::UnmarshalDict(const unsigned char** cursor, const unsigned char* end, unsigned structId,
                             ref<SornObject>* out) const {
    CheckGiven(cursor, out);
    return Read(cursor, end, [=](ObjectDecoder& decoder) { return decoder.Object(structId, out); });
}

bool ProtoBuf::UnmarshalFields(const StructInfo* info, const unsigned char** cursor, const unsigned char* end,
                               SornObject* object) const {
    CheckGiven(info, cursor, object);
    return Read(cursor, end, [=](ObjectDecoder& decoder) { return decoder.Fields(*info, object); });
}

bool ProtoBuf::UnmarshalOneSingleValue(const FieldInfo* field, const unsigned char** cursor,
                                       const unsigned char* end, SornObject* object) const {
    CheckGiven(field, cursor, object);
    return Read(cursor, end, [=](ObjectDecoder& decoder) { return decoder.Value(*field, false, object); });
}

bool ProtoBuf::UnmarshalOneMultiValue(const FieldInfo* field, const unsigned char** cursor,
                                      const unsigned char* end, SornObject* object) const {
    CheckGiven(field, cursor, object);
    return Read(cursor, end, [=](ObjectDecoder& decoder) { return decoder.Value(*field, true, object); });
}

bool ProtoBuf::UnmarshalSubdict(const unsigned char** cursor, const unsigned char* end, unsigned structId,
                                ref<SornObject>* out) const {
    CheckGiven(cursor, out);
    return Read(cursor, end, [=](ObjectDecoder& decoder) { return decoder.Subdict(structId, out); });
}

bool ProtoBuf::UnmarshalKnownDict(const unsigned char* data, int length, ref<SornObject>* out) const {
    if (length < 0) return false;
    CheckBytes(data, length);
    CheckGiven(out);
    const unsigned char* cursor = data;
    ref<SornObject> object;
    if (!UnmarshalKnownDictValue(&cursor, data + length, &object) || cursor != data + length) return false;
    *out = std::move(object);
    return true;
}

bool ProtoBuf::UnmarshalKnownDict(const ref<rox::ByteBuffer>& bytes, ref<SornObject>* out) const {
    CheckGiven(out);
    if (bytes == nullptr || bytes->FEmpty()) return false;
    const unsigned char* const end = bytes->GetData() + bytes->GetLength();
    const ref<rox::ByteBuffer>* const owner = FShares(pMempoolM, *bytes) ? &bytes : nullptr;
    ObjectDecoder decoder(pMempoolM, tableM, bytes->GetData(), end, owner);
    ref<SornObject> object;
    if (!decoder.KnownDictValue(&object) || decoder.Cursor() != end) return false;
    *out = std::move(object);
    return true;
}

bool ProtoBuf::UnmarshalKnownDictValue(const unsigned char** cursor, const unsigned char* end,
                                       ref<SornObject>* out) const {
    CheckGiven(cursor, out);
    return Read(cursor, end, [=](ObjectDecoder& decoder) { return decoder.KnownDictValue(out); });
}

bool ProtoBuf::UnmarshalKnownDictField(const unsigned char** cursor, const unsigned char* end,
                                       ref<SornObject>* out) const {
    CheckGiven(cursor, out);
    return Read(cursor, end, [=](ObjectDecoder& decoder) { return decoder.KnownDictField(out); });
}

bool ProtoBuf::UnmarshalKnownDictAsLazyField(const unsigned char** cursor, const unsigned char* end,
                                             ref<LazyDict>* out) const {
    CheckGiven(cursor, out);
    return Read(cursor, end, [=](ObjectDecoder& decoder) { return decoder.LazyField(out); });
}

bool ProtoBuf::UnmarshalAnyDict(const unsigned char** cursor, const unsigned char* end,
                                ref<Dict>* out) const {
    CheckGiven(cursor, out);
    const unsigned char* const begin = *cursor;
    *cursor = end;
    dictvalue::Type type = dictvalue::STRING;
    RoxString text;
    ref<Dict> dict = *out;
    if (!UnmarshalAnyDictValue(begin, end, type, text, dict) || type == dictvalue::STRING) return false;
    *out = std::move(dict);
    return true;
}

bool ProtoBuf::UnmarshalAnyDictWithLength(const unsigned char** cursor, const unsigned char* end,
                                          ref<Dict>* out) const {
    CheckGiven(cursor, out);
    uint32_t nBytes = 0;
    const unsigned char* const begin = varint::Read(*cursor, end, nBytes);
    if (begin == nullptr || nBytes > static_cast<size_t>(end - begin)) return false;
    *cursor = begin;
    return UnmarshalAnyDict(cursor, begin + nBytes, out);
}

bool ProtoBuf::UnmarshalAnyDictField(const unsigned char* begin, const unsigned char* end,
                                     const ref<Dict>& dict) const {
    CheckGiven(dict.get());
    if (begin > end) return false;
    ObjectBudget budget(static_cast<uint64_t>(end - begin));
    return AnyDictDecoder(pMempoolM, budget).Entry(begin, end, *dict);
}

bool ProtoBuf::UnmarshalAnyDictValue(const unsigned char* begin, const unsigned char* end,
                                     dictvalue::Type& type, RoxString& text, ref<Dict>& dict) const {
    if (begin > end) return false;
    ObjectBudget budget(static_cast<uint64_t>(end - begin));
    bool fText = false;
    if (!AnyDictDecoder(pMempoolM, budget).Value(begin, end, fText, text, dict)) return false;
    // 1 stands for a dictionary here, as in Dict::GetType, and not for what has that number among values.
    type = fText ? dictvalue::STRING : static_cast<dictvalue::Type>(1);
    return true;
}

bool ProtoBuf::SkipFieldValue(unsigned wireType, const unsigned char** cursor,
                              const unsigned char* end) const {
    CheckGiven(cursor);
    const unsigned char* const behind = SkipValue(wireType, *cursor, end);
    if (behind == nullptr) return false;
    *cursor = behind;
    return true;
}

ref<Dict> ProtoBuf::DictFromSornObject(const ref<SornObject>& object) const {
    CheckGiven(object.get());
    DictionarySornObject context(pMempoolM, tableM.vStructDef, tableM.nStructDef);
    return MempoolNew<Dict>(pMempoolM, context.SornObjectToDictionary(object.get(), 0));
}

}  // namespace sorn
