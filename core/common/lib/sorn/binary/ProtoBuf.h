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

/// The codec of the binary form: tags and values of Protocol Buffers, driven by the tables of structs. A
/// small value that callers build on the spot; it owns nothing and keeps no state, so that it may be used
/// from any number of threads on different objects. docs/formats.md shows the bytes.
///
/// A tag is a field's slot times 8 plus the wire type of its data type. Schema versions play no part: fields
/// go out and come in by their current records.
///
/// What the operations get by pointer or reference is not null, unless they say what null does there:
/// RoxAssertFail. A range of no bytes may begin and end at null.
class ProtoBuf {
 public:
    /// What is read is made in the pool, which must outlive it.
    ProtoBuf(RoxMempool* pool, const StructInfo* const* vStructDef, uint32_t nStructDef)
        : pMempoolM(pool), tableM{vStructDef, nStructDef} {}

    // Writing. Cannot fail: a body that does not convert goes out as an object of type "error", and so does
    // one inside more than maxLazyLevelsG bodies, or one that LazyTextBudget does not allow for; null
    // references inside objects go out as nothing, neither tag nor value. An object of a struct that the
    // table has not got ends in RoxAssertFail. The operations append to the stream, any nesting costs memory
    // and no stack, and the same object always gives the same bytes.

    /// Fields of an object, by the struct that its structId names.
    void Marshal(const SornObject* object, ProtoBufByteOutputStream& stream) const;
    void MarshalDict(const SornObject* object, ProtoBufByteOutputStream& stream) const;
    /// Fields by the slots of `info`: holes, and optional fields that are not set, are left out.
    void MarshalFields(const StructInfo* info, const SornObject* object,
                       ProtoBufByteOutputStream& stream) const;
    /// The value of a field that is not repeated, without its tag.
    void MarshalSingleField(const FieldInfo* field, const SornObject* object,
                            ProtoBufByteOutputStream& stream) const;
    /// The tag and the value of each element.
    void MarshalMultiField(int tag, const FieldInfo* field, const SornObject* object,
                           ProtoBufByteOutputStream& stream) const;
    /// Length and fields.
    void MarshalSubdict(const SornObject* object, ProtoBufByteOutputStream& stream) const;
    /// The top-level form of a record: struct id times 8 plus 2, length, fields. Two names of one operation.
    void MarshalKnownDict(const SornObject* object, ProtoBufByteOutputStream& stream) const;
    void MarshalKnownDictValue(const SornObject* object, ProtoBufByteOutputStream& stream) const;
    /// A length and the top-level form.
    void MarshalKnownDictField(const SornObject* object, ProtoBufByteOutputStream& stream) const;
    /// The same of the object that a body converts to; nothing for null.
    void MarshalKnownDictAsLazyField(const LazyDict* body, ProtoBufByteOutputStream& stream) const;
    /// The entries of a dictionary, by name in ascending byte order. Values other than texts and dictionaries
    /// (arrays in arrays) go out empty; lazy values as dictionaries.
    void MarshalAnyDict(const Dict* dict, ProtoBufByteOutputStream& stream) const;
    void MarshalAnyDictWithLength(const Dict* dict, ProtoBufByteOutputStream& stream) const;
    /// One entry: the name and its values.
    void MarshalAnyDictField(const Dict* dict, const RoxString& name, ProtoBufByteOutputStream& stream) const;
    /// One value of a name.
    void MarshalAnyDictValue(const Dict* dict, const RoxString& name, unsigned index,
                             ProtoBufByteOutputStream& stream) const;

    /// MarshalKnownDict into a new byte buffer in the pool, its capacity at least 8. RoxAssertFail when there
    /// are 4 GiB or more.
    ref<rox::ByteBuffer> MarshalKnownDict(const SornObject* object) const;

    // Reading: true when the bytes from the cursor on, up to `end` at most, could be read; the cursor stands
    // behind them then. On failure it stands anywhere in the range, what was made is gone, and `out` is as it
    // was. No byte outside the range is read; the lengths of objects inside objects are compared with `end`
    // only, not with the end of the object around them.
    //
    // Fields that the struct has not got are skipped, with a line on standard output; of fields that it has,
    // the wire type is not looked at. Missing required fields keep their defaults; of a single field that
    // comes twice the last value stays, but an any-dict field gets the entries of both. Failures are bad or
    // truncated values, unknown structs, a 65,536th element, and more objects than ObjectBudget allows for so
    // many bytes.

    /// Fields of an object of a struct, which must use up the bytes exactly.
    bool Unmarshal(const unsigned char* data, int length, unsigned structId, ref<SornObject>* out) const;
    bool UnmarshalDict(const unsigned char** cursor, const unsigned char* end, unsigned structId,
                       ref<SornObject>* out) const;
    /// Fields into an object that is there, of which a failure leaves those set that came before it.
    bool UnmarshalFields(const StructInfo* info, const unsigned char** cursor, const unsigned char* end,
                         SornObject* object) const;
    /// A value without its tag into a field that is not repeated; the presence byte is the caller's.
    bool UnmarshalOneSingleValue(const FieldInfo* field, const unsigned char** cursor,
                                 const unsigned char* end, SornObject* object) const;
    /// One more element of a repeated field.
    bool UnmarshalOneMultiValue(const FieldInfo* field, const unsigned char** cursor,
                                const unsigned char* end, SornObject* object) const;
    bool UnmarshalSubdict(const unsigned char** cursor, const unsigned char* end, unsigned structId,
                          ref<SornObject>* out) const;
    /// The whole of the bytes as the top-level form.
    bool UnmarshalKnownDict(const unsigned char* data, int length, ref<SornObject>* out) const;
    /// The same of a byte buffer, false for null. Lazy fields of the object share its bytes instead of
    /// copying them, so that a body in a body in a body costs no more than its bytes; but they have copies
    /// when the bytes lie in another pool than this codec's, whose end the object may outlive. Bytes on the
    /// general heap are always shared.
    bool UnmarshalKnownDict(const ref<rox::ByteBuffer>& bytes, ref<SornObject>* out) const;
    bool UnmarshalKnownDictValue(const unsigned char** cursor, const unsigned char* end,
                                 ref<SornObject>* out) const;
    /// The length in front does not tell where the value ends: the cursor stands behind the value.
    bool UnmarshalKnownDictField(const unsigned char** cursor, const unsigned char* end,
                                 ref<SornObject>* out) const;
    /// A copy of the bytes as a body that is not decoded; null for no bytes.
    bool UnmarshalKnownDictAsLazyField(const unsigned char** cursor, const unsigned char* end,
                                       ref<LazyDict>* out) const;
    /// Entries up to the end. `out` is filled up when it has a dictionary already, and keeps what came before
    /// a failure then. The cursor stands at `end` in any case.
    bool UnmarshalAnyDict(const unsigned char** cursor, const unsigned char* end, ref<Dict>* out) const;
    bool UnmarshalAnyDictWithLength(const unsigned char** cursor, const unsigned char* end,
                                    ref<Dict>* out) const;
    /// One entry into a dictionary, which keeps what came before a failure.
    bool UnmarshalAnyDictField(const unsigned char* begin, const unsigned char* end,
                               const ref<Dict>& dict) const;
    /// One value that fills the range. `type` is 0 for a text, 1 for a dictionary: the numbers of
    /// Dict::GetType; no bytes at all are an empty dictionary. A dictionary is made when `dict` is null, else
    /// filled up.
    bool UnmarshalAnyDictValue(const unsigned char* begin, const unsigned char* end, dictvalue::Type& type,
                               RoxString& text, ref<Dict>& dict) const;
    /// Steps over a value of a wire type: 0 a number, 1 eight bytes, 2 a length and as many bytes.
    bool SkipFieldValue(unsigned wireType, const unsigned char** cursor, const unsigned char* end) const;

    // Messages of the older form: records of RPC structs as top-level forms. They are written as any record.

    /// The message in the whole of the bytes, never null: an OrvoRpcRequest, OrvoRpcResponse, OrvoRpcCancel
    /// or OrvoRpcHello, or a record of type "error" with the code badArgument and words. docs/errors.md has
    /// them.
    ///
    /// Unlike any other record, a request or a response must not have fields that this reader does not know,
    /// "headers" among them, and its body is decoded at once; one that does not decode becomes an "error"
    /// record, and the message is good. Missing fields keep their defaults, except that the body must be
    /// there.
    ref<SornObject> UnmarshalWrapper(const unsigned char* data, int length) const;
    /// The same of what stands behind the struct's tag, up to `end`.
    ref<SornObject> UnmarshalRequestWrapper(const unsigned char** cursor, const unsigned char* end) const;
    ref<SornObject> UnmarshalResponseWrapper(const unsigned char** cursor, const unsigned char* end) const;

    /// The object as a dictionary in its current fields, wrapped in a new Dict in the pool.
    ref<Dict> DictFromSornObject(const ref<SornObject>& object) const;

 private:
    template <class Message>
    ref<SornObject> UnmarshalMessage(const unsigned char** cursor, const unsigned char* end) const;
    template <class Encode>
    void Write(ProtoBufByteOutputStream& stream, Encode encode) const;
    template <class Decode>
    bool Read(const unsigned char** cursor, const unsigned char* end, Decode decode) const;

    RoxMempool* pMempoolM;
    StructTable tableM;
};

}  // namespace sorn
