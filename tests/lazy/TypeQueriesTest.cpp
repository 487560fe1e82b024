#include <string>

#include "convert/ConvertFixture.h"
#include "lazy/TextSource.h"
#include "sorn/dict/Dict.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/lazy/LazyDict.h"
#include "sornschema/EveryTypeCompanion.h"

namespace sorntest {

using namespace sorn;

class TypeQueriesTest : public ConvertFixture {
 protected:
    ref<LazyDict> OfText(const char* text) { return LazyDict::FromJsonString(&pool, RoxString(text), 0); }
    ref<LazyDict> OfDictionary(const char* text) { return LazyDict::FromDictionary(&pool, Parse(text), 0); }
    ref<LazyDict> OfDict(const char* text) {
        return LazyDict::FromDict(&pool, ref<Dict>(new (&pool) Dict(Parse(text))), 0);
    }
    ref<LazyDict> OfStream(const char* text) {
        return LazyDict::FromBytesource(&pool, new TextSource(counts, text), 0);
    }
    ref<LazyDict> OfBytes(const std::string& bytes) {
        return LazyDict::FromBytestring(
            &pool, rox::ByteBuffer::New(&pool, bytes.data(), static_cast<uint32_t>(bytes.size())), 0);
    }
    /// What the two queries answer: "ID NAME", with "-" for false.
    static std::string Answers(const ref<LazyDict>& lazy) {
        unsigned structId = 0;
        RoxString name;
        const bool isKnown = lazy->GetType(&structId);
        const bool isNamed = lazy->GetTypeName(&name);
        return (isKnown ? std::to_string(structId) : "-") + " " + (isNamed ? Text(name) : "-");
    }
    TextSource::Counts counts;
};

TEST_F(TypeQueriesTest, OfDictionariesAndTexts) {
    struct Row {
        const char* text;
        const char* answers;
    };
    const Row rows[] = {
        {R"({"type": "everyTypeCompanion", "number": 1})", "5919 everyTypeCompanion"},
        {R"({"a": {"type": "error"}, "type": "account"})", "129 account"},
        {R"({"type": "nope"})", "- nope"},
        {R"({"a": "b"})", "- -"},
        {R"({"type": ""})", "- "},
        {R"({"type": {"type": "account"}})", "- "},  // a value, but no text
        {R"({"type": null})", "- "},
    };
    for (const Row& row : rows) {
        EXPECT_EQ(Answers(OfText(row.text)), row.answers) << row.text;
        EXPECT_EQ(Answers(OfDictionary(row.text)), row.answers) << row.text;
        EXPECT_EQ(Answers(OfDict(row.text)), row.answers) << row.text;
        EXPECT_EQ(Answers(OfStream(row.text)), row.answers) << row.text;
    }
    EXPECT_EQ(Answers(OfText("{")), "- -");
}

TEST_F(TypeQueriesTest, OfObjectsAndBinaryBodies) {
    EXPECT_EQ(Answers(LazyDict::FromSornObject(&pool, sornschema::EveryTypeCompanion::Factory(&pool), 0)),
              "5919 everyTypeCompanion");
    EXPECT_EQ(Answers(OfBytes(std::string("\xFA\xF1\x02\x00", 4))), "5919 everyTypeCompanion");
    // What does not unmarshal is an error: the one place where a failure becomes a success.
    EXPECT_EQ(Answers(OfBytes("\xFA\xF1\x02")), "346 error");
    EXPECT_EQ(Answers(OfBytes("[]")), "346 error");
}

TEST_F(TypeQueriesTest, AStreamIsReadForGood) {
    for (const bool byName : {false, true}) {
        counts = {};
        const ref<LazyDict> lazy = OfStream(R"({"type": "account"})");
        unsigned structId = 0;
        RoxString name;
        EXPECT_TRUE(byName ? lazy->GetTypeName(&name) : lazy->GetType(&structId));
        EXPECT_EQ(lazy->GetRep(), LazyDict::REP_DICTIONARY);
        EXPECT_EQ(lazy->GetStoredBytesource(), nullptr);
        EXPECT_EQ(counts.newSources, 1);
        EXPECT_EQ(counts.releases, 2);  // the new one and the body's own
        const int nReads = counts.reads;
        EXPECT_EQ(Answers(lazy), "129 account");
        EXPECT_EQ(counts.reads, nReads);
        EXPECT_EQ(counts.releases, 2);
    }
}

TEST_F(TypeQueriesTest, AnUnreadableStreamStays) {
    const ref<LazyDict> lazy = OfStream(R"({"type": "account", "a":)");
    for (int i = 1; i <= 2; ++i) {
        EXPECT_EQ(Answers(lazy), "- -");
        EXPECT_EQ(lazy->GetRep(), LazyDict::REP_BYTESOURCE);
        EXPECT_NE(lazy->GetStoredBytesource(), nullptr);
        EXPECT_EQ(lazy->GetStoredDictionary(), nullptr);
        EXPECT_EQ(counts.newSources, 2 * i);
        EXPECT_EQ(counts.releases, 2 * i);
    }
}

TEST_F(TypeQueriesTest, BuildDictionaryFromBytesource) {
    const ref<LazyDict> lazy = OfStream(R"({"a": "b"})");
    lazy->BuildDictionaryFromBytesource();
    EXPECT_EQ(lazy->GetRep(), LazyDict::REP_DICTIONARY);
    EXPECT_EQ(Text(lazy->GetStoredDictionary()->ToJson(false)), R"({"a": "b"})");
    // A dictionary that is there already is left alone, and so is the representation.
    const ref<LazyDict> another = OfStream(R"({"a": "b"})");
    const ref<Dictionary> given = Parse("{}");
    another->SetDictionary(given);
    counts = {};
    another->BuildDictionaryFromBytesource();
    EXPECT_EQ(another->GetRep(), LazyDict::REP_BYTESOURCE);
    EXPECT_EQ(another->GetStoredDictionary(), given);
    EXPECT_EQ(counts.newSources, 0);
}

}  // namespace sorntest
