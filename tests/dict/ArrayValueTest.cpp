#include "sorn/dict/ArrayValue.h"

#include "DictFixture.h"
#include "rox/VkCast.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/dict/LazyDictValue.h"
#include "sorn/dict/NullValue.h"
#include "sorn/dict/StringValue.h"
#include "sorn/lazy/LazyDict.h"

namespace {

using sorn::ArrayValue;
using sorn::Dictionary;
using sorn::DictValue;
using sorn::LazyDict;
using sorn::LazyDictValue;
using sorn::NullValue;
using sorn::StringValue;

class ArrayValueTest : public DictFixture {
 protected:
    ref<ArrayValue> Array() { return new (&pool) ArrayValue; }
    ref<ArrayValue> ArrayOf(const Strings& texts) {
        ref<ArrayValue> array = Array();
        for (const std::string& text : texts) array->Add(Text(text));
        return array;
    }
    static bool FEqual(const ref<ArrayValue>& a, const ref<ArrayValue>& b) {
        return a->Equals(ref<DictValue>(b));
    }
};

TEST_F(ArrayValueTest, EmptyOne) {
    const ref<ArrayValue> array = Array();
    EXPECT_EQ(array->GetTag(), sorn::dictvalue::ARRAY);
    EXPECT_EQ(array->CountValues(), 0u);
    EXPECT_EQ(array->GetValueAt(0), nullptr);
    EXPECT_FALSE(array->Remove(0));
    EXPECT_EQ(ref<ArrayValue>(new (&pool) ArrayValue(&pool))->GetMempool(), &pool);
}

TEST_F(ArrayValueTest, AddsEveryKindInOrder) {
    const ref<ArrayValue> array = Array();
    const ref<StringValue> text = StringValue::Make("s", &pool);
    const ref<ArrayValue> inner = Array();
    const ref<NullValue> null(new (&pool) NullValue);
    const ref<Dictionary> dictionary(new (&pool) Dictionary);
    const ref<LazyDict> body = LazyDict::FromDictionary(&pool, dictionary, 0);
    EXPECT_TRUE(array->Add(text));
    EXPECT_TRUE(array->Add(inner));
    EXPECT_TRUE(array->Add(null));
    EXPECT_TRUE(array->Add(dictionary));
    EXPECT_TRUE(array->Add(ref<DictValue>(text)));
    EXPECT_TRUE(array->Add(Text("t")));
    EXPECT_TRUE(array->Add(body));
    EXPECT_TRUE(array->AddBytestring(Bytes("A")));
    ASSERT_EQ(array->CountValues(), 8u);
    EXPECT_EQ(array->GetValueAt(0).get(), text.get());
    EXPECT_EQ(array->GetValueAt(1).get(), inner.get());
    EXPECT_EQ(array->GetValueAt(2).get(), null.get());
    EXPECT_EQ(array->GetValueAt(3).get(), dictionary.get());
    EXPECT_EQ(array->GetValueAt(4).get(), text.get());
    EXPECT_EQ(Str(VkCast<StringValue>(array->GetValueAt(5))->GetValue()), "t");
    EXPECT_EQ(array->GetValueAt(5)->GetMempool(), &pool);
    EXPECT_EQ(VkCast<LazyDictValue>(array->GetValueAt(6))->GetValue(), body);
    EXPECT_EQ(Str(VkCast<StringValue>(array->GetValueAt(7))->GetValue()), "QQ==");
    EXPECT_EQ(array->GetValueAt(8), nullptr);
    EXPECT_EQ(array->GetValueAt(4294967295u), nullptr);
    EXPECT_EQ(array->At(3), dictionary.get());
    EXPECT_EQ(array->GetElements().GetCount(), 8u);
}

TEST_F(ArrayValueTest, RemoveTakesTheFirstOfThatPointer) {
    const ref<ArrayValue> array = Array();
    const ref<StringValue> twice = StringValue::Make("twice", &pool);
    const ref<StringValue> once = StringValue::Make("once", &pool);
    array->Add(twice);
    array->Add(once);
    array->Add(twice);
    EXPECT_FALSE(array->Remove(3));
    EXPECT_TRUE(array->Remove(2));  // the first goes, though the last was asked for
    ASSERT_EQ(array->CountValues(), 2u);
    EXPECT_EQ(array->GetValueAt(0).get(), once.get());
    EXPECT_EQ(array->GetValueAt(1).get(), twice.get());
    EXPECT_TRUE(array->Remove(0));
    EXPECT_EQ(array->GetValueAt(0).get(), twice.get());
    EXPECT_EQ(once->GetRefCount(), 1u);
}

TEST_F(ArrayValueTest, RemoveOfANullTakesTheFirstNull) {
    const ref<ArrayValue> array = Array();
    const ref<StringValue> text = StringValue::Make("text", &pool);
    array->Add(ref<DictValue>());
    array->Add(text);
    array->Add(ref<DictValue>());
    EXPECT_TRUE(array->Remove(2));
    ASSERT_EQ(array->CountValues(), 2u);
    EXPECT_EQ(array->GetValueAt(0).get(), text.get());
    EXPECT_EQ(array->GetValueAt(1), nullptr);
    EXPECT_TRUE(array->Remove(1));
    ASSERT_EQ(array->CountValues(), 1u);
    EXPECT_EQ(array->GetValueAt(0).get(), text.get());
}

TEST_F(ArrayValueTest, EqualInOrder) {
    EXPECT_TRUE(FEqual(Array(), Array()));
    EXPECT_TRUE(FEqual(ArrayOf({"a", "b"}), ArrayOf({"a", "b"})));
    EXPECT_FALSE(FEqual(ArrayOf({"a", "b"}), ArrayOf({"b", "a"})));
    EXPECT_FALSE(FEqual(ArrayOf({"a"}), ArrayOf({"a", "b"})));
    EXPECT_FALSE(FEqual(ArrayOf({"a", "b"}), ArrayOf({"a"})));
    EXPECT_FALSE(FEqual(ArrayOf({"a", "b"}), ArrayOf({"a", "c"})));
    EXPECT_FALSE(Array()->Equals(ref<DictValue>(new (&pool) Dictionary)));
    EXPECT_FALSE(Array()->Equals(nullptr));
}

TEST_F(ArrayValueTest, EqualInDepth) {
    const auto nested = [this](const char* text) {
        ref<ArrayValue> array = Array();
        array->Add(ArrayOf({"x", text}));
        array->Add(Text("tail"));
        return array;
    };
    EXPECT_TRUE(FEqual(nested("y"), nested("y")));
    EXPECT_FALSE(FEqual(nested("y"), nested("z")));
    const ref<ArrayValue> other = Array();
    other->Add(ArrayOf({"x", "y"}));
    other->Add(Text("head"));
    EXPECT_FALSE(FEqual(nested("y"), other));
}

TEST_F(ArrayValueTest, NullsMakeArraysDiffer) {
    const ref<ArrayValue> array = Array();
    array->Add(ref<NullValue>(new (&pool) NullValue));
    EXPECT_FALSE(FEqual(array, array));
}

TEST_F(ArrayValueTest, NullReferencesEqualOnlyEachOther) {
    const ref<ArrayValue> a = Array();
    const ref<ArrayValue> b = Array();
    EXPECT_TRUE(a->Add(ref<DictValue>()));
    EXPECT_TRUE(b->Add(ref<DictValue>()));
    EXPECT_EQ(a->CountValues(), 1u);
    EXPECT_TRUE(FEqual(a, b));
    EXPECT_FALSE(FEqual(a, ArrayOf({""})));
    EXPECT_FALSE(FEqual(ArrayOf({""}), a));
}

TEST_F(ArrayValueTest, HoldsAsManyAsTheRuntimesContainersDo) {
    const ref<ArrayValue> array = Array();
    const ref<StringValue> value = StringValue::Make("v", &pool);
    const ref<LazyDict> body = LazyDict::FromDictionary(&pool, ref<Dictionary>(new (&pool) Dictionary), 0);
    for (unsigned i = 0; i < 65'535; ++i) ASSERT_TRUE(array->Add(value));
    const RoxString text = Text("text");
    const ref<rox::ByteBuffer> bytes = Bytes("bytes");
    const size_t used = pool.GetUsedBytes();
    EXPECT_FALSE(array->Add(value));
    EXPECT_FALSE(array->Add(text));
    EXPECT_FALSE(array->Add(body));
    EXPECT_FALSE(array->AddBytestring(bytes));
    EXPECT_EQ(array->CountValues(), 65'535u);
    EXPECT_EQ(value->GetRefCount(), 65'536u);
    EXPECT_EQ(pool.GetUsedBytes(), used) << "a refused value is still alive";
    EXPECT_TRUE(array->Remove(65'534));
    EXPECT_TRUE(array->Add(text));
}

TEST_F(ArrayValueTest, LazyValues) {
    const ref<LazyDict> a = LazyDict::FromJsonString(&pool, Text("{\"k\":\"v\"}"), 0);
    const ref<LazyDict> same = LazyDict::FromJsonString(&pool, Text("{\"k\":\"v\"}"), 0);
    const ref<LazyDict> other = LazyDict::FromJsonString(&pool, Text("{\"k\":\"w\"}"), 0);
    const auto value = [this](const ref<LazyDict>& body) {
        return ref<DictValue>(new (&pool) LazyDictValue(body));
    };
    EXPECT_TRUE(value(a)->Equals(value(a)));
    EXPECT_TRUE(value(a)->Equals(value(same)));
    EXPECT_FALSE(value(a)->Equals(value(other)));
    EXPECT_FALSE(value(a)->Equals(value(nullptr)));
    EXPECT_TRUE(value(nullptr)->Equals(ref<DictValue>(new (&pool) LazyDictValue)));
    EXPECT_FALSE(value(a)->Equals(nullptr));
    EXPECT_FALSE(value(a)->Equals(ref<DictValue>(StringValue::Make("", &pool))));
    const ref<DictValue> null(new (&pool) NullValue);
    EXPECT_FALSE(value(a)->Equals(null));
    EXPECT_TRUE(value(nullptr)->Equals(null));   // the tag is the same, and neither has a body,
    EXPECT_FALSE(null->Equals(value(nullptr)));  // but a null equals nothing
    EXPECT_EQ(LazyDictValue::BodyOf(*null), nullptr);
    EXPECT_EQ(LazyDictValue::BodyOf(*value(a)), a);
    ASSERT_NE(LazyDictValue::EmptyValue(&pool), nullptr);
    EXPECT_EQ(LazyDictValue::EmptyValue(&pool)->GetRep(), LazyDict::REP_JSON);
    EXPECT_EQ(Str(LazyDictValue::EmptyValue(&pool)->GetStoredBytes()), "{}");
}

}  // namespace
