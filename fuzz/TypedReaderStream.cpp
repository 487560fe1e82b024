// The reader of typed text from a stream. Invariants 1 to 4, 6 to 9 and 13.
//
// Verdict, words and record are those of the same text in memory, whatever the pieces that the input's head
// tells; lazy bodies keep their bytes, captured across pieces. A stream that lies in memory counts the same
// blocks as one that is read.
#include <algorithm>
#include <string>

#include "fuzz/support/Check.h"
#include "fuzz/support/FuzzPool.h"
#include "fuzz/support/PiecedInput.h"
#include "fuzz/support/Texts.h"
#include "fuzz/support/TypedRead.h"
#include "sorn/typedjson/InputPointerBytesource.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size);

namespace {

void CheckSame(const TypedRead& one, const TypedRead& other, RoxMempool* pool) {
    Check(one.isGood == other.isGood, "the verdict on a stream differs");
    Check(one.words == other.words, "the words about a stream differ");
    if (!one.isGood) return;
    Check(one.record->structId == other.record->structId, "the struct from a stream differs");
    Check(TypedText(*one.record, pool) == TypedText(*other.record, pool), "the record from a stream differs");
    Check(BinaryForm(*one.record, pool) == BinaryForm(*other.record, pool),
          "the record from a stream has another binary form");
}

/// The text behind so many blanks that the end of a block may lie in it.
std::string BehindBlanks(const PiecedInput& input) {
    constexpr unsigned nBlockG = sorn::InputPointerBytesource::blockBytesG;
    const unsigned nBehind = input.Choice() % 128;
    std::string text(input.Choice() < 128 ? 0 : nBlockG - std::min(nBehind, nBlockG), ' ');
    text.append(reinterpret_cast<const char*>(input.Text()), input.NText());
    return text;
}

}  // namespace

int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    FuzzPool pool;
    const PiecedInput input(data, size);
    const TypedRead memory = TypedRead::OfMemory(input.Text(), input.NText(), pool.Get());
    CheckSame(TypedRead::OfSource(input, pool.Get()), memory, pool.Get());

    const std::string text = BehindBlanks(input);
    const TypedRead inMemory = TypedRead::OfMemoryStream(text.data(), text.size(), pool.Get());
    CheckSame(inMemory, memory, pool.Get());
    const auto* bytes = reinterpret_cast<const uint8_t*>(text.data());
    const TypedRead blocks = TypedRead::OfSource(PiecedInput::Whole(bytes, text.size()), pool.Get());
    CheckSame(blocks, memory, pool.Get());
    Check(inMemory.nRead == blocks.nRead, "a stream in memory is read in other blocks");
    return 0;
}
