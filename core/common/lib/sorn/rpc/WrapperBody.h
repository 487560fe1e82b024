#pragma once

#include "rox/RoxString.h"
#include "rox/ref.h"
#include "sorn/model/OrvoVersion.h"
#include "sorn/model/SornObject.h"

class RoxMempool;

namespace kelbaselib {
class Bytesink;
}

namespace sorn {

class ByteBuffer;
class Dict;
class LazyDict;

/// The body of a request or a response: a reference to a LazyDict, which a program may have left null. A null
/// body has no forms: null references, no text, no object.
class WrapperBody {
 public:
    explicit WrapperBody(const ref<LazyDict>& body);
    ~WrapperBody();

    const ref<LazyDict>& Get() const { return bodyM; }
    ref<Dict> ToDict() const;
    RoxString ToJson(bool pretty) const;
    void ToJsonByteBuffer(ByteBuffer& out, bool pretty) const;
    void ToJsonBytesink(kelbaselib::Bytesink& out, bool pretty) const;
    /// The body as an object, which is the body from now on, at the version, in a new LazyDict in the pool.
    /// Null when it does not convert; the body is as it was then.
    ref<SornObject> Unmarshal(RoxMempool* pool, OrvoVersion version);
    /// The same with words, after the body itself was given the version `readVersion`.
    ref<SornObject> Unmarshal(RoxMempool* pool, OrvoVersion version, OrvoVersion readVersion,
                              RoxString& error);

    /// By LazyDict::operator==; null equals null only.
    bool operator==(const WrapperBody& other) const;

 private:
    ref<SornObject> Keep(RoxMempool* pool, OrvoVersion version, const ref<SornObject>& object);

    ref<LazyDict> bodyM;
};

}  // namespace sorn
