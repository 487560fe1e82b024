#include "sorn/dict/StringValue.h"

#include "DictFixture.h"
#include "rox/VkCast.h"
#include "sorn/dict/MempoolNew.h"
#include "sorn/dict/NullValue.h"

namespace {

using sorn::DictValue;
using sorn::MempoolNew;
using sorn::NullValue;
using sorn::StringValue;

class StringValueTest : public DictFixture {
 protected:
    ref<StringValue> Value(std::string_view text) { return MempoolNew<StringValue>(&pool, Text(text)); }
};

TEST_F(StringValueTest, Makers) {
    struct {
        ref<StringValue> value;
        const char* text;
        bool needQuotes;
    } const cases[] = {
        {new (&pool) StringValue, "", true},
        {Value("plain"), "plain", true},
        {StringValue::Make("text", &pool), "text", true},
        {StringValue::Make("", &pool), "", true},
        {StringValue::Make(Bytes("foob"), &pool), "Zm9vYg==", true},
        {StringValue::Make(ref<rox::ByteBuffer>(), &pool), "", true},
        {StringValue::Make(true, &pool), "true", false},
        {StringValue::Make(false, &pool), "false", false},
        {StringValue::Make(5.0, &pool), "5.0", false},
        {StringValue::Make(-2147483647 - 1, &pool), "-2147483648", false},
        {StringValue::Make(4294967295u, &pool), "4294967295", false},
        {StringValue::Make(-5ll, &pool), "-5", true},
        {StringValue::Make(18446744073709551615ull, &pool), "18446744073709551615", true},
    };
    for (const auto& c : cases) {
        EXPECT_EQ(Str(c.value->GetValue()), c.text);
        EXPECT_EQ(c.value->FNeedQuotes(), c.needQuotes) << c.text;
        EXPECT_EQ(c.value->GetTag(), sorn::dictvalue::STRING);
        EXPECT_EQ(c.value->GetMempool(), &pool);
    }
    EXPECT_TRUE(StringValue::EmptyValue(&pool).FEmpty());
}

TEST_F(StringValueTest, QuotesCanBeSet) {
    const ref<StringValue> value = Value("5");
    value->SetNeedQuotes(false);
    EXPECT_FALSE(value->FNeedQuotes());
    value->SetNeedQuotes(true);
    EXPECT_TRUE(value->FNeedQuotes());
}

TEST_F(StringValueTest, MadeInItsContainersPool) {
    const ref<StringValue> value(new (&pool) StringValue(&pool, Text("x"), false));
    EXPECT_EQ(value->GetMempool(), &pool);
    EXPECT_FALSE(value->FNeedQuotes());
    const ref<StringValue> onHeap(new (static_cast<RoxMempool*>(nullptr)) StringValue(RoxString("y")));
    EXPECT_EQ(onHeap->GetMempool(), nullptr);
}

/// A conversion that must fail leaves the target alone.
template <class T>
void ExpectFails(const ref<StringValue>& value, T untouched) {
    T target = untouched;
    EXPECT_FALSE(value->GetValue(target)) << value->GetValue().Utf8();
    EXPECT_EQ(target, untouched) << value->GetValue().Utf8();
}

template <class T>
void ExpectGives(const ref<StringValue>& value, T expected) {
    T target{};
    EXPECT_TRUE(value->GetValue(target)) << value->GetValue().Utf8();
    EXPECT_EQ(target, expected) << value->GetValue().Utf8();
}

TEST_F(StringValueTest, ToBool) {
    ExpectGives(Value("true"), true);
    bool target = true;
    EXPECT_TRUE(Value("false")->GetValue(target));
    EXPECT_FALSE(target);
    for (const char* text : {"True", "FALSE", "1", "0", "", " true", "true ", "falsetrue"}) {
        ExpectFails(Value(text), true);
        ExpectFails(Value(text), false);
    }
}

TEST_F(StringValueTest, ToBytes) {
    ref<rox::ByteBuffer> bytes;
    EXPECT_TRUE(Value("Zm9vYg==")->GetValue(bytes));
    EXPECT_EQ(Str(bytes), "foob");
    EXPECT_EQ(bytes->GetMempool(), &pool);
    EXPECT_TRUE(Value("not Base64")->GetValue(bytes));
    ASSERT_NE(bytes, nullptr);
    EXPECT_EQ(bytes->GetLength(), 0u);
    EXPECT_TRUE(Value("")->GetValue(bytes));
    EXPECT_EQ(bytes->GetLength(), 0u);
}

TEST_F(StringValueTest, ToInt) {
    ExpectGives(Value(" 7x"), 7);
    ExpectGives(Value("12abc"), 12);
    ExpectGives(Value("+5"), 5);
    ExpectGives(Value("2147483647"), 2147483647);
    ExpectGives(Value("-2147483648"), -2147483647 - 1);
    for (const char* text :
         {"2147483648", "-2147483649", "4294967296", "99999999999999999999", "", " ", "x7", "-", "+-1"}) {
        ExpectFails(Value(text), 4711);
    }
}

TEST_F(StringValueTest, ToUnsigned) {
    ExpectGives(Value("4294967295"), 4294967295u);
    ExpectGives(Value(" 7 8"), 7u);
    ExpectGives(Value("-18446744073709551615"), 1u);  // wraps as it does in C
    for (const char* text : {"4294967296", "-1", "18446744073709551616", "", "x"})
        ExpectFails(Value(text), 4711u);
}

TEST_F(StringValueTest, ToLongLong) {
    ExpectGives(Value("-12 and more"), -12ll);
    ExpectGives(Value("9223372036854775808"), 9223372036854775807ll);  // the nearest in range
    ExpectGives(Value("-9223372036854775809"), -9223372036854775807ll - 1);
    ExpectFails(Value("abc"), 4711ll);
    ExpectFails(Value(""), 4711ll);
}

TEST_F(StringValueTest, ToUnsignedLongLong) {
    ExpectGives(Value("18446744073709551615"), 18446744073709551615ull);
    ExpectGives(Value("18446744073709551616"), 18446744073709551615ull);
    ExpectGives(Value("-1"), 18446744073709551615ull);
    ExpectGives(Value("-18446744073709551616"), 18446744073709551615ull);
    ExpectGives(Value("0x1F"), 0ull);
    ExpectFails(Value("-"), 4711ull);
}

TEST_F(StringValueTest, ToDouble) {
    ExpectGives(Value(" -1.5e2z"), -150.0);
    ExpectGives(Value("0x10"), 16.0);
    ExpectFails(Value("."), 4711.0);
    ExpectFails(Value(""), 4711.0);
}

TEST_F(StringValueTest, AllConversionsStopAtANul) {
    const ref<StringValue> value =
        Value(std::string_view("1\0"
                               "2",
                               3));
    ExpectGives(value, 1ll);
    ExpectGives(value, 1.0);
    ExpectFails(Value(std::string_view("true\0", 5)), false);
}

TEST_F(StringValueTest, EqualByText) {
    const ref<DictValue> a = Value("5");
    const ref<DictValue> same = StringValue::Make(5, &pool);  // without quotes
    EXPECT_TRUE(a->Equals(same));
    EXPECT_TRUE(same->Equals(a));
    EXPECT_TRUE(a->Equals(a));
    EXPECT_FALSE(a->Equals(ref<DictValue>(Value("5 "))));
    EXPECT_FALSE(a->Equals(ref<DictValue>(Value(std::string_view("5\0", 2)))));
    EXPECT_FALSE(a->Equals(ref<DictValue>(new (&pool) NullValue)));
    EXPECT_FALSE(a->Equals(nullptr));
    EXPECT_TRUE(Value("")->Equals(ref<DictValue>(new (&pool) StringValue)));
}

TEST_F(StringValueTest, ClassTest) {
    const ref<DictValue> value = Value("x");
    EXPECT_EQ(VkCast<StringValue>(value), value.get());
    EXPECT_EQ(VkCast<DictValue>(value), value.get());
    EXPECT_EQ(VkCast<NullValue>(value), nullptr);
}

TEST_F(StringValueTest, NullValueEqualsNothing) {
    const ref<DictValue> null(new (&pool) NullValue);
    const ref<DictValue> other(new (&pool) NullValue(&pool));
    EXPECT_EQ(null->GetTag(), sorn::dictvalue::LAZY_DICT);
    EXPECT_FALSE(null->Equals(null));
    EXPECT_FALSE(null->Equals(other));
    EXPECT_FALSE(null->Equals(nullptr));
    EXPECT_FALSE(null->Equals(ref<DictValue>(Value(""))));
    EXPECT_EQ(VkCast<NullValue>(null), null.get());
}

}  // namespace
