#pragma once

#include <utility>

#include "rox/RoxWorkStack.h"
#include "rox/ref.h"
#include "sorn/dict/DictionaryEntries.h"
#include "sorn/json/JsonFormat.h"
#include "sorn/json/JsonOutput.h"
#include "sorn/model/OrvoVersion.h"

namespace sorn {

class ArrayValue;
class DictValue;
class Dictionary;
class SornObject;

/// The writer of values. It keeps its own stack, so that nesting is bounded by memory alone, that of lazy
/// bodies in lazy bodies included. A lazy body begins again at indentation 0. Null references in arrays and
/// under names are left out, with no stray separator, and so are lazy bodies that cannot be read. The tree
/// must not change meanwhile.
///
/// Objects in lazy bodies it cannot write: it stops before each one, and goes on behind it when whoever runs
/// it has written the object. What stands in the object may be written by this same writer meanwhile, above
/// the containers that are open.
class ValueWriter {
 public:
    /// `pool` takes the stack when it becomes large.
    ValueWriter(RoxMempool* pool, JsonOutput& out, JsonFormat format)
        : outM(out), formatM(format), framesM(pool), namesM(pool), bodiesM(pool) {}

    /// Writes one value that is no container, or opens one; false then, and before an object.
    bool Begin(const DictValue& value);
    /// Opens a dictionary that begins again at indentation 0.
    void BeginBody(const ref<Dictionary>& dictionary);
    /// Writes until no more than `depth` containers are open. False when it stops before an object.
    bool Run(size_t depth);
    /// Containers that are open.
    size_t GetDepth() const { return framesM.Size(); }

    /// The object before which Run has stopped, and the version that it is to be written at.
    ref<SornObject> TakeObject() { return std::move(objectM); }
    OrvoVersion GetObjectVersion() const { return objectVersionM; }

 private:
    /// A container that is being written.
    struct Frame {
        const ArrayValue* array;  // null for a dictionary
        uint32_t next;            // element, or name above firstName
        uint32_t nextOfName;      // value of that name
        uint32_t count;
        bool isBehindFirst;  // a separator goes before what comes next
        bool isBody;         // the dictionary of the lazy body on top of bodiesM
        size_t firstName;
    };
    /// A lazy body that is being written.
    struct Body {
        Dictionary* held;  // by hand, because frames are plain
        int32_t outerLevel;
    };

    bool FPrepare(const DictValue& value);
    bool BeginPrepared(const DictValue& value);
    bool BeginNullOrLazy();
    void EndBody();
    void BeginArray(const ArrayValue& array);
    void BeginDictionary(const Dictionary& dictionary);
    /// Writes from what is next in the container on top until it ends, or what Begin is false for.
    void ContinueArray();
    void ContinueDictionary();
    bool WriteMember(Frame& frame, const DictionaryEntries::Name& name, const DictValue& value);
    void End(char bracket);
    void NewLine() {
        if (formatM.isPretty) formatM.NewLine(outM);
    }
    void Indent() {
        if (formatM.isPretty) formatM.Indent(outM);
    }

    JsonOutput& outM;
    JsonFormat formatM;
    RoxWorkStack<Frame, 16> framesM;
    RoxWorkStack<DictionaryEntries::Name, 64> namesM;  // those of all open dictionaries, sorted
    RoxWorkStack<Body, 4> bodiesM;
    LazyBodyContent contentM;  // of the lazy body that is written next
    ref<SornObject> objectM;
    OrvoVersion objectVersionM;
};

}  // namespace sorn
