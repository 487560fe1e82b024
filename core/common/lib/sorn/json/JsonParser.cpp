#include "sorn/json/JsonParser.h"

#include <cstdint>

#include "rox/RoxAssert.h"
#include "rox/RoxMempool.h"
#include "sorn/dict/DictValue.h"

namespace sorn {

namespace {

/// Bytes that are kept back at most, far below what a byte buffer holds.
constexpr size_t maxKeptG = size_t{1} << 30;

/// Sizes of blocks from here on are rounded up: by an eighth at most.
constexpr size_t coarseBlockG = size_t{1} << 15;

/// yajl's stack of open containers grows by 128 bytes at a time. Rounded, most of that finds its block large
/// enough, and the copying stays in proportion to the depth.
size_t RoundedUp(size_t size) {
    if (size < coarseBlockG || size > SIZE_MAX / 2) return size;
    size_t step = coarseBlockG / 8;
    while (size / step >= 16) step *= 2;
    return (size + step - 1) / step * step;
}

}  // namespace

const char JsonParser::ErrorMessageJsonIsNotAMap[] = "The JSON must start with a '{' character";

JsonParser::JsonParser(RoxMempool* pool)
    : allocFuncsM{Malloc, Realloc, Free, pool}, pMempoolM(pool), keptM(pool) {
    RoxAssert(nullptr != pMempoolM, "__null != pMempoolM");
}

JsonParser::~JsonParser() {
    if (handleM == nullptr) return;
    if (!isCompleteM) EndParse();
    yajl_free(handleM);
}

void JsonParser::BeginParse(ref<Dictionary>& result) {
    RoxAssert(handleM == nullptr, "!wasBeginParseCalled");
    pResultM = &result;
    handleM = yajl_alloc(&CALLBACKS, &allocFuncsM, this);
}

void JsonParser::BeginParse() {
    RoxAssert(handleM == nullptr, "!wasBeginParseCalled");
    handleM = yajl_alloc(nullptr, &allocFuncsM, nullptr);
}

bool JsonParser::ParseChunk(const char* data, size_t size) {
    RoxAssert(handleM != nullptr, "wasParsingStarted");
    const bool fInsideToken = !unfinishedM.Read(data, size);
    if (FKept(data, size, fInsideToken)) return true;
    statusM = FeedKept();
    if (statusM == yajl_status_ok) statusM = Feed(data, size);
    nHeldM = unfinishedM.GetLength();
    // yajl waits for what follows a number, but at the top it is refused whatever follows.
    if (statusM == yajl_status_ok && pResultM != nullptr && !hasTopM && unfinishedM.FEndsInDigit()) {
        statusM = Feed(" ", 1);
    }
    ErrorToString(statusM);
    return statusM == yajl_status_ok;
}

/// yajl looks at all bytes of an unfinished token again with each feed. So what comes inside a token waits
/// here until it is as long as what yajl has of the token: the token is then looked at a bounded number of
/// times per byte, whatever the chunks. All other text goes to yajl at once. True when the chunk waits.
bool JsonParser::FKept(const char* data, size_t size, bool fInsideToken) {
    const size_t nKept = keptM.GetLength();
    if (statusM != yajl_status_ok || !fInsideToken) return false;
    if (size >= nHeldM || nKept >= nHeldM - size || size > maxKeptG - nKept) return false;
    keptM.AppendBytes(data, static_cast<unsigned>(size));
    return true;
}

yajl_status JsonParser::FeedKept() {
    if (keptM.GetLength() == 0) return yajl_status_ok;
    const yajl_status status = Feed(reinterpret_cast<const char*>(keptM.GetData()), keptM.GetLength());
    keptM.Clear();
    return status;
}

yajl_status JsonParser::Feed(const char* data, size_t size) {
    return yajl_parse(handleM, reinterpret_cast<const unsigned char*>(data), size);
}

bool JsonParser::EndParse() {
    if (!isCompleteM) {
        RoxAssert(handleM != nullptr, "wasBeginParseCalled");
        FeedKept();  // a failure stays in yajl, which tells it again
        statusM = yajl_complete_parse(handleM);
        // yajl overlooks a string behind the top value that never ends; once closed it is seen.
        if (statusM == yajl_status_ok && unfinishedM.FInString()) statusM = Feed("\"", 1);
        ErrorToString(statusM);
        isCompleteM = true;
    }
    return statusM == yajl_status_ok;
}

void JsonParser::DropErrorMessage() {
    if (errorMessageM != nullptr && errorMessageM != ErrorMessageJsonIsNotAMap && errorMessageM != refusalM) {
        yajl_free_error(handleM, reinterpret_cast<unsigned char*>(const_cast<char*>(errorMessageM)));
    }
    errorMessageM = nullptr;
}

void JsonParser::ErrorToString(yajl_status status) {
    DropErrorMessage();
    if (status == yajl_status_ok) return;
    if (refusalM != nullptr) {
        errorMessageM = refusalM;
        return;
    }
    if (status == yajl_status_client_canceled) {
        RoxAssert(!isJsonAMapM, "!isJsonAMapM");
        errorMessageM = ErrorMessageJsonIsNotAMap;
    }
    // Over the constant, too: callers see yajl's words about a parse that was cancelled.
    errorMessageM = reinterpret_cast<const char*>(yajl_get_error(handleM, 0, nullptr, 0));
}

void* JsonParser::Malloc(void* context, size_t size) {
    RoxAssert(nullptr != context, "__null != context");
    return static_cast<RoxMempool*>(context)->Malloc(size);
}

void* JsonParser::Realloc(void* context, void* p, size_t size) {
    RoxAssert(nullptr != context, "__null != context");
    if (p == nullptr) return Malloc(context, size);
    if (size == 0) {
        Free(context, p);
        return nullptr;
    }
    return static_cast<RoxMempool*>(context)->Realloc(p, RoundedUp(size));
}

void JsonParser::Free(void* context, void* p) {
    RoxAssert(nullptr != context, "__null != context");
    static_cast<RoxMempool*>(context)->Free(p);
}

JsonParser::DictStack::~DictStack() {
    while (pTopM != nullptr) {
        Block* const block = pTopM;
        pTopM = block->pBelow;
        RoxMempool::FreeIn(nullptr, block);
    }
}

bool JsonParser::DictStack::Push(nonRef<DictValue> value, State state) {
    if (!value) return false;
    static_assert(alignof(DictValue) > stateMaskG);
    if (pTopM == nullptr || pTopM->nNodes == nNodesG) {
        Block* const block = static_cast<Block*>(RoxMempool::MallocIn(nullptr, sizeof(Block)));
        block->pBelow = pTopM;
        block->nNodes = 0;
        pTopM = block;
    }
    pTopM->vNode[pTopM->nNodes++] = reinterpret_cast<Node>(value.Get()) | static_cast<Node>(state);
    return true;
}

bool JsonParser::DictStack::Peek(nonRef<DictValue>& value, State& state) const {
    return PeekDictValue(value) && PeekState(state);
}

bool JsonParser::DictStack::PeekDictValue(nonRef<DictValue>& value) const {
    if (pTopM == nullptr) return false;
    value = reinterpret_cast<DictValue*>(Top() & ~stateMaskG);
    return true;
}

bool JsonParser::DictStack::PeekState(State& state) const {
    if (pTopM == nullptr) return false;
    state = static_cast<State>(Top() & stateMaskG);
    return true;
}

bool JsonParser::DictStack::Pop(nonRef<DictValue>& value, State& state) {
    if (!Peek(value, state)) return false;
    if (--pTopM->nNodes != 0) return true;
    Block* const block = pTopM;
    pTopM = block->pBelow;
    RoxMempool::FreeIn(nullptr, block);
    return true;
}

}  // namespace sorn
