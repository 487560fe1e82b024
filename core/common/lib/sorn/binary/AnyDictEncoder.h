#pragma once

#include <cstdint>

#include "rox/RoxWorkStack.h"
#include "sorn/binary/ReverseBuffer.h"
#include "sorn/dict/DictionaryEntries.h"
#include "sorn/dict/LazyBody.h"

namespace sorn {

/// Writes dictionaries without a schema from their end to their begin, with a stack of its own instead of
/// recursion: the names in descending order, the values of a name from the last one down. Sees values as Dict
/// does. One thread at a time.
class AnyDictEncoder {
 public:
    /// Writes into the buffer; the stack may grow in the pool, where the words for bodies that are nested too
    /// deeply are made, too.
    AnyDictEncoder(RoxMempool* pool, ReverseBuffer& out)
        : pMempoolM(pool), outM(out), namesM(pool), stackM(pool) {}
    ~AnyDictEncoder();

    /// The entries of a dictionary.
    void Body(const Dictionary& dictionary);
    /// The name and the values of one entry; no values for a name that the dictionary has not got.
    void Entry(const Dictionary& dictionary, const RoxString& name);
    /// One value, null for none.
    void Value(DictValue* value);

 private:
    using Name = DictionaryEntries::Name;

    /// What stands before the bytes of a frame.
    enum Form : uint8_t {
        VALUE,  ///< length and tag of a value; each entry has its own
        BODY,   ///< nothing; each entry has its own
        ENTRY,  ///< nothing, for the only entry neither
    };

    /// A dictionary under way. The names that are left are the topmost ones of `namesM`.
    struct Frame {
        uint32_t nNames;       ///< names left, the one under way included
        uint32_t nValues;      ///< values of the name under way that are left
        size_t endOfEntry;     ///< bytes behind the entry under way
        size_t endOfBody;      ///< bytes behind the dictionary
        RoxCore* pHeld;        ///< what keeps the dictionary alive, or null
        uint32_t nLazyLevels;  ///< lazy bodies around
        bool fInEntry;
        Form form;
    };

    void Run();
    void StepEntry(Frame& frame);
    void WriteValue(DictValue* value);
    void OpenLazyBody(const DictValue& value, uint32_t nLazyLevels, Form form);
    void Open(const Dictionary& dictionary, RoxCore* held, uint32_t nLazyLevels, Form form);
    void WriteHead(size_t end, unsigned char tag);
    void WriteText(const char* bytes, uint32_t n, unsigned char tag);

    RoxMempool* pMempoolM;
    ReverseBuffer& outM;
    RoxWorkStack<Name, 32> namesM;
    RoxWorkStack<Frame, 4> stackM;
};

}  // namespace sorn
