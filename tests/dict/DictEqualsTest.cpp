#include <functional>

#include "DictFixture.h"
#include "sorn/dict/ArrayValue.h"
#include "sorn/dict/Dict.h"
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

/// Comparison of dicts by structure: Dict::Equals with a reference.
class DictEqualsTest : public DictFixture {
 protected:
    ref<Dict> Make(const std::function<void(Dict&)>& fill) {
        ref<Dict> dict = MakeDict(&pool);
        fill(*dict);
        return dict;
    }
    ref<Dict> WithValue(const ref<DictValue>& value) {
        return Make([&](Dict& dict) { dict.GetDictionary()->Add(Text("n"), value); });
    }
    ref<Dict> WithDict(const ref<Dict>& inner) {
        return Make([&](Dict& dict) { dict.AddDict("n", inner); });
    }
    ref<Dict> WithLazy(const ref<LazyDict>& body) {
        return Make([&](Dict& dict) { dict.AddLazyDict("n", body); });
    }
    ref<Dict> WithTexts(const Strings& texts) {
        return Make([&](Dict& dict) {
            for (const std::string& text : texts) dict.AddString(Text("n"), Text(text));
        });
    }
    ref<LazyDict> Lazy(std::string_view json) { return LazyDict::FromJsonString(&pool, Text(json), 0); }
};

TEST_F(DictEqualsTest, Texts) {
    EXPECT_TRUE(MakeDict(&pool)->Equals(MakeDict(&pool)));
    EXPECT_TRUE(WithTexts({"a"})->Equals(WithTexts({"a"})));
    EXPECT_TRUE(WithTexts({"a", "b"})->Equals(WithTexts({"a", "b"})));
    EXPECT_FALSE(WithTexts({"a", "b"})->Equals(WithTexts({"b", "a"})));
    EXPECT_FALSE(WithTexts({"a"})->Equals(WithTexts({"b"})));
    EXPECT_FALSE(WithTexts({"a"})->Equals(WithTexts({"a", "a"})));
    EXPECT_FALSE(WithTexts({"a"})->Equals(MakeDict(&pool)));
    EXPECT_FALSE(MakeDict(&pool)->Equals(WithTexts({"a"})));
    EXPECT_FALSE(MakeDict(&pool)->Equals(ref<Dict>()));
}

TEST_F(DictEqualsTest, NamesAndOrder) {
    const ref<Dict> ab = Make([](Dict& dict) {
        dict.AddString("a", "1");
        dict.AddString("b", "2");
    });
    const ref<Dict> ba = Make([](Dict& dict) {
        dict.AddString("b", "2");
        dict.AddString("a", "1");
    });
    const ref<Dict> ac = Make([](Dict& dict) {
        dict.AddString("a", "1");
        dict.AddString("c", "2");
    });
    EXPECT_TRUE(ab->Equals(ba));
    EXPECT_FALSE(ab->Equals(ac));
}

TEST_F(DictEqualsTest, ASingleValueAndAnArrayOfOneAreTheSame) {
    const ref<ArrayValue> array(new (&pool) ArrayValue);
    array->Add(Text("a"));
    EXPECT_TRUE(WithValue(array)->Equals(WithTexts({"a"})));
    EXPECT_TRUE(WithTexts({"a"})->Equals(WithValue(array)));
}

TEST_F(DictEqualsTest, ValuesOfTheOtherAreCountedAgainstNames) {
    // Several values in the Dictionary itself: one name here, two values there.
    const ref<Dict> several = Make([this](Dict& dict) {
        dict.GetDictionary()->Add(Text("n"), Text("a"));
        dict.GetDictionary()->Add(Text("n"), Text("b"));
    });
    EXPECT_FALSE(several->Equals(several)) << "one name, two values";
    EXPECT_FALSE(WithTexts({"a"})->Equals(several));
    EXPECT_TRUE(several->Equals(WithTexts({"a"}))) << "one name, one value, and only the first is looked at";
    const ref<Dict> twoNames = Make([](Dict& dict) {
        dict.AddString("n", "a");
        dict.AddDict("m", MakeDict(dict.GetMempool()));
    });
    EXPECT_FALSE(twoNames->Equals(several)) << "the counts agree, the names do not";
    const ref<Dict> emptyArray = Make([this](Dict& dict) {
        dict.GetDictionary()->Add(Text("n"), Text("a"));
        dict.GetDictionary()->Add(Text("m"), ref<ArrayValue>(new (&pool) ArrayValue));
    });
    EXPECT_TRUE(emptyArray->Equals(several)) << "an empty array is as no value at all";
}

TEST_F(DictEqualsTest, Dicts) {
    EXPECT_TRUE(WithDict(WithTexts({"a"}))->Equals(WithDict(WithTexts({"a"}))));
    EXPECT_FALSE(WithDict(WithTexts({"a"}))->Equals(WithDict(WithTexts({"b"}))));
    EXPECT_FALSE(WithDict(WithTexts({"a"}))->Equals(WithDict(MakeDict(&pool))));
    EXPECT_FALSE(WithDict(WithTexts({"a"}))->Equals(WithTexts({"a"})));
    EXPECT_FALSE(WithTexts({"a"})->Equals(WithDict(WithTexts({"a"}))));
}

TEST_F(DictEqualsTest, WhatFollowsANestedDictCounts) {
    const auto make = [this](const char* tail) {
        return Make([&](Dict& dict) {
            dict.AddDict("d", WithDict(WithTexts({"x"})));
            dict.AddDict("d", WithTexts({"y"}));
            dict.AddString("d", tail);
            dict.AddString("e", tail);
        });
    };
    EXPECT_TRUE(make("1")->Equals(make("1")));
    EXPECT_FALSE(make("1")->Equals(make("2")));
}

TEST_F(DictEqualsTest, LazyValuesAreEqualAsObjects) {
    const ref<LazyDict> body = Lazy("{\"n\":\"a\"}");
    EXPECT_TRUE(WithLazy(body)->Equals(WithLazy(body)));
    EXPECT_FALSE(WithLazy(body)->Equals(WithLazy(Lazy("{\"n\":\"a\"}"))));
    // A lazy value on this side only is converted; on the other side only it is compared with a new body.
    EXPECT_TRUE(WithLazy(body)->Equals(WithDict(WithTexts({"a"}))));
    EXPECT_FALSE(WithLazy(body)->Equals(WithDict(WithTexts({"b"}))));
    EXPECT_FALSE(WithDict(WithTexts({"a"}))->Equals(WithLazy(body)));
    EXPECT_FALSE(WithLazy(body)->Equals(WithTexts({"a"})));
}

TEST_F(DictEqualsTest, Nulls) {
    const ref<DictValue> null(new (&pool) NullValue);
    const ref<DictValue> another(new (&pool) NullValue);
    EXPECT_TRUE(WithValue(null)->Equals(WithValue(another))) << "both are lazy, and neither has a body";
    EXPECT_TRUE(WithValue(null)->Equals(WithValue(ref<DictValue>(new (&pool) LazyDictValue))));
    EXPECT_FALSE(WithValue(null)->Equals(WithLazy(Lazy("{}"))));
    EXPECT_TRUE(WithValue(null)->Equals(WithDict(MakeDict(&pool))))
        << "without a body it converts to an empty dict";
    EXPECT_FALSE(WithDict(MakeDict(&pool))->Equals(WithValue(null)));
    EXPECT_FALSE(WithValue(null)->Equals(WithTexts({""})));
}

TEST_F(DictEqualsTest, ArraysInArraysEqualNothing) {
    const ref<ArrayValue> nested(new (&pool) ArrayValue);
    nested->Add(ref<ArrayValue>(new (&pool) ArrayValue));
    const ref<Dict> dict = WithValue(nested);
    EXPECT_FALSE(dict->Equals(dict));
    EXPECT_TRUE(dict->Equals(dict.get())) << "the comparison of dictionaries knows no such rule";
    const ref<ArrayValue> withNull(new (&pool) ArrayValue);
    withNull->Add(ref<DictValue>());
    const ref<Dict> nullReference = WithValue(withNull);
    EXPECT_FALSE(nullReference->Equals(nullReference));
}

TEST_F(DictEqualsTest, ThroughADictPointerTheDictionariesCompare) {
    const ref<Dict> a = WithTexts({"a"});
    EXPECT_TRUE(a->Equals(WithTexts({"a"}).get()));
    EXPECT_FALSE(a->Equals(WithTexts({"b"}).get()));
    EXPECT_FALSE(a->Equals(static_cast<const Dict*>(nullptr)));
    const ref<ArrayValue> array(new (&pool) ArrayValue);
    array->Add(Text("a"));
    EXPECT_FALSE(WithValue(array)->Equals(a.get())) << "an array of one is no string";
    EXPECT_TRUE(WithLazy(Lazy("{\"n\":\"a\"}"))->Equals(WithLazy(Lazy("{\"n\":\"a\"}")).get()));
}

}  // namespace
