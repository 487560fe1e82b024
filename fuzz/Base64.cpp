// Base64. Invariants 1, 2, 9 and 14.
//
// Verdict and bytes are those of a small decoder that goes by bits; any bytes come back from their text, and
// so do the bytes of a text that was accepted; a code set of the input's own is judged rightly.
#include "sorn/dict/Base64.h"

#include <algorithm>
#include <optional>
#include <string>
#include <string_view>

#include "fuzz/support/Check.h"
#include "fuzz/support/FuzzPool.h"
#include "fuzz/support/Texts.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size);

namespace {

constexpr size_t nCodesG = 64;

/// A text is groups of four. Codes stand in front; in the last group a terminator may end the bytes at its
/// third place, whatever follows it, or at its fourth.
std::optional<std::string> Expected(std::string_view text, std::string_view codeSet, char terminator) {
    if (text.size() % 4 != 0) return std::nullopt;
    size_t nCodes = 0;
    while (nCodes < text.size() && codeSet.find(text[nCodes]) != codeSet.npos) ++nCodes;
    if (nCodes != text.size()) {
        const bool isLastGroup = text.size() - nCodes <= 2;
        if (!isLastGroup || text[nCodes] != terminator) return std::nullopt;
    }
    std::string bytes(nCodes * 6 / 8, 0);
    for (size_t bit = 0; bit < bytes.size() * 8; ++bit) {
        const size_t code = codeSet.find(text[bit / 6]);
        if ((code >> (5 - bit % 6) & 1) != 0)
            bytes[bit / 8] = static_cast<char>(bytes[bit / 8] | 0x80 >> bit % 8);
    }
    return bytes;
}

void CheckSet(const sorn::Base64& codec, std::string_view codeSet, char terminator, std::string_view input,
              RoxMempool* pool) {
    // Exact-size copies, so that an access beyond them is seen.
    const ref<rox::ByteBuffer> bytes =
        rox::ByteBuffer::New(pool, input.data(), static_cast<uint32_t>(input.size()));
    ref<rox::ByteBuffer> decoded = bytes;
    const bool isGood = codec.Decode(pool, bytes, decoded);
    const std::optional<std::string> expected = Expected(input, codeSet, terminator);
    Check(isGood == expected.has_value(), "the verdict on a text is wrong");
    if (isGood) {
        Check(View(decoded) == *expected, "the bytes of a text are wrong");
    } else {
        Check(decoded == bytes, "a refusal touches the result");
    }

    ref<rox::ByteBuffer> text;
    ref<rox::ByteBuffer> back;
    codec.Encode(pool, bytes, text);
    Check(codec.Decode(pool, text, back) && View(back) == input, "bytes do not come back");
    Check(Expected(View(text), codeSet, terminator) == input, "the text of bytes is wrong");
}

bool FGoodSet(std::string_view codeSet, char terminator) {
    for (size_t i = 0; i < codeSet.size(); ++i) {
        if (codeSet[i] == terminator || codeSet.find(codeSet[i], i + 1) != codeSet.npos) return false;
    }
    return codeSet.size() == nCodesG;
}

}  // namespace

int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    FuzzPool pool;
    const std::string_view input(reinterpret_cast<const char*>(data), size);
    CheckSet({sorn::Base64::DEFAULT_CODE_SET, sorn::Base64::DEFAULT_TERMINATOR},
             sorn::Base64::DEFAULT_CODE_SET, static_cast<char>(sorn::Base64::DEFAULT_TERMINATOR), input,
             pool.Get());
    CheckSet({sorn::Base64::YAHOO_CODE_SET, sorn::Base64::YAHOO_TERMINATOR}, sorn::Base64::YAHOO_CODE_SET,
             static_cast<char>(sorn::Base64::YAHOO_TERMINATOR), input, pool.Get());
    if (input.empty()) return 0;

    // The first byte as the terminator, up to 64 bytes behind it as the code set, the rest as the text.
    // The NUL behind a set that is one short is a code like any other; one in front of it ends the set.
    std::string codeSet(input.substr(1, nCodesG));
    const sorn::Base64 own(codeSet.c_str(), data[0]);
    if (codeSet.size() == nCodesG - 1) codeSet += '\0';
    const bool isGood = FGoodSet(codeSet, input[0]) && codeSet.find('\0') >= nCodesG - 1;
    Check(own.FCodeSetBad() != isGood, "a code set is judged wrongly");
    if (isGood && size > nCodesG) CheckSet(own, codeSet, input[0], input.substr(1 + nCodesG), pool.Get());
    return 0;
}
