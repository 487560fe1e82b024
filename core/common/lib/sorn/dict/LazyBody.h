#pragma once

#include <cstdint>

#include "rox/ref.h"
#include "sorn/model/OrvoVersion.h"

class RoxMempool;

namespace kelbaselib {
class Bytesource;
}
namespace rox {
class ByteBuffer;
}

/// The one knot between layers: dynamic values hold lazy bodies, and lazy bodies convert to dynamic values.
/// This header names LazyDict for the layers below it and declares what they ask of it; the lazy layer
/// defines it.
namespace sorn {

class Dict;
class Dictionary;
class LazyDict;
class SornObject;

/// What a body's JSON text is made of: at most one member is set. None: the body writes nothing.
struct LazyBodyContent {
    ref<Dictionary> dictionary;  ///< the text is the one of this dictionary
    ref<rox::ByteBuffer> text;   ///< these bytes are the text
    ref<SornObject> object;      ///< the text is the typed writer's one of this object at `version`
    OrvoVersion version;

    bool FNothing() const { return dictionary == nullptr && text == nullptr && object == nullptr; }
};

/// LazyDict::FromDictionary.
ref<LazyDict> NewLazyBody(RoxMempool* pool, const ref<Dictionary>& dictionary, OrvoVersion version);
/// LazyDict::FromJsonString of "{}".
ref<LazyDict> NewEmptyLazyBody(RoxMempool* pool);
/// LazyDict::ToDict; a null reference gives a new empty Dict in the pool.
ref<Dict> DictOfLazyBody(RoxMempool* pool, const ref<LazyDict>& body);
/// LazyDict::operator==; null equals only null.
bool FEqualLazyBodies(const ref<LazyDict>& a, const ref<LazyDict>& b);
/// LazyDict::ToWrite; the body is not null.
LazyBodyContent LazyBodyToWrite(const ref<LazyDict>& body, bool pretty, bool isForSink);
/// LazyDict::FromBytestring without a version; null for no bytes, and for bytes that open with 0.
ref<LazyDict> NewLazyBodyOfBytes(RoxMempool* pool, const ref<rox::ByteBuffer>& bytes);
/// LazyDict::FromBytesource without a version: takes the source's ownership.
ref<LazyDict> NewLazyBodyOfSource(RoxMempool* pool, kelbaselib::Bytesource* source);
/// A reference on a body, for those to whom the class is incomplete.
ref<LazyDict> ShareLazyBody(const LazyDict* body);
/// LazyDict::ToSornObjectOrError; the body is not null.
ref<SornObject> ObjectOfLazyBody(const ref<LazyDict>& body);
/// Bytes of JSON text that a conversion of the body reads, which is not null; 0 for a body of another form,
/// and for a stream that does not know its length.
uint32_t TextBytesOfLazyBody(const ref<LazyDict>& body);

}  // namespace sorn
