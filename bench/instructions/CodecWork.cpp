// Runs one codec once over one input: codec_work SHAPE CODEC SIZE, for bench/instructions.py. Under callgrind
// only that run is counted (--instr-atstart=no), with its results' end and behind a first run over a small
// input that fills tables and caches. Prints the bytes of the form that the codec reads or writes.
#include <valgrind/callgrind.h>

#include <cstdio>
#include <cstdlib>
#include <string>

#include "instructions/Shapes.h"
#include "kelbaselib/InMemoryBytestream.h"
#include "rox/RoxMempool.h"
#include "sorn/binary/ProtoBuf.h"
#include "sorn/convert/DictionarySornObject.h"
#include "sorn/dict/Base64.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/model/Schema.h"
#include "sorn/typedjson/JsonSornObject.h"

namespace {

const unsigned char* Bytes(const std::string& text) {
    return reinterpret_cast<const unsigned char*>(text.data());
}

/// One input in the forms that codecs read; only those asked for are made.
class Work {
 public:
    explicit Work(const std::string& text) : textM(text) {}

    /// Makes what the codec reads. False for a codec that is none.
    bool Prepare(const std::string& codec);
    /// The codec's bytes; 0 when it refused.
    size_t Run(const std::string& codec);
    /// Why it refused, from codecs that have words.
    const char* Error() const { return errorM.Utf8(); }

 private:
    ref<sorn::Dictionary> Parse();
    ref<sorn::Dictionary> ParseStream();
    ref<sorn::SornObject> ReadText();
    ref<sorn::SornObject> ReadStream();
    ref<sorn::SornObject> ReadBinary();
    ref<sorn::SornObject> Convert();
    sorn::ProtoBuf Codec() {
        return sorn::ProtoBuf(&poolM, sorn::Schema::vStructDefG, sorn::Schema::nStructDefG);
    }
    void Fail(const char* what) {
        std::fprintf(stderr, "%s\n", what);
        std::exit(1);
    }

    std::string textM;
    RoxMempool poolM{"work"};
    kelbaselib::InMemoryBytestream streamM;
    ref<sorn::Dictionary> dictionaryM;
    ref<sorn::SornObject> objectM;
    ref<rox::ByteBuffer> binaryM;
    ref<rox::ByteBuffer> base64M;
    RoxString errorM;
};

ref<sorn::Dictionary> Work::Parse() {
    return sorn::Dictionary::FromJson(Bytes(textM), static_cast<unsigned>(textM.size()), errorM, &poolM);
}

ref<sorn::Dictionary> Work::ParseStream() {
    return sorn::Dictionary::FromJsonBytesource(streamM.NewSource(), errorM, &poolM);
}

ref<sorn::SornObject> Work::ReadText() {
    ref<sorn::SornObject> object;
    sorn::JsonSornObject(&poolM).JsonToSornObject(Bytes(textM), static_cast<int>(textM.size()), 0, &object,
                                                  errorM);
    return object;
}

ref<sorn::SornObject> Work::ReadStream() {
    unsigned nRead = 0;
    ref<sorn::SornObject> object;
    sorn::JsonSornObject(&poolM).JsonToSornObject(streamM.NewSource(), nRead, 0, &object, errorM);
    return object;
}

ref<sorn::SornObject> Work::ReadBinary() {
    ref<sorn::SornObject> object;
    Codec().UnmarshalKnownDict(binaryM, &object);
    return object;
}

ref<sorn::SornObject> Work::Convert() {
    ref<sorn::SornObject> object;
    sorn::DictionarySornObject converter(&poolM, sorn::Schema::vStructDefG, sorn::Schema::nStructDefG);
    if (dictionaryM != nullptr) converter.DictionaryToSornObject(dictionaryM, 0, object, errorM);
    return object;
}

bool Work::Prepare(const std::string& codec) {
    if (codec == "dictionary-in" || codec == "typed-in") return true;
    if (codec == "stream-in" || codec == "typed-stream-in") {
        streamM.Write(textM.data(), static_cast<unsigned>(textM.size()));
        return true;
    }
    if (codec == "base64-out" || codec == "base64-in") {
        binaryM = rox::ByteBuffer::New(&poolM, textM.data(), static_cast<uint32_t>(textM.size()));
        sorn::Base64(sorn::Base64::DEFAULT_CODE_SET, sorn::Base64::DEFAULT_TERMINATOR)
            .Encode(&poolM, binaryM, base64M);
        return true;
    }
    dictionaryM = Parse();
    if (dictionaryM == nullptr) Fail("the text does not parse");
    if (codec == "dictionary-out") return true;
    objectM = Convert();
    if (objectM == nullptr) Fail("the text is no record");
    if (codec == "typed-out" || codec == "to-dictionary") return true;
    if (codec == "to-object") return true;
    binaryM = Codec().MarshalKnownDict(objectM.get());
    return codec == "binary-out" || codec == "binary-in";
}

size_t Work::Run(const std::string& codec) {
    const sorn::Base64 base64(sorn::Base64::DEFAULT_CODE_SET, sorn::Base64::DEFAULT_TERMINATOR);
    if (codec == "dictionary-in") return Parse() != nullptr ? textM.size() : 0;
    if (codec == "stream-in") return ParseStream() != nullptr ? textM.size() : 0;
    if (codec == "dictionary-out") return dictionaryM->ToJson(false).NByte();
    if (codec == "typed-in") return ReadText() != nullptr ? textM.size() : 0;
    if (codec == "typed-stream-in") return ReadStream() != nullptr ? textM.size() : 0;
    if (codec == "typed-out") return sorn::JsonSornObject(&poolM).SornObjectToJson(objectM.get(), 0).NByte();
    if (codec == "to-object") return Convert() != nullptr ? textM.size() : 0;
    if (codec == "to-dictionary") return objectM->ToDictionary(0) != nullptr ? textM.size() : 0;
    if (codec == "binary-in") return ReadBinary() != nullptr ? binaryM->GetLength() : 0;
    if (codec == "binary-out") return Codec().MarshalKnownDict(objectM.get())->GetLength();
    ref<rox::ByteBuffer> result;
    if (codec == "base64-out") base64.Encode(&poolM, binaryM, result);
    if (codec == "base64-in") base64.Decode(&poolM, base64M, result);
    return result != nullptr ? textM.size() : 0;
}

}  // namespace

int main(int argc, char** argv) {
    if (argc != 4) {
        std::fprintf(stderr, "usage: codec_work SHAPE CODEC SIZE\n");
        return 2;
    }
    const std::string shape = argv[1], codec = argv[2];
    const std::string text = bench::ShapedText(shape, std::strtoul(argv[3], nullptr, 10));
    Work small(bench::ShapedText(shape, 2000)), work(text);
    if (text.empty() || !small.Prepare(codec) || !work.Prepare(codec)) {
        std::fprintf(stderr, "no such shape or codec: %s %s\n", argv[1], argv[2]);
        return 2;
    }
    small.Run(codec);
    CALLGRIND_START_INSTRUMENTATION;
    const size_t nBytes = work.Run(codec);
    CALLGRIND_STOP_INSTRUMENTATION;
    if (nBytes == 0) {
        std::fprintf(stderr, "%s was refused by %s: %s\n", argv[1], argv[2], work.Error());
        return 1;
    }
    std::printf("%zu\n", nBytes);
    return 0;
}
