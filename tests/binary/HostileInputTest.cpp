// Truncated, flipped and lying input, in blocks of exactly its size. Invariants for untrusted input: 1, 2, 4,
// 8, 9.

#include <set>

#include "binary/ValueRows.h"
#include "sornschema/EveryTypePlain.h"

namespace sorntest {

using namespace sorn;
using sornschema::EveryType;
using sornschema::EveryTypeCompanion;

class HostileInputTest : public BinaryFixture {
 protected:
    /// The fields of an everyType, two values for each, and the places at which a value ends.
    std::string WholeRecord(std::set<size_t>& boundaries) {
        std::string bytes;
        boundaries = {0};
        for (const char* arity : {"multi", "optional", "required"}) {
            for (const ValueRow& row : ValueRows(&pool)) {
                const OneFieldStruct one(std::string(arity) + row.name);
                for (const char* value : {row.first, row.second}) {
                    // It is read as another struct than the one that the row's bytes are of.
                    if (std::string(arity) + row.name == "optionalObject") continue;
                    bytes += one.Tag(row.wireType) + Bytes(value);
                    boundaries.insert(bytes.size());
                }
            }
        }
        return bytes;
    }
    /// Reads the bytes; what was read can be written, and nothing stays in the pool.
    bool IsTaken(const std::string& bytes, unsigned structId = EveryType::structIdG) {
        const size_t nBefore = pool.GetUsedBytes();
        bool isRead = false;
        {
            const ExactBytes exact(bytes);
            ref<SornObject> object;
            isRead = Codec().Unmarshal(exact.Begin(), exact.Size(), structId, &object);
            EXPECT_EQ(isRead, object != nullptr);
            if (isRead) {
                DropBodies(*object);
                Codec().MarshalKnownDict(object.get());
            }
        }
        EXPECT_EQ(pool.GetUsedBytes(), nBefore);
        return isRead;
    }
    /// Bodies are for who converts them; this is about the bytes around them.
    static void DropBodies(SornObject& object) {
        if (object.structId != EveryType::structIdG) return;
        auto& record = static_cast<EveryType&>(object);
        record.multiLazy.Destroy();
        record.optionalLazy = nullptr;
        record.requiredLazy = nullptr;
    }
    void SetUp() override { testing::internal::CaptureStdout(); }  // lines about unknown fields
    void TearDown() override {
        testing::internal::GetCapturedStdout();
        BinaryFixture::TearDown();
    }
};

TEST_F(HostileInputTest, TruncatedAtEveryByte) {
    std::set<size_t> boundaries;
    const std::string bytes = WholeRecord(boundaries);
    for (size_t n = 0; n <= bytes.size(); ++n) {
        EXPECT_EQ(IsTaken(bytes.substr(0, n)), boundaries.count(n) != 0) << n;
    }
    // With a length in front nothing but the whole will do.
    const std::string top = Bytes("8A F2 02") + Section(bytes);
    for (size_t n = 0; n <= top.size(); ++n) {
        const ExactBytes exact(top.substr(0, n));
        ref<SornObject> object;
        EXPECT_EQ(Codec().UnmarshalKnownDict(exact.Begin(), exact.Size(), &object), n == top.size()) << n;
    }
}

TEST_F(HostileInputTest, EveryBitFlipped) {
    std::set<size_t> boundaries;
    const std::string bytes = WholeRecord(boundaries);
    unsigned nTaken = 0;
    for (size_t bit = 0; bit < bytes.size() * 8; ++bit) {
        std::string flipped = bytes;
        flipped[bit / 8] = static_cast<char>(flipped[bit / 8] ^ (1 << bit % 8));
        nTaken += IsTaken(flipped) ? 1u : 0u;
    }
    EXPECT_GT(nTaken, 0u);
    EXPECT_LT(nTaken, bytes.size() * 8);
}

TEST_F(HostileInputTest, EveryByteAtItsExtremes) {
    std::set<size_t> boundaries;
    const std::string bytes = WholeRecord(boundaries);
    unsigned nTaken = 0;
    for (size_t i = 0; i < bytes.size(); ++i) {
        for (const int value : {0x00, 0x7F, 0x80, 0xFF}) {
            std::string changed = bytes;
            changed[i] = static_cast<char>(value);
            nTaken += IsTaken(changed) ? 1u : 0u;
        }
    }
    EXPECT_GT(nTaken, 0u);
    EXPECT_LT(nTaken, bytes.size() * 4);
}

/// Every length of every form, with bytes behind it that are all there is.
TEST_F(HostileInputTest, LengthsThatLie) {
    struct Case {
        const char* name;
        const char* before;  ///< what stands before the length
        const char* content;
    };
    // In an everyTypeCompanion: child 0A, children 12, dict 22, known 2A, label 32.
    const Case cases[] = {
        {"a text", "32", "61 62 63"},
        {"an object", "0A", "38 06"},
        {"an object in a list", "12", "38 06"},
        {"an object in an object", "0A 04 0A", "38 06"},
        {"a known dict's fields", "2A 06 FA F1 02", "38 06"},
        {"a dictionary", "22", "22 08 32 01 61 42 03 12 01 62"},
        {"an entry", "22 0A 22", "32 01 61 42 03 12 01 62"},
        {"a name", "22 0A 22 08 42 03 12 01 62 32", "61"},
        {"a value", "22 0A 22 08 32 01 61 42", "12 01 62"},
        {"a text in a value", "22 0A 22 08 32 01 61 42 03 12", "62"},
        {"an unknown field", "42", "01 02 03"},
    };
    for (const Case& each : cases) {
        SCOPED_TRACE(each.name);
        const std::string content = Bytes(each.content);
        const auto n = static_cast<uint64_t>(content.size());
        EXPECT_TRUE(IsTaken(Bytes(each.before) + Varint(n) + content, EveryTypeCompanion::structIdG));
        const uint64_t lies[] = {n + 1, n + 2, 127, 128, INT32_MAX, uint64_t{1} << 31, UINT32_MAX};
        for (const uint64_t lie : lies) {
            EXPECT_FALSE(IsTaken(Bytes(each.before) + Varint(lie) + content, EveryTypeCompanion::structIdG))
                << lie;
        }
        // Ten bytes are too many for all lengths but those of unknown fields, of which the low bits are all
        // ones.
        EXPECT_FALSE(
            IsTaken(Bytes(each.before) + Varint(UINT64_MAX) + content, EveryTypeCompanion::structIdG));
        // Too short: what is left over is read as something else, or refused.
        for (uint64_t lie = 0; lie < n; ++lie) {
            IsTaken(Bytes(each.before) + Varint(lie) + content, EveryTypeCompanion::structIdG);
        }
    }
}

/// The first length of a known-dict field, which only bounds two numbers, must not leave the bytes either.
TEST_F(HostileInputTest, LengthOfAKnownDictField) {
    const std::string content = Bytes("FA F1 02 02 38 06");
    for (const uint64_t n : {4u, 5u, 6u}) {
        EXPECT_TRUE(IsTaken(Bytes("2A") + Varint(n) + content, EveryTypeCompanion::structIdG)) << n;
    }
    for (const uint64_t n : {uint64_t{0}, uint64_t{1}, uint64_t{2}, uint64_t{3}, uint64_t{7},
                             uint64_t{INT32_MAX}, uint64_t{1} << 31, uint64_t{UINT32_MAX}, UINT64_MAX}) {
        EXPECT_FALSE(IsTaken(Bytes("2A") + Varint(n) + content, EveryTypeCompanion::structIdG)) << n;
    }
}

TEST_F(HostileInputTest, BytesAndBodiesThatLie) {
    for (const char* name : {"optionalBytes", "multiBytes", "optionalLazy", "multiLazy", "requiredLazy"}) {
        const OneFieldStruct one(name);
        for (const uint64_t n : {uint64_t{4}, uint64_t{INT32_MAX}, uint64_t{1} << 31, uint64_t{UINT32_MAX}}) {
            EXPECT_FALSE(IsTaken(one.Tag(2) + Varint(n) + "abc")) << name << n;
        }
        EXPECT_TRUE(IsTaken(one.Tag(2) + Varint(3) + "abc")) << name;
    }
}

}  // namespace sorntest
