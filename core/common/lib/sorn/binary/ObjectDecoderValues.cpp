#include <cstring>

#include "sorn/binary/AnyDictDecoder.h"
#include "sorn/binary/ObjectDecoder.h"
#include "sorn/binary/Varint.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/model/ChannelNumber.h"
#include "sorn/model/Currency.h"

namespace sorn {

namespace {

template <bool isMulti, class T>
bool Store(void* member, const T& value) {
    if constexpr (isMulti) return static_cast<RoxGenericIntArray*>(member)->Add(&value);
    std::memcpy(member, &value, sizeof value);
    return true;
}

template <bool isMulti, class Wire, class Convert>
const unsigned char* ReadNumber(const unsigned char* p, const unsigned char* end, void* member,
                                Convert convert) {
    Wire value = 0;
    p = varint::Read(p, end, value);
    return p != nullptr && Store<isMulti>(member, convert(value)) ? p : nullptr;
}

/// Reads a length and gives where its bytes begin, or null when they do not end before `end`.
const unsigned char* ReadHead(const unsigned char* p, const unsigned char* end, uint32_t& nBytes) {
    p = varint::Read(p, end, nBytes);
    return p != nullptr && nBytes <= static_cast<size_t>(end - p) ? p : nullptr;
}

template <bool isMulti>
const unsigned char* ReadText(const unsigned char* p, const unsigned char* end, RoxMempool* pool,
                              void* member) {
    uint32_t nBytes = 0;
    p = ReadHead(p, end, nBytes);
    if (p == nullptr) return nullptr;
    RoxString text = RoxString::FromUtf8Bytes(pool, nBytes, p);
    if constexpr (isMulti) {
        if (!static_cast<RoxStringArray*>(member)->Add(text)) return nullptr;
    } else {
        *static_cast<RoxString*>(member) = std::move(text);
    }
    return p + nBytes;
}

template <class Scalar, bool isMulti>
const unsigned char* ReadScalarText(const unsigned char* p, const unsigned char* end, RoxMempool* pool,
                                    void* member) {
    uint32_t nBytes = 0;
    p = ReadHead(p, end, nBytes);
    if (p == nullptr) return nullptr;
    const Scalar value = Scalar::Parse(RoxString::FromUtf8Bytes(pool, nBytes, p));
    return value != Scalar::INVALID && Store<isMulti>(member, value) ? p + nBytes : nullptr;
}

template <bool isMulti>
const unsigned char* ReadDouble(const unsigned char* p, const unsigned char* end, void* member) {
    double value = 0;
    if (static_cast<size_t>(end - p) < sizeof value) return nullptr;
    std::memcpy(&value, p, sizeof value);
    return Store<isMulti>(member, value) ? p + sizeof value : nullptr;
}

}  // namespace

const unsigned char* ObjectDecoder::ReadValue(const FieldInfo& field, bool isMulti, const unsigned char* p,
                                              const unsigned char* end, SornObject* object) {
    return isMulti ? ReadValue<true>(field, p, end, object) : ReadValue<false>(field, p, end, object);
}

template <bool isMulti>
const unsigned char* ObjectDecoder::ReadValue(const FieldInfo& field, const unsigned char* p,
                                              const unsigned char* end, SornObject* object) {
    void* const member = object->MemberAt(field);
    switch (field.Type()) {
        case SORN_DATA_TYPE_BOOL: {
            uint32_t value = 0;
            p = varint::Read(p, end, value);
            if (p == nullptr || value > 1) return nullptr;
            return Store<isMulti>(member, static_cast<uint8_t>(value)) ? p : nullptr;
        }
        case SORN_DATA_TYPE_DATE:
        case SORN_DATA_TYPE_S32:
            return ReadNumber<isMulti, uint32_t>(p, end, member,
                                                 [](uint32_t n) { return varint::Unzigzag(n); });
        case SORN_DATA_TYPE_DATETIME:
        case SORN_DATA_TYPE_S64:
            return ReadNumber<isMulti, uint64_t>(p, end, member,
                                                 [](uint64_t n) { return varint::Unzigzag(n); });
        case SORN_DATA_TYPE_ENUM:
        case SORN_DATA_TYPE_INT_ID:
        case SORN_DATA_TYPE_TIME:
        case SORN_DATA_TYPE_U32:
            return ReadNumber<isMulti, uint32_t>(p, end, member, [](uint32_t n) { return n; });
        case SORN_DATA_TYPE_LONG_ID:
        case SORN_DATA_TYPE_U64:
            return ReadNumber<isMulti, uint64_t>(p, end, member, [](uint64_t n) { return n; });
        case SORN_DATA_TYPE_FLOAT:
            return ReadDouble<isMulti>(p, end, member);
        case SORN_DATA_TYPE_STRING:
        case SORN_DATA_TYPE_STRING_ID:
            return ReadText<isMulti>(p, end, pMempoolM, member);
        case SORN_DATA_TYPE_CHANNEL:
            return ReadScalarText<ChannelNumber, isMulti>(p, end, pMempoolM, member);
        case SORN_DATA_TYPE_CURRENCY:
            return ReadScalarText<Currency, isMulti>(p, end, pMempoolM, member);
        case SORN_DATA_TYPE_BYTESTRING:
            return ReadBytes(p, end, FieldTarget(member, isMulti));
        case SORN_DATA_TYPE_ANY_DICT:
            return ReadAnyDict(p, end, member, isMulti);
        case SORN_DATA_TYPE_KNOWN_DICT_AS_LAZY: {
            ref<LazyDict> body;
            p = ReadLazyBody(p, end, body);
            return p != nullptr && FieldTarget(member, isMulti).StoreReference(body) ? p : nullptr;
        }
        default:
            return nullptr;
    }
}

const unsigned char* ObjectDecoder::ReadBytes(const unsigned char* p, const unsigned char* end,
                                              FieldTarget target) const {
    uint32_t nBytes = 0;
    p = ReadHead(p, end, nBytes);
    if (p == nullptr) return nullptr;
    return target.StoreReference(rox::ByteBuffer::New(pMempoolM, p, nBytes)) ? p + nBytes : nullptr;
}

/// No bytes are a null body.
const unsigned char* ObjectDecoder::ReadLazyBody(const unsigned char* p, const unsigned char* end,
                                                 ref<LazyDict>& body) const {
    uint32_t nBytes = 0;
    p = ReadHead(p, end, nBytes);
    if (p == nullptr) return nullptr;
    ref<rox::ByteBuffer> bytes;
    if (pOwnerM == nullptr) {
        bytes = rox::ByteBuffer::New(pMempoolM, p, nBytes);
    } else {
        const auto offset = static_cast<uint32_t>(p - (*pOwnerM)->GetData());
        bytes = rox::ByteBuffer::NewSlice(pMempoolM, *pOwnerM, offset, nBytes);
    }
    body = NewLazyBodyOfBytes(pMempoolM, bytes);
    return p + nBytes;
}

bool ObjectDecoder::LazyField(ref<LazyDict>* out) {
    ref<LazyDict> body;
    const unsigned char* const behind = ReadLazyBody(pM, pEndM, body);
    if (behind == nullptr) return false;
    pM = behind;
    *out = std::move(body);
    return true;
}

/// A single field that has a dictionary already gets what is read added to it.
const unsigned char* ObjectDecoder::ReadAnyDict(const unsigned char* p, const unsigned char* end,
                                                void* member, bool isMulti) {
    uint32_t nBytes = 0;
    p = ReadHead(p, end, nBytes);
    if (p == nullptr) return nullptr;
    ref<Dict> dict;
    if (!isMulti) dict = *static_cast<ref<Dict>*>(member);
    bool fText = false;
    RoxString text;
    AnyDictDecoder decoder(pMempoolM, budgetM);
    if (!decoder.Value(p, p + nBytes, fText, text, dict) || fText) return nullptr;
    return FieldTarget(member, isMulti).StoreReference(dict) ? p + nBytes : nullptr;
}

}  // namespace sorn
