#include <string>

#include "convert/ConvertFixture.h"
#include "json/Support.h"
#include "sorn/dict/ArrayValue.h"
#include "sorn/dict/ByteBuffer.h"
#include "sorn/dict/Dict.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/lazy/LazyDict.h"
#include "sornschema/EveryTypeLazy.h"
#include "support/SmallStack.h"

namespace sorntest {

using namespace sorn;
using sornschema::EveryTypeLazy;

constexpr unsigned nLevelsG = 1'000'000;

std::string Repeated(unsigned n, const std::string& text) {
    std::string result;
    result.reserve(n * text.size());
    for (unsigned i = 0; i < n; ++i) result += text;
    return result;
}

/// Lazy bodies in lazy bodies, as deep as no thread's stack would bear a recursion.
class NestedLazyTest : public ConvertFixture {
 protected:
    /// A dictionary with the text under "n" in a body, in a dictionary under "n", and so on: bodies of both
    /// forms by turns, each third one in an array. `fLazy` false: the same without bodies.
    ref<Dictionary> Deep(const char* text, bool fLazy = true) {
        const RoxString name(&pool, "n");
        ref<Dictionary> dictionary(new (&pool) Dictionary(&pool));
        dictionary->Add(name, RoxString(&pool, text));
        for (unsigned i = 0; i < nLevelsG; ++i) {
            ref<Dictionary> outer(new (&pool) Dictionary(&pool));
            const ref<ArrayValue> array(i % 3 == 0 ? new (&pool) ArrayValue(&pool) : nullptr);
            if (!fLazy) {
                array != nullptr ? array->Add(dictionary) : outer->Add(name, dictionary);
            } else {
                const ref<LazyDict> body =
                    i % 2 == 0 ? LazyDict::FromDictionary(&pool, dictionary, 0)
                               : LazyDict::FromDict(&pool, ref<Dict>(new (&pool) Dict(dictionary)), 0);
                array != nullptr ? array->Add(body) : outer->Add(name, body);
            }
            if (array != nullptr) outer->Add(name, array);
            dictionary = std::move(outer);
        }
        return dictionary;
    }
    /// The text of Deep. With bodies the indentation begins anew on each level.
    static std::string DeepText(const std::string& text, bool pretty) {
        std::string begin;
        std::string end;
        for (unsigned i = nLevelsG; i-- > 0;) {
            const bool fArray = i % 3 == 0;
            begin += pretty ? "{\n    \"n\": " : "{\"n\": ";
            if (fArray) begin += pretty ? "[\n        " : "[";
        }
        begin += pretty ? "{\n    \"n\": \"" : "{\"n\": \"";
        end += pretty ? "\"\n}" : "\"}";
        for (unsigned i = 0; i < nLevelsG; ++i) {
            if (i % 3 == 0) end += pretty ? "\n    ]" : "]";
            end += pretty ? "\n}" : "}";
        }
        return begin + text + end;
    }
    ref<Dict> DictAround(const ref<Dictionary>& dictionary) { return new (&pool) Dict(dictionary); }
};

TEST_F(NestedLazyTest, BodiesInBodiesAreWrittenWithoutRecursion) {
    RunOnSmallStack([this] {
        const ref<Dictionary> deep = Deep("x");
        for (const bool pretty : {false, true}) {
            const std::string expected = DeepText("x", pretty);
            EXPECT_TRUE(Text(deep->ToJson(pretty)) == expected);
            jsontest::StringSink sink;
            deep->ToJson(sink, JsonFormat(pretty));
            EXPECT_TRUE(sink.GetText() == expected);
            ByteBuffer out(&pool);
            LazyDict::FromDictionary(&pool, deep, 0)->ToJsonByteBuffer(out, pretty);
            EXPECT_TRUE(jsontest::String(out) == expected);
        }
    });
}

TEST_F(NestedLazyTest, BodiesInBodiesAreComparedWithoutRecursion) {
    RunOnSmallStack([this] {
        const ref<Dictionary> a = Deep("same");
        {
            const ref<Dictionary> b = Deep("same");
            EXPECT_TRUE(a->Equals(b));
            EXPECT_TRUE(*DictAround(a) == *DictAround(b));
            EXPECT_TRUE(*LazyDict::FromDictionary(&pool, a, 0) ==
                        *LazyDict::FromDict(&pool, DictAround(b), 0));
        }
        const ref<Dictionary> other = Deep("other");
        EXPECT_FALSE(a->Equals(other));
        EXPECT_FALSE(*DictAround(a) == *DictAround(other));
    });
}

TEST_F(NestedLazyTest, StructureOfBodiesAgainstDictionariesWithoutRecursion) {
    RunOnSmallStack([this] {
        const ref<Dict> lazy = DictAround(Deep("same"));
        EXPECT_TRUE(lazy->Equals(DictAround(Deep("same", false))));
        EXPECT_FALSE(lazy->Equals(DictAround(Deep("other", false))));
    });
}

TEST_F(NestedLazyTest, ObjectsInBodiesOfObjectsAreWrittenWithoutRecursion) {
    RunOnSmallStack([this] {
        ref<SornObject> object = EveryTypeLazy::Factory(&pool);
        for (unsigned i = 0; i < nLevelsG; ++i) {
            ref<SornObject> outer = EveryTypeLazy::Factory(&pool);
            static_cast<EveryTypeLazy*>(outer.get())->body = LazyDict::FromSornObject(&pool, object, 0);
            object = std::move(outer);
        }
        // The outermost object is a dictionary, whose names are sorted; those in bodies have the order of
        // slots.
        const std::string expected =
            "{\"body\": " + Repeated(nLevelsG - 1, "{\"type\": \"everyTypeLazy\", \"body\": ") +
            "{\"type\": \"everyTypeLazy\"}" + Repeated(nLevelsG - 1, "}") + ", \"type\": \"everyTypeLazy\"}";
        const ref<LazyDict> body = LazyDict::FromSornObject(&pool, object, 0);
        EXPECT_TRUE(Text(body->ToDict()->ToString(false)) == expected);
    });
}

TEST_F(NestedLazyTest, ABodyOfTextInsideABodyInsideABody) {
    // The text goes out as it is, unless it is to be pretty.
    const ref<Dict> middle = MakeDict(&pool);
    middle->AddLazyDict("t", LazyDict::FromJsonString(&pool, RoxString(" {\"k\":1 }"), 0));
    middle->AddString("z", "2");
    const ref<Dict> outer = MakeDict(&pool);
    outer->AddLazyDict("m", LazyDict::FromDict(&pool, middle, 0));
    outer->AddString("z", "3");
    EXPECT_EQ(Text(outer->ToString(false)), R"({"m": {"t":  {"k":1 }, "z": "2"}, "z": "3"})");
    EXPECT_EQ(Text(outer->ToString(true)),
              "{\n"
              "    \"m\": {\n"
              "    \"t\": {\n"
              "    \"k\": 1\n"
              "}, \n"
              "    \"z\": \"2\"\n"
              "}, \n"
              "    \"z\": \"3\"\n"
              "}");
}

TEST_F(NestedLazyTest, TheIndentationComesBackBehindABodyAndUnreadableOnesAreLeftOut) {
    const ref<Dictionary> inner = Parse(R"({"k": 1})");
    const ref<ArrayValue> list(new (&pool) ArrayValue(&pool));
    list->Add(LazyDict::FromDictionary(&pool, inner, 0));
    list->Add(LazyDict::FromJsonString(&pool, RoxString("{"), 0));  // writes nothing
    list->Add(ref<LazyDict>());
    list->Add(inner);
    const ref<Dictionary> outer(new (&pool) Dictionary(&pool));
    outer->Add(RoxString("list"), list);
    outer->Add(RoxString("alone"), LazyDict::FromJsonString(&pool, RoxString("{"), 0));
    const std::string expected =
        "{\n"
        "    \"list\": [\n"
        "        {\n"
        "    \"k\": 1\n"
        "}, \n"
        "        null, \n"
        "        {\n"
        "            \"k\": 1\n"
        "        }\n"
        "    ]\n"
        "}";
    EXPECT_EQ(Text(outer->ToJson(true)), expected);
    jsontest::StringSink sink;
    outer->ToJson(sink, JsonFormat(true));
    EXPECT_EQ(sink.GetText(), expected);
}

TEST_F(NestedLazyTest, BodiesLongerThanTheWindows) {
    const std::string text = "{\"k\":\"" + std::string(10'000, 'x') + "\"}";
    const ref<Dict> outer = MakeDict(&pool);
    outer->AddLazyDict("raw", LazyDict::FromJsonString(&pool, RoxString(text.c_str()), 0));
    outer->AddLazyDict("walked", LazyDict::FromDictionary(&pool, Parse(text), 0));
    outer->AddString("z", "end");
    const std::string expected =
        "{\"raw\": " + text + ", \"walked\": {\"k\": \"" + std::string(10'000, 'x') + "\"}, \"z\": \"end\"}";
    EXPECT_EQ(Text(outer->ToString(false)), expected);
    jsontest::StringSink sink;
    outer->GetDictionary()->ToJson(sink, JsonFormat(false));
    EXPECT_EQ(sink.GetText(), expected);
    ByteBuffer buffer(&pool);
    outer->GetDictionary()->ToJson(buffer, JsonFormat(false));
    EXPECT_EQ(jsontest::String(buffer), expected);
}

}  // namespace sorntest
