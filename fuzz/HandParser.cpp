// The parser of text in memory, for dictionaries. Invariants 1 to 5, 9 and 14.
//
// What is accepted is written to a text, compact and pretty, that is accepted and written as it was; where
// control bytes became escapes, from the second time on. A refusal has words.
#include <optional>
#include <string>

#include "fuzz/support/Check.h"
#include "fuzz/support/FuzzPool.h"
#include "fuzz/support/Texts.h"
#include "kelbaselib/InMemoryBytestream.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/json/JsonFormat.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size);

namespace {

/// Pretty text grows with the square of the depth.
constexpr size_t nPrettyG = 2048;

ref<sorn::Dictionary> Read(const void* data, size_t size, RoxString& error, RoxMempool* pool) {
    // An exact-size copy, so that an access beyond it is seen.
    const ref<rox::ByteBuffer> bytes = rox::ByteBuffer::New(pool, data, static_cast<uint32_t>(size));
    const ref<sorn::Dictionary> dictionary = sorn::Dictionary::FromJsonBytestring(bytes, error, pool);
    Check((dictionary != nullptr) == error.FEmpty(), "a verdict and its words differ");
    return dictionary;
}

/// Reads a text that was written and gives what is written then; nothing when it is refused, which happens
/// only where control bytes in keys became escapes, and two keys the same.
std::optional<std::string> Again(const std::string& text, RoxMempool* pool) {
    RoxString error;
    const ref<sorn::Dictionary> dictionary = Read(text.data(), text.size(), error, pool);
    if (dictionary != nullptr) return DictionaryText(*dictionary, pool);
    Check(error.View().find("Duplicate key: ") == 0 && FBrittle(text), "a written text is refused");
    return std::nullopt;
}

/// `text` is the compact text or the pretty one.
void CheckReadBack(const std::string& text, const std::string& compact, RoxMempool* pool) {
    const std::optional<std::string> again = Again(text, pool);
    if (!again) return;
    if (FBrittle(compact)) {
        // A key whose control byte became an escape sorts elsewhere, and stays there.
        Check(Again(*again, pool) == again, "a text does not settle");
    } else {
        Check(again == compact, "a text read back is written differently");
    }
}

}  // namespace

int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    FuzzPool pool;
    RoxString error("old words");
    const ref<sorn::Dictionary> dictionary =
        sorn::Dictionary::FromJson(data, static_cast<unsigned>(size), error, pool.Get());
    Check((dictionary != nullptr) == error.FEmpty(), "a verdict and its words differ");
    if (dictionary == nullptr) return 0;

    const std::string compact = DictionaryText(*dictionary, pool.Get());
    CheckReadBack(compact, compact, pool.Get());
    if (size <= nPrettyG) CheckReadBack(DictionaryText(*dictionary, pool.Get(), true), compact, pool.Get());

    kelbaselib::InMemoryBytestream sink(pool.Get());
    dictionary->ToJson(sink, sorn::JsonFormat(false));
    Check(std::string_view(reinterpret_cast<const char*>(sink.GetData()), sink.GetLength()) == compact,
          "a sink gets another text");
    return 0;
}
