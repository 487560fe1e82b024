// Objects, dictionaries and lazy bodies inside each other.

#include "json/Support.h"
#include "rox/RoxFeatures.h"
#include "sorn/dict/ArrayValue.h"
#include "sorn/dict/Dict.h"
#include "sorn/dict/LazyDictValue.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/lazy/LazyDict.h"
#include "sornschema/EveryTypeCompanion.h"
#include "sornschema/EveryTypeLazy.h"
#include "support/SmallStack.h"
#include "typedjson/WriterFixture.h"

namespace sorntest {

using namespace sorn;
using sornschema::EveryTypeCompanion;
using sornschema::EveryTypeLazy;

class NestedWriterTest : public WriterFixture {
 protected:
    ref<EveryTypeLazy> Around(const ref<LazyDict>& body) {
        ref<EveryTypeLazy> object = New<EveryTypeLazy>();
        object->body = body;
        return object;
    }
    ref<LazyDict> BodyOf(const ref<SornObject>& object, int version = 0) {
        return LazyDict::FromSornObject(&pool, object, version);
    }
    ref<LazyDict> BodyOf(const ref<Dictionary>& dictionary) {
        return LazyDict::FromDictionary(&pool, dictionary, 0);
    }
    ref<LazyDict> BodyOf(const char* json) {
        return LazyDict::FromJsonString(&pool, RoxString(&pool, json), 0);
    }
    /// {"n": body}
    ref<Dictionary> Under(const ref<LazyDict>& body) {
        ref<Dictionary> dictionary(new (&pool) Dictionary(&pool));
        dictionary->Add(nameM, body);
        return dictionary;
    }
    std::string Compact(const Dictionary& dictionary) {
        jsontest::StringSink sink;
        RoxFeatures::SetEnabled(VK_FEATURE_TYPED_JSON, true);  // sinks get the text of objects then, too
        dictionary.ToJson(sink, JsonFormat(false));
        RoxFeatures::SetEnabled(VK_FEATURE_TYPED_JSON, false);
        const std::string text = ::sorntest::Text(dictionary.ToJson(false));
        EXPECT_EQ(sink.GetText() == text, true);
        return text;
    }

    const RoxString nameM{"n"};
};

TEST_F(NestedWriterTest, BodiesOfAllShapes) {
    struct Row {
        ref<LazyDict> body;
        const char* text;
    };
    ref<EveryTypeCompanion> companion = New<EveryTypeCompanion>();
    companion->number = 4;
    companion->number_isSet = 1;
    const ref<Dictionary> dictionary = Parse(R"({"b": 1, "a": {"c": "2"}})");
    const Row vRow[] = {
        {BodyOf(" {\"b\" :1}"), " {\"b\" :1}"},
        {BodyOf("{not read"), "{not read"},
        {BodyOf(dictionary), R"({"a": {"c": "2"}, "b": 1})"},
        {LazyDict::FromDict(&pool, ref<Dict>(new (&pool) Dict(dictionary)), 0),
         R"({"a": {"c": "2"}, "b": 1})"},
        {BodyOf(companion), R"({"type": "everyTypeCompanion", "number": 4})"},
    };
    for (const Row& row : vRow) {
        const ref<EveryTypeLazy> object = Around(row.body);
        const std::string text = row.text;
        EXPECT_EQ(Typed(object), R"({"type": "everyTypeLazy", "body": )" + text + "}");
        object->body = nullptr;
        object->bodies.Add(row.body.get());
        object->bodies.Add(nullptr);
        object->bodies.Add(row.body.get());
        EXPECT_EQ(Typed(object), R"({"bodies": [)" + text + "," + text + R"(], "type": "everyTypeLazy"})");
        EXPECT_EQ(Compact(*Under(row.body)), R"({"n": )" + text + "}");
    }
}

TEST_F(NestedWriterTest, ABodyHasAVersionOfItsOwn) {
    const ref<SornObject> settings =
        Object(R"({"type": "ttsSettings", "enabled": true, "isFeatureEnabled": true})");
    const char* const old = R"({"type": "ttsSettings", "enabled": true})";
    const char* const now = R"({"enabled": true, "type": "ttsSettings", "isFeatureEnabled": true})";
    for (const int version : {0, 7, 22, 42}) {
        SCOPED_TRACE(version);
        EXPECT_EQ(Typed(Around(BodyOf(settings, 7)), version),
                  std::string(R"({"type": "everyTypeLazy", "body": )") + old + "}");
        EXPECT_EQ(Typed(Around(BodyOf(settings, 0)), version),
                  std::string(R"({"type": "everyTypeLazy", "body": )") + now + "}");
        // What an any-dict field holds is not filtered either, and behind both the object's version is back.
        ref<EveryTypeCompanion> object = New<EveryTypeCompanion>();
        object->child = New<EveryTypeCompanion>();
        object->dict = new (&pool) Dict(Under(BodyOf(settings, 22)));
        object->known = settings;
        EXPECT_EQ(Typed(object, version),
                  std::string(R"({"child": {"type": "everyTypeCompanion"}, "dict": {"n": )") + old +
                      R"(}, "known": )" + (version == 0 || version == 42 ? now : old) +
                      R"(, "type": "everyTypeCompanion"})");
    }
}

TEST_F(NestedWriterTest, ObjectsInDictionaries) {
    const ref<SornObject> account = Object(R"({"type": "account", "accountId": "vuka:an.5", "bodyId": "b"})");
    const std::string text = R"({"accountId": "vuka:an.5", "type": "account", "bodyId": ["b"]})";
    const ref<ArrayValue> list(new (&pool) ArrayValue(&pool));
    list->Add(BodyOf(account));
    list->Add(Under(BodyOf(account)));
    list->Add(BodyOf(account));
    const ref<Dictionary> dictionary = Under(BodyOf(account));
    dictionary->Add(nameM, list);
    dictionary->Add(nameM, BodyOf(account));
    dictionary->Add(RoxString("z"), RoxString("end"));
    EXPECT_EQ(Compact(*dictionary), R"({"n": )" + text + R"(, "n": [)" + text + R"(, {"n": )" + text + "}, " +
                                        text + R"(], "n": )" + text + R"(, "z": "end"})");
    const ref<LazyDictValue> value(new (&pool) LazyDictValue(BodyOf(account)));
    EXPECT_EQ(::sorntest::Text(value->ToJson(false)), text);
    // Pretty text is that of dictionaries throughout.
    EXPECT_EQ(::sorntest::Text(Under(BodyOf(account))->ToJson(true)),
              "{\n"
              "    \"n\": {\n"
              "    \"accountId\": \"vuka:an.5\", \n"
              "    \"bodyId\": [\n"
              "        \"b\"\n"
              "    ], \n"
              "    \"type\": \"account\"\n"
              "}\n"
              "}");
}

TEST_F(NestedWriterTest, BodiesAreReleased) {
    const ref<SornObject> account = Object(R"({"type": "account", "accountId": "vuka:an.5"})");
    const ref<LazyDict> body = BodyOf(account);
    const size_t nBefore = pool.GetUsedBytes();
    {
        ref<EveryTypeCompanion> object = New<EveryTypeCompanion>();
        object->dict = new (&pool) Dict(Under(BodyOf(Around(body))));
        EXPECT_EQ(Typed(object),
                  R"({"dict": {"n": {"type": "everyTypeLazy", "body": {"accountId": "vuka:an.5", )"
                  R"("type": "account"}}}, "type": "everyTypeCompanion"})");
    }
    EXPECT_EQ(pool.GetUsedBytes(), nBefore);
}

TEST_F(NestedWriterTest, AMillionLevelsInTurns) {
    constexpr unsigned nRounds = 500'000;
    RunOnSmallStack([this] {
        ref<Dictionary> dictionary = Parse(R"({"x": "y"})");
        std::string begin;
        std::string end;
        // From the outside in the text begins with the last round.
        for (unsigned i = nRounds; i-- > 0;) {
            const char* const vBegin[] = {R"({"n": {"dict": )", R"({"n": {"type": "everyTypeLazy", "body": )",
                                          R"({"n": {"bodies": [)"};
            begin += vBegin[i % 3];
        }
        for (unsigned i = 0; i < nRounds; ++i) {
            const char* const vEnd[] = {R"(, "type": "everyTypeCompanion"}})", "}}",
                                        R"(], "type": "everyTypeLazy"}})"};
            end += vEnd[i % 3];
            ref<SornObject> object;
            if (i % 3 == 0) {
                ref<EveryTypeCompanion> companion = New<EveryTypeCompanion>();
                companion->dict = new (&pool) Dict(dictionary);
                object = companion;
            } else if (i % 3 == 1) {
                object = Around(BodyOf(dictionary));
            } else {
                ref<EveryTypeLazy> lazy = New<EveryTypeLazy>();
                lazy->bodies.Add(BodyOf(dictionary).get());
                object = lazy;
            }
            dictionary = Under(BodyOf(object));
        }
        const std::string expected = begin + R"({"x": "y"})" + end;
        EXPECT_TRUE(Compact(*dictionary) == expected);
        EXPECT_TRUE(Typed(Around(BodyOf(dictionary))) ==
                    R"({"type": "everyTypeLazy", "body": )" + expected + "}");
    });
}

TEST_F(NestedWriterTest, AMillionObjectsInObjects) {
    constexpr unsigned nLevels = 1'000'000;
    RunOnSmallStack([this] {
        ref<EveryTypeCompanion> object = New<EveryTypeCompanion>();
        std::string begin;
        std::string end = R"({"type": "everyTypeCompanion"})";
        for (unsigned i = nLevels; i-- > 0;) {
            begin += i % 3 == 0 ? R"({"child": )" : i % 3 == 1 ? R"({"children": [)" : R"({"known": )";
        }
        for (unsigned i = 0; i < nLevels; ++i) {
            ref<EveryTypeCompanion> outer = New<EveryTypeCompanion>();
            if (i % 3 == 0) outer->child = object;
            if (i % 3 == 1) outer->children.Add(object.get());
            if (i % 3 == 2) outer->known = object;
            end += i % 3 == 1 ? R"(], "type": "everyTypeCompanion"})" : R"(, "type": "everyTypeCompanion"})";
            object = std::move(outer);
        }
        EXPECT_TRUE(Typed(object) == begin + end);
    });
}

TEST_F(NestedWriterTest, AMillionBodiesOfObjectsInObjects) {
    constexpr unsigned nLevels = 1'000'000;
    RunOnSmallStack([this] {
        ref<EveryTypeLazy> object = New<EveryTypeLazy>();
        std::string begin;
        for (unsigned i = 0; i < nLevels; ++i) {
            object = Around(BodyOf(object));
            begin += R"({"type": "everyTypeLazy", "body": )";
        }
        EXPECT_TRUE(Typed(object) == begin + R"({"type": "everyTypeLazy"})" + std::string(nLevels, '}'));
    });
}

}  // namespace sorntest
