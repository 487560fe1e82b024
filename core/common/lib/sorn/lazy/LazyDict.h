#pragma once

#include "rox/RoxCore.h"
#include "rox/RoxString.h"
#include "rox/ref.h"
#include "sorn/dict/LazyBody.h"
#include "sorn/model/OrvoVersion.h"

namespace kelbaselib {
class Bytesink;
}

namespace sorn {

class ByteBuffer;

/// A message body in the shape in which it came, shared by reference. Which member holds it is told by
/// GetRep; nothing is cached: every conversion works anew. All results are made in the pool that the body was
/// allocated in.
class LazyDict final : public RoxCore {
 public:
    enum Rep {
        REP_DICT = 0,        ///< a Dict handle
        REP_JSON = 1,        ///< JSON text in a byte buffer
        REP_PROTOBUF = 2,    ///< a known-dict value of the binary form in a byte buffer
        REP_OBJECT = 3,      ///< a schema object
        REP_DICTIONARY = 4,  ///< a Dictionary
        REP_BYTESOURCE = 5,  ///< a stream of JSON text that has not been read yet
    };

    static const char classTagG;

    /// The general form: takes references, and the source's ownership. Members that do not apply are null.
    static ref<LazyDict> New(RoxMempool* pool, Rep rep, const ref<Dict>& dict,
                             const ref<rox::ByteBuffer>& bytes, const ref<SornObject>& object,
                             kelbaselib::Bytesource* bytesource, OrvoVersion version);
    static ref<LazyDict> FromDict(RoxMempool* pool, const ref<Dict>& dict, unsigned short version);
    /// Bytes of which the first tells what they are: blank or '{' JSON text, 0 or no byte at all a null
    /// reference, anything else the binary form. No further look: JSON text that opens with another byte is
    /// taken for binary. The bytes are shared, not copied.
    static ref<LazyDict> FromBytestring(RoxMempool* pool, const ref<rox::ByteBuffer>& bytes,
                                        OrvoVersion version);
    /// The same with a copy of the text, which must open with a blank or a brace.
    static ref<LazyDict> FromJsonString(RoxMempool* pool, const RoxString& text, OrvoVersion version);
    static ref<LazyDict> FromSornObject(RoxMempool* pool, const ref<SornObject>& object, OrvoVersion version);
    /// Takes the source's ownership. The body reads only from sources that it makes of this one, which stays
    /// at its start until it is released.
    static ref<LazyDict> FromBytesource(RoxMempool* pool, kelbaselib::Bytesource* bytesource,
                                        OrvoVersion version);
    static ref<LazyDict> FromDictionary(RoxMempool* pool, const ref<Dictionary>& dictionary,
                                        OrvoVersion version);

    /// Releases the source if one is still there.
    ~LazyDict() override;

    /// Replaces the dictionary and does not touch the representation.
    void SetDictionary(const ref<Dictionary>& dictionary);

    // Queries. They are the only operations that read a REP_BYTESOURCE body for good: once read, it is a
    // REP_DICTIONARY body and its source is released. An unreadable one stays as it is, and they give false.

    /// The id of the struct that the body's "type" names; false when it names none. A REP_PROTOBUF body that
    /// does not unmarshal answers with the id of the struct "error".
    bool GetType(unsigned* structId);
    /// The body's "type" itself, without a look at any table: a name that no struct has is given, too. False
    /// without one.
    bool GetTypeName(RoxString* name);

    // Conversions. Readers on several threads may share a body as long as nobody asks the queries above.

    /// The body as a Dict, never null: a failure gives a dictionary of type "error" with "code" and "text".
    ref<Dict> ToDict() const;
    /// The body as a dictionary, or null and words, which replace what `error` holds; a stream that cannot be
    /// read gives none. The dictionary of a REP_DICT or REP_DICTIONARY body is shared, not copied. A
    /// REP_PROTOBUF body that does not unmarshal gives the dictionary of an error.
    ref<Dictionary> ToDictionary(RoxString& error) const;
    /// The body as an object, or null and words; `error` is to be handed in empty, for some words are
    /// appended to it. The object of a REP_OBJECT body is shared, not copied.
    ///
    /// Bodies of JSON text take one of two roads, chosen by the feature VK_FEATURE_TYPED_JSON: through a
    /// dictionary (off), which honours the version and required fields, or by the typed reader (on), which
    /// does not. Either is measured; the figures of a channelMapConfigInstructions go to the log.
    ref<SornObject> ToSornObjectOrErrorString(RoxString& error) const;
    /// The same with an object of type "error" for the words in place of null.
    ref<SornObject> ToSornObjectOrError() const;
    /// The same without words: true when `out` is not null.
    bool ToSornObject(ref<SornObject>& out) const;
    /// The body as a known-dict value of the binary form, never null. The bytes of a REP_PROTOBUF body are
    /// shared, not copied. What cannot become an object is an object of type "error".
    ref<rox::ByteBuffer> ToProtobuf() const;

    // JSON text. A body of JSON text gives its bytes as they are unless `pretty`; an unreadable body gives
    // nothing. Compact text of objects and of the binary form is the typed writer's, in the order of slots;
    // all other text is the dictionary writer's, sorted.

    /// Appends the text.
    void ToJsonByteBuffer(ByteBuffer& out, bool pretty) const;
    /// Hands the text to the sink: JSON bytes in one write, whose answer is not looked at, and other text in
    /// pieces until the sink takes nothing more, which ends it in silence. With the feature
    /// VK_FEATURE_TYPED_JSON off, objects and the binary form go through a dictionary even when compact: this
    /// differs from the other operations, and users count on it.
    void ToJsonBytesink(kelbaselib::Bytesink& out, bool pretty) const;
    /// The text in a byte buffer; the very buffer of a body of JSON text, unless `pretty`.
    ref<rox::ByteBuffer> ToJsonBytestring(bool pretty) const;
    RoxString ToJson(bool pretty) const;
    /// What the text of ToJsonByteBuffer, or of ToJsonBytesink, is made of, for writers that walk values
    /// without recursion.
    LazyBodyContent ToWrite(bool pretty, bool isForSink) const;

    /// Reads the whole of a REP_BYTESOURCE body by a source of its own into `out`, which holds a part of the
    /// body when that fails. RoxAssertFail for a body of another representation or without its source.
    bool GetDictionaryFromBytesource(ref<Dictionary>& out) const;
    /// Makes a REP_BYTESOURCE body a REP_DICTIONARY one, if it can be read, and releases its source. Does
    /// nothing to a body without a source.
    void BuildDictionaryFromBytesource();

    /// Equal contents, whatever the representations: both sides through ToDict, compared as Dict::operator==
    /// does, by their compact texts; so without recursion, however deep bodies lie in bodies.
    bool operator==(const LazyDict& other) const;
    bool operator!=(const LazyDict& other) const { return !(*this == other); }

    Rep GetRep() const { return repM; }
    OrvoVersion GetVersion() const { return versionM; }
    void SetVersion(OrvoVersion version) { versionM = version; }
    const ref<Dict>& GetStoredDict() const { return dictM; }
    const ref<Dictionary>& GetStoredDictionary() const { return dictionaryM; }
    const ref<rox::ByteBuffer>& GetStoredBytes() const { return bytesM; }
    const ref<SornObject>& GetStoredObject() const { return objectM; }
    kelbaselib::Bytesource* GetStoredBytesource() const { return bytesourceM; }

    void* VkCastHelper(const void* classTag) override;

 private:
    LazyDict(RoxMempool* pool, Rep rep, OrvoVersion version) : RoxCore(pool), repM(rep), versionM(version) {}

    ref<Dictionary> ReadBytesource(RoxString& error) const;
    ref<Dictionary> ToDictionaryOrError() const;
    ref<SornObject> ObjectToName() const;
    ref<Dictionary> DictionaryToName() const;
    ref<SornObject> Decode() const;
    ref<SornObject> ObjectOfDictionary(const ref<Dictionary>& dictionary, RoxString& error) const;
    ref<SornObject> ObjectOfText(RoxString& error) const;
    ref<SornObject> ObjectOfStream(RoxString& error) const;
    ref<Dictionary> NewErrorDictionary(const char* code, const RoxString& text) const;
    ref<SornObject> NewErrorObject(const RoxString& text) const;

    Rep repM;
    ref<Dict> dictM;
    ref<Dictionary> dictionaryM;
    ref<rox::ByteBuffer> bytesM;
    ref<SornObject> objectM;
    OrvoVersion versionM;
    kelbaselib::Bytesource* bytesourceM = nullptr;
};

}  // namespace sorn
