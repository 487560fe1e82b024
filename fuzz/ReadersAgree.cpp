// One text and all three readers of JSON. Invariants 1 to 5, 9, 13 and 14.
//
// The parser of text in memory is the widest but for what it says about duplicates: it accepts what the
// parser of chunks accepts, and gives the same tree, unless the text has escapes that one of them decodes or
// white space that only yajl knows. The typed reader walks over every text that it accepts, but for a "type"
// that is no scalar. Where the typed reader and the road through a dictionary both give a record, it is the
// same, unless it has any-dict or lazy fields, whose texts they keep differently, or objects whose "type" is
// not the declared one, which only the dictionary's road believes.
#include <string>
#include <string_view>

#include "fuzz/support/Check.h"
#include "fuzz/support/FuzzPool.h"
#include "fuzz/support/RecordContents.h"
#include "fuzz/support/Texts.h"
#include "fuzz/support/TypedRead.h"
#include "sorn/convert/DictionarySornObject.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/json/JsonParser.h"
#include "sorn/model/Schema.h"
#include "sorn/typedjson/InputPointerBytesource.h"
#include "sorn/typedjson/JsonSornObject.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size);

namespace {

/// The dictionary by yajl, or null.
ref<sorn::Dictionary> ParseChunk(std::string_view text, RoxMempool* pool) {
    ref<sorn::Dictionary> result;
    sorn::JsonParser parser(pool);
    parser.BeginParse(result);
    parser.ParseChunk(text.data(), text.size());
    const bool isGood = parser.EndParse();
    parser.DropErrorMessage();
    return isGood ? result : nullptr;
}

/// Whether the reader's first pass, which builds nothing, accepts the text's object.
bool FWalks(std::string_view text, RoxMempool* pool) {
    sorn::InputPointerBytesource cursor(reinterpret_cast<const unsigned char*>(text.data()),
                                        static_cast<unsigned>(text.size()));
    RoxString lost;
    return sorn::JsonSornObject(pool).Unmarshal(0, cursor, nullptr, nullptr, lost);
}

void CheckDictionaries(std::string_view text, const ref<sorn::Dictionary>& byHand, const RoxString& error,
                       RoxMempool* pool) {
    const ref<sorn::Dictionary> byChunks = ParseChunk(text, pool);
    const bool isPlain = text.find("\\u") == text.npos && text.find_first_of("\v\f") == text.npos;
    if (byChunks == nullptr || !isPlain) return;
    if (byHand == nullptr) {
        Check(error.View().find("Duplicate key: ") == 0, "the parser in memory refuses what yajl accepts");
        return;
    }
    Check(DictionaryText(*byHand, pool) == DictionaryText(*byChunks, pool),
          "the trees of the two parsers differ");
}

void CheckRecords(const ref<sorn::Dictionary>& dictionary, const sorn::SornObject& typed, RoxMempool* pool) {
    sorn::DictionarySornObject converter(pool, sorn::Schema::vStructDefG, sorn::Schema::nStructDefG);
    ref<sorn::SornObject> converted;
    RoxString error;
    const bool isGood = converter.DictionaryToSornObject(dictionary, 0, converted, error);
    Check(isGood == error.FEmpty(), "a verdict and its words differ");
    if (!isGood) return;
    Check(converted->structId == typed.structId, "the roads give records of different structs");
    const RecordContents contents = RecordContents::Of(converted);
    if (contents.hasAnyDict || contents.hasLazy || contents.hasForeignObject) return;
    Check(TypedText(*converted, pool) == TypedText(typed, pool), "the roads give different records");
}

}  // namespace

int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    FuzzPool pool;
    const std::string_view text(reinterpret_cast<const char*>(data), size);
    RoxString error;
    const ref<sorn::Dictionary> byHand =
        sorn::Dictionary::FromJson(data, static_cast<unsigned>(size), error, pool.Get());
    CheckDictionaries(text, byHand, error, pool.Get());
    const TypedRead typed = TypedRead::OfMemory(data, size, pool.Get());
    if (byHand == nullptr) return 0;
    Check(FWalks(text, pool.Get()) || text.find("type") != text.npos,
          "the typed reader does not walk over what the parser in memory accepts");
    if (typed.isGood && text.find("\\u") == text.npos) CheckRecords(byHand, *typed.record, pool.Get());
    return 0;
}
