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
/// memory alone. Null references in arrays and under names are left out, with no stray separator. An object
/// serves one write; the tree must not change meanwhile.
class ValueWriter {
 public:
    /// `pool` takes the stack when it becomes large.
    ValueWriter(RoxMempool* pool, JsonOutput& out, JsonFormat format)
        : outM(out), formatM(format), framesM(pool), namesM(pool) {}

    void Write(const DictValue& value);

 private:
    /// A container that is being written.
    struct Frame {
        const ArrayValue* array;  // null for a dictionary
        uint32_t next;            // element, or name above firstName
        uint32_t nextOfName;      // value of that name
        uint32_t count;
        bool isBehindFirst;  // a separator goes before what comes next
        size_t firstName;
    };

    /// Writes one value that is no container, or opens one; false then.
    bool Begin(const DictValue& value);
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
};

}  // namespace sorn
