#include "sorn/binary/AnyDictDecoder.h"
#include "sorn/binary/ObjectDecoder.h"
#include "sorn/binary/WireValues.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/model/ChannelNumber.h"
#include "sorn/model/Currency.h"

namespace sorn {

const unsigned char* ObjectDecoder::ReadValue(uint8_t kind, const unsigned char* p, Bounds bounds,
                                              void* member) {
    const auto type = static_cast<DataType>(kind % PlannedField::multiG);
    return kind >= PlannedField::multiG ? ReadValue<true>(type, p, bounds, member)
                                        : ReadValue<false>(type, p, bounds, member);
}

template <bool isMulti>
const unsigned char* ObjectDecoder::ReadValue(DataType type, const unsigned char* p, Bounds bounds,
                                              void* member) {
    switch (type) {
        case SORN_DATA_TYPE_BOOL:
            return wirevalues::ReadBool<isMulti>(p, bounds, member);
        case SORN_DATA_TYPE_DATE:
        case SORN_DATA_TYPE_S32:
            return wirevalues::ReadSigned<isMulti, uint32_t>(p, bounds, member);
        case SORN_DATA_TYPE_DATETIME:
        case SORN_DATA_TYPE_S64:
            return wirevalues::ReadSigned<isMulti, uint64_t>(p, bounds, member);
        case SORN_DATA_TYPE_ENUM:
        case SORN_DATA_TYPE_INT_ID:
        case SORN_DATA_TYPE_TIME:
        case SORN_DATA_TYPE_U32:
            return wirevalues::ReadUnsigned<isMulti, uint32_t>(p, bounds, member);
        case SORN_DATA_TYPE_LONG_ID:
        case SORN_DATA_TYPE_U64:
            return wirevalues::ReadUnsigned<isMulti, uint64_t>(p, bounds, member);
        case SORN_DATA_TYPE_FLOAT:
            return wirevalues::ReadDouble<isMulti>(p, bounds, member);
        case SORN_DATA_TYPE_STRING:
        case SORN_DATA_TYPE_STRING_ID:
            return wirevalues::ReadText<isMulti>(p, bounds, pMempoolM, member);
        case SORN_DATA_TYPE_CHANNEL:
            return wirevalues::ReadScalarText<isMulti, ChannelNumber>(p, bounds, pMempoolM, member);
        case SORN_DATA_TYPE_CURRENCY:
            return wirevalues::ReadScalarText<isMulti, Currency>(p, bounds, pMempoolM, member);
        case SORN_DATA_TYPE_BYTESTRING:
            return ReadBytes(p, bounds, FieldTarget(member, isMulti));
        case SORN_DATA_TYPE_ANY_DICT:
            return ReadAnyDict(p, bounds, member, isMulti);
        case SORN_DATA_TYPE_KNOWN_DICT_AS_LAZY: {
            ref<LazyDict> body;
            p = ReadLazyBody(p, bounds, body);
            return p != nullptr && FieldTarget(member, isMulti).StoreReference(body) ? p : nullptr;
        }
        default:
            return nullptr;
    }
}

const unsigned char* ObjectDecoder::ReadBytes(const unsigned char* p, Bounds bounds,
                                              FieldTarget target) const {
    uint32_t nBytes = 0;
    p = wirevalues::ReadHead(p, bounds, nBytes);
    if (p == nullptr) return nullptr;
    return target.StoreReference(rox::ByteBuffer::New(pMempoolM, p, nBytes)) ? p + nBytes : nullptr;
}

/// No bytes are a null body.
const unsigned char* ObjectDecoder::ReadLazyBody(const unsigned char* p, Bounds bounds,
                                                 ref<LazyDict>& body) const {
    uint32_t nBytes = 0;
    p = wirevalues::ReadHead(p, bounds, nBytes);
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
    const unsigned char* const behind = ReadLazyBody(pM, {pEndM, pEndM}, body);
    if (behind == nullptr) return false;
    pM = behind;
    *out = std::move(body);
    return true;
}

/// A single field that has a dictionary already gets what is read added to it.
const unsigned char* ObjectDecoder::ReadAnyDict(const unsigned char* p, Bounds bounds, void* member,
                                                bool isMulti) {
    uint32_t nBytes = 0;
    p = wirevalues::ReadHead(p, bounds, nBytes);
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
