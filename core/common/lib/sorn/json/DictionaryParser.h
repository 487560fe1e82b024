#pragma once

#include <initializer_list>
#include <string_view>

#include "rox/RoxString.h"
#include "rox/RoxWorkStack.h"
#include "rox/ref.h"
#include "sorn/dict/DictionaryFiller.h"
#include "sorn/json/InputPointer.h"
#include "sorn/json/KeyCache.h"

namespace sorn {

class ArrayValue;
class DictValue;

/// The parser by hand of JSON text in memory, behind the FromJson and ReadFieldValue operations of Dictionary
/// and ArrayValue, whose contracts it has. It keeps its own stack, so that nesting is bounded by memory
/// alone, and looks at each byte a bounded number of times. Every container joins its parent before it is
/// filled, and all values are made in the pool of the outermost container. An object serves one read.
class DictionaryParser {
 public:
    DictionaryParser(RoxMempool* pool, InputPointer& cursor, RoxString& error)
        : pMempoolM(pool),
          cursorM(cursor),
          errorM(error),
          pM(cursor.pCurrentM),
          pEndM(cursor.pEndM),
          stackM(pool) {}

    bool ReadObject(Dictionary& object);
    bool ReadArray(ArrayValue& array);
    bool ReadMemberValue(Dictionary& object, const RoxString& key);
    bool ReadElementValue(ArrayValue& array);

 private:
    using Bytes = const unsigned char*;
    using Words = std::initializer_list<std::string_view>;

    /// A container that is being read, with what is being read in it.
    struct Frame {
        DictValue* container;
        const RoxStringRepN* key;  // of a dictionary; its entry holds it
        bool isDictionary;
        bool isLaterElement;  // of an array
    };
    /// A key that was read and waits for its value.
    struct Member {
        DictionaryFiller::Place* place;
        RoxStringRepN* key;
        bool isNew;  // else the name is there with the value null, and this holds the key
    };
    enum class Step { opened, closed, failed };

    bool Run(DictValue* container, bool isDictionary);
    Step ReadMembers(bool fBehindValue);
    Step ReadElements(bool fBehindValue);
    Bytes ReadKey(Bytes p, Dictionary& object, Member& member);
    Bytes FindKey(Bytes p, RoxStringRepN*& key);
    RoxStringRepN* KeyOf(Bytes bytes, size_t n);
    bool AddMember(Bytes p, Dictionary& object, const Member& member, DictValue* value);
    static void Drop(Dictionary& object, const Member& member);
    Step OpenMember(Bytes p, Dictionary& object, const Member& member);
    Step OpenElement(Bytes p, ArrayValue& array);
    Bytes AddScalarMember(Bytes p, Dictionary& object, const Member& member);
    Bytes AddScalarElement(Bytes p, ArrayValue& array);
    Bytes Fail(Bytes p, Words innermost);
    std::string_view ElementWrapper() const;

    RoxMempool* pMempoolM;
    InputPointer& cursorM;
    RoxString& errorM;
    Bytes pM;
    Bytes pEndM;
    RoxWorkStack<Frame, 32> stackM;
    KeyCache keyCacheM;
};

}  // namespace sorn
