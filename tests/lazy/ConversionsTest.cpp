// Every representation to every form: one row a body of the same contents, one test a form.
#include <atomic>
#include <string>
#include <thread>
#include <vector>

#include "convert/ConvertFixture.h"
#include "kelbaselib/Bytesink.h"
#include "lazy/TextSource.h"
#include "rox/RoxFeatures.h"
#include "sorn/dict/ByteBuffer.h"
#include "sorn/dict/Dict.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/json/JsonFormat.h"
#include "sorn/lazy/LazyDict.h"
#include "sornschema/EveryTypeCompanion.h"

namespace sorntest {

using namespace sorn;

// The record of all rows: struct 5919 with label "x" in slot 6 and number -2 in slot 7.
const char* const sortedG = R"({"label": "x", "number": -2, "type": "everyTypeCompanion"})";
const char* const prettyG =
    "{\n    \"label\": \"x\", \n    \"number\": -2, \n    \"type\": \"everyTypeCompanion\"\n}";
const char* const slotsG = R"({"label": "x", "type": "everyTypeCompanion", "number": -2})";
const char* const rawG = R"( {"number":-2,"type":"everyTypeCompanion" , "label" : "x"})";
// 5919 * 8 + 2 = 47354 = 0x2B8FA: FA F1 02. Slot 6 text: 6 * 8 + 2 = 0x32. Slot 7 number: 7 * 8 = 0x38, -2 by
// zigzag is 3.
const std::string binaryG("\xFA\xF1\x02\x05\x32\x01x\x38\x03", 9);

/// Takes the given numbers of bytes, then all that comes.
class StingySink final : public kelbaselib::Bytesink {
 public:
    explicit StingySink(std::vector<unsigned> limits = {}) : limitsM(std::move(limits)) {}
    unsigned Write(const void* bytes, unsigned count) override {
        countsM.push_back(count);
        if (countsM.size() <= limitsM.size()) count = std::min(count, limitsM[countsM.size() - 1]);
        textM.append(static_cast<const char*>(bytes), count);
        return count;
    }
    const std::string& GetText() const { return textM; }
    const std::vector<unsigned>& GetCounts() const { return countsM; }

 private:
    std::vector<unsigned> limitsM;
    std::vector<unsigned> countsM;
    std::string textM;
};

class ConversionsTest : public ConvertFixture {
 protected:
    void TearDown() override {
        RoxFeatures::SetEnabled(VK_FEATURE_TYPED_JSON, false);
        bodies.clear();
        ConvertFixture::TearDown();
    }
    struct Body {
        const char* name;
        ref<LazyDict> lazy;
    };
    ref<LazyDict> OfBytes(const std::string& bytes) {
        return LazyDict::FromBytestring(
            &pool, rox::ByteBuffer::New(&pool, bytes.data(), static_cast<uint32_t>(bytes.size())), 0);
    }
    ref<LazyDict> OfStream(const std::string& text, int version = 0) {
        return LazyDict::FromBytesource(&pool, new TextSource(counts, text), version);
    }
    /// The record in each representation, in the order of their numbers.
    const std::vector<Body>& Bodies() {
        bodies = {{"REP_DICT", LazyDict::FromDict(&pool, ref<Dict>(new (&pool) Dict(Parse(sortedG))), 0)},
                  {"REP_JSON", OfBytes(rawG)},
                  {"REP_PROTOBUF", OfBytes(binaryG)},
                  {"REP_OBJECT", LazyDict::FromSornObject(&pool, Object(sortedG), 0)},
                  {"REP_DICTIONARY", LazyDict::FromDictionary(&pool, Parse(sortedG), 0)},
                  {"REP_BYTESOURCE", OfStream(rawG)}};
        for (size_t i = 0; i < bodies.size(); ++i) EXPECT_EQ(bodies[i].lazy->GetRep(), i);
        return bodies;
    }
    static std::string Bytes(const ref<rox::ByteBuffer>& bytes) {
        return std::string(reinterpret_cast<const char*>(bytes->GetData()), bytes->GetLength());
    }
    static std::string Appended(const ref<LazyDict>& lazy, bool pretty) {
        ByteBuffer out(nullptr);
        out.AppendString("before ");
        lazy->ToJsonByteBuffer(out, pretty);
        return std::string(reinterpret_cast<const char*>(out.GetData()), out.GetLength());
    }
    static std::string Sunk(const ref<LazyDict>& lazy, bool pretty) {
        StingySink sink;
        lazy->ToJsonBytesink(sink, pretty);
        return sink.GetText();
    }
    static const char* CompactOf(const ref<LazyDict>& lazy) {
        switch (lazy->GetRep()) {
            case LazyDict::REP_JSON:
                return rawG;
            case LazyDict::REP_PROTOBUF:
            case LazyDict::REP_OBJECT:
                return slotsG;
            default:
                return sortedG;
        }
    }

    TextSource::Counts counts;
    std::vector<Body> bodies;
};

TEST_F(ConversionsTest, ToDict) {
    for (const auto& [name, lazy] : Bodies())
        EXPECT_EQ(Text(lazy->ToDict()->ToString(false)), sortedG) << name;
}

TEST_F(ConversionsTest, ToDictionary) {
    for (const auto& [name, lazy] : Bodies()) {
        RoxString error("old");
        const ref<Dictionary> dictionary = lazy->ToDictionary(error);
        ASSERT_NE(dictionary, nullptr) << name;
        EXPECT_EQ(Text(dictionary->ToJson(false)), sortedG) << name;
        EXPECT_EQ(Text(error), "") << name;
    }
}

TEST_F(ConversionsTest, ToObject) {
    for (const bool isTyped : {false, true}) {
        RoxFeatures::SetEnabled(VK_FEATURE_TYPED_JSON, isTyped);
        for (const auto& [name, lazy] : Bodies()) {
            RoxString error;
            const ref<SornObject> object = lazy->ToSornObjectOrErrorString(error);
            ASSERT_NE(object, nullptr) << name;
            EXPECT_EQ(Text(error), "") << name;
            EXPECT_EQ(Json(object), sortedG) << name;
            EXPECT_EQ(Json(lazy->ToSornObjectOrError()), sortedG) << name;
            ref<SornObject> out;
            EXPECT_TRUE(lazy->ToSornObject(out));
            EXPECT_EQ(Json(out), sortedG) << name;
        }
        EXPECT_EQ(bodies[LazyDict::REP_OBJECT].lazy->ToSornObjectOrError(),
                  bodies[LazyDict::REP_OBJECT].lazy->GetStoredObject());
    }
}

TEST_F(ConversionsTest, ToProtobuf) {
    for (const auto& [name, lazy] : Bodies()) {
        const ref<rox::ByteBuffer> bytes = lazy->ToProtobuf();
        EXPECT_EQ(Bytes(bytes), binaryG) << name;
        EXPECT_GE(bytes->GetCapacity(), 8u) << name;
        const ref<LazyDict> back = LazyDict::FromBytestring(&pool, bytes, 0);
        EXPECT_EQ(back->GetRep(), LazyDict::REP_PROTOBUF) << name;
        EXPECT_TRUE(*back->ToDict() == *lazy->ToDict()) << name;
    }
    const ref<LazyDict>& binary = bodies[LazyDict::REP_PROTOBUF].lazy;
    EXPECT_EQ(binary->ToProtobuf(), binary->GetStoredBytes());
}

TEST_F(ConversionsTest, CompactText) {
    for (const auto& [name, lazy] : Bodies()) {
        const std::string expected = CompactOf(lazy);
        EXPECT_EQ(Appended(lazy, false), "before " + expected) << name;
        EXPECT_EQ(Bytes(lazy->ToJsonBytestring(false)), expected) << name;
        EXPECT_EQ(Text(lazy->ToJson(false)), expected) << name;
    }
    const ref<LazyDict>& text = bodies[LazyDict::REP_JSON].lazy;
    EXPECT_EQ(text->ToJsonBytestring(false), text->GetStoredBytes());
    EXPECT_NE(text->ToJsonBytestring(true), text->GetStoredBytes());
}

TEST_F(ConversionsTest, PrettyText) {
    for (const auto& [name, lazy] : Bodies()) {
        EXPECT_EQ(Appended(lazy, true), std::string("before ") + prettyG) << name;
        EXPECT_EQ(Bytes(lazy->ToJsonBytestring(true)), prettyG) << name;
        EXPECT_EQ(Text(lazy->ToJson(true)), prettyG) << name;
        EXPECT_EQ(Sunk(lazy, true), prettyG) << name;
    }
}

TEST_F(ConversionsTest, CompactTextToASink) {
    for (const auto& [name, lazy] : Bodies()) {
        RoxFeatures::SetEnabled(VK_FEATURE_TYPED_JSON, true);
        EXPECT_EQ(Sunk(lazy, false), CompactOf(lazy)) << name;
        EXPECT_EQ(Sunk(lazy, true), prettyG) << name;
        // With the feature off objects go through a dictionary, for sinks only.
        RoxFeatures::SetEnabled(VK_FEATURE_TYPED_JSON, false);
        EXPECT_EQ(Sunk(lazy, false), lazy->GetRep() == LazyDict::REP_JSON ? rawG : sortedG) << name;
    }
}

TEST_F(ConversionsTest, BodiesInADictionaryHaveTheTextThatTheyHaveAlone) {
    for (const bool isTyped : {false, true}) {
        RoxFeatures::SetEnabled(VK_FEATURE_TYPED_JSON, isTyped);
        for (const auto& [name, lazy] : Bodies()) {
            const ref<Dictionary> around = Parse("{}");
            around->Add(RoxString("b"), lazy);
            StingySink sink;
            around->ToJson(sink, JsonFormat(false));
            EXPECT_EQ(sink.GetText(), "{\"b\": " + Sunk(lazy, false) + "}") << name;
            EXPECT_EQ(Text(around->ToJson(false)), std::string("{\"b\": ") + CompactOf(lazy) + "}") << name;
        }
    }
}

TEST_F(ConversionsTest, JsonBytesGoToASinkInOneWrite) {
    const std::string text = "{\"a\": \"" + std::string(100'000, 'x') + "\"}";
    StingySink sink({10});
    OfBytes(text)->ToJsonBytesink(sink, false);
    EXPECT_EQ(sink.GetCounts(), std::vector<unsigned>({100'009}));  // its answer, 10, is not looked at
}

TEST_F(ConversionsTest, TypedTextGoesToASinkInPieces) {
    RoxFeatures::SetEnabled(VK_FEATURE_TYPED_JSON, true);
    const std::string label(39'960, 'x');
    const std::string text = "{\"label\": \"" + label + "\", \"type\": \"everyTypeCompanion\"}";
    const ref<LazyDict> lazy = LazyDict::FromSornObject(&pool, Object(text), 0);
    const unsigned n = static_cast<unsigned>(text.size());
    struct Row {
        std::vector<unsigned> limits;
        std::vector<unsigned> counts;
        size_t nTaken;
    };
    const Row rows[] = {
        {{}, {16384, 16384, n - 32768}, n},
        {{16384, 16384, 5}, {16384, 16384, n - 32768, n - 32773}, n},  // a short write goes on with the rest
        {{1}, {16384, 16384, 16384, n - 32769}, n},
        {{16384, 0}, {16384, 16384}, 16384},  // a write of nothing ends it
        {{0}, {16384}, 0},
    };
    for (const Row& row : rows) {
        StingySink sink(row.limits);
        lazy->ToJsonBytesink(sink, false);
        EXPECT_EQ(sink.GetCounts(), row.counts);
        EXPECT_EQ(sink.GetText(), text.substr(0, row.nTaken));
    }
}

TEST_F(ConversionsTest, EqualWhateverTheForm) {
    Bodies();
    for (const Body& a : bodies) {
        for (const Body& b : bodies) EXPECT_TRUE(*a.lazy == *b.lazy) << a.name << " " << b.name;
    }
}

TEST_F(ConversionsTest, TheVersionSelectsTheFields) {
    // validUntilDateTime exists from version 11 on; the typed reader of the new road looks at no version.
    const char* const json =
        R"({"type": "channelMapConfigInstructions", "resultToken": {"a": "b"}, "validUntilDateTime": "2012-01-01 00:00:00"})";
    const std::string without = R"({"resultToken": {"a": "b"}, "type": "channelMapConfigInstructions"})";
    const ref<LazyDict> text = LazyDict::FromJsonString(&pool, RoxString(json), 10);
    EXPECT_EQ(Json(text->ToSornObjectOrError()), without);
    EXPECT_EQ(Json(OfStream(json, 10)->ToSornObjectOrError()), without);
    RoxFeatures::SetEnabled(VK_FEATURE_TYPED_JSON, true);
    const std::string with =
        R"({"resultToken": {"a": "b"}, "type": "channelMapConfigInstructions", "validUntilDateTime": "2012-01-01 00:00:00"})";
    EXPECT_EQ(Json(text->ToSornObjectOrError()), with);
    EXPECT_EQ(Json(OfStream(json, 10)->ToSornObjectOrError()), with);
    const ref<LazyDict> object = LazyDict::FromSornObject(&pool, Object(json), 10);
    EXPECT_EQ(Text(object->ToDict()->ToString(false)), without);
    EXPECT_EQ(Text(object->ToJson(false)),
              R"({"type": "channelMapConfigInstructions", "resultToken": {"a": "b"}})");
}

TEST_F(ConversionsTest, ARefusedVersionOrFieldOnTheOldRoadPassesOnTheNew) {
    const char* const json = R"({"type": "channelMapConfigInstructions"})";  // without its required field
    for (const int version : {3, 42}) {
        for (const bool isStream : {false, true}) {
            const ref<LazyDict> lazy = isStream ? OfStream(json, version)
                                                : LazyDict::FromJsonString(&pool, RoxString(json), version);
            RoxFeatures::SetEnabled(VK_FEATURE_TYPED_JSON, false);
            RoxString error;
            EXPECT_EQ(lazy->ToSornObjectOrErrorString(error), nullptr);
            EXPECT_EQ(Text(error),
                      version == 3 ? "Unmarshaling to SornObject: given orvo version is out of range used in "
                                     "code generation: \x03"
                                   : "Required field not set: resultToken");
            RoxFeatures::SetEnabled(VK_FEATURE_TYPED_JSON, true);
            EXPECT_NE(lazy->ToSornObjectOrErrorString(error), nullptr);
        }
    }
}

TEST_F(ConversionsTest, FailuresToObject) {
    struct Row {
        ref<LazyDict> lazy;
        const char* words;  // null: the parser's own
    };
    const Row rows[] = {
        {LazyDict::FromDictionary(&pool, Parse(R"({"a": 1})"), 0), "Dictionary has no 'type' field."},
        {LazyDict::FromDict(&pool, MakeDict(&pool), 0), "Dictionary has no 'type' field."},
        {OfBytes("\x02"), "Protobuf did not unmarshal to SornObject"},
        {OfBytes(R"({"type": "nope"})"), "no such structure type: nope"},
        {OfStream(R"({"type": "nope"})"), "no such structure type: nope"},
        {OfBytes("{"), nullptr},
        {OfStream("{"), nullptr},
    };
    for (const Row& row : rows) {
        RoxString error;
        EXPECT_EQ(row.lazy->ToSornObjectOrErrorString(error), nullptr);
        if (row.words != nullptr) {
            EXPECT_EQ(Text(error), row.words);
        }
        EXPECT_NE(Text(error), "");
        ref<SornObject> out = sornschema::EveryTypeCompanion::Factory(&pool);
        EXPECT_FALSE(row.lazy->ToSornObject(out));
        EXPECT_EQ(out, nullptr);
        const ref<Dictionary> dictionary =
            Context().SornObjectToDictionary(row.lazy->ToSornObjectOrError().get(), 0);
        EXPECT_EQ(Text(dictionary->GetString("type")), "error");
        EXPECT_EQ(Text(dictionary->GetString("code")), "badArgument");
        EXPECT_EQ(Text(dictionary->GetString("text")), Text(error));
    }
}

TEST_F(ConversionsTest, FailuresToProtobufAreErrorObjects) {
    struct Row {
        ref<LazyDict> lazy;
        const char* words;
    };
    const Row rows[] = {
        {LazyDict::FromDictionary(&pool, Parse(R"({"a": 1})"), 0),
         "Dictionary has no 'type' field.Dict did not unmarshal"},
        {LazyDict::FromDict(&pool, MakeDict(&pool), 0),
         "Dictionary has no 'type' field.Dict did not unmarshal"},
        {OfBytes(R"({"type": "nope"})"), "no such structure type: nopeDict did not unmarshal"},
        {OfStream(R"({"type": "nope"})"), "no such structure type: nopeDict did not unmarshal"},
    };
    for (const Row& row : rows) {
        const ref<LazyDict> back = LazyDict::FromBytestring(&pool, row.lazy->ToProtobuf(), 0);
        EXPECT_EQ(Text(back->ToDict()->ToString(false)),
                  std::string(R"({"code": "badArgument", "text": ")") + row.words + R"(", "type": "error"})");
    }
    // A text that does not parse is the error object of the parser's words, with nothing behind them.
    for (const ref<LazyDict>& lazy : {OfBytes("{"), OfStream("{")}) {
        const ref<Dict> back = LazyDict::FromBytestring(&pool, lazy->ToProtobuf(), 0)->ToDict();
        EXPECT_EQ(Text(back->GetString("type", 0)), "error");
        EXPECT_EQ(Text(back->GetString("text", 0)), Text(lazy->ToDict()->GetString("text", 0)));
    }
}

TEST_F(ConversionsTest, WordsThatAreThereDoNotMakeAReadableStreamUnreadable) {
    RoxString error("old;");
    EXPECT_NE(OfStream(sortedG)->ToSornObjectOrErrorString(error), nullptr);
}

TEST_F(ConversionsTest, WordsThatEndInANulKeepIt) {
    // The low byte of a version out of range is a byte of the words: 256 ends in a NUL.
    const ref<LazyDict> lazy = LazyDict::FromDictionary(&pool, Parse(sortedG), 256);
    const ref<Dict> error = LazyDict::FromBytestring(&pool, lazy->ToProtobuf(), 0)->ToDict();
    const std::string words =
        "Unmarshaling to SornObject: given orvo version is out of range used in code generation: ";
    EXPECT_EQ(Text(error->GetString("text", 0)), words + std::string(1, '\0') + "Dict did not unmarshal");
}

TEST_F(ConversionsTest, ManyThreadsReadOneBody) {
    // Each representation but a stream, whose queries change it; the pool is shared.
    Bodies();
    bodies.pop_back();
    RoxFeatures::SetEnabled(VK_FEATURE_TYPED_JSON, true);
    std::vector<std::thread> threads;
    std::atomic<unsigned> nGood{0};
    for (unsigned i = 0; i < 4; ++i) {
        threads.emplace_back([this, &nGood] {
            for (unsigned round = 0; round < 50; ++round) {
                for (const auto& [name, lazy] : bodies) {
                    const bool isGood = Text(lazy->ToDict()->ToString(false)) == sortedG &&
                                        Bytes(lazy->ToProtobuf()) == binaryG &&
                                        Text(lazy->ToJson(false)) == CompactOf(lazy) &&
                                        Json(lazy->ToSornObjectOrError()) == sortedG;
                    nGood += isGood ? 1 : 0;
                }
            }
        });
    }
    for (std::thread& thread : threads) thread.join();
    EXPECT_EQ(nGood.load(), 4u * 50 * 5);
}

TEST_F(ConversionsTest, AStreamIsReadThroughSourcesOfItsOwn) {
    const ref<LazyDict> lazy = OfStream(rawG);
    for (int i = 1; i <= 3; ++i) {
        lazy->ToDict();
        EXPECT_EQ(counts.newSources, i);
        EXPECT_EQ(counts.releases, i);
        EXPECT_EQ(counts.largestRead, 512u);
    }
    EXPECT_EQ(lazy->GetRep(), LazyDict::REP_BYTESOURCE);
    RoxFeatures::SetEnabled(VK_FEATURE_TYPED_JSON, true);
    lazy->ToSornObjectOrError();
    EXPECT_EQ(counts.newSources, 5);  // one for each pass
    EXPECT_EQ(counts.releases, 5);
    EXPECT_EQ(counts.largestRead, 16384u);
}

TEST_F(ConversionsTest, GetDictionaryFromBytesourceNeedsASource) {
    ref<Dictionary> out;
    const ref<LazyDict> text = OfBytes("{}");
    const ref<LazyDict> none = LazyDict::FromBytesource(&pool, nullptr, 0);
    EXPECT_DEATH(text->GetDictionaryFromBytesource(out), "GetDictionaryFromBytesource");
    EXPECT_DEATH(none->GetDictionaryFromBytesource(out), "GetDictionaryFromBytesource");
    const ref<LazyDict> cut = OfStream(R"({"a":)");
    EXPECT_FALSE(cut->GetDictionaryFromBytesource(out));
    ASSERT_NE(out, nullptr);  // a part, which is good for nothing
    EXPECT_EQ(out->CountNames(), 0u);
    const ref<LazyDict> good = OfStream(R"({"a":1})");
    EXPECT_TRUE(good->GetDictionaryFromBytesource(out));
    EXPECT_EQ(Text(out->ToJson(false)), R"({"a": 1})");
}

}  // namespace sorntest
