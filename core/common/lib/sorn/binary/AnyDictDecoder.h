#pragma once

#include <cstdint>

#include "rox/RoxString.h"
#include "rox/RoxWorkStack.h"
#include "rox/ref.h"
#include "sorn/convert/ObjectBudget.h"
#include "sorn/dict/Dict.h"

namespace sorn {

/// Reads dictionaries without a schema, with a stack of its own instead of recursion. Looser than what is
/// written: name and values of an entry may come in any order. One reader makes one reading.
class AnyDictDecoder {
 public:
    /// Everything is made in the pool and counted against the budget.
    AnyDictDecoder(RoxMempool* pool, ObjectBudget& budget) : pMempoolM(pool), budgetM(budget), stackM(pool) {}
    ~AnyDictDecoder();

    /// Reads a value that fills the range: text, or a dictionary, which is made when `dict` is null and else
    /// filled up. False for bad bytes: `dict` may have got values until then when it was not null.
    bool Value(const unsigned char* begin, const unsigned char* end, bool& fText, RoxString& text,
               ref<Dict>& dict);
    /// Reads one entry into a dictionary.
    bool Entry(const unsigned char* begin, const unsigned char* end, Dict& dict);

 private:
    /// A dictionary under way: a range of entries, and the entry in it. Holds a reference on the dictionary
    /// and on the entry's name.
    struct Frame {
        Dict* pDict;
        RoxStringRepN* pName;           ///< of the entry under way; null for the empty name
        const unsigned char* pInEntry;  ///< in the entry under way; null for none
        const unsigned char* pEntryEnd;
        const unsigned char* pInBody;  ///< behind the entry under way
        const unsigned char* pBodyEnd;
    };
    /// A tag with its length and bytes.
    struct Item {
        unsigned char tag;
        const unsigned char* begin;
        const unsigned char* end;
    };

    bool Run();
    bool Step();
    bool StepEntry();
    bool OpenEntry(Frame& frame, const unsigned char* begin, const unsigned char* end) const;
    bool StoreValue(const unsigned char* begin, const unsigned char* end);
    bool CloseBody();
    void Push(const ref<Dict>& dict, const unsigned char* begin, const unsigned char* end);
    void PopFrame();
    ref<Dict> NewDict();
    static bool ReadItem(const unsigned char*& p, const unsigned char* end, Item& item);
    bool ReadText(const unsigned char* begin, const unsigned char* end, RoxString& text) const;

    RoxMempool* pMempoolM;
    ObjectBudget& budgetM;
    RoxWorkStack<Frame, 8> stackM;
};

}  // namespace sorn
