#pragma once

#include <cstdint>

#include "rox/RoxCore.h"
#include "rox/RoxString.h"
#include "rox/ref.h"

namespace kelbaselib {
class Bytesink;
}

namespace sorn {

class ByteBuffer;
class JsonFormat;

namespace dictvalue {

/// By this tag code tells values apart.
enum Type : uint8_t {
    STRING = 0,      ///< StringValue
    LAZY_DICT = 1,   ///< LazyDictValue, and NullValue too
    NONE = 2,        ///< no value that a caller can meet
    ARRAY = 3,       ///< ArrayValue
    DICTIONARY = 4,  ///< Dictionary
};

}  // namespace dictvalue

/// A node of a tree of values without a schema. Nodes are reference counted, live in a pool, and may be
/// shared between trees. A tree belongs to one thread at a time; only the counts are atomic.
class DictValue : public RoxCore {
 public:
    static const char classTagG;

    dictvalue::Type GetTag() const { return tagM; }

    void* VkCastHelper(const void* classTag) override;

    /// Equality as each class defines it; a null reference equals nothing.
    virtual bool Equals(const ref<DictValue>& other) const = 0;
    /// Appends the JSON text of the value.
    virtual void ToJson(ByteBuffer& out, JsonFormat format) const = 0;
    /// Writes the same bytes to a sink, in pieces. Once the sink takes less of a piece than it is given, it
    /// gets nothing more: it has the text's beginning then, and who must know asks the sink.
    virtual void ToJson(kelbaselib::Bytesink& out, JsonFormat format) const = 0;
    /// The whole JSON text of the value, in the value's pool.
    virtual RoxString ToJson(bool pretty) const;

 protected:
    /// The object's pool is the one that it is allocated in.
    explicit DictValue(dictvalue::Type tag) : tagM(tag) {}
    /// The same, with the pool at hand, which saves looking for it.
    DictValue(RoxMempool* pool, dictvalue::Type tag) : RoxCore(pool), tagM(tag) {}

 private:
    dictvalue::Type tagM;
};

}  // namespace sorn
