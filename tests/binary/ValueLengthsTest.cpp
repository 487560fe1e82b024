// Numbers and texts of every length, from blocks of exactly the bytes. Invariants for untrusted input: 1, 2.

#include "binary/ValueRows.h"

namespace sorntest {

using namespace sorn;
using sornschema::EveryType;

class ValueLengthsTest : public BinaryFixture {
 protected:
    /// A number alone and before others in a struct of one field.
    template <class T>
    void CheckNumber(const char* name, T value, const std::string& wire);
};

template <class T>
void ValueLengthsTest::CheckNumber(const char* name, T value, const std::string& wire) {
    const OneFieldStruct one(name);
    const ref<SornObject> object = EveryType::Factory(&pool);
    FieldTarget(object->MemberAt(one.Field()), false).StorePlain(value);
    object->SetPresent(one.Field());
    const std::string bytes = one.Tag(0) + wire;
    EXPECT_EQ(
        Written([&](ProtoBufByteOutputStream& s) { Codec().MarshalFields(&one.Info(), object.get(), s); }),
        Hex(bytes));
    // Behind it nothing, or up to ten more bytes: the same field once more, with a value of one byte.
    for (unsigned nMore = 0; nMore <= 10; nMore += static_cast<unsigned>(one.Tag(0).size()) + 1) {
        std::string more;
        while (more.size() < nMore) more += one.Tag(0) + '\1';
        const ref<SornObject> again = EveryType::Factory(&pool);
        for (size_t n = 0; n <= bytes.size(); ++n) {  // and cut off at every place
            const ExactBytes exact(n < bytes.size() ? bytes.substr(0, n) : bytes + more);
            const unsigned char* cursor = exact.Begin();
            EXPECT_EQ(Codec().UnmarshalFields(&one.Info(), &cursor, exact.End(), again.get()),
                      n == 0 || n == bytes.size());
        }
        if (more.empty()) {
            EXPECT_EQ(FieldSource(again->MemberAt(one.Field()), false).PlainAt<T>(0), value);
        }
    }
}

TEST_F(ValueLengthsTest, NumbersOfEveryLength) {
    for (unsigned nBits = 0; nBits <= 64; ++nBits) {
        const uint64_t edge = nBits == 64 ? 0 : uint64_t{1} << nBits;
        for (const uint64_t value : {edge - 1, edge, edge + 1}) {
            SCOPED_TRACE(value);
            CheckNumber("optionalU64", value, Varint(value));
            CheckNumber("requiredLongId", value, Varint(value));
            const auto narrow = static_cast<uint32_t>(value);
            CheckNumber("optionalU32", narrow, Varint(narrow));
            // In zigzag form even numbers stand for 0, 1, 2, ..., odd ones for -1, -2, ...
            const auto half = static_cast<int64_t>(value / 2);
            CheckNumber("optionalS64", value % 2 == 0 ? half : -half - 1, Varint(value));
            const auto narrowHalf = static_cast<int32_t>(narrow / 2);
            CheckNumber("requiredS32", narrow % 2 == 0 ? narrowHalf : -narrowHalf - 1, Varint(narrow));
        }
    }
}

/// Texts around every length at which copying changes its way, alone and behind others.
TEST_F(ValueLengthsTest, TextsOfEveryLength) {
    const OneFieldStruct one("multiString");
    std::string all;
    const ref<SornObject> object = EveryType::Factory(&pool);
    for (unsigned n = 0; n <= 300; ++n) {
        std::string text;
        for (unsigned i = 0; i < n; ++i) text += static_cast<char>('!' + (n + i) % 90);
        FieldTarget(object->MemberAt(one.Field()), true).StoreText(RoxString(&pool, text.c_str()));
        all += one.Tag(2) + Section(text);
        const ref<SornObject> alone = EveryType::Factory(&pool);
        const ExactBytes exact(one.Tag(2) + Section(text));
        const unsigned char* cursor = exact.Begin();
        ASSERT_TRUE(Codec().UnmarshalFields(&one.Info(), &cursor, exact.End(), alone.get()));
        EXPECT_EQ(Text(FieldSource(alone->MemberAt(one.Field()), true).TextAt(0)), text);
    }
    EXPECT_EQ(
        Written([&](ProtoBufByteOutputStream& s) { Codec().MarshalFields(&one.Info(), object.get(), s); }),
        Hex(all));
}

}  // namespace sorntest
