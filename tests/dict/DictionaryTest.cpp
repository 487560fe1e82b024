#include "sorn/dict/Dictionary.h"

#include <algorithm>

#include "DictFixture.h"
#include "rox/RoxArray.h"
#include "rox/VkCast.h"
#include "sorn/dict/ArrayValue.h"
#include "sorn/dict/DictionaryEntries.h"
#include "sorn/dict/LazyDictValue.h"
#include "sorn/dict/MempoolNew.h"
#include "sorn/dict/NullValue.h"
#include "sorn/dict/StringValue.h"
#include "sorn/lazy/LazyDict.h"

namespace {

using sorn::ArrayValue;
using sorn::Dictionary;
using sorn::DictionaryEntries;
using sorn::DictValue;
using sorn::LazyDict;
using sorn::LazyDictValue;
using sorn::NullValue;
using sorn::StringValue;

class DictionaryTest : public DictFixture {
 protected:
    struct Member {
        const char* name;
        const char* text;
    };
    ref<Dictionary> Make() { return new (&pool) Dictionary; }
    ref<Dictionary> Make(const std::vector<Member>& members) {
        ref<Dictionary> dictionary = Make();
        for (const Member& member : members) dictionary->Add(Text(member.name), Text(member.text));
        return dictionary;
    }
    Strings Texts(const ref<Dictionary>& dictionary, const char* name) {
        RoxStringArray texts(&pool);
        dictionary->GetStringRange(Text(name), texts);
        return Strs(texts);
    }
    Strings Names(const ref<Dictionary>& dictionary) {
        RoxStringArray names(&pool);
        dictionary->GetSortedNames(names);
        return Strs(names);
    }
    static bool FEqual(const ref<Dictionary>& a, const ref<Dictionary>& b) {
        const bool fEqual = a->Equals(b);
        EXPECT_EQ(a->Equals(ref<DictValue>(b)), fEqual);
        return fEqual;
    }
};

TEST_F(DictionaryTest, EmptyOne) {
    const ref<Dictionary> dictionary = Make();
    EXPECT_EQ(dictionary->GetTag(), sorn::dictvalue::DICTIONARY);
    EXPECT_EQ(dictionary->CountNames(), 0u);
    EXPECT_EQ(dictionary->CountValues(Text("x")), 0u);
    EXPECT_EQ(dictionary->Get(Text("x")), nullptr);
    EXPECT_EQ(dictionary->Find("x"), nullptr);
    EXPECT_TRUE(dictionary->GetString(Text("x")).FEmpty());
    EXPECT_EQ(dictionary->GetArray(Text("x")), nullptr);
    EXPECT_EQ(dictionary->GetDictionary(Text("x")), nullptr);
    dictionary->Remove(Text("x"));
    dictionary->SetDebugLockOwner(5);
    EXPECT_EQ(Names(dictionary), Strings());
    EXPECT_EQ(ref<Dictionary>(new (&pool) Dictionary(&pool))->GetMempool(), &pool);
}

TEST_F(DictionaryTest, NewSetsTheType) {
    const ref<Dictionary> typed = Dictionary::New(&pool, Text("recording"));
    EXPECT_EQ(Str(typed->GetString(Text("type"))), "recording");
    EXPECT_EQ(typed->CountNames(), 1u);
    EXPECT_EQ(typed->GetMempool(), &pool);
    EXPECT_EQ(Dictionary::New(&pool, RoxString())->CountNames(), 0u);
}

TEST_F(DictionaryTest, AddsEveryKind) {
    const ref<Dictionary> dictionary = Make();
    const ref<StringValue> text = StringValue::Make("s", &pool);
    const ref<ArrayValue> array(new (&pool) ArrayValue);
    const ref<NullValue> null(new (&pool) NullValue);
    const ref<Dictionary> inner = Make();
    const ref<LazyDict> body = LazyDict::FromDictionary(&pool, inner, 0);
    EXPECT_TRUE(dictionary->Add(Text("string"), text));
    EXPECT_TRUE(dictionary->Add(Text("array"), array));
    EXPECT_TRUE(dictionary->Add(Text("null"), null));
    EXPECT_TRUE(dictionary->Add(Text("dictionary"), inner));
    EXPECT_TRUE(dictionary->Add(Text("value"), ref<DictValue>(text)));
    EXPECT_TRUE(dictionary->Add(Text("text"), Text("t")));
    EXPECT_TRUE(dictionary->Add(Text("lazy"), body));
    EXPECT_TRUE(dictionary->AddBytestring(Text("bytes"), Bytes("A")));
    EXPECT_TRUE(dictionary->Add(Text(""), Text("unnamed")));
    EXPECT_EQ(dictionary->CountNames(), 9u);
    EXPECT_EQ(dictionary->Get(Text("string")).get(), text.get());
    EXPECT_EQ(dictionary->GetArray(Text("array")), array);
    EXPECT_EQ(dictionary->Get(Text("null")).get(), null.get());
    EXPECT_EQ(dictionary->GetDictionary(Text("dictionary")), inner);
    EXPECT_EQ(dictionary->Find("value"), text.get());
    EXPECT_EQ(Str(dictionary->GetString(Text("text"))), "t");
    EXPECT_EQ(dictionary->Get(Text("text"))->GetMempool(), &pool);
    EXPECT_EQ(VkCast<LazyDictValue>(dictionary->Get(Text("lazy")))->GetValue(), body);
    EXPECT_EQ(Str(dictionary->GetString(Text("bytes"))), "QQ==");
    EXPECT_EQ(Str(dictionary->GetString(Text(""))), "unnamed");
    EXPECT_EQ(Str(sorn::MempoolNew<StringValue>(&pool, Text("made"))->GetValue()), "made");
}

TEST_F(DictionaryTest, GettersLookAtTheTag) {
    const ref<Dictionary> dictionary = Make();
    dictionary->Add(Text("d"), Make());
    dictionary->Add(Text("s"), Text("text"));
    dictionary->Add(Text("n"), ref<NullValue>(new (&pool) NullValue));
    EXPECT_TRUE(dictionary->GetString(Text("d")).FEmpty());
    EXPECT_TRUE(dictionary->GetString(Text("n")).FEmpty());
    EXPECT_EQ(dictionary->GetArray(Text("d")), nullptr);
    EXPECT_EQ(dictionary->GetArray(Text("s")), nullptr);
    EXPECT_EQ(dictionary->GetDictionary(Text("s")), nullptr);
}

TEST_F(DictionaryTest, SeveralValuesUnderOneName) {
    const ref<Dictionary> dictionary = Make();
    const ref<Dictionary> inner = Make();
    dictionary->Add(Text("x"), Text("first"));
    dictionary->Add(Text("x"), Text("second"));
    EXPECT_EQ(dictionary->CountValues(Text("x")), 2u);
    EXPECT_EQ(dictionary->CountNames(), 2u);  // values, not names
    dictionary->Add(Text("x"), inner);
    dictionary->Add(Text("x"), Text("fourth"));
    dictionary->Add(Text("y"), Text("other"));
    EXPECT_EQ(dictionary->CountValues(Text("x")), 4u);
    EXPECT_EQ(dictionary->CountNames(), 5u);
    EXPECT_EQ(Str(dictionary->GetString(Text("x"))), "first");
    EXPECT_EQ(Str(VkCast<StringValue>(dictionary->Get(Text("x")))->GetValue()), "first");
    EXPECT_EQ(dictionary->Find("x"), dictionary->Get(Text("x")).get());
    EXPECT_EQ(dictionary->GetDictionary(Text("x")), nullptr);
    EXPECT_EQ(Texts(dictionary, "x"), Strings({"first", "second", "fourth"}));
    RoxArray<DictValue> values(&pool);
    dictionary->GetRange(Text("y"), values);
    dictionary->GetRange(Text("x"), values);
    dictionary->GetRange(Text("unknown"), values);
    ASSERT_EQ(values.GetCount(), 5u);
    EXPECT_EQ(values[3], inner.get());
    EXPECT_EQ(Str(VkCast<StringValue>(values[1])->GetValue()), "first");
    EXPECT_EQ(Str(VkCast<StringValue>(values[4])->GetValue()), "fourth");
    EXPECT_EQ(Names(dictionary), Strings({"x", "y"}));
    dictionary->Remove(Text("x"));
    EXPECT_EQ(dictionary->CountValues(Text("x")), 0u);
    EXPECT_EQ(dictionary->CountNames(), 1u);
    EXPECT_EQ(dictionary->Get(Text("x")), nullptr);
    dictionary->Remove(Text("x"));
    EXPECT_EQ(dictionary->CountNames(), 1u);
    dictionary->Remove(Text("y"));
    EXPECT_EQ(dictionary->CountNames(), 0u);
}

TEST_F(DictionaryTest, GetSortedNamesReplacesTheArray) {
    const ref<Dictionary> dictionary = Make({{"b", ""}, {"a", ""}});
    RoxStringArray names(&pool);
    names.Add(Text("rubbish"));
    dictionary->GetSortedNames(names);
    EXPECT_EQ(Strs(names), Strings({"a", "b"}));
    Make()->GetSortedNames(names);
    EXPECT_TRUE(names.FEmpty());
}

/// Names that are alike in their first bytes, of all short lengths, with and without bytes above 0x7F.
Strings HardNames(unsigned n) {
    Random random(n);
    Strings names;
    while (names.size() < n) {
        std::string name;
        for (unsigned length = random.Below(14); length != 0; --length)
            name.push_back("ab\x01\x7f\x80\xff"[random.Below(6)]);
        if (random.Below(3) == 0) name = "commonPrefix" + name;
        if (std::find(names.begin(), names.end(), name) == names.end()) names.push_back(name);
    }
    return names;
}

TEST_F(DictionaryTest, SortedNamesAreInByteOrder) {
    for (const unsigned n : {1u, 2u, 3u, 10u, 31u, 32u, 33u, 34u, 100u, 1000u, 1023u, 1024u, 1025u, 5000u}) {
        Strings names = HardNames(n);
        const ref<Dictionary> dictionary = Make();
        for (const std::string& name : names) dictionary->Add(Text(name), Text("v"));
        std::sort(names.begin(), names.end(), [](const std::string& a, const std::string& b) {
            return std::strcmp(a.c_str(), b.c_str()) < 0;
        });
        EXPECT_EQ(Names(dictionary), names) << n;
        // Added in order, it is in order already.
        const ref<Dictionary> sorted = Make();
        for (const std::string& name : names) sorted->Add(Text(name), Text("v"));
        EXPECT_EQ(Names(sorted), names) << n;
    }
}

TEST_F(DictionaryTest, NamesWithNulBytesSort) {
    const Strings names = {"",
                           std::string(1, '\0'),
                           std::string("\0a", 2),
                           "a",
                           std::string("a\0", 2),
                           std::string("a\0\0", 3),
                           std::string("a\0b", 3),
                           "ab",
                           "abcdefgh",
                           std::string("abcdefgh\0", 9)};
    const ref<Dictionary> dictionary = Make();
    for (auto name = names.rbegin(); name != names.rend(); ++name) dictionary->Add(Text(*name), Text("v"));
    EXPECT_EQ(Names(dictionary), names);
}

TEST_F(DictionaryTest, ThousandsOfNamesWithNulBytesAndCommonBeginningsSort) {
    // Bytes that end a name, fill up a name and follow it are one here: zeros at every place of eight.
    std::set<std::string> names;
    for (const char* beginning : {"", "eight by", "sixteen bytes ar", "twelve bytes"}) {
        for (unsigned i = 0; i < 3000; ++i) {
            std::string name = beginning;
            for (unsigned rest = i; rest != 0; rest /= 3) name.push_back("\0\x01\xff"[rest % 3]);
            names.insert(name);
        }
    }
    ASSERT_GT(names.size(), 10'000u);
    const ref<Dictionary> dictionary = Make();
    for (auto name = names.rbegin(); name != names.rend(); ++name) dictionary->Add(Text(*name), Text("v"));
    // std::string compares bytes as unsigned ones, and a shorter name comes first.
    EXPECT_EQ(Names(dictionary), Strings(names.begin(), names.end()));
}

TEST_F(DictionaryTest, MoreNamesThanAnArrayHolds) {
    const ref<Dictionary> dictionary = Make();
    for (int i = 70'000; i-- > 0;) dictionary->Add(Text("name" + std::to_string(100'000 + i)), Text("v"));
    EXPECT_EQ(dictionary->CountNames(), 70'000u);
    const Strings names = Names(dictionary);
    ASSERT_EQ(names.size(), 65'535u);
    EXPECT_EQ(names.front(), "name100000");
    EXPECT_EQ(names.back(), "name165534");
    EXPECT_TRUE(dictionary->Equals(dictionary));
}

TEST_F(DictionaryTest, HoldsAsManyValuesOfANameAsAContainer) {
    const ref<Dictionary> dictionary = Make();
    const ref<StringValue> value = StringValue::Make("v", &pool);
    const RoxString name = Text("name");
    const ref<rox::ByteBuffer> bytes = Bytes("b");
    for (unsigned i = 0; i < 65'535; ++i) ASSERT_TRUE(dictionary->Add(name, value));
    const size_t used = pool.GetUsedBytes();
    EXPECT_FALSE(dictionary->Add(name, value));
    EXPECT_FALSE(dictionary->Add(name, name));
    EXPECT_FALSE(dictionary->AddBytestring(name, bytes));
    EXPECT_EQ(pool.GetUsedBytes(), used) << "a refused value is still alive";
    EXPECT_EQ(dictionary->CountValues(name), 65'535u);
    EXPECT_EQ(dictionary->CountNames(), 65'535u);
    EXPECT_TRUE(dictionary->Add(Text("other"), value));
    dictionary->Remove(name);
    EXPECT_EQ(dictionary->CountNames(), 1u);
    EXPECT_EQ(value->GetRefCount(), 2u);
}

TEST_F(DictionaryTest, Equality) {
    EXPECT_TRUE(FEqual(Make(), Make()));
    EXPECT_TRUE(FEqual(Make({{"a", "1"}, {"b", "2"}}), Make({{"b", "2"}, {"a", "1"}})));
    EXPECT_TRUE(FEqual(Make({{"a", "1"}, {"a", "2"}}), Make({{"a", "1"}, {"a", "2"}})));
    EXPECT_FALSE(FEqual(Make({{"a", "1"}, {"a", "2"}}), Make({{"a", "2"}, {"a", "1"}})));
    EXPECT_FALSE(FEqual(Make({{"a", "1"}}), Make({{"a", "2"}})));
    EXPECT_FALSE(FEqual(Make({{"a", "1"}}), Make({{"b", "1"}})));
    EXPECT_FALSE(FEqual(Make({{"a", "1"}}), Make()));
    EXPECT_FALSE(FEqual(Make(), Make({{"a", "1"}})));
    EXPECT_FALSE(FEqual(Make({{"a", "1"}}), Make({{"a", "1"}, {"b", "1"}})));
    EXPECT_FALSE(FEqual(Make({{"a", "1"}}), Make({{"a", "1"}, {"a", "1"}})));
    // As many values, but of other names.
    EXPECT_FALSE(FEqual(Make({{"a", "1"}, {"a", "2"}}), Make({{"a", "1"}, {"b", "2"}})));
    EXPECT_FALSE(FEqual(Make({{"a", "1"}, {"b", "2"}}), Make({{"a", "1"}, {"a", "2"}})));
    EXPECT_FALSE(Make()->Equals(ref<Dictionary>()));
    EXPECT_FALSE(Make()->Equals(ref<DictValue>(new (&pool) ArrayValue)));
}

TEST_F(DictionaryTest, EqualityGoesDeep) {
    const auto nested = [this](const char* text, bool several) {
        const ref<ArrayValue> array(new (&pool) ArrayValue);
        array->Add(Make({{"k", "v"}}));
        array->Add(Make({{"k", text}}));
        ref<Dictionary> dictionary = Make({{"z", "last"}});
        dictionary->Add(Text("list"), array);
        dictionary->Add(Text("inner"), Make({{"k", text}}));
        if (several) dictionary->Add(Text("inner"), Make({{"k", "again"}}));
        return dictionary;
    };
    EXPECT_TRUE(FEqual(nested("x", false), nested("x", false)));
    EXPECT_TRUE(FEqual(nested("x", true), nested("x", true)));
    EXPECT_FALSE(FEqual(nested("x", false), nested("x", true)));
    EXPECT_FALSE(FEqual(nested("x", false), nested("y", false)));
}

TEST_F(DictionaryTest, NullsMakeDictionariesDiffer) {
    const auto withNull = [this] {
        ref<Dictionary> dictionary = Make();
        dictionary->Add(Text("n"), ref<NullValue>(new (&pool) NullValue));
        return dictionary;
    };
    EXPECT_FALSE(FEqual(withNull(), withNull()));
    const ref<Dictionary> one = withNull();
    EXPECT_FALSE(FEqual(one, one));
}

TEST_F(DictionaryTest, NullReferencesCountAsValues) {
    const ref<Dictionary> a = Make();
    EXPECT_TRUE(a->Add(Text("n"), ref<DictValue>()));
    EXPECT_EQ(a->CountNames(), 1u);
    EXPECT_EQ(a->CountValues(Text("n")), 1u);
    EXPECT_EQ(a->Get(Text("n")), nullptr);
    EXPECT_TRUE(a->GetString(Text("n")).FEmpty());
    const ref<Dictionary> b = Make();
    b->Add(Text("n"), ref<DictValue>());
    EXPECT_TRUE(FEqual(a, b));
    EXPECT_FALSE(FEqual(a, Make({{"n", ""}})));
    EXPECT_FALSE(FEqual(Make({{"n", ""}}), a));
    a->Add(Text("n"), Text("second"));
    EXPECT_EQ(a->CountValues(Text("n")), 2u);
    EXPECT_EQ(Texts(a, "n"), Strings({"second"}));
    RoxArray<DictValue> values(&pool);
    a->GetRange(Text("n"), values);
    ASSERT_EQ(values.GetCount(), 2u);
    EXPECT_EQ(values[0], nullptr);
    a->Remove(Text("n"));
    EXPECT_EQ(a->CountNames(), 0u);
}

TEST_F(DictionaryTest, ValuesAreShared) {
    const ref<Dictionary> inner = Make({{"k", "v"}});
    const ref<Dictionary> a = Make();
    const ref<Dictionary> b = Make();
    a->Add(Text("i"), inner);
    b->Add(Text("j"), inner);
    inner->Add(Text("new"), Text("n"));
    EXPECT_EQ(a->GetDictionary(Text("i"))->CountNames(), 2u);
    EXPECT_EQ(b->GetDictionary(Text("j")), inner);
    EXPECT_EQ(inner->GetRefCount(), 3u);
}

TEST_F(DictionaryTest, ClassTest) {
    const ref<DictValue> value = Make();
    EXPECT_EQ(VkCast<Dictionary>(value), value.get());
    EXPECT_EQ(VkCast<DictValue>(value), value.get());
    EXPECT_EQ(VkCast<ArrayValue>(value), nullptr);
}

TEST_F(DictionaryTest, EntriesGiveNamesAndValues) {
    const ref<Dictionary> dictionary = Make({{"one", "1"}, {"two", "2"}, {"two", "3"}, {"", "0"}});
    Strings seen;
    for (DictionaryEntries names(*dictionary); names.FCurrent(); names.Next()) {
        const DictionaryEntries::Name name = names.Current();
        std::string line(name.Utf8(), name.NByte());
        EXPECT_EQ(Str(name.ToRoxString()), line);
        EXPECT_EQ(name.GetRepN() == nullptr, line.empty());
        EXPECT_EQ(name.GetSeveral() != nullptr, line == "two");
        for (unsigned i = 0; i < name.CountValues(); ++i) {
            line += ' ';
            line += VkCast<StringValue>(name.At(i))->GetValue().Utf8();
        }
        seen.push_back(line);
    }
    std::sort(seen.begin(), seen.end());
    EXPECT_EQ(seen, Strings({" 0", "one 1", "two 2 3"}));
    EXPECT_EQ(DictionaryEntries::Count(*dictionary), 3u);
    EXPECT_EQ(dictionary->Find("one")->GetRefCount(), 1u) << "the table's; the walk takes none";
}

TEST_F(DictionaryTest, PushSortedLeavesWhatIsOnTheStack) {
    const ref<Dictionary> dictionary = Make({{"b", ""}, {"a", ""}, {"c", ""}});
    RoxWorkStack<DictionaryEntries::Name, 2> stack(&pool);
    DictionaryEntries::PushSorted(*dictionary, stack);
    const ref<Dictionary> other = Make({{"0", ""}});
    DictionaryEntries::PushSorted(*other, stack);
    DictionaryEntries::PushSorted(*Make(), stack);
    std::string all;
    for (size_t i = 0; i < 3; ++i) all += stack[i].Utf8();
    EXPECT_EQ(stack.Size(), 4u);
    EXPECT_EQ(all, "abc");
}

TEST_F(DictionaryTest, RangesTellWhenTheArrayIsFull) {
    const ref<Dictionary> dictionary = Make({{"x", "first"}, {"x", "second"}});
    const ref<StringValue> filler = StringValue::Make("", &pool);
    RoxArray<DictValue> values(&pool);
    RoxStringArray texts(&pool);
    EXPECT_TRUE(dictionary->GetRange(Text("x"), values));
    EXPECT_TRUE(dictionary->GetStringRange(Text("x"), texts));
    while (values.GetCount() < 65'534) values.Add(filler);
    while (texts.GetCount() < 65'534) texts.Add(Text(""));
    EXPECT_FALSE(dictionary->GetRange(Text("x"), values));
    EXPECT_FALSE(dictionary->GetStringRange(Text("x"), texts));
    ASSERT_EQ(values.GetCount(), 65'535u);
    ASSERT_EQ(texts.GetCount(), 65'535u);
    EXPECT_EQ(values[65'534], dictionary->Find("x"));
    EXPECT_EQ(Str(texts[65'534]), "first");
    // Nothing to add fits.
    dictionary->Add(Text("d"), Make());
    EXPECT_TRUE(dictionary->GetRange(Text("unknown"), values));
    EXPECT_TRUE(dictionary->GetStringRange(Text("unknown"), texts));
    EXPECT_TRUE(dictionary->GetStringRange(Text("d"), texts));
    EXPECT_FALSE(dictionary->GetRange(Text("d"), values));
}

TEST_F(DictionaryTest, ADictionaryThatWasLargeCostsWhatIsLeft) {
    const ref<Dictionary> dictionary = Make();
    const auto name = [this](int i) { return Text("name" + std::to_string(i)); };
    for (int i = 0; i < 100'000; ++i) dictionary->Add(name(i), Text("v"));
    for (int i = 0; i < 100'000; ++i) {
        if (i != 777) dictionary->Remove(name(i));
    }
    EXPECT_LT(pool.GetUsedBytes(), 4096u) << "it keeps the size that it had";
    EXPECT_EQ(Names(dictionary), Strings({"name777"}));
    EXPECT_EQ(dictionary->CountNames(), 1u);
    EXPECT_TRUE(FEqual(dictionary, Make({{"name777", "v"}})));
    EXPECT_FALSE(FEqual(dictionary, Make({{"name778", "v"}})));
    EXPECT_EQ(Str(dictionary->ToJson(false)), R"({"name777": "v"})");
    dictionary->Add(Text("name777"), Text("w"));
    dictionary->Add(Text("another"), Text("x"));
    EXPECT_EQ(Texts(dictionary, "name777"), Strings({"v", "w"}));
    EXPECT_EQ(Names(dictionary), Strings({"another", "name777"}));
}

}  // namespace
