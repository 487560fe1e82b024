#include "sorn/dict/Dict.h"

#include "DictFixture.h"
#include "rox/RoxArray.h"
#include "rox/VkCast.h"
#include "sorn/dict/ArrayValue.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/dict/LazyDictValue.h"
#include "sorn/dict/NullValue.h"
#include "sorn/dict/StringValue.h"
#include "sorn/lazy/LazyDict.h"

namespace {

using sorn::ArrayValue;
using sorn::Dict;
using sorn::Dictionary;
using sorn::DictValue;
using sorn::LazyDict;
using sorn::LazyDictValue;
using sorn::MakeDict;
using sorn::NullValue;
using sorn::StringValue;

class DictTest : public DictFixture {
 protected:
    ref<LazyDict> Lazy(std::string_view json) { return LazyDict::FromJsonString(&pool, Text(json), 0); }
    ref<NullValue> Null() { return new (&pool) NullValue; }
    /// The texts of a name's values, an empty one for a value that is no text.
    static Strings Texts(const ref<Dict>& dict, const char* name) {
        Strings texts;
        for (unsigned i = 0; i < dict->CountValues(name); ++i) texts.push_back(Str(dict->GetString(name, i)));
        return texts;
    }
};

TEST_F(DictTest, Construction) {
    const ref<Dict> dict(new (&pool) Dict);
    EXPECT_EQ(dict->CountNames(), 0u);
    EXPECT_EQ(dict->GetDictionary()->GetMempool(), &pool);
    EXPECT_EQ(MakeDict(&pool)->GetMempool(), &pool);
    const ref<Dictionary> dictionary = Dictionary::New(&pool, Text("t"));
    const ref<Dict> wrapping(new (&pool) Dict(dictionary));
    EXPECT_EQ(wrapping->GetDictionary(), dictionary);
    EXPECT_EQ(Str(wrapping->GetString("type", 0)), "t");
    EXPECT_EQ(Str(Dict::New(&pool, Text("u"))->GetString("type", 0)), "u");
    EXPECT_EQ(Dict::New(&pool, RoxString())->CountNames(), 0u);
    EXPECT_EQ(VkCast<Dict>(wrapping), wrapping.get());
    EXPECT_EQ(VkCast<Dictionary>(wrapping), nullptr);
    EXPECT_DEATH(new (&pool) Dict(ref<Dictionary>()), "no dictionary");
}

TEST_F(DictTest, InsertTypeZeroOnlyAdds) {
    const ref<Dict> dict = Dict::New(&pool, Text("a"));
    dict->InsertTypeZero(Text("b"));
    EXPECT_EQ(Texts(dict, "type"), Strings({"a", "b"}));
    dict->InsertTypeZero(RoxString());
    EXPECT_EQ(Texts(dict, "type"), Strings({"a", "b", ""}));
}

TEST_F(DictTest, SecondValueMakesAnArray) {
    const ref<Dict> dict = MakeDict(&pool);
    EXPECT_TRUE(dict->AddString("n", "a"));
    EXPECT_EQ(dict->CountValues("n"), 1u);
    EXPECT_EQ(Str(dict->GetString("n", 0)), "a");
    EXPECT_EQ(Str(dict->GetString("n", 1)), "");
    EXPECT_TRUE(dict->AddString(Text("n"), Text("b")));
    EXPECT_EQ(dict->CountValues("n"), 2u);
    EXPECT_EQ(dict->CountValues(Text("n")), 2u);
    EXPECT_EQ(dict->CountNames(), 1u);
    EXPECT_EQ(Texts(dict, "n"), Strings({"a", "b"}));
    const ref<ArrayValue> array = dict->GetDictionary()->GetArray(Text("n"));
    ASSERT_NE(array, nullptr);
    EXPECT_EQ(array->GetMempool(), &pool);
    EXPECT_TRUE(dict->AddString("n", "c"));
    EXPECT_EQ(dict->GetDictionary()->GetArray(Text("n")), array);
    EXPECT_EQ(Texts(dict, "n"), Strings({"a", "b", "c"}));
    EXPECT_EQ(dict->CountValues("unknown"), 0u);
}

TEST_F(DictTest, AnArrayThatIsThereIsAppendedTo) {
    const ref<Dict> dict = MakeDict(&pool);
    const ref<ArrayValue> array(new (&pool) ArrayValue);
    dict->GetDictionary()->Add(Text("n"), array);
    EXPECT_EQ(dict->CountValues("n"), 0u);
    dict->AddString("n", "a");
    EXPECT_EQ(array->CountValues(), 1u);
    EXPECT_EQ(Texts(dict, "n"), Strings({"a"}));
}

TEST_F(DictTest, OfSeveralDictionaryValuesOnlyTheFirstIsSeen) {
    const ref<Dict> dict = MakeDict(&pool);
    dict->GetDictionary()->Add(Text("n"), Text("a"));
    dict->GetDictionary()->Add(Text("n"), Text("b"));
    EXPECT_EQ(dict->CountNames(), 2u);
    EXPECT_EQ(Texts(dict, "n"), Strings({"a"}));
    dict->AddString("n", "c");  // the name goes with all its values, the first comes back
    EXPECT_EQ(dict->CountNames(), 1u);
    EXPECT_EQ(Texts(dict, "n"), Strings({"a", "c"}));
}

TEST_F(DictTest, DictsAreShared) {
    const ref<Dict> dict = MakeDict(&pool);
    const ref<Dict> inner = Dict::New(&pool, Text("inner"));
    EXPECT_TRUE(dict->AddDict("d", inner));
    EXPECT_TRUE(dict->AddDict(Text("d"), MakeDict(&pool)));
    EXPECT_FALSE(dict->AddDict("d", nullptr));
    EXPECT_FALSE(dict->AddDict("e", nullptr));
    EXPECT_EQ(dict->CountValues("d"), 2u);
    EXPECT_EQ(dict->CountValues("e"), 0u);
    EXPECT_EQ(dict->GetDict("d", 0)->GetDictionary(), inner->GetDictionary());
    EXPECT_EQ(dict->GetDict(Text("d"), 0)->GetMempool(), &pool);
    inner->AddString("later", "x");
    EXPECT_EQ(Str(dict->GetDict("d", 0)->GetString("later", 0)), "x");
    EXPECT_EQ(dict->GetDict("d", 1)->CountNames(), 0u);
}

TEST_F(DictTest, GetDictNeverGivesNull) {
    const ref<Dict> dict = MakeDict(&pool);
    dict->AddString("text", "x");
    dict->AddLazyDict("lazy", Lazy("{\"k\":\"v\"}"));
    dict->GetDictionary()->Add(Text("null"), Null());
    dict->GetDictionary()->Add(Text("bodiless"), ref<DictValue>(new (&pool) LazyDictValue));
    for (const char* name : {"text", "unknown", "null", "bodiless"}) {
        ASSERT_NE(dict->GetDict(name, 0), nullptr) << name;
        EXPECT_EQ(dict->GetDict(name, 0)->CountNames(), 0u) << name;
        EXPECT_EQ(dict->GetDict(name, 0)->GetMempool(), &pool) << name;
    }
    EXPECT_EQ(Str(dict->GetDict("lazy", 0)->GetString("k", 0)), "v");
    EXPECT_EQ(dict->GetDict("lazy", 1)->CountNames(), 0u);
}

TEST_F(DictTest, LazyDicts) {
    const ref<Dict> dict = MakeDict(&pool);
    const ref<LazyDict> body = Lazy("{}");
    const ref<Dict> inner = MakeDict(&pool);
    EXPECT_TRUE(dict->AddLazyDict("l", body));
    EXPECT_FALSE(dict->AddLazyDict("l", nullptr));
    dict->AddDict("d", inner);
    dict->GetDictionary()->Add(Text("null"), Null());
    EXPECT_EQ(dict->CountValues("l"), 1u);
    testing::internal::CaptureStderr();
    EXPECT_EQ(dict->GetLazyDict("l", 0), body);
    EXPECT_EQ(dict->GetLazyDict(Text("l"), 0), body);
    const ref<LazyDict> wrapped = dict->GetLazyDict("d", 0);
    EXPECT_EQ(wrapped->GetRep(), LazyDict::REP_DICTIONARY);
    EXPECT_EQ(wrapped->GetStoredDictionary(), inner->GetDictionary());
    EXPECT_TRUE(wrapped->GetVersion().FAbsent());
    EXPECT_EQ(dict->GetLazyDict("null", 0), nullptr);
    EXPECT_EQ(testing::internal::GetCapturedStderr(), "");
    EXPECT_TRUE(dict->AddLazyDict(Text("l"), body));
    EXPECT_EQ(dict->GetLazyDict("l", 1), body);
}

TEST_F(DictTest, GetLazyDictSaysWhatIsMissing) {
    const ref<Dict> dict = MakeDict(&pool);
    dict->AddString("text", "x");
    testing::internal::CaptureStderr();
    EXPECT_EQ(Str(dict->GetLazyDict("none", 3)->GetStoredBytes()), "{}");
    EXPECT_EQ(testing::internal::GetCapturedStderr(), "Dict::GetValueFromWrapper: field none[3] not found");
    testing::internal::CaptureStderr();
    EXPECT_EQ(dict->GetLazyDict(Text("text"), 0)->GetRep(), LazyDict::REP_JSON);
    EXPECT_EQ(testing::internal::GetCapturedStderr(), "text[0] is neither a LazyDict nor a Dict");
}

TEST_F(DictTest, Types) {
    const ref<Dict> dict = MakeDict(&pool);
    dict->AddString("text", "x");
    dict->AddDict("dict", MakeDict(&pool));
    dict->AddLazyDict("lazy", Lazy("{}"));
    dict->GetDictionary()->Add(Text("null"), Null());
    const ref<ArrayValue> nested(new (&pool) ArrayValue);
    nested->Add(ref<ArrayValue>(new (&pool) ArrayValue));
    nested->Add(Text("x"));
    dict->GetDictionary()->Add(Text("array"), nested);
    struct {
        const char* name;
        unsigned index;
        int type;
        bool isLazy;
    } const cases[] = {
        {"text", 0, 0, false},  {"text", 1, 2, false},  {"dict", 0, 1, false},
        {"lazy", 0, 1, true},   {"null", 0, 1, true},   {"array", 0, 2, false},
        {"array", 1, 0, false}, {"array", 2, 2, false}, {"none", 0, 2, false},
    };
    for (const auto& c : cases) {
        for (const bool before : {false, true}) {
            bool isLazy = before;
            EXPECT_EQ(dict->GetType(c.name, c.index, isLazy), c.type) << c.name;
            EXPECT_EQ(isLazy, c.isLazy) << c.name;
            isLazy = before;
            EXPECT_EQ(dict->GetType(Text(c.name), c.index, isLazy), c.type) << c.name;
            EXPECT_EQ(isLazy, c.isLazy) << c.name;
        }
        EXPECT_EQ(dict->GetType(c.name, c.index), c.type) << c.name;
        EXPECT_EQ(dict->GetType(Text(c.name), c.index), c.type) << c.name;
    }
}

TEST_F(DictTest, FindValue) {
    const ref<Dict> dict = MakeDict(&pool);
    dict->AddString("one", "a");
    dict->AddString("two", "a");
    dict->AddString("two", "b");
    EXPECT_EQ(dict->FindValue("one", 0), dict->GetDictionary()->Get(Text("one")));
    EXPECT_EQ(dict->FindValue(Text("one"), 1), nullptr);
    EXPECT_EQ(Str(VkCast<StringValue>(dict->FindValue("two", 1))->GetValue()), "b");
    EXPECT_EQ(dict->FindValue("two", 2), nullptr);
    EXPECT_EQ(dict->FindValue(Text("three"), 0), nullptr);
}

TEST_F(DictTest, SortedNames) {
    const ref<Dict> dict = MakeDict(&pool);
    dict->AddString("b", "");
    dict->AddString("a", "");
    dict->AddString("b", "");
    dict->SetDebugLockOwner(1);
    RoxStringArray names(&pool);
    dict->GetSortedNames(names);
    EXPECT_EQ(Strs(names), Strings({"a", "b"}));
}

TEST_F(DictTest, RemovesValues) {
    for (const unsigned index : {0u, 5u}) {  // of a single value, whatever the index
        const ref<Dict> dict = MakeDict(&pool);
        dict->AddString("n", "a");
        dict->Remove("n", index);
        EXPECT_EQ(dict->CountNames(), 0u);
    }
    const ref<Dict> dict = MakeDict(&pool);
    dict->AddString("n", "a");
    dict->AddString("n", "b");
    dict->Remove("n", 2);
    EXPECT_EQ(Texts(dict, "n"), Strings({"a", "b"}));
    dict->Remove(Text("n"), 1);
    EXPECT_EQ(Texts(dict, "n"), Strings({"a"}));
    EXPECT_NE(dict->GetDictionary()->GetArray(Text("n")), nullptr) << "it stays an array";
    dict->Remove("n", 0);
    EXPECT_EQ(dict->CountNames(), 0u);
    dict->Remove("n", 0);
    dict->Remove("n");
    dict->AddString("m", "a");
    dict->AddString("m", "b");
    dict->Remove("m");
    EXPECT_EQ(dict->CountNames(), 0u);
    dict->AddString("k", "a");
    dict->Remove(Text("k"));
    EXPECT_EQ(dict->CountNames(), 0u);
}

TEST_F(DictTest, RemoveOfAnEmptyArrayRemovesTheName) {
    const ref<Dict> dict = MakeDict(&pool);
    dict->GetDictionary()->Add(Text("n"), ref<ArrayValue>(new (&pool) ArrayValue));
    dict->Remove("n", 7);
    EXPECT_EQ(dict->CountNames(), 0u);
}

TEST_F(DictTest, AFullArrayRefuses) {
    const ref<Dict> dict = MakeDict(&pool);
    const ref<StringValue> value = StringValue::Make("v", &pool);
    const ref<ArrayValue> array(new (&pool) ArrayValue);
    for (unsigned i = 0; i < 65'534; ++i) array->Add(value);
    dict->GetDictionary()->Add(Text("n"), array);
    EXPECT_TRUE(dict->AddString("n", "last"));
    const ref<Dict> inner = MakeDict(&pool);
    const ref<LazyDict> body = Lazy("{}");
    const size_t used = pool.GetUsedBytes();
    EXPECT_FALSE(dict->AddString("n", "more"));
    EXPECT_FALSE(dict->AddDict("n", inner));
    EXPECT_FALSE(dict->AddLazyDict("n", body));
    EXPECT_EQ(pool.GetUsedBytes(), used) << "a refused value is still alive";
    EXPECT_EQ(dict->CountValues("n"), 65'535u);
    EXPECT_EQ(Str(dict->GetString("n", 65'534)), "last");
}

TEST_F(DictTest, ArgumentsThatLieInWhatTheOperationRemoves) {
    // Several values under one name of the dictionary: the next one that is added takes them all away.
    const auto dictWith = [this](const ref<DictValue>& second) {
        const ref<Dict> dict = MakeDict(&pool);
        dict->GetDictionary()->Add(Text("name"), Text("a first text that is long"));
        dict->GetDictionary()->Add(Text("name"), second);
        return dict;
    };
    const auto secondOf = [this](const ref<Dict>& dict) {
        RoxArray<DictValue> values(&pool);
        dict->GetDictionary()->GetRange(Text("name"), values);
        return values[1];
    };
    const ref<Dict> texts = dictWith(StringValue::Make("a second text that is long", &pool));
    EXPECT_TRUE(texts->AddString(Text("name"), static_cast<StringValue*>(secondOf(texts))->GetValue()));
    EXPECT_EQ(Texts(texts, "name"), Strings({"a first text that is long", "a second text that is long"}));

    const ref<Dict> named = dictWith(StringValue::Make("name", &pool));
    EXPECT_TRUE(named->AddString(static_cast<StringValue*>(secondOf(named))->GetValue(), Text("third")));
    EXPECT_EQ(Texts(named, "name"), Strings({"a first text that is long", "third"}));

    const ref<Dict> lazies = dictWith(ref<DictValue>(new (&pool) LazyDictValue(Lazy("{\"k\":\"v\"}"))));
    EXPECT_TRUE(lazies->AddLazyDict(Text("name"), static_cast<LazyDictValue*>(secondOf(lazies))->GetValue()));
    EXPECT_EQ(Str(lazies->GetDict("name", 1)->GetString("k", 0)), "v");

    const ref<Dict> owner = MakeDict(&pool);
    owner->AddString("k", "v");
    const ref<Dict> dicts = dictWith(ref<DictValue>(owner->GetDictionary()));
    EXPECT_TRUE(dicts->AddDict(Text("name"), owner));
    EXPECT_EQ(Str(dicts->GetDict("name", 1)->GetString("k", 0)), "v");
}

TEST_F(DictTest, RemoveOfAnElementThatIsTheName) {
    const ref<Dict> dict = MakeDict(&pool);
    const ref<ArrayValue> array(new (&pool) ArrayValue);
    array->Add(StringValue::Make("the name of the array", &pool));
    dict->GetDictionary()->Add(Text("the name of the array"), array);
    dict->Remove(static_cast<StringValue*>(array->At(0))->GetValue(), 0);
    EXPECT_EQ(dict->CountNames(), 0u);
    EXPECT_EQ(array->CountValues(), 0u);
}

TEST_F(DictTest, ANullNameIsTheEmptyName) {
    const char* const null = nullptr;
    const ref<Dict> dict = MakeDict(&pool);
    testing::internal::CaptureStderr();
    EXPECT_EQ(Str(dict->GetLazyDict(null, 2)->GetStoredBytes()), "{}");
    EXPECT_EQ(testing::internal::GetCapturedStderr(), "Dict::GetValueFromWrapper: field [2] not found");
    EXPECT_EQ(dict->CountValues(null), 0u);
    EXPECT_TRUE(dict->AddString(null, null));
    EXPECT_EQ(dict->CountValues(""), 1u);
    EXPECT_EQ(dict->CountValues(null), 1u);
    EXPECT_NE(dict->FindValue(null, 0), nullptr);
    EXPECT_EQ(Str(dict->GetString(null, 0)), "");
    EXPECT_EQ(dict->GetDict(null, 0)->CountNames(), 0u);
    EXPECT_EQ(dict->GetType(null, 0), 0);
    bool isLazy = true;
    EXPECT_EQ(dict->GetType(null, 0, isLazy), 0);
    EXPECT_FALSE(isLazy);
    EXPECT_EQ(dict->GetDictionary()->Find(null), dict->GetDictionary()->Find(""));
    EXPECT_TRUE(dict->AddDict(null, MakeDict(&pool)));
    EXPECT_TRUE(dict->AddLazyDict(null, Lazy("{}")));
    EXPECT_EQ(dict->CountValues(""), 3u);
    dict->Remove(null, 1);
    EXPECT_EQ(dict->CountValues(""), 2u);
    dict->Remove(null);
    EXPECT_EQ(dict->CountNames(), 0u);
}

TEST_F(DictTest, ANullReferenceCountsAsNoValue) {
    const ref<Dict> dict = MakeDict(&pool);
    dict->GetDictionary()->Add(Text("n"), ref<DictValue>());
    EXPECT_EQ(dict->CountValues("n"), 0u);
    EXPECT_EQ(dict->CountNames(), 1u);
    EXPECT_EQ(dict->FindValue("n", 0), nullptr);
    EXPECT_EQ(dict->GetType("n", 0), 2);
}

TEST_F(DictTest, Bytestrings) {
    const ref<Dict> dict = MakeDict(&pool);
    dict->AddString("b", "2");
    dict->AddString("a", "\x01");
    EXPECT_EQ(Str(dict->ToBytestring(false)), "{\"a\": \"\\u0001\", \"b\": \"2\"}");
    EXPECT_EQ(Str(dict->ToBytestring(true)), "{\n    \"a\": \"\\u0001\", \n    \"b\": \"2\"\n}");
    EXPECT_EQ(dict->ToBytestring(false)->GetMempool(), &pool);
    EXPECT_EQ(Str(MakeDict(&pool)->ToBytestring(false)), "{}");

    EXPECT_EQ(Str(Dict::FormatBytestring(&pool, Bytes("foob"))), "Zm9vYg==");
    EXPECT_EQ(Str(Dict::FormatBytestring(&pool, Bytes(""))), "");
    EXPECT_EQ(Str(Dict::FormatBytestring(&pool, nullptr)), "");
    EXPECT_EQ(Str(Dict::ParseBytestring(&pool, Text("Zm9vYg=="))), "foob");
    for (const char* text : {"", "Zm9vY", "Zm9v\n", "****"}) {
        const ref<rox::ByteBuffer> bytes = Dict::ParseBytestring(&pool, Text(text));
        ASSERT_NE(bytes, nullptr) << text;
        EXPECT_EQ(bytes->GetLength(), 0u) << text;
    }
}

}  // namespace
