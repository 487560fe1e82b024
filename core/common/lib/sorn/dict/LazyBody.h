#pragma once

#include "rox/ref.h"
#include "sorn/model/OrvoVersion.h"

class RoxMempool;

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

/// LazyDict::FromDictionary.
ref<LazyDict> NewLazyBody(RoxMempool* pool, const ref<Dictionary>& dictionary, OrvoVersion version);
/// LazyDict::FromJsonString of "{}".
ref<LazyDict> NewEmptyLazyBody(RoxMempool* pool);
/// LazyDict::ToDict; a null reference gives a new empty Dict in the pool.
ref<Dict> DictOfLazyBody(RoxMempool* pool, const ref<LazyDict>& body);
/// LazyDict::operator==; null equals only null.
bool FEqualLazyBodies(const ref<LazyDict>& a, const ref<LazyDict>& b);
/// LazyDict::ToWrite; the body is not null.
ref<Dictionary> LazyBodyToWrite(const ref<LazyDict>& body, bool pretty, ref<rox::ByteBuffer>& text);

}  // namespace sorn
