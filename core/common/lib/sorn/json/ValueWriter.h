#pragma once

#include "rox/RoxWorkStack.h"
#include "sorn/dict/DictionaryEntries.h"
#include "sorn/json/JsonFormat.h"
#include "sorn/json/JsonOutput.h"

namespace sorn {

class ArrayValue;
class DictValue;
class Dictionary;

/// The writer behind all ToJson operations of values. It keeps its own stack, so that nesting is bounded by
/// memory alone, that of lazy bodies in lazy bodies included. A lazy body begins again at indentation 0. Null
/// references in arrays and under names are left out, with no stray separator. An object serves one write;
/// the tree must not change meanwhile.
class ValueWriter {
 public:
    /// `pool` takes the stack when it becomes large.
    ValueWriter(RoxMempool* pool, JsonOutput& out, JsonFormat format)
        : outM(out), formatM(format), framesM(pool), namesM(pool), bodiesM(pool) {}

    void Write(const DictValue& value);

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

    /// Writes one value that is no container, or opens one; false then.
    bool Begin(const DictValue& value);
    bool BeginNullOrLazy(const DictValue& value);
    void EndBody();
    void BeginArray(const ArrayValue& array);
    void BeginDictionary(const Dictionary& dictionary);
    /// Writes from what is next in the container on top until it ends, or a container opens in it.
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
};

}  // namespace sorn
