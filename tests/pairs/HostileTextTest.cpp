// Texts cut off at every byte, with wrong bits and with wrong tokens, through all readers of text, and what
// they take through all writers. Invariants for untrusted input: 1, 2, 9, 13, 14.

#include "kelbaselib/InMemoryBytestream.h"
#include "pairs/HostileFixture.h"
#include "pairs/LibraryForms.h"
#include "sorn/dict/Dict.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/lazy/LazyDict.h"
#include "sorn/model/Schema.h"
#include "sorn/typedjson/JsonSornObject.h"

namespace sorntest {

using namespace sorn;

class HostileTextTest : public HostileFixture {
 protected:
    ref<LazyDict> Stream(const std::string& text, unsigned piece) {
        return LazyDict::FromBytesource(&pool, new PieceSource(text, piece), 0);
    }
    ref<LazyDict> Json(const std::string& text) {
        return LazyDict::FromBytestring(
            &pool, rox::ByteBuffer::New(&pool, text.data(), static_cast<uint32_t>(text.size())), 0);
    }

    /// Reads by the typed reader from the heap, from a body in memory and from a stream in small pieces: same
    /// verdict, words and record. Then writes it in all forms.
    void ReadTyped(const std::string& text) {
        RoxFeatures::SetEnabled(VK_FEATURE_TYPED_JSON, true);
        const ExactBytes bytes(text);
        ref<SornObject> object;
        RoxString words;
        const bool isRead =
            JsonSornObject(&pool).JsonToSornObject(bytes.Data(), bytes.Length(), 0, &object, words);
        ASSERT_EQ(object != nullptr, isRead);
        ++(isRead ? nReadM : nRefusedM);
        RoxString streamWords;
        const ref<SornObject> streamed = Stream(text, 7)->ToSornObjectOrErrorString(streamWords);
        ASSERT_EQ(streamed != nullptr, isRead);
        ASSERT_EQ(Text(streamWords), Text(words));
        if (!isRead) return;
        ASSERT_TRUE(Same(Show(RecordOfObject(*streamed)), Show(RecordOfObject(*object))));
        const ref<LazyDict> out = LazyDict::FromSornObject(&pool, object, 0);
        // What was taken for a body may be no text that a parser reads; the second account knows good text
        // only.
        if (Show(RecordOfObject(*object)).find("body ") == std::string::npos) {
            ASSERT_TRUE(Same(Text(out->ToJson(false)), TypedText(RecordOfObject(*object), 0)));
        }
        ASSERT_FALSE(out->ToJson(true).FEmpty());
        ASSERT_FALSE(out->ToProtobuf()->FEmpty());
    }

    /// Reads by the parser for streams in two sizes of pieces, and writes what it gives.
    void ReadTrees(const std::string& text) {
        RoxString error;
        const ref<LazyDict> stream = Stream(text, 512);
        const ref<Dictionary> whole = stream->ToDictionary(error);
        const ref<Dictionary> pieces = Stream(text, 3)->ToDictionary(error);
        ASSERT_EQ(whole != nullptr, pieces != nullptr);
        ++(whole != nullptr ? nReadM : nRefusedM);
        if (whole != nullptr) {
            ASSERT_TRUE(Same(Show(TreeOfDictionary(*pieces)), Show(TreeOfDictionary(*whole))));
            ASSERT_TRUE(Same(Text(stream->ToJson(true)), TreeText(TreeOfDictionary(*whole), true)));
        } else {
            ASSERT_TRUE(stream->ToJson(false).FEmpty());
        }
        ASSERT_FALSE(stream->ToProtobuf()->FEmpty());
    }

    /// Reads by the parser for text in memory and the dictionary road, and writes in all forms.
    void ReadBody(const std::string& text) {
        RoxFeatures::SetEnabled(VK_FEATURE_TYPED_JSON, false);
        const ref<LazyDict> json = Json(text);
        if (json == nullptr) return;
        RoxString error;
        ++(json->ToSornObjectOrErrorString(error) != nullptr ? nReadM : nRefusedM);
        ASSERT_FALSE(json->ToProtobuf()->FEmpty());
        ASSERT_FALSE(json->ToDict()->ToString(true).FEmpty());
    }

    Attack Typed() {
        return [this](const std::string& text) { ReadTyped(text); };
    }
    Attack Trees() {
        return [this](const std::string& text) { ReadTrees(text); };
    }
    Attack Bodies() {
        return [this](const std::string& text) { ReadBody(text); };
    }
    void ReadAll(const std::string& text, const Attack& attack) {
        Read(ForEachTruncation, text, attack);
        Read(ForEachBitFlip, text, attack);
        Read(ForEachWrongToken, text, attack);
    }
};

TEST_F(HostileTextTest, TypedReader) {
    for (const Record& record : Victims()) ReadAll(TypedText(record, 0), Typed());
    EXPECT_GT(nReadM, 1000u);
    EXPECT_GT(nRefusedM, 1000u);
}

TEST_F(HostileTextTest, StreamParser) {
    const std::vector<Record> victims = Victims();
    for (size_t i = 0; i < victims.size(); ++i) {
        const std::string text = TreeText(TreeOfRecord(victims[i], 0), false);
        Read(ForEachTruncation, text, Trees());
        if (i < 2) Read(ForEachBitFlip, text, Trees());
    }
    EXPECT_GT(nReadM, 1000u);
    EXPECT_GT(nRefusedM, 1000u);
}

TEST_F(HostileTextTest, DictionaryRoad) {
    for (const Record& record : Victims()) {
        const std::string text = TreeText(TreeOfRecord(record, 0), false);
        Read(ForEachTruncation, text, Bodies());
        Read(ForEachWrongToken, text, Bodies());
    }
    EXPECT_GT(nReadM, 1000u);
    EXPECT_GT(nRefusedM, 1000u);
}

}  // namespace sorntest
