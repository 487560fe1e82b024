#include "rox/RoxAssert.h"
#include "sorn/binary/AnyDictEncoder.h"
#include "sorn/binary/CheckGiven.h"
#include "sorn/binary/ObjectEncoder.h"
#include "sorn/binary/ProtoBuf.h"
#include "sorn/binary/ReverseBuffer.h"
#include "sorn/dict/Dict.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/dict/RoxByteBuffer.h"

namespace sorn {

/// Lets `encode` write into a buffer from its end, and hands the bytes to the stream.
template <class Encode>
void ProtoBuf::Write(ProtoBufByteOutputStream& stream, Encode encode) const {
    ReverseBuffer out;
    encode(out);
    out.WriteTo(stream);
}

void ProtoBuf::Marshal(const SornObject* object, ProtoBufByteOutputStream& stream) const {
    MarshalDict(object, stream);
}

void ProtoBuf::MarshalDict(const SornObject* object, ProtoBufByteOutputStream& stream) const {
    CheckGiven(object);
    Write(stream, [=, this](ReverseBuffer& out) {
        ObjectEncoder(pMempoolM, tableM, out).Object(*object, ObjectEncoder::FIELDS);
    });
}

void ProtoBuf::MarshalFields(const StructInfo* info, const SornObject* object,
                             ProtoBufByteOutputStream& stream) const {
    CheckGiven(info, object);
    Write(stream,
          [=, this](ReverseBuffer& out) { ObjectEncoder(pMempoolM, tableM, out).Fields(*info, *object); });
}

void ProtoBuf::MarshalSingleField(const FieldInfo* field, const SornObject* object,
                                  ProtoBufByteOutputStream& stream) const {
    CheckGiven(field, object);
    Write(stream, [=, this](ReverseBuffer& out) {
        ObjectEncoder(pMempoolM, tableM, out).SingleField(*field, *object);
    });
}

void ProtoBuf::MarshalMultiField(int tag, const FieldInfo* field, const SornObject* object,
                                 ProtoBufByteOutputStream& stream) const {
    CheckGiven(field, object);
    Write(stream, [=, this](ReverseBuffer& out) {
        ObjectEncoder(pMempoolM, tableM, out).MultiField(static_cast<uint32_t>(tag), *field, *object);
    });
}

void ProtoBuf::MarshalSubdict(const SornObject* object, ProtoBufByteOutputStream& stream) const {
    CheckGiven(object);
    Write(stream, [=, this](ReverseBuffer& out) {
        ObjectEncoder(pMempoolM, tableM, out).Object(*object, ObjectEncoder::SUBDICT);
    });
}

void ProtoBuf::MarshalKnownDict(const SornObject* object, ProtoBufByteOutputStream& stream) const {
    MarshalKnownDictValue(object, stream);
}

void ProtoBuf::MarshalKnownDictValue(const SornObject* object, ProtoBufByteOutputStream& stream) const {
    CheckGiven(object);
    Write(stream, [=, this](ReverseBuffer& out) {
        ObjectEncoder(pMempoolM, tableM, out).Object(*object, ObjectEncoder::KNOWN_VALUE);
    });
}

void ProtoBuf::MarshalKnownDictField(const SornObject* object, ProtoBufByteOutputStream& stream) const {
    CheckGiven(object);
    Write(stream, [=, this](ReverseBuffer& out) {
        ObjectEncoder(pMempoolM, tableM, out).Object(*object, ObjectEncoder::KNOWN_FIELD);
    });
}

void ProtoBuf::MarshalKnownDictAsLazyField(const LazyDict* body, ProtoBufByteOutputStream& stream) const {
    Write(stream, [=, this](ReverseBuffer& out) {
        ObjectEncoder(pMempoolM, tableM, out).LazyBody(ShareLazyBody(body));
    });
}

void ProtoBuf::MarshalAnyDict(const Dict* dict, ProtoBufByteOutputStream& stream) const {
    CheckGiven(dict);
    Write(stream,
          [=, this](ReverseBuffer& out) { AnyDictEncoder(pMempoolM, out).Body(*dict->GetDictionary()); });
}

void ProtoBuf::MarshalAnyDictWithLength(const Dict* dict, ProtoBufByteOutputStream& stream) const {
    CheckGiven(dict);
    Write(stream, [=, this](ReverseBuffer& out) {
        AnyDictEncoder(pMempoolM, out).Body(*dict->GetDictionary());
        unsigned char* const p = out.Room(out.Begin(), varint::maxBytes64G);
        out.Commit(varint::WriteBefore(out.Count(p), p));
    });
}

void ProtoBuf::MarshalAnyDictField(const Dict* dict, const RoxString& name,
                                   ProtoBufByteOutputStream& stream) const {
    CheckGiven(dict);
    Write(stream, [&, this](ReverseBuffer& out) {
        AnyDictEncoder(pMempoolM, out).Entry(*dict->GetDictionary(), name);
    });
}

void ProtoBuf::MarshalAnyDictValue(const Dict* dict, const RoxString& name, unsigned index,
                                   ProtoBufByteOutputStream& stream) const {
    CheckGiven(dict);
    Write(stream, [&, this](ReverseBuffer& out) {
        const ref<DictValue> value = dict->FindValue(name, index);
        AnyDictEncoder(pMempoolM, out).Value(value.get());
    });
}

ref<rox::ByteBuffer> ProtoBuf::MarshalKnownDict(const SornObject* object) const {
    CheckGiven(object);
    ReverseBuffer out;
    ObjectEncoder(pMempoolM, tableM, out).Object(*object, ObjectEncoder::KNOWN_VALUE);
    const size_t nBytes = out.Count();
    RoxAssert(nBytes <= UINT32_MAX, "a record of 4 GiB or more in the binary form");
    ref<rox::ByteBuffer> bytes = rox::ByteBuffer::NewToFill(pMempoolM, static_cast<uint32_t>(nBytes));
    out.CopyTo(bytes->MutableData());
    return bytes;
}

}  // namespace sorn
