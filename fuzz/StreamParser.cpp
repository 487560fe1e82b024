// The parser of text that arrives in chunks. Invariants 1 to 4, 9, 13 and 14.
//
// Verdict and tree are the same in one chunk, in the chunks that the input's head tells, and from a source; a
// refusal has words; the check of syntax alone agrees.
#include <algorithm>
#include <string>

#include "fuzz/support/Check.h"
#include "fuzz/support/FuzzPool.h"
#include "fuzz/support/PieceSource.h"
#include "fuzz/support/PiecedInput.h"
#include "fuzz/support/Texts.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/json/JsonParser.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size);

namespace {

/// Feeds the text in the input's pieces, or whole. The verdict is the one at the end.
bool Feed(const PiecedInput& input, bool isWhole, sorn::JsonParser& parser) {
    const char* text = reinterpret_cast<const char*>(input.Text());
    size_t nLeft = input.NText();
    bool isGood = true;
    for (size_t number = 0; nLeft > 0 && isGood; ++number) {
        const size_t n = isWhole ? nLeft : std::min<size_t>(nLeft, input.PieceSize(number));
        isGood = parser.ParseChunk(text, n);
        Check(isGood == (parser.GetErrorMessage() == nullptr), "a chunk's verdict and its words differ");
        text += n;
        nLeft -= n;
    }
    const bool isGoodAtEnd = parser.EndParse();
    Check(isGood || !isGoodAtEnd, "a text that was refused is accepted at its end");
    Check(parser.EndParse() == isGoodAtEnd, "a second end has another verdict");
    const char* const words = parser.GetErrorMessage();
    Check(isGoodAtEnd ? words == nullptr : words != nullptr && words[0] != 0,
          "a verdict and its words differ");
    parser.DropErrorMessage();
    return isGoodAtEnd;
}

/// The text's dictionary, or null.
ref<sorn::Dictionary> Parse(const PiecedInput& input, bool isWhole, RoxMempool* pool) {
    ref<sorn::Dictionary> result;
    sorn::JsonParser parser(pool);
    parser.BeginParse(result);
    if (!Feed(input, isWhole, parser)) return nullptr;
    Check(result != nullptr, "a text is accepted without a result");
    return result;
}

ref<sorn::Dictionary> ParseSource(const PiecedInput& input, RoxMempool* pool) {
    PieceSource::Counts counts;
    RoxString error;
    ref<sorn::Dictionary> result =
        sorn::Dictionary::FromJsonBytesource(PieceSource::New(input, counts), error, pool);
    Check(counts.nSources == 1 && counts.nReleases == 1, "the source is not released once");
    if (!error.FEmpty()) result = nullptr;
    return result;
}

bool FSyntax(const PiecedInput& input, RoxMempool* pool) {
    sorn::JsonParser parser(pool);
    parser.BeginParse();
    return Feed(input, false, parser);
}

/// White space is yajl's here, which has two bytes more.
bool FOpensWithBrace(const PiecedInput& input) {
    const std::string_view text(reinterpret_cast<const char*>(input.Text()), input.NText());
    const size_t first = text.find_first_not_of("\t\n\v\f\r ");
    return first != text.npos && text[first] == '{';
}

}  // namespace

int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    FuzzPool pool;
    const PiecedInput input(data, size);
    const ref<sorn::Dictionary> whole = Parse(input, true, pool.Get());
    const ref<sorn::Dictionary> pieces = Parse(input, false, pool.Get());
    const ref<sorn::Dictionary> source = ParseSource(input, pool.Get());
    const bool isGood = whole != nullptr;
    Check((pieces != nullptr) == isGood, "the verdict depends on the chunks");
    Check((source != nullptr) == isGood, "the verdict of a source differs");
    Check((FSyntax(input, pool.Get()) && FOpensWithBrace(input)) == isGood, "the check of syntax differs");
    if (!isGood) return 0;

    const std::string text = DictionaryText(*whole, pool.Get());
    Check(DictionaryText(*pieces, pool.Get()) == text, "the tree depends on the chunks");
    Check(DictionaryText(*source, pool.Get()) == text, "the tree of a source differs");
    return 0;
}
