#pragma once

#include <cstdint>

#include "rox/RoxString.h"
#include "rox/ref.h"
#include "sorn/convert/StructTable.h"
#include "sorn/dict/DictValue.h"
#include "sorn/dict/LazyBody.h"
#include "sorn/model/FieldInfo.h"
#include "sorn/model/SornObject.h"

namespace rox {
class ByteBuffer;
}

namespace sorn {

class Dict;
class ProtoBufByteOutputStream;

/// The codec of the binary form: tags and values of Protocol Buffers, driven by the tables of structs. A small
/// value that callers build on the spot; it owns nothing and keeps no state. docs/formats.md shows the bytes.
class ProtoBuf {
 public:
    /// What is read is made in the pool.
    ProtoBuf(RoxMempool* pool, const StructInfo* const* vStructDef, uint32_t nStructDef)
        : pMempoolM(pool), tableM{vStructDef, nStructDef} {}

    // Writing. Cannot fail...

    void Marshal(const SornObject* object, ProtoBufByteOutputStream& stream);
    void MarshalDict(const SornObject* object, ProtoBufByteOutputStream& stream);
    void MarshalFields(const StructInfo* info, const SornObject* object, ProtoBufByteOutputStream& stream);
    void MarshalSingleField(const FieldInfo* field, const SornObject* object, ProtoBufByteOutputStream& stream);
    void MarshalMultiField(int tag, const FieldInfo* field, const SornObject* object,
                           ProtoBufByteOutputStream& stream);
    void MarshalSubdict(const SornObject* object, ProtoBufByteOutputStream& stream);
    void MarshalKnownDict(const SornObject* object, ProtoBufByteOutputStream& stream);
    void MarshalKnownDictValue(const SornObject* object, ProtoBufByteOutputStream& stream);
    void MarshalKnownDictField(const SornObject* object, ProtoBufByteOutputStream& stream);
    void MarshalKnownDictAsLazyField(const LazyDict* body, ProtoBufByteOutputStream& stream);
    void MarshalAnyDict(Dict* dict, ProtoBufByteOutputStream& stream);
    void MarshalAnyDictWithLength(Dict* dict, ProtoBufByteOutputStream& stream);
    void MarshalAnyDictField(Dict* dict, const RoxString& name, ProtoBufByteOutputStream& stream);
    void MarshalAnyDictValue(Dict* dict, const RoxString& name, unsigned index, ProtoBufByteOutputStream& stream);

    /// MarshalKnownDict into a new byte buffer in the pool, its capacity at least 8.
    ref<rox::ByteBuffer> MarshalKnownDict(const SornObject* object);

    // Reading.

    bool Unmarshal(const unsigned char* data, int length, unsigned structId, ref<SornObject>* out);
    bool UnmarshalDict(const unsigned char** cursor, const unsigned char* end, unsigned structId,
                       ref<SornObject>* out);
    bool UnmarshalFields(const StructInfo* info, const unsigned char** cursor, const unsigned char* end,
                         SornObject* object);
    bool UnmarshalOneSingleValue(const FieldInfo* field, const unsigned char** cursor, const unsigned char* end,
                                 SornObject* object);
    bool UnmarshalOneMultiValue(const FieldInfo* field, const unsigned char** cursor, const unsigned char* end,
                                SornObject* object);
    bool UnmarshalSubdict(const unsigned char** cursor, const unsigned char* end, unsigned structId,
                          ref<SornObject>* out);
    bool UnmarshalKnownDict(const unsigned char* data, int length, ref<SornObject>* out);
    /// The same of a byte buffer. Lazy fields of the object share its bytes instead of copying them, so that a
    /// body in a body in a body costs no more than its bytes.
    bool UnmarshalKnownDict(const ref<rox::ByteBuffer>& bytes, ref<SornObject>* out);
    bool UnmarshalKnownDictValue(const unsigned char** cursor, const unsigned char* end, ref<SornObject>* out);
    bool UnmarshalKnownDictField(const unsigned char** cursor, const unsigned char* end, ref<SornObject>* out);
    bool UnmarshalKnownDictAsLazyField(const unsigned char** cursor, const unsigned char* end, ref<LazyDict>* out);
    bool UnmarshalAnyDict(const unsigned char** cursor, const unsigned char* end, ref<Dict>* out);
    bool UnmarshalAnyDictWithLength(const unsigned char** cursor, const unsigned char* end, ref<Dict>* out);
    bool UnmarshalAnyDictField(const unsigned char* begin, const unsigned char* end, const ref<Dict>& dict);
    bool UnmarshalAnyDictValue(const unsigned char* begin, const unsigned char* end, dictvalue::Type& type,
                               RoxString& text, ref<Dict>& dict);
    bool SkipFieldValue(unsigned wireType, const unsigned char** cursor, const unsigned char* end);

    ref<Dict> DictFromSornObject(const ref<SornObject>& object);

 private:
    RoxMempool* pMempoolM;
    StructTable tableM;
};

}  // namespace sorn
