// What JsonParser makes of yajl's events.
#include "rox/RoxAssert.h"
#include "sorn/dict/ArrayValue.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/dict/NullValue.h"
#include "sorn/dict/StringValue.h"
#include "sorn/json/JsonParser.h"

namespace sorn {

namespace {

constexpr char tooManyElementsG[] = "Too many elements in an array";
constexpr char tooManyValuesG[] = "Too many values of a name";
constexpr char tooLongG[] = "A text of 4 GiB or more";

/// Whether a text is short enough for a RoxString.
bool FFits(size_t length) {
    return static_cast<uint32_t>(length) == length;
}

JsonParser* ParserOf(void* context) {
    return static_cast<JsonParser*>(context);
}

}  // namespace

// Without yajl_integer and yajl_double, and with yajl_number, every number comes as its text.
const yajl_callbacks JsonParser::CALLBACKS = {
    OnNull,     OnBoolean, nullptr,  nullptr,      OnNumber,   OnString,
    OnStartMap, OnMapKey,  OnEndMap, OnStartArray, OnEndArray,
};

int JsonParser::OnNull(void* context) {
    JsonParser* const parser = ParserOf(context);
    RoxMempool* const pool = parser->pMempoolM;
    return parser->Add(ref<DictValue>(new (pool) NullValue(pool)));
}

int JsonParser::OnBoolean(void* context, int value) {
    return value != 0 ? ParserOf(context)->AddText("true", 4, false)
                      : ParserOf(context)->AddText("false", 5, false);
}

int JsonParser::OnNumber(void* context, const char* text, size_t length) {
    return ParserOf(context)->AddText(text, length, false);
}

int JsonParser::OnString(void* context, const unsigned char* bytes, size_t length) {
    return ParserOf(context)->AddText(bytes, length, true);
}

int JsonParser::OnMapKey(void* context, const unsigned char* bytes, size_t length) {
    JsonParser* const parser = ParserOf(context);
    if (!FFits(length)) return parser->Refuse(tooLongG);
    parser->currentKeyM = parser->keyTextsM.Get(parser->pMempoolM, bytes, static_cast<uint32_t>(length));
    return 1;
}

int JsonParser::OnStartMap(void* context) {
    JsonParser* const parser = ParserOf(context);
    RoxMempool* const pool = parser->pMempoolM;
    return parser->SetMap(ref<Dictionary>(new (pool) Dictionary(pool)));
}

int JsonParser::OnStartArray(void* context) {
    JsonParser* const parser = ParserOf(context);
    RoxMempool* const pool = parser->pMempoolM;
    return parser->SetArray(ref<ArrayValue>(new (pool) ArrayValue(pool)));
}

int JsonParser::OnEndMap(void* context) {
    return ParserOf(context)->RestorePreviousState();
}

int JsonParser::OnEndArray(void* context) {
    return ParserOf(context)->RestorePreviousState();
}

JsonParser::State JsonParser::GetState() const {
    State state = STATE_NONE;
    dictionaryStackM.PeekState(state);
    return state;
}

bool JsonParser::AddText(const void* bytes, size_t length, bool needQuotes) {
    if (!FFits(length)) return Refuse(tooLongG);
    RoxString text = RoxString::FromUtf8Bytes(pMempoolM, static_cast<unsigned>(length), bytes);
    return Add(ref<DictValue>(new (pMempoolM) StringValue(pMempoolM, std::move(text), needQuotes)));
}

bool JsonParser::Add(const ref<DictValue>& pDictValue) {
    RoxAssert(nullptr != pDictValue.get(), "__null != pDictValue.Get()");
    switch (GetState()) {
        case STATE_MAP:
            return AddToMap(pDictValue);
        case STATE_ARRAY:
            return AddToArray(pDictValue);
        case STATE_NONE:
            break;
    }
    return SetScalar();
}

bool JsonParser::AddToMap(const ref<DictValue>& value) {
    RoxAssert(!dictionaryStackM.IsEmpty(), "!dictionaryStackM.IsEmpty()");
    RoxAssert(nullptr != pCurrentMapM, "__null != pCurrentMapM");
    return pCurrentMapM->Add(currentKeyM, value) || Refuse(tooManyValuesG);
}

bool JsonParser::AddToArray(const ref<DictValue>& value) {
    RoxAssert(!dictionaryStackM.IsEmpty(), "!dictionaryStackM.IsEmpty()");
    RoxAssert(nullptr != pCurrentArrayM, "__null != pCurrentArrayM");
    return pCurrentArrayM->Add(value) || Refuse(tooManyElementsG);
}

bool JsonParser::SetScalar() {
    isJsonAMapM = false;
    return false;
}

bool JsonParser::SetMap(const ref<Dictionary>& dictionary) {
    if (dictionaryStackM.IsEmpty()) {
        hasTopM = true;
        *pResultM = dictionary;
    } else if (!Add(dictionary)) {
        return false;
    }
    pCurrentArrayM = nullptr;
    pCurrentMapM = dictionary.get();
    return dictionaryStackM.Push(nonRef<DictValue>(pCurrentMapM), STATE_MAP);
}

bool JsonParser::SetArray(const ref<ArrayValue>& array) {
    if (dictionaryStackM.IsEmpty()) {
        isJsonAMapM = false;
        return false;
    }
    if (!Add(array)) return false;
    pCurrentMapM = nullptr;
    pCurrentArrayM = array.get();
    return dictionaryStackM.Push(nonRef<DictValue>(pCurrentArrayM), STATE_ARRAY);
}

bool JsonParser::RestorePreviousState() {
    nonRef<DictValue> value;
    State state = STATE_NONE;
    if (!dictionaryStackM.Pop(value, state)) return false;
    pCurrentMapM = nullptr;
    pCurrentArrayM = nullptr;
    if (!dictionaryStackM.Peek(value, state)) return true;
    switch (state) {
        case STATE_MAP:
            pCurrentMapM = static_cast<Dictionary*>(value.Get());
            break;
        case STATE_ARRAY:
            pCurrentArrayM = static_cast<ArrayValue*>(value.Get());
            break;
        default:
            RoxAssertFail("0");
    }
    return true;
}

/// Cancels the parse for a reason other than what stands at the top.
bool JsonParser::Refuse(const char* words) {
    refusalM = words;
    return false;
}

}  // namespace sorn
