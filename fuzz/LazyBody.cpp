// A lazy body of any bytes, as bytes and as a stream, through every conversion. Invariants 1 to 4, 6 to 9 and
// 12 to 14.
//
// With the feature of typed text off and on: no conversion that cannot fail gives null, verdicts and results
// of the forms of one conversion agree, the binary form of anything decodes and is stable, and a stream is
// released once. The first byte of the input's head also tells the schema version.
#include <iterator>
#include <string>

#include "fuzz/support/Check.h"
#include "fuzz/support/FuzzPool.h"
#include "fuzz/support/PieceSource.h"
#include "fuzz/support/PiecedInput.h"
#include "fuzz/support/RecordContents.h"
#include "fuzz/support/Texts.h"
#include "kelbaselib/InMemoryBytestream.h"
#include "rox/RoxFeatures.h"
#include "rox/RoxLogger.h"
#include "sorn/dict/ByteBuffer.h"
#include "sorn/dict/Dict.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/json/JsonFormat.h"
#include "sorn/lazy/LazyDict.h"
#include "sorn/model/Schema.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size);

namespace {

using sorn::LazyDict;

/// Pretty text grows with the square of the depth.
constexpr unsigned nPrettyG = 2048;

/// The last lies outside the schema's, which the road through a dictionary refuses.
constexpr int versionsG[] = {0, 7, 11, 12, 21, 22, 25, 26, 42, 43};

/// What `write` writes to a sink.
template <class Write>
std::string SinkText(RoxMempool* pool, Write write) {
    kelbaselib::InMemoryBytestream sink(pool);
    write(sink);
    if (sink.GetLength() == 0) return {};
    return std::string(reinterpret_cast<const char*>(sink.GetData()), sink.GetLength());
}

/// All ways to one text.
void CheckText(const LazyDict& body, bool isPretty, RoxMempool* pool) {
    const std::string text(View(body.ToJsonBytestring(isPretty)));
    Check(body.ToJson(isPretty).View() == text, "the text as a string differs");
    sorn::ByteBuffer out(pool);
    body.ToJsonByteBuffer(out, isPretty);
    Check(out.ToRoxString(pool).View() == text, "the text in a buffer differs");
    const std::string atSink =
        SinkText(pool, [&](kelbaselib::Bytesink& sink) { body.ToJsonBytesink(sink, isPretty); });
    const bool isObject = body.GetRep() == LazyDict::REP_OBJECT || body.GetRep() == LazyDict::REP_PROTOBUF;
    if (!isObject || isPretty || RoxFeatures::FEnabled(VK_FEATURE_TYPED_JSON)) {
        Check(atSink == text, "the text to a sink differs");
        return;
    }
    // Sorted then, as the bodies inside are, which other texts have in the order of slots.
    RoxString error;
    const ref<sorn::Dictionary> dictionary = body.ToDictionary(error);
    const std::string sorted = SinkText(
        pool, [&](kelbaselib::Bytesink& sink) { dictionary->ToJson(sink, sorn::JsonFormat(false)); });
    Check(atSink == sorted, "the sorted text differs");
}

void CheckDictionaries(const LazyDict& body, RoxMempool* pool) {
    const ref<sorn::Dict> dict = body.ToDict();
    RoxString error;
    const ref<sorn::Dictionary> dictionary = body.ToDictionary(error);
    Check(dict != nullptr, "no Dict");
    if (dictionary != nullptr) {
        Check(DictionaryText(*dict->GetDictionary(), pool) == DictionaryText(*dictionary, pool),
              "Dict and dictionary differ");
        return;
    }
    Check(body.GetRep() == LazyDict::REP_BYTESOURCE || !error.FEmpty(), "no dictionary and no words");
    Check(dict->GetString("type", 0).View() == "error" && dict->GetString("code", 0).View() == "badArgument",
          "a failure is no error dictionary");
}

void CheckObjects(const LazyDict& body, RoxMempool* pool) {
    RoxString error;
    const ref<sorn::SornObject> object = body.ToSornObjectOrErrorString(error);
    // The typed reader says nothing about a text without a type.
    const bool isTyped = RoxFeatures::FEnabled(VK_FEATURE_TYPED_JSON);
    Check(object != nullptr ? error.FEmpty() : isTyped || !error.FEmpty(), "a verdict and its words differ");
    const ref<sorn::SornObject> orError = body.ToSornObjectOrError();
    Check(orError != nullptr, "no object");
    ref<sorn::SornObject> out;
    Check(body.ToSornObject(out) == (object != nullptr) && (out != nullptr) == (object != nullptr),
          "the verdicts on an object differ");
    if (object == nullptr) {
        Check(orError->GetTypeName().View() == "error", "a failure is no error object");
        return;
    }
    Check(TypedText(*orError, pool) == TypedText(*object, pool),
          "an object differs when it is asked for again");
    Check(BinaryForm(*orError, pool) == BinaryForm(*object, pool), "its binary form differs");
}

/// The object that the binary form is made of: never the typed reader's, whatever the feature says.
ref<sorn::SornObject> ByDictionary(const LazyDict& body) {
    const bool isTyped = RoxFeatures::FEnabled(VK_FEATURE_TYPED_JSON);
    RoxFeatures::SetEnabled(VK_FEATURE_TYPED_JSON, false);
    ref<sorn::SornObject> object = body.ToSornObjectOrError();
    RoxFeatures::SetEnabled(VK_FEATURE_TYPED_JSON, isTyped);
    return object;
}

/// Of any body: the binary form decodes. Of one that is not binary already it is also what its own object
/// marshals to.
void CheckBinary(const LazyDict& body, RoxMempool* pool) {
    const ref<rox::ByteBuffer> bytes = body.ToProtobuf();
    Check(bytes != nullptr, "no binary form");
    if (body.GetRep() == LazyDict::REP_PROTOBUF) {
        Check(bytes == body.GetStoredBytes(), "the bytes of a binary body are not shared");
        return;
    }
    const ref<LazyDict> binary = LazyDict::FromBytestring(pool, bytes, body.GetVersion());
    Check(binary->GetRep() == LazyDict::REP_PROTOBUF, "a binary form is taken for something else");
    RoxString error;
    const ref<sorn::SornObject> object = binary->ToSornObjectOrErrorString(error);
    if (RecordContents::Of(ByDictionary(body)).hasUnreadableScalar) return;  // and no reader takes it
    Check(object != nullptr, "a binary form does not decode");
    Check(View(LazyDict::FromSornObject(pool, object, body.GetVersion())->ToProtobuf()) == View(bytes),
          "a binary form is not stable");
}

void CheckType(LazyDict& body) {
    unsigned structId = 0;
    RoxString name;
    const bool hasName = body.GetTypeName(&name);
    if (!body.GetType(&structId)) return;
    Check(hasName, "a struct without a name");
    const sorn::StructInfo* info = sorn::Schema::FindStruct(structId);
    Check(info != nullptr && name.View() == info->name, "the struct and its name differ");
}

void CheckConversions(LazyDict& body, bool isSmall, RoxMempool* pool) {
    CheckDictionaries(body, pool);
    CheckObjects(body, pool);
    CheckBinary(body, pool);
    CheckText(body, false, pool);
    if (isSmall) CheckText(body, true, pool);
    Check(body == body, "a body differs from itself");
}

void RunBytes(const PiecedInput& input, int version, RoxMempool* pool) {
    const ref<rox::ByteBuffer> bytes = rox::ByteBuffer::New(pool, input.Text(), input.NText());
    const ref<LazyDict> body = LazyDict::FromBytestring(pool, bytes, version);
    Check((body == nullptr) == (input.NText() == 0 || input.Text()[0] == 0), "null for the wrong bytes");
    if (body == nullptr) return;
    CheckConversions(*body, input.NText() <= nPrettyG, pool);
    if (body->GetRep() == LazyDict::REP_JSON) {
        Check(body->ToJsonBytestring(false) == bytes, "the bytes of a text are not shared");
    }
    CheckType(*body);
    // Whatever the bytes were, their object is a body, too.
    const ref<sorn::SornObject> object = body->ToSornObjectOrError();
    CheckConversions(*LazyDict::FromSornObject(pool, object, version), input.NText() <= nPrettyG, pool);
}

void RunStream(const PiecedInput& input, int version, RoxMempool* pool) {
    PieceSource::Counts counts;
    {
        const ref<LazyDict> body = LazyDict::FromBytesource(pool, PieceSource::New(input, counts), version);
        CheckConversions(*body, input.NText() <= nPrettyG, pool);
        RoxString error;
        const ref<sorn::Dictionary> before = body->ToDictionary(error);
        Check(body->GetRep() == LazyDict::REP_BYTESOURCE, "a conversion read the stream for good");
        Check(counts.nReleases == counts.nSources - 1, "a source of a conversion is not released once");
        CheckType(*body);
        Check((body->GetRep() == LazyDict::REP_DICTIONARY) == (before != nullptr),
              "a stream is readable for one operation alone");
        if (before != nullptr) {
            const ref<sorn::Dictionary> after = body->ToDictionary(error);
            Check(DictionaryText(*after, pool) == DictionaryText(*before, pool),
                  "a stream changed by reading");
            CheckConversions(*body, input.NText() <= nPrettyG, pool);
        }
    }
    Check(counts.nReleases == counts.nSources, "a source is not released once");
}

}  // namespace

int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    RoxLogger::SetSink([](void*, int, int, const char*, const char*) {}, nullptr);
    const PiecedInput input(data, size);
    const int version = versionsG[input.Choice() % std::size(versionsG)];
    for (const bool isTyped : {false, true}) {
        RoxFeatures::SetEnabled(VK_FEATURE_TYPED_JSON, isTyped);
        FuzzPool pool;
        RunBytes(input, version, pool.Get());
        RunStream(input, version, pool.Get());
    }
    return 0;
}
