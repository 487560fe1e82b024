// How much text the encoder reads again for bodies in bodies. Invariants for untrusted input: 4, 12.

#include "binary/ValueRows.h"
#include "rox/RoxFeatures.h"
#include "sorn/binary/LazyLevels.h"
#include "sornschema/EveryTypeLazy.h"

namespace sorntest {

using namespace sorn;
using sornschema::EveryTypeLazy;

TEST(LazyTextBudget, FreeBytesAndText) {
    LazyTextBudget budget;
    EXPECT_TRUE(budget.TakeInner(67108864 - 1));
    EXPECT_FALSE(budget.TakeInner(2));
    EXPECT_TRUE(budget.TakeInner(1)) << "a refusal takes nothing";
    EXPECT_FALSE(budget.TakeInner(1));
    EXPECT_TRUE(budget.TakeInner(0));
    budget.AddOuter(3);
    EXPECT_FALSE(budget.TakeInner(49));
    EXPECT_TRUE(budget.TakeInner(48));
    EXPECT_FALSE(budget.TakeInner(1));
    budget.AddOuter(UINT32_MAX);  // 16 times that needs more than 32 bits
    for (unsigned i = 0; i < 16; ++i) EXPECT_TRUE(budget.TakeInner(UINT32_MAX));
    EXPECT_FALSE(budget.TakeInner(1));
}

class LazyTextTest : public BinaryFixture {
 protected:
    void SetUp() override { RoxFeatures::SetEnabled(VK_FEATURE_TYPED_JSON, true); }
    void TearDown() override {
        RoxFeatures::SetEnabled(VK_FEATURE_TYPED_JSON, false);
        BinaryFixture::TearDown();
    }
    /// Text of n bodies in one another: each but the innermost adds 32 bytes; that one has nInnermost bytes.
    static std::string Nested(unsigned n, size_t nInnermost) {
        const std::string head = R"({"type":"everyTypeCompanion","label":")";
        std::string text = head + std::string(nInnermost - head.size() - 2, 'x') + "\"}";
        for (unsigned i = 1; i < n; ++i) {
            text.insert(0, R"({"type":"everyTypeLazy","body":)");
            text += '}';
        }
        EXPECT_EQ(text.size(), nInnermost + 32 * (n - 1));
        return text;
    }
    /// A body in binary form: n - 1 bodies in one another, and in them the innermost one.
    static std::string Converted(unsigned n, std::string innermost) {
        for (unsigned i = 1; i < n; ++i) {
            innermost = Bytes("A2 F2 02") + Section(Bytes("12") + Section(innermost));
        }
        return innermost;
    }
    static std::string Label(size_t nInnermost) {
        return Bytes("FA F1 02") + Section(Bytes("32") + Section(std::string(nInnermost - 40, 'x')));
    }
    static std::string TooDeep() {
        return Bytes("D2 15") + Section(Bytes("08 03 1A") + Section("lazy bodies nested too deeply"));
    }
    ref<LazyDict> TextBody(const std::string& text) {
        return LazyDict::FromBytestring(
            &pool, rox::ByteBuffer::New(&pool, text.data(), static_cast<uint32_t>(text.size())), 0);
    }
    /// Whether the bodies of an object go out as these values; says nothing of where, since they are long.
    bool AreWrittenAs(std::initializer_list<ref<LazyDict>> bodies,
                      std::initializer_list<std::string> values) {
        const ref<SornObject> object = EveryTypeLazy::Factory(&pool);
        for (const ref<LazyDict>& body : bodies) {
            static_cast<EveryTypeLazy&>(*object).bodies.Add(body.get());
        }
        std::string fields;
        for (const std::string& value : values) fields += Bytes("0A") + Section(value);
        const std::string expected = Bytes("A2 F2 02") + Section(fields);
        const ref<rox::ByteBuffer> bytes = Codec().MarshalKnownDict(object.get());
        return bytes->GetLength() == expected.size() &&
               std::memcmp(bytes->GetData(), expected.data(), expected.size()) == 0;
    }
};

// 273 bodies, the innermost of n bytes: all of them have n + 272 * 32 bytes, and the 272 inside that are read
// again n + 271 * 32, n + 270 * 32, ..., n, together 272 * n + 32 * 272 * 271 / 2. They may take 67108864 +
// 16 * (n + 272 * 32). Both are 71377424 for n = 258081; beyond, each byte adds 272 to the one and 16 to the
// other.
constexpr unsigned nBodiesG = 273;
constexpr size_t nInnermostG = 258081;

TEST_F(LazyTextTest, UpToTheLimit) {
    const ref<LazyDict> body = TextBody(Nested(nBodiesG, nInnermostG));
    // The last one is written first, and takes all. To the one before it are left 16 times its own 266785
    // bytes, 4268560: enough for the 16 inside of it, 16 * 266785 - 32 * (1 + 2 + ... + 16) bytes, and no
    // more.
    EXPECT_TRUE(
        AreWrittenAs({body, body}, {Converted(18, TooDeep()), Converted(nBodiesG, Label(nInnermostG))}));
}

TEST_F(LazyTextTest, BeyondTheLimit) {
    const ref<LazyDict> body = TextBody(Nested(nBodiesG, nInnermostG + 1));
    EXPECT_TRUE(AreWrittenAs({body}, {Converted(nBodiesG, TooDeep())}));
    // The road through a dictionary reads the text once, however deep bodies lie in it.
    RoxFeatures::SetEnabled(VK_FEATURE_TYPED_JSON, false);
    EXPECT_TRUE(AreWrittenAs({body}, {Converted(nBodiesG, Label(nInnermostG + 1))}));
}

TEST_F(LazyTextTest, ShortTextIsBoundedByItsLevelsAlone) {
    EXPECT_TRUE(AreWrittenAs({TextBody(Nested(1000, 41))}, {Converted(1000, Label(41))}));
    EXPECT_TRUE(AreWrittenAs({TextBody(Nested(1002, 41))}, {Converted(1001, TooDeep())}));
}

/// A body of text in a body of bytes in a body of text: what comes as bytes is not read before its turn.
TEST_F(LazyTextTest, TextInBytes) {
    const std::string text = Nested(2, 41);
    const std::string bytes = Bytes("A2 F2 02") + Section(Bytes("12") + Section(text));
    EXPECT_EQ(TextBytesOfLazyBody(TextBody(text)), 73u);
    EXPECT_EQ(TextBytesOfLazyBody(TextBody(bytes)), 0u);
    EXPECT_TRUE(AreWrittenAs({TextBody(bytes)}, {Converted(3, Label(41))}));
}

}  // namespace sorntest
