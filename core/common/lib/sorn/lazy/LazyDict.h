#pragma once

#include "rox/RoxCore.h"
#include "rox/RoxString.h"
#include "rox/ref.h"
#include "sorn/dict/LazyBody.h"
#include "sorn/model/OrvoVersion.h"

namespace kelbaselib {
class Bytesource;
}
namespace rox {
class ByteBuffer;
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

    // Conversions.

    /// The body as a Dict, never null: a failure gives a dictionary of type "error" with "code" and "text".
    ref<Dict> ToDict() const;
    /// The body as a dictionary, or null and words, which replace what `error` holds. The one of a REP_DICT
    /// or REP_DICTIONARY body is shared, not copied.
    ref<Dictionary> ToDictionary(RoxString& error) const;
    /// The body as an object, or null and words; an empty `error` is to be handed in, for some words are
    /// appended. A REP_OBJECT body is shared, not copied.
    ref<SornObject> ToSornObjectOrErrorString(RoxString& error) const;
    /// The same, with an object of type "error" for the words in place of null.
    ref<SornObject> ToSornObjectOrError() const;
    /// What the body's JSON text is made of, for writers that walk values without recursion.
    LazyBodyContent ToWrite(bool pretty) const;
    /// Appends the body's JSON text. JSON bytes go out as they are unless `pretty`; an unreadable body writes
    /// nothing.
    void ToJsonByteBuffer(ByteBuffer& out, bool pretty) const;
    /// Equal contents, whatever the representations: both sides through ToDict, compared as Dict::operator==
    /// does, by their compact texts; so without recursion, however deep bodies lie in bodies.
    bool operator==(const LazyDict& other) const;
    bool operator!=(const LazyDict& other) const { return !(*this == other); }

    Rep GetRep() const { return repM; }
    OrvoVersion GetVersion() const { return versionM; }
    const ref<Dict>& GetStoredDict() const { return dictM; }
    const ref<Dictionary>& GetStoredDictionary() const { return dictionaryM; }
    const ref<rox::ByteBuffer>& GetStoredBytes() const { return bytesM; }
    const ref<SornObject>& GetStoredObject() const { return objectM; }
    kelbaselib::Bytesource* GetStoredBytesource() const { return bytesourceM; }

    void* VkCastHelper(const void* classTag) override;

 private:
    LazyDict(RoxMempool* pool, Rep rep, OrvoVersion version) : RoxCore(pool), repM(rep), versionM(version) {}

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
