#include "sorn/lazy/LazyDict.h"

#include <cstring>
#include <string>

#include "convert/ConvertFixture.h"
#include "kelbaselib/ByteCountingBytesink.h"
#include "lazy/TextSource.h"
#include "rox/VkCast.h"
#include "sorn/dict/ByteBuffer.h"
#include "sorn/dict/Dict.h"
#include "sorn/dict/LazyBody.h"
#include "sorn/dict/LazyDictValue.h"
#include "sorn/dict/NullValue.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sornschema/AudioStream.h"
#include "sornschema/EveryTypeCompanion.h"

namespace sorntest {

using namespace sorn;
using sornschema::EveryTypeCompanion;

class LazyDictTest : public ConvertFixture {
 protected:
    ref<rox::ByteBuffer> Bytes(const char* text, size_t n) {
        return rox::ByteBuffer::New(&pool, text, static_cast<uint32_t>(n));
    }
    ref<LazyDict> FromText(const char* text) { return LazyDict::FromJsonString(&pool, RoxString(text), 0); }
    std::string JsonOf(const ref<LazyDict>& lazy, bool pretty) {
        ByteBuffer out(&pool);
        out.AppendString("before ");
        lazy->ToJsonByteBuffer(out, pretty);
        return std::string(reinterpret_cast<const char*>(out.GetData()), out.GetLength());
    }
    std::string DictOf(const ref<LazyDict>& lazy) { return Text(lazy->ToDict()->ToString(false)); }
    /// What ToDictionary gives for a body that cannot be read.
    std::string WordsOf(const ref<LazyDict>& lazy) {
        RoxString error("old;");
        EXPECT_EQ(lazy->ToDictionary(error), nullptr);
        return Text(error);
    }
};

TEST_F(LazyDictTest, TheFirstByteDecides) {
    struct Row {
        const char* bytes;
        size_t n;
        int rep;  // -1: no body
    };
    const Row rows[] = {
        {"", 0, -1},
        {"\0{}", 3, -1},
        {"\0", 1, -1},
        {"{}", 2, LazyDict::REP_JSON},
        {" {}", 3, LazyDict::REP_JSON},
        {" ", 1, LazyDict::REP_JSON},
        {"{", 1, LazyDict::REP_JSON},
        {"[]", 2, LazyDict::REP_PROTOBUF},
        {"\n{}", 3, LazyDict::REP_PROTOBUF},
        {"\t{}", 3, LazyDict::REP_PROTOBUF},
        {"\x01", 1, LazyDict::REP_PROTOBUF},
        {"\xFF", 1, LazyDict::REP_PROTOBUF},
        {"\"", 1, LazyDict::REP_PROTOBUF},
    };
    for (const Row& row : rows) {
        SCOPED_TRACE(std::string(row.bytes, row.n));
        ref<rox::ByteBuffer> bytes = Bytes(row.bytes, row.n);
        ref<LazyDict> lazy = LazyDict::FromBytestring(&pool, bytes, 9);
        ref<LazyDict> fromText = LazyDict::FromJsonString(
            &pool, RoxString::FromUtf8Bytes(&pool, static_cast<unsigned>(row.n), row.bytes), 9);
        if (row.rep < 0) {
            EXPECT_EQ(lazy, nullptr);
            EXPECT_EQ(fromText, nullptr);
            continue;
        }
        ASSERT_NE(lazy, nullptr);
        ASSERT_NE(fromText, nullptr);
        EXPECT_EQ(lazy->GetRep(), row.rep);
        EXPECT_EQ(fromText->GetRep(), row.rep);
        EXPECT_EQ(lazy->GetStoredBytes(), bytes);
        EXPECT_EQ(lazy->GetVersion(), OrvoVersion(9));
        EXPECT_EQ(fromText->GetStoredBytes()->GetLength(), row.n);
    }
    EXPECT_EQ(LazyDict::FromBytestring(&pool, nullptr, 0), nullptr);
}

TEST_F(LazyDictTest, BodiesAreSharedNotCopied) {
    ref<Dict> dict = MakeDict(&pool);
    ref<LazyDict> fromDict = LazyDict::FromDict(&pool, dict, 11);
    EXPECT_EQ(fromDict->GetRep(), LazyDict::REP_DICT);
    EXPECT_EQ(fromDict->GetStoredDict(), dict);
    EXPECT_EQ(fromDict->ToDict(), dict);
    EXPECT_EQ(fromDict->GetVersion(), OrvoVersion(11));
    EXPECT_EQ(fromDict->GetMempool(), &pool);

    ref<Dictionary> dictionary = Parse("{}");
    ref<LazyDict> fromDictionary = LazyDict::FromDictionary(&pool, dictionary, 0);
    EXPECT_EQ(fromDictionary->GetRep(), LazyDict::REP_DICTIONARY);
    EXPECT_EQ(fromDictionary->GetStoredDictionary(), dictionary);
    EXPECT_EQ(fromDictionary->ToDict()->GetDictionary(), dictionary);

    ref<SornObject> object = EveryTypeCompanion::Factory(&pool);
    ref<LazyDict> fromObject = LazyDict::FromSornObject(&pool, object, 0);
    EXPECT_EQ(fromObject->GetRep(), LazyDict::REP_OBJECT);
    EXPECT_EQ(fromObject->GetStoredObject(), object);
    EXPECT_EQ(object->GetRefCount(), 2u);
    EXPECT_EQ(VkCast<LazyDict>(fromObject), fromObject.get());
    EXPECT_EQ(VkCast<SornObject>(fromObject), nullptr);
}

TEST_F(LazyDictTest, SetDictionaryLeavesTheRepresentation) {
    ref<LazyDict> lazy = FromText(R"({"a": "b"})");
    ref<Dictionary> dictionary = Parse("{}");
    lazy->SetDictionary(dictionary);
    EXPECT_EQ(lazy->GetRep(), LazyDict::REP_JSON);
    EXPECT_EQ(lazy->GetStoredDictionary(), dictionary);
    EXPECT_EQ(DictOf(lazy), R"({"a": "b"})");
}

TEST_F(LazyDictTest, TheSourceIsReleasedOnceAndNotReadBefore) {
    TextSource::Counts counts;
    {
        ref<LazyDict> lazy = LazyDict::FromBytesource(&pool, new TextSource(counts, ""), 42);
        EXPECT_EQ(lazy->GetRep(), LazyDict::REP_BYTESOURCE);
        EXPECT_NE(lazy->GetStoredBytesource(), nullptr);
        ref<LazyDict> another = lazy;
        lazy = nullptr;
        EXPECT_EQ(counts.releases, 0);
        EXPECT_EQ(counts.reads, 0);
    }
    EXPECT_EQ(counts.releases, 1 + counts.newSources);
}

TEST_F(LazyDictTest, NewTakesItsMembersAndTheVersion) {
    const ref<Dict> dict = MakeDict(&pool);
    const ref<rox::ByteBuffer> bytes = Bytes("{}", 2);
    const ref<SornObject> object = EveryTypeCompanion::Factory(&pool);
    TextSource::Counts counts;
    TextSource* const source = new TextSource(counts, "");
    {
        const ref<LazyDict> lazy =
            LazyDict::New(&pool, LazyDict::REP_OBJECT, dict, bytes, object, source, 17);
        EXPECT_EQ(lazy->GetRep(), LazyDict::REP_OBJECT);
        EXPECT_EQ(lazy->GetStoredDict(), dict);
        EXPECT_EQ(lazy->GetStoredBytes(), bytes);
        EXPECT_EQ(lazy->GetStoredObject(), object);
        EXPECT_EQ(lazy->GetStoredBytesource(), source);
        EXPECT_EQ(lazy->GetStoredDictionary(), nullptr);
        EXPECT_EQ(lazy->GetVersion(), OrvoVersion(17));
        EXPECT_EQ(dict->GetRefCount(), 2u);
        EXPECT_EQ(counts.releases, 0);
    }
    EXPECT_EQ(counts.releases, 1);
    EXPECT_EQ(counts.reads, 0);
    EXPECT_EQ(dict->GetRefCount(), 1u);
}

TEST_F(LazyDictTest, ABodyWithoutItsSource) {
    const ref<LazyDict> lazy = LazyDict::FromBytesource(&pool, nullptr, 3);
    EXPECT_EQ(lazy->GetRep(), LazyDict::REP_BYTESOURCE);
    EXPECT_EQ(lazy->GetStoredBytesource(), nullptr);
    EXPECT_EQ(WordsOf(lazy), "");
    EXPECT_EQ(DictOf(lazy), R"({"code": "badArgument", "text": "", "type": "error"})");
    EXPECT_EQ(JsonOf(lazy, false), "before ");
}

TEST_F(LazyDictTest, FromJsonStringCopiesTheText) {
    const char json[] = "{\"a\": \"\xC3\xA9\"}";
    const RoxString text(json);
    const ref<LazyDict> lazy = LazyDict::FromJsonString(&pool, text, 0);
    const ref<rox::ByteBuffer>& bytes = lazy->GetStoredBytes();
    ASSERT_EQ(bytes->GetLength(), sizeof json - 1);
    EXPECT_EQ(std::memcmp(bytes->GetData(), json, sizeof json - 1), 0);
    EXPECT_NE(static_cast<const void*>(bytes->GetData()), static_cast<const void*>(text.Utf8()));
    EXPECT_EQ(bytes->GetMempool(), &pool);
}

TEST_F(LazyDictTest, ToDictOfEachForm) {
    ref<SornObject> object = Object(R"({"type": "everyTypeCompanion", "number": 5})");
    const char* const json = R"({"number": 5, "type": "everyTypeCompanion"})";
    EXPECT_EQ(DictOf(LazyDict::FromSornObject(&pool, object, 0)), json);
    EXPECT_EQ(DictOf(FromText(json)), json);
    EXPECT_EQ(DictOf(LazyDict::FromDictionary(&pool, Parse(json), 0)), json);
    EXPECT_EQ(DictOf(LazyDict::FromDict(&pool, ref<Dict>(new (&pool) Dict(Parse(json))), 0)), json);
}

TEST_F(LazyDictTest, NothingIsCached) {
    ref<LazyDict> lazy = FromText(R"({"a": "b"})");
    RoxString error;
    EXPECT_NE(lazy->ToDict(), lazy->ToDict());
    EXPECT_NE(lazy->ToDictionary(error), lazy->ToDictionary(error));
    EXPECT_EQ(lazy->GetRep(), LazyDict::REP_JSON);
}

TEST_F(LazyDictTest, ObjectsAreWrittenAtTheVersionOfTheBody) {
    ref<sornschema::AudioStream> object(
        static_cast<sornschema::AudioStream*>(sornschema::AudioStream::Factory(&pool).get()));
    object->audioStreamId_7_21 = 5;
    object->audioStreamFormat_7_21 = 999;
    EXPECT_EQ(DictOf(LazyDict::FromSornObject(&pool, object, 0)), R"({"type": "audioStream"})");
    EXPECT_EQ(
        DictOf(LazyDict::FromSornObject(&pool, object, 21)),
        R"({"audioStreamFormat": "INVALID_VALUE:999", "audioStreamId": "vuka:aus.5", "type": "audioStream"})");
}

TEST_F(LazyDictTest, BadJsonBecomesAnErrorDictionaryOrWords) {
    ref<LazyDict> lazy = FromText("{");
    std::string words = WordsOf(lazy);
    EXPECT_NE(words, "");
    EXPECT_EQ(words.find("old;"), std::string::npos);
    ref<Dict> dict = lazy->ToDict();
    EXPECT_EQ(Text(dict->GetString("type", 0)), "error");
    EXPECT_EQ(Text(dict->GetString("code", 0)), "badArgument");
    EXPECT_EQ(Text(dict->GetString("text", 0)), words);
    EXPECT_EQ(dict->CountNames(), 3u);
    EXPECT_EQ(JsonOf(lazy, false), "before {");
    EXPECT_EQ(JsonOf(lazy, true), "before ");
}

TEST_F(LazyDictTest, ABinaryBodyThatDoesNotUnmarshal) {
    // Struct id 0 names nothing. The body is an error object then, in every form.
    const ref<LazyDict> binary = LazyDict::FromBytestring(&pool, Bytes("\x02", 1), 0);
    const char* const sorted =
        R"({"code": "badArgument", "text": "protobuf did not unmarshal", "type": "error"})";
    EXPECT_EQ(DictOf(binary), sorted);
    RoxString error;
    EXPECT_EQ(Text(binary->ToDictionary(error)->ToJson(false)), sorted);
    EXPECT_EQ(Text(error), "");
    EXPECT_EQ(JsonOf(binary, false), std::string("before ") + sorted);  // here the slots have this order, too
    EXPECT_EQ(binary->ToProtobuf(), binary->GetStoredBytes());
}

TEST_F(LazyDictTest, AStreamThatCannotBeRead) {
    TextSource::Counts counts;
    const ref<LazyDict> stream = LazyDict::FromBytesource(&pool, new TextSource(counts, "{\"a\":1"), 0);
    EXPECT_EQ(WordsOf(stream), "");
    const ref<Dict> dict = stream->ToDict();
    EXPECT_EQ(Text(dict->GetString("type", 0)), "error");
    EXPECT_EQ(Text(dict->GetString("code", 0)), "badArgument");
    EXPECT_NE(Text(dict->GetString("text", 0)), "");
    EXPECT_EQ(JsonOf(stream, true), "before ");
    EXPECT_EQ(JsonOf(stream, false), "before ");
    EXPECT_EQ(stream->GetRep(), LazyDict::REP_BYTESOURCE);
    EXPECT_EQ(counts.newSources, counts.releases);
}

TEST_F(LazyDictTest, AnUnknownRepresentation) {
    ref<LazyDict> lazy =
        LazyDict::New(&pool, static_cast<LazyDict::Rep>(6), nullptr, nullptr, nullptr, nullptr, 0);
    EXPECT_EQ(WordsOf(lazy), "LazyDict to Dictionary: unknown representation in LazyDict");
    EXPECT_EQ(DictOf(lazy), R"({"code": "internalError", "text": "bad rep in LazyDict", "type": "error"})");
    EXPECT_EQ(JsonOf(lazy, false), "before ");
    EXPECT_EQ(JsonOf(lazy, true), "before ");
    EXPECT_TRUE(lazy->ToProtobuf()->FEmpty());
    RoxString error("old;");
    EXPECT_EQ(lazy->ToSornObjectOrErrorString(error), nullptr);
    EXPECT_EQ(Text(error), "unknown rep in LazyDict");
    EXPECT_EQ(Context().SornObjectToDictionary(lazy->ToSornObjectOrError().get(), 0)->GetString("text"),
              RoxString("unknown rep in LazyDict"));
    ref<SornObject> object = EveryTypeCompanion::Factory(&pool);
    EXPECT_FALSE(lazy->ToSornObject(object));
    EXPECT_EQ(object, nullptr);
    EXPECT_TRUE(lazy->ToJsonBytestring(false)->FEmpty());
    kelbaselib::ByteCountingBytesink sink;
    lazy->ToJsonBytesink(sink, false);
    EXPECT_EQ(sink.GetWrittenBytes(), 0u);
    EXPECT_TRUE(*lazy == *lazy);
    unsigned structId = 1;
    RoxString name("old");
    EXPECT_FALSE(lazy->GetType(&structId));
    EXPECT_FALSE(lazy->GetTypeName(&name));
    EXPECT_EQ(structId, 1u);
    EXPECT_EQ(Text(name), "old");
}

TEST_F(LazyDictTest, BodiesWithoutTheirMember) {
    for (LazyDict::Rep rep : {LazyDict::REP_DICT, LazyDict::REP_JSON, LazyDict::REP_PROTOBUF,
                              LazyDict::REP_OBJECT, LazyDict::REP_DICTIONARY, LazyDict::REP_BYTESOURCE}) {
        ref<LazyDict> lazy = LazyDict::New(&pool, rep, nullptr, nullptr, nullptr, nullptr, 0);
        EXPECT_EQ(WordsOf(lazy), "");
        EXPECT_EQ(Text(lazy->ToDict()->GetString("type", 0)), "error");
        EXPECT_EQ(JsonOf(lazy, false), "before ");
        RoxString error;
        EXPECT_EQ(lazy->ToSornObjectOrErrorString(error), nullptr);
        EXPECT_FALSE(lazy->ToProtobuf()->FEmpty());  // an error object
        unsigned structId = 0;
        EXPECT_FALSE(lazy->GetType(&structId));
        EXPECT_TRUE(lazy->ToJsonBytestring(false)->FEmpty());
    }
}

TEST_F(LazyDictTest, Json) {
    const char* const odd = "{ \"b\" :1 ,\n\"a\":\"x\"}";
    ref<LazyDict> text = FromText(odd);
    EXPECT_EQ(JsonOf(text, false), std::string("before ") + odd);
    const std::string pretty = "before {\n    \"a\": \"x\", \n    \"b\": 1\n}";
    EXPECT_EQ(JsonOf(text, true), pretty);
    ref<LazyDict> dictionary = LazyDict::FromDictionary(&pool, Parse(odd), 0);
    EXPECT_EQ(JsonOf(dictionary, false), R"(before {"a": "x", "b": 1})");
    EXPECT_EQ(JsonOf(dictionary, true), pretty);
    ref<LazyDict> dict = LazyDict::FromDict(&pool, ref<Dict>(new (&pool) Dict(Parse(odd))), 0);
    EXPECT_EQ(JsonOf(dict, false), R"(before {"a": "x", "b": 1})");
    ref<LazyDict> object =
        LazyDict::FromSornObject(&pool, Object(R"({"type": "everyTypeCompanion", "number": 5})"), 0);
    // In the order of slots, "type" before the last name below it: here "number".
    EXPECT_EQ(JsonOf(object, false), R"(before {"type": "everyTypeCompanion", "number": 5})");
    EXPECT_EQ(JsonOf(object, true), "before {\n    \"number\": 5, \n    \"type\": \"everyTypeCompanion\"\n}");
}

TEST_F(LazyDictTest, EqualContentsAreEqualInAnyForm) {
    const char* const json = R"({"number": 5, "type": "everyTypeCompanion"})";
    ref<LazyDict> bodies[] = {FromText(json), FromText(R"( {"type":"everyTypeCompanion","number":5})"),
                              LazyDict::FromSornObject(&pool, Object(json), 0),
                              LazyDict::FromDictionary(&pool, Parse(json), 0),
                              LazyDict::FromDict(&pool, ref<Dict>(new (&pool) Dict(Parse(json))), 0)};
    ref<LazyDict> other = FromText(R"({"number": 6, "type": "everyTypeCompanion"})");
    for (const ref<LazyDict>& a : bodies) {
        for (const ref<LazyDict>& b : bodies) {
            EXPECT_TRUE(*a == *b);
            EXPECT_FALSE(*a != *b);
        }
        EXPECT_FALSE(*a == *other);
        EXPECT_FALSE(*other == *a);
    }
}

TEST_F(LazyDictTest, WhatDynamicValuesAskOfABody) {
    ref<LazyDict> none;
    ref<LazyDict> text = FromText(R"({ "a" : 1})");
    EXPECT_EQ(Text(DictOfLazyBody(&pool, none)->ToString(false)), "{}");
    EXPECT_EQ(Text(DictOfLazyBody(&pool, text)->ToString(false)), R"({"a": 1})");
    EXPECT_TRUE(FEqualLazyBodies(none, none));
    EXPECT_FALSE(FEqualLazyBodies(none, text));
    EXPECT_FALSE(FEqualLazyBodies(text, none));
    EXPECT_TRUE(FEqualLazyBodies(text, FromText(R"({"a":1})")));
    EXPECT_EQ(LazyBodyToWrite(text, false, false).dictionary, nullptr);
    EXPECT_EQ(LazyBodyToWrite(text, false, false).text, text->GetStoredBytes());
    EXPECT_EQ(LazyBodyToWrite(text, true, true).text, nullptr);
    EXPECT_EQ(Text(LazyBodyToWrite(text, true, true).dictionary->ToJson(false)), R"({"a": 1})");
    ref<Dictionary> dictionary = Parse("{}");
    EXPECT_EQ(LazyBodyToWrite(NewLazyBody(&pool, dictionary, 0), false, true).dictionary, dictionary);
    EXPECT_EQ(NewLazyBody(&pool, dictionary, 7)->GetStoredDictionary(), dictionary);
    EXPECT_EQ(NewLazyBody(&pool, dictionary, 7)->GetVersion(), OrvoVersion(7));
    EXPECT_EQ(NewEmptyLazyBody(&pool)->GetRep(), LazyDict::REP_JSON);
    EXPECT_EQ(DictOf(NewEmptyLazyBody(&pool)), "{}");
}

TEST_F(LazyDictTest, LazyValuesInsideDicts) {
    ref<Dict> dict = MakeDict(&pool);
    dict->AddLazyDict("body", FromText(R"({ "a" : 1})"));
    EXPECT_EQ(Text(dict->ToString(false)), R"({"body": { "a" : 1}})");
    EXPECT_EQ(Text(dict->GetDict("body", 0)->ToString(false)), R"({"a": 1})");
    bool isLazy = false;
    EXPECT_EQ(dict->GetType("body", 0, isLazy), 1);
    EXPECT_TRUE(isLazy);
    ref<LazyDictValue> a(new (&pool) LazyDictValue(FromText(R"({"a":1})")));
    ref<LazyDictValue> b(new (&pool) LazyDictValue(FromText(R"({"a": 1})")));
    ref<NullValue> null(new (&pool) NullValue);
    EXPECT_TRUE(a->Equals(ref<DictValue>(b)));
    EXPECT_FALSE(a->Equals(ref<DictValue>(null)));
}

}  // namespace sorntest
