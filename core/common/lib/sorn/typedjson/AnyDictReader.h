#pragma once

#include <cstdint>

#include "rox/RoxString.h"
#include "rox/RoxWorkStack.h"
#include "rox/ref.h"
#include "sorn/dict/Dict.h"
#include "sorn/typedjson/CursorText.h"
#include "sorn/typedjson/InputPointerBytesource.h"

namespace sorn {

/// Reads JSON into a Dict without a schema, with a stack of its own. Every scalar becomes a text. A map must
/// have a key; an element of an array may be missing, which is the empty text, and needs no comma before it.
/// An array leaves no trace but its values, and an array in an array is refused.
class AnyDictReader {
 public:
    AnyDictReader(RoxMempool* pool, InputPointerBytesource& cursor)
        : pMempoolM(pool), cursorM(cursor), textM(pool), stackM(pool) {}
    ~AnyDictReader();
    AnyDictReader(const AnyDictReader&) = delete;
    AnyDictReader& operator=(const AnyDictReader&) = delete;

    /// Reads a map into `dict`, which is made if it is null, or a scalar into `text`; `isMap` tells which.
    /// After a failure the map has what was read until then.
    bool ReadValue(bool& isMap, RoxString& text, ref<Dict>& dict);
    /// Reads a key with its value or values into `dict`.
    bool ReadField(Dict& dict);
    /// What was wrong, of the outermost operation alone; a literal.
    const char* Words() const { return pWordsM; }

 private:
    /// A map under way. The stack holds the references on all maps but the lowest.
    struct Frame {
        Dict* pDict;
        RoxStringRepN* pKey;  ///< of the values under way, with a hold of the frame's
        bool isArray;         ///< of the values
        bool isField;         ///< just a key of a caller's map
    };
    enum class Step : uint8_t { KEY, VALUE, BEHIND_VALUE, BEHIND_FIELD, DONE, FAILED };

    bool Run(Step step);
    Step ReadKey();
    Step ReadFieldValue();
    Step OpenMap();
    Step EndValue();
    Step EndField();
    Step AddMap();
    Step Fail(const char* fieldWords);
    void Push(Dict* dict, bool isField);
    void Pop();

    RoxMempool* pMempoolM;
    InputPointerBytesource& cursorM;
    CursorText textM;
    RoxWorkStack<Frame, 8> stackM;
    const char* pWordsM = "";
};

}  // namespace sorn
