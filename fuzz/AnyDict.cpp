// The binary form of a dictionary without a schema. Invariants 1 to 5, 9 and 14.
//
// What decodes is written to bytes that decode to the same dictionary and the same bytes; its text can be
// read by the text parser and is then written as it was, but for control bytes, which become escapes.
#include <string>
#include <string_view>

#include "fuzz/support/Check.h"
#include "fuzz/support/FuzzPool.h"
#include "fuzz/support/Texts.h"
#include "sorn/binary/ProtoBuf.h"
#include "sorn/binary/ProtoBufByteOutputStream.h"
#include "sorn/dict/Dict.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/model/Schema.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size);

namespace {

std::string BytesOf(const sorn::Dict& dict, const sorn::ProtoBuf& codec) {
    sorn::ProtoBufByteOutputStream stream;
    codec.MarshalAnyDict(&dict, stream);
    const unsigned char* data = nullptr;
    unsigned length = 0;
    stream.Finish(data, length);
    return length == 0 ? std::string() : std::string(reinterpret_cast<const char*>(data), length);
}

/// Reads a whole range; null when it is refused.
ref<sorn::Dict> Read(const uint8_t* data, size_t size, const sorn::ProtoBuf& codec) {
    const unsigned char* cursor = data;
    ref<sorn::Dict> dict;
    const bool isGood = codec.UnmarshalAnyDict(&cursor, data + size, &dict);
    Check(cursor == data + size, "the cursor does not stand at the end");
    Check(isGood == (dict != nullptr), "verdict and result differ");
    return dict;
}

void CheckText(const sorn::Dict& dict, RoxMempool* pool) {
    const std::string text = DictionaryText(*dict.GetDictionary(), pool);
    RoxString error;
    const ref<sorn::Dictionary> again = sorn::Dictionary::FromJson(
        RoxString::FromUtf8Bytes(pool, static_cast<unsigned>(text.size()), text.data()), error, pool);
    if (again != nullptr) {
        // A name whose control byte became an escape sorts elsewhere.
        Check(DictionaryText(*again, pool) == text || FBrittle(text),
              "a text read back is written differently");
        return;
    }
    // A control byte and the six bytes of its escape are written alike: such names fall together.
    Check(error.View().find("Duplicate key: ") == 0 && FBrittle(text), "a written text is refused");
}

}  // namespace

int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    FuzzPool pool;
    const sorn::ProtoBuf codec(pool.Get(), sorn::Schema::vStructDefG, sorn::Schema::nStructDefG);
    const ref<sorn::Dict> dict = Read(data, size, codec);

    // The same with a length in front, of which more is tested: where it ends is told by the bytes.
    const unsigned char* cursor = data;
    ref<sorn::Dict> withLength;
    if (codec.UnmarshalAnyDictWithLength(&cursor, data + size, &withLength)) {
        Check(cursor <= data + size && cursor > data, "the cursor left the range");
        BytesOf(*withLength, codec);
    }
    if (dict == nullptr) return 0;

    const std::string first = BytesOf(*dict, codec);
    const ref<rox::ByteBuffer> bytes =
        rox::ByteBuffer::New(pool.Get(), first.data(), static_cast<uint32_t>(first.size()));
    const ref<sorn::Dict> again = Read(bytes->GetData(), bytes->GetLength(), codec);
    Check(again != nullptr, "written bytes are refused");
    Check(BytesOf(*again, codec) == first, "a dictionary read back is written differently");
    Check(*again == *dict, "a dictionary read back has another text");
    CheckText(*dict, pool.Get());
    return 0;
}
