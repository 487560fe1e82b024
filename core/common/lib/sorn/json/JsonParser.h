#pragma once

#include <yajl/yajl_parse.h>

#include <cstddef>
#include <cstdint>

#include "rox/RoxString.h"
#include "rox/nonRef.h"
#include "rox/ref.h"
#include "sorn/dict/ByteBuffer.h"
#include "sorn/json/KeyTexts.h"
#include "sorn/json/UnfinishedToken.h"

class RoxMempool;

namespace sorn {

class ArrayValue;
class Dictionary;
class DictValue;

/// Builds a dictionary from JSON text that arrives in chunks. Syntax and the decoding of strings are yajl's:
/// real JSON, valid UTF-8, one object at the top. Numbers stay text; a key that comes twice gives its name
/// two values. However the text is cut into chunks, the verdict and the tree are the same, and the cost is in
/// proportion to the text; nesting takes no thread stack.
///
/// A parser serves one parse, on one thread. Values, the words of a failure and yajl's memory lie in the
/// pool.
class JsonParser {
 public:
    /// What the innermost open container is.
    enum State { STATE_NONE = 0, STATE_MAP = 1, STATE_ARRAY = 2 };

    /// The open containers, the innermost on top. It holds no reference on them: their parents and the
    /// caller's result do. The nodes lie on the general heap, many to a block, for a text may open a
    /// container with every byte.
    class DictStack {
     public:
        DictStack() = default;
        virtual ~DictStack();
        DictStack(const DictStack&) = delete;
        DictStack& operator=(const DictStack&) = delete;

        /// False, and nothing done, for a null value.
        bool Push(nonRef<DictValue> value, State state);
        // False when the stack is empty; what is asked for stays as it was then.
        bool Peek(nonRef<DictValue>& value, State& state) const;
        bool PeekDictValue(nonRef<DictValue>& value) const;
        bool PeekState(State& state) const;
        bool Pop(nonRef<DictValue>& value, State& state);
        bool IsEmpty() const { return pTopM == nullptr; }

     private:
        /// A container's address with its state in the low bits, which an address has free.
        using Node = uintptr_t;
        static constexpr Node stateMaskG = 3;
        static constexpr unsigned nNodesG = 510;
        struct Block {
            Block* pBelow;
            unsigned nNodes;  // never 0
            Node vNode[nNodesG];
        };
        Node Top() const { return pTopM->vNode[pTopM->nNodes - 1]; }

        Block* pTopM = nullptr;
    };

    /// The pool must not be null and must outlive the parser.
    explicit JsonParser(RoxMempool* pool);
    /// Ends a parse that was begun and not ended. The words of a failure stay in the pool.
    virtual ~JsonParser();
    JsonParser(const JsonParser&) = delete;
    JsonParser& operator=(const JsonParser&) = delete;

    /// Begins a parse into `result`, which takes the dictionary as soon as the text opens it and must keep it
    /// until the parse has ended. Once only.
    void BeginParse(ref<Dictionary>& result);
    /// Begins a check of the syntax alone: no value is built, and the top may be any value.
    void BeginParse();
    /// Feeds a chunk of any size. False when the text is refused so far, and on every later call. Bytes
    /// inside of a token that the chunks before have begun, a string, a number or a word, may wait until they
    /// are as many as the token had up to there: a refusal among them comes that late, at the end of the
    /// parse at the latest.
    bool ParseChunk(const char* data, size_t size);
    /// Ends the parse: whether the text is whole and right. May be called again, with the same answer.
    bool EndParse();

    /// Why the last operation failed, null when it did not; holds until the next operation.
    const char* GetErrorMessage() const { return errorMessageM; }
    /// Gives the memory of those words back to the pool: for those who do not want to leave them there.
    void DropErrorMessage();

    /// What yajl calls for each event, in its order; null where it is to do without.
    static const yajl_callbacks CALLBACKS;
    /// "The JSON must start with a '{' character"; yajl's own words about such a text replace it.
    static const char ErrorMessageJsonIsNotAMap[];

 private:
    static void* Malloc(void* context, size_t size);
    static void* Realloc(void* context, void* p, size_t size);
    static void Free(void* context, void* p);

    static int OnNull(void* context);
    static int OnBoolean(void* context, int value);
    static int OnNumber(void* context, const char* text, size_t length);
    static int OnString(void* context, const unsigned char* bytes, size_t length);
    static int OnStartMap(void* context);
    static int OnMapKey(void* context, const unsigned char* bytes, size_t length);
    static int OnEndMap(void* context);
    static int OnStartArray(void* context);
    static int OnEndArray(void* context);

    State GetState() const;
    bool AddText(const void* bytes, size_t length, bool needQuotes);
    bool Add(const ref<DictValue>& pDictValue);
    bool AddToMap(const ref<DictValue>& value);
    bool AddToArray(const ref<DictValue>& value);
    bool SetScalar();
    bool SetMap(const ref<Dictionary>& dictionary);
    bool SetArray(const ref<ArrayValue>& array);
    bool RestorePreviousState();
    bool Refuse(const char* words);
    void ErrorToString(yajl_status status);
    bool FKept(const char* data, size_t size, bool fInsideToken);
    yajl_status Feed(const char* data, size_t size);
    yajl_status FeedKept();

    yajl_alloc_funcs allocFuncsM;
    yajl_handle handleM = nullptr;
    yajl_status statusM = yajl_status_error;  // a parser that was never started has failed
    const char* errorMessageM = nullptr;
    bool isCompleteM = false;
    RoxMempool* pMempoolM;
    ref<Dictionary>* pResultM = nullptr;
    DictStack dictionaryStackM;
    Dictionary* pCurrentMapM = nullptr;
    ArrayValue* pCurrentArrayM = nullptr;
    RoxString currentKeyM;
    bool isJsonAMapM = true;

    bool hasTopM = false;            // the text has opened its top container
    const char* refusalM = nullptr;  // constant words, when it was this class that refused a map's text
    size_t nHeldM = 0;               // bytes of an unfinished token that yajl looks at again with each feed
    UnfinishedToken unfinishedM;     // as of the last chunk, whether yajl has it or not
    ByteBuffer keptM;                // bytes inside that token which yajl has not been given yet
    KeyTexts keyTextsM;
};

}  // namespace sorn
