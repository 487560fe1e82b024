// Slices of byte buffers, and bodies that share a record's bytes. Invariants for untrusted input: 1, 12.

#include "binary/BinaryFixture.h"
#include "sorn/lazy/LazyDict.h"
#include "sornschema/EveryTypeLazy.h"

namespace sorntest {

using namespace sorn;
using rox::ByteBuffer;

class ByteBufferSliceTest : public BinaryFixture {};

TEST_F(ByteBufferSliceTest, Ranges) {
    const ref<ByteBuffer> owner = ByteBuffer::New(&pool, "abcdef", 6);
    struct Case {
        uint32_t offset;
        uint32_t n;
        const char* hex;
    };
    for (const Case& each : {Case{0, 6, "61 62 63 64 65 66"}, Case{0, 1, "61"}, Case{2, 3, "63 64 65"},
                             Case{5, 1, "66"}, Case{0, 0, ""}, Case{6, 0, ""}}) {
        const ref<ByteBuffer> slice = ByteBuffer::NewSlice(&pool, owner, each.offset, each.n);
        EXPECT_EQ(Hex(*slice), each.hex);
        EXPECT_EQ(slice->GetLength(), each.n);
        EXPECT_EQ(slice->FEmpty(), each.n == 0);
        EXPECT_EQ(slice->GetCapacity(), 0u);
        EXPECT_EQ(slice->GetData(), each.n != 0 ? owner->GetData() + each.offset : nullptr);
        EXPECT_EQ(slice->GetOwner(), each.n != 0 ? owner : nullptr);
    }
    EXPECT_EQ(owner->GetOwner(), nullptr);
    EXPECT_EQ(owner->GetRefCount(), 1u);
}

TEST_F(ByteBufferSliceTest, OfASliceHoldsTheOwner) {
    ref<ByteBuffer> owner = ByteBuffer::New(&pool, "abcdef", 6);
    ref<ByteBuffer> slice = ByteBuffer::NewSlice(&pool, owner, 1, 4);
    const ref<ByteBuffer> inner = ByteBuffer::NewSlice(&pool, slice, 1, 2);
    EXPECT_EQ(inner->GetOwner(), owner);
    EXPECT_EQ(slice->GetRefCount(), 1u);
    EXPECT_EQ(owner->GetRefCount(), 3u);
    slice = nullptr;
    owner = nullptr;
    EXPECT_EQ(Hex(*inner), "63 64");
}

TEST_F(ByteBufferSliceTest, OutsideTheOwner) {
    const ref<ByteBuffer> owner = ByteBuffer::New(&pool, "abcdef", 6);
    for (const auto& [offset, n] : {std::pair<uint32_t, uint32_t>{0, 7}, {6, 1}, {7, 0}, {1, UINT32_MAX}}) {
        EXPECT_DEATH(ByteBuffer::NewSlice(&pool, owner, offset, n), "slice outside its owner");
    }
    // A slice's own bounds count, not its owner's.
    const ref<ByteBuffer> slice = ByteBuffer::NewSlice(&pool, owner, 0, 2);
    EXPECT_DEATH(ByteBuffer::NewSlice(&pool, slice, 0, 3), "slice outside its owner");
}

TEST_F(ByteBufferSliceTest, InAnotherPool) {
    RoxMempool other("other");
    {
        const ref<ByteBuffer> owner = ByteBuffer::New(&pool, "abcdef", 6);
        const ref<ByteBuffer> slice = ByteBuffer::NewSlice(&other, owner, 1, 2);
        EXPECT_EQ(slice->GetMempool(), &other);
        EXPECT_EQ(Hex(*slice), "62 63");
    }
    EXPECT_EQ(other.GetUsedBytes(), 0u);
}

TEST_F(ByteBufferSliceTest, NewToFill) {
    for (const uint32_t n : {0u, 1u, 8u, 9u, 5000u}) {
        const ref<ByteBuffer> buffer = ByteBuffer::NewToFill(&pool, n);
        EXPECT_EQ(buffer->GetLength(), n);
        EXPECT_EQ(buffer->GetCapacity(), n == 0 ? 0 : std::max(n, 8u));
        if (n != 0) std::memset(buffer->MutableData(), 'x', n);
        EXPECT_EQ(Hex(*buffer), Hex(std::string(n, 'x')));
    }
}

/// Two bodies in a list: 5924 * 8 + 2 is A2 F2 02.
TEST_F(ByteBufferSliceTest, BodiesOfARecord) {
    const std::string bytes = Bytes("A2 F2 02 0B 0A 02 38 06 12 02 7B 7D 0A 01 7A");
    ref<SornObject> object;
    {
        const ref<ByteBuffer> buffer =
            ByteBuffer::New(&pool, bytes.data(), static_cast<uint32_t>(bytes.size()));
        ASSERT_TRUE(Codec().UnmarshalKnownDict(buffer, &object));
        const auto& lazy = static_cast<sornschema::EveryTypeLazy&>(*object);
        EXPECT_EQ(lazy.body->GetStoredBytes()->GetOwner(), buffer);
        EXPECT_EQ(lazy.body->GetStoredBytes()->GetData(), buffer->GetData() + 10);
    }
    // The buffer's own reference is gone; the bodies hold it.
    const auto& lazy = static_cast<sornschema::EveryTypeLazy&>(*object);
    ASSERT_EQ(lazy.bodies.GetCount(), 2u);
    EXPECT_EQ(Hex(*static_cast<const LazyDict*>(lazy.bodies.At(0))->GetStoredBytes()), "38 06");
    EXPECT_EQ(Hex(*static_cast<const LazyDict*>(lazy.bodies.At(1))->GetStoredBytes()), "7A");
    EXPECT_EQ(Hex(*lazy.body->GetStoredBytes()), "7B 7D");
    // From raw bytes each body has a copy.
    const ExactBytes exact(bytes);
    ASSERT_TRUE(Codec().UnmarshalKnownDict(exact.Begin(), exact.Size(), &object));
    const auto& copied = static_cast<sornschema::EveryTypeLazy&>(*object);
    EXPECT_EQ(copied.body->GetStoredBytes()->GetOwner(), nullptr);
    EXPECT_EQ(Hex(*copied.body->GetStoredBytes()), "7B 7D");
}

/// Bytes of another pool than the result's: that pool may end first.
TEST_F(ByteBufferSliceTest, BodiesOutliveTheBytesOfAnotherPool) {
    // Two bodies, one in the other: the inner one has a number.
    const std::string bytes = Bytes("A2 F2 02 0E 12 0C A2 F2 02 08 12 06 FA F1 02 02 38 06");
    const auto n = static_cast<uint32_t>(bytes.size());
    const auto bodyOf = [](const ref<SornObject>& object) {
        return static_cast<const sornschema::EveryTypeLazy&>(*object).body;
    };
    ref<SornObject> object;
    {
        RoxMempool other("other");
        const ref<ByteBuffer> buffer = ByteBuffer::New(&other, bytes.data(), n);
        ASSERT_TRUE(Codec().UnmarshalKnownDict(buffer, &object));
        EXPECT_EQ(buffer->GetRefCount(), 1u);
        EXPECT_EQ(bodyOf(object)->GetStoredBytes()->GetMempool(), &pool);
        EXPECT_EQ(bodyOf(object)->GetStoredBytes()->GetOwner(), nullptr);
    }
    EXPECT_EQ(Hex(*bodyOf(object)->GetStoredBytes()), "A2 F2 02 08 12 06 FA F1 02 02 38 06");
    // The body inside shares the copy.
    ref<SornObject> inner = bodyOf(object)->ToSornObjectOrError();
    EXPECT_EQ(bodyOf(inner)->GetStoredBytes()->GetOwner(), bodyOf(object)->GetStoredBytes());
    EXPECT_EQ(Hex(*bodyOf(inner)->GetStoredBytes()), "FA F1 02 02 38 06");
    inner = nullptr;
    {
        // What counts is where the bytes lie, not where the slice does.
        RoxMempool other("other");
        const ref<ByteBuffer> slice =
            ByteBuffer::NewSlice(&pool, ByteBuffer::New(&other, bytes.data(), n), 0, n);
        ASSERT_TRUE(Codec().UnmarshalKnownDict(slice, &object));
        EXPECT_EQ(bodyOf(object)->GetStoredBytes()->GetOwner(), nullptr);
    }
    EXPECT_EQ(FieldsOf(object), "12 0C A2 F2 02 08 12 06 FA F1 02 02 38 06");
}

TEST_F(ByteBufferSliceTest, BodiesShareTheBytesOfTheGeneralHeap) {
    const std::string bytes = Bytes("A2 F2 02 04 12 02 7B 7D");
    ref<SornObject> object;
    {
        const ref<ByteBuffer> buffer =
            ByteBuffer::New(nullptr, bytes.data(), static_cast<uint32_t>(bytes.size()));
        ASSERT_TRUE(Codec().UnmarshalKnownDict(buffer, &object));
        EXPECT_EQ(static_cast<sornschema::EveryTypeLazy&>(*object).body->GetStoredBytes()->GetOwner(),
                  buffer);
    }
    EXPECT_EQ(Hex(*static_cast<sornschema::EveryTypeLazy&>(*object).body->GetStoredBytes()), "7B 7D");
}

}  // namespace sorntest
