// A million levels on a thread with 256 KiB of stack, at costs in proportion to the bytes. Invariants for
// untrusted input: 3, 4, 12.

#include <algorithm>

#include "binary/ValueRows.h"
#include "sornschema/EveryTypeLazy.h"
#include "support/SmallStack.h"

namespace sorntest {

using namespace sorn;
using sornschema::EveryTypeCompanion;
using sornschema::EveryTypeLazy;

// ThreadSanitizer maps its shadow of each piece of the pool apart, and the system allows a process 65,530
// mappings.
#ifdef __SANITIZE_THREAD__
constexpr unsigned nLevelsG = 100000;
#else
constexpr unsigned nLevelsG = 1000000;
#endif

class BinaryDeepNestingTest : public BinaryFixture {
 protected:
    /// `levels` times a piece with all lengths of what lies inside, made from the inside out: `wrap` appends
    /// to reversed bytes what stands before them.
    template <class Wrap>
    static std::string Nested(const std::string& innermost, Wrap wrap) {
        std::string reversed(innermost.rbegin(), innermost.rend());
        for (unsigned i = 0; i < nLevelsG; ++i) wrap(reversed);
        std::reverse(reversed.begin(), reversed.end());
        return reversed;
    }
    /// Puts bytes before those that are there.
    static void Before(std::string& reversed, const std::string& bytes) {
        reversed.append(bytes.rbegin(), bytes.rend());
    }
    void ThereAndBack(const std::string& fields) {
        const ExactBytes exact(fields);
        ref<SornObject> object;
        ASSERT_TRUE(Codec().Unmarshal(exact.Begin(), exact.Size(), EveryTypeCompanion::structIdG, &object));
        const ref<rox::ByteBuffer> bytes = Codec().MarshalKnownDict(object.get());
        const std::string expected = Bytes("FA F1 02") + Section(fields);
        ASSERT_EQ(bytes->GetLength(), expected.size());
        EXPECT_EQ(std::memcmp(bytes->GetData(), expected.data(), expected.size()), 0);
        // Without its last byte it is refused, with all levels open.
        object = nullptr;
        const ExactBytes truncated(fields.substr(0, fields.size() - 1));
        EXPECT_FALSE(
            Codec().Unmarshal(truncated.Begin(), truncated.Size(), EveryTypeCompanion::structIdG, &object));
    }
};

TEST_F(BinaryDeepNestingTest, ObjectsInObjects) {
    RunOnSmallStack([this] {
        ThereAndBack(Nested(Bytes("38 06"), [](std::string& reversed) {
            Before(reversed, Varint(reversed.size()));
            Before(reversed, Bytes("0A"));
        }));
    });
}

TEST_F(BinaryDeepNestingTest, ObjectsInLists) {
    RunOnSmallStack([this] {
        ThereAndBack(Nested(Bytes("38 06"), [](std::string& reversed) {
            Before(reversed, Varint(reversed.size()));
            Before(reversed, Bytes("12 00 12"));  // an empty element before it
        }));
    });
}

TEST_F(BinaryDeepNestingTest, KnownDictsInKnownDicts) {
    RunOnSmallStack([this] {
        ThereAndBack(Nested(Bytes("38 06"), [](std::string& reversed) {
            const std::string head = Bytes("FA F1 02") + Varint(reversed.size());
            Before(reversed, head);
            Before(reversed, Varint(reversed.size()));
            Before(reversed, Bytes("2A"));
        }));
    });
}

TEST_F(BinaryDeepNestingTest, DictionariesInDictionaries) {
    RunOnSmallStack([this] {
        const std::string body = Nested("", [](std::string& reversed) {
            Before(reversed, Varint(reversed.size()));
            Before(reversed, Bytes("32 01 6E 42"));
            Before(reversed, Varint(reversed.size()));
            Before(reversed, Bytes("22"));
        });
        ThereAndBack(Bytes("22") + Section(body));
    });
}

/// Bodies in bodies, read one by one: all of them share the bytes of the outermost.
TEST_F(BinaryDeepNestingTest, BodiesInBodiesShareTheirBytes) {
    RunOnSmallStack([this] {
        // A known dict of id 5924, A2 F2 02, with the next one as the body in its slot 2.
        const std::string bytes = Nested("", [](std::string& reversed) {
            if (!reversed.empty()) {
                Before(reversed, Varint(reversed.size()));
                Before(reversed, Bytes("12"));
            }
            Before(reversed, Varint(reversed.size()));
            Before(reversed, Bytes("A2 F2 02"));
        });
        const size_t nBefore = pool.GetUsedBytes();
        const ref<rox::ByteBuffer> top =
            rox::ByteBuffer::New(&pool, bytes.data(), static_cast<uint32_t>(bytes.size()));
        const size_t nTop = pool.GetUsedBytes() - nBefore;
        ref<rox::ByteBuffer> body = top;
        for (unsigned i = 0; i < nLevelsG; ++i) {
            ref<SornObject> object;
            ASSERT_TRUE(Codec().UnmarshalKnownDict(body, &object)) << i;
            const ref<LazyDict> next = static_cast<EveryTypeLazy&>(*object).body;
            if (next == nullptr) {
                EXPECT_EQ(i, nLevelsG - 1);
                break;
            }
            body = next->GetStoredBytes();
            ASSERT_EQ(body->GetOwner(), top);
            ASSERT_LT(pool.GetUsedBytes() - nBefore, nTop + 1000);
        }
    });
}

/// Writing converts a thousand bodies in one another, and then stops.
TEST_F(BinaryDeepNestingTest, BodiesInBodies) {
    RunOnSmallStack([this] {
        ref<SornObject> object = EveryTypeLazy::Factory(&pool);
        for (unsigned i = 0; i < nLevelsG; ++i) {
            const ref<LazyDict> body = LazyDict::FromSornObject(&pool, object, 0);
            object = EveryTypeLazy::Factory(&pool);
            static_cast<EveryTypeLazy&>(*object).body = body;
        }
        std::string value =
            Bytes("D2 15") + Section(Bytes("08 03 1A") + Section("lazy bodies nested too deeply"));
        std::string fields;
        for (unsigned i = 0; i < 1001; ++i) {
            fields = Bytes("12") + Section(value);
            value = Bytes("A2 F2 02") + Section(fields);
        }
        EXPECT_EQ(Hex(*Codec().MarshalKnownDict(object.get())), Hex(value));
    });
}

}  // namespace sorntest
