#include "sorn/dict/ByteBuffer.h"

#include <algorithm>
#include <cstdint>

#include "DictFixture.h"
#include "rox/VkCast.h"
#include "sorn/dict/Rox1ByteBufferCore.h"

namespace {

using sorn::ByteBuffer;
using sorn::Rox1ByteBufferCore;

using ByteBufferTest = DictFixture;
using RoxByteBufferTest = DictFixture;
using Rox1ByteBufferCoreTest = DictFixture;

std::string Held(const ByteBuffer& buffer) {
    return buffer.GetLength() == 0
               ? std::string()
               : std::string(reinterpret_cast<const char*>(buffer.GetData()), buffer.GetLength());
}

TEST_F(ByteBufferTest, EmptyHasLengthZero) {
    const ByteBuffer buffer(&pool);
    EXPECT_EQ(buffer.GetLength(), 0u);
    EXPECT_EQ(buffer.GetCapacity(), 0u);
    EXPECT_EQ(buffer.GetMempool(), &pool);
    EXPECT_TRUE(buffer.ToRoxString(&pool).FEmpty());
}

TEST_F(ByteBufferTest, GrowsByteByByteAheadOfTheData) {
    // Capacity c becomes c + 1 + max(c / 5, 256) when the data would reach c.
    const unsigned capacities[] = {257, 514, 771, 1028, 1285, 1543, 1852, 2223};
    ByteBuffer buffer(&pool);
    for (const unsigned capacity : capacities) {
        while (buffer.GetLength() + 1 < capacity) {
            buffer.AppendByte('x');
            ASSERT_EQ(buffer.GetCapacity(), capacity) << "at length " << buffer.GetLength();
        }
    }
}

TEST_F(ByteBufferTest, GrowsByRuns) {
    const std::string run(2000, 'r');
    ByteBuffer buffer(&pool);
    const auto append = [&](unsigned n) {
        buffer.AppendBytes(run.data(), n);
        return buffer.GetCapacity();
    };
    EXPECT_EQ(append(0), 0u);
    EXPECT_EQ(append(10), 266u);   // 10 + 0 + 256
    EXPECT_EQ(append(255), 266u);  // 265 is below 266
    EXPECT_EQ(append(0), 266u);
    EXPECT_EQ(append(1), 523u);      // 266 is not: 1 + 266 + 256
    EXPECT_EQ(append(2000), 2779u);  // 2000 + 523 + 256
    EXPECT_EQ(append(2000), 5334u);  // 2000 + 2779 + 555
    EXPECT_EQ(buffer.GetLength(), 4266u);
    EXPECT_EQ(Held(buffer), std::string(4266, 'r'));
}

TEST_F(ByteBufferTest, AppendStringGrowsAsByteByByte) {
    for (unsigned n = 0; n < 1600; n += 7) {
        std::string text;
        for (unsigned i = 0; i < n; ++i) text.push_back(static_cast<char>('a' + i % 26));
        ByteBuffer whole(&pool);
        ByteBuffer bytewise(&pool);
        for (int round = 0; round < 2; ++round) {
            whole.AppendString(text.c_str());
            for (const char c : text) bytewise.AppendByte(static_cast<unsigned char>(c));
            ASSERT_EQ(whole.GetCapacity(), bytewise.GetCapacity()) << n;
            ASSERT_EQ(Held(whole), Held(bytewise)) << n;
        }
    }
}

TEST_F(ByteBufferTest, KeepsEveryByteValue) {
    ByteBuffer buffer(&pool);
    std::string expected;
    for (int i = 0; i < 3000; ++i) {
        buffer.AppendByte(static_cast<unsigned char>(i));
        expected.push_back(static_cast<char>(i));
    }
    EXPECT_EQ(Held(buffer), expected);
    EXPECT_EQ(Str(buffer.ToRoxString(&pool)), expected);
}

TEST_F(ByteBufferTest, MixedAppends) {
    ByteBuffer buffer(&pool);
    buffer.AppendString("ab\0cd");
    buffer.AppendString("");
    buffer.AppendBytes("x\0y", 3);
    buffer.AppendText(Text(std::string_view("t\0u", 3)));
    buffer.AppendLiteral("lit");
    buffer.AppendChar('\xff');
    EXPECT_EQ(Held(buffer), std::string("abx\0yt\0ulit\xff", 12));
}

TEST_F(ByteBufferTest, ReserveAndCommit) {
    ByteBuffer buffer(&pool);
    buffer.AppendString("ab");
    unsigned char* place = buffer.Reserve(1000);
    EXPECT_EQ(buffer.GetLength(), 2u);
    EXPECT_EQ(buffer.GetCapacity(), 1513u);  // 1000 + 257 + 256
    for (int i = 0; i < 1000; ++i) place[i] = static_cast<unsigned char>('0' + i % 10);
    buffer.Commit(3);
    EXPECT_EQ(Held(buffer), "ab012");
    EXPECT_EQ(buffer.Reserve(1507), buffer.GetData() + 5);  // 5 + 1507 is below 1513
    EXPECT_EQ(buffer.GetCapacity(), 1513u);
    buffer.Reserve(1508);
    EXPECT_EQ(buffer.GetCapacity(), 3323u);  // 1508 + 1513 + 302
    EXPECT_EQ(Held(buffer), "ab012");
    buffer.Truncate(4);
    EXPECT_EQ(Held(buffer), "ab01");
    buffer.Clear();
    EXPECT_EQ(buffer.GetLength(), 0u);
    EXPECT_EQ(buffer.GetCapacity(), 3323u);
}

TEST_F(ByteBufferTest, OnTheGeneralHeap) {
    ByteBuffer buffer(nullptr);
    buffer.AppendString("heap");
    EXPECT_EQ(Held(buffer), "heap");
    EXPECT_EQ(pool.GetUsedBytes(), 0u);
}

TEST_F(ByteBufferTest, AppendingCostsLinearTime) {
    // Growing by a fifth: 30,000,000 bytes take fewer than 120 moves.
    ByteBuffer buffer(&pool);
    unsigned nMoves = 0;
    unsigned capacity = 0;
    for (unsigned i = 0; i < 30'000'000; ++i) {
        buffer.AppendByte('x');
        if (buffer.GetCapacity() != capacity) ++nMoves;
        capacity = buffer.GetCapacity();
    }
    EXPECT_EQ(buffer.GetLength(), 30'000'000u);
    EXPECT_LT(nMoves, 120u);
}

TEST_F(ByteBufferTest, MoreThanTheLimitAsserts) {
    ByteBuffer buffer(&pool);
    buffer.AppendString("0123456789");
    EXPECT_DEATH(buffer.Reserve(UINT32_MAX - 9), "too many");
    EXPECT_DEATH(buffer.Reserve(UINT32_MAX), "too many");
}

TEST_F(RoxByteBufferTest, EmptyHasNoStorage) {
    const ref<rox::ByteBuffer> buffer(new (&pool) rox::ByteBuffer);
    EXPECT_EQ(buffer->GetData(), nullptr);
    EXPECT_EQ(buffer->GetLength(), 0u);
    EXPECT_EQ(buffer->GetCapacity(), 0u);
    EXPECT_TRUE(buffer->FEmpty());
    EXPECT_EQ(buffer->GetMempool(), &pool);
    EXPECT_EQ(rox::ByteBuffer::New(&pool, nullptr, 0)->GetData(), nullptr);
    EXPECT_EQ(rox::ByteBuffer::New(&pool, RoxString())->GetData(), nullptr);
}

TEST_F(RoxByteBufferTest, CopiesIntoExactStorage) {
    struct {
        const char* bytes;
        unsigned capacity;
    } const cases[] = {
        {"a", 8}, {"1234567", 8}, {"12345678", 8}, {"123456789", 9}, {"0123456789abcdef0", 17}};
    for (const auto& c : cases) {
        const ref<rox::ByteBuffer> buffer = Bytes(c.bytes);
        EXPECT_EQ(Str(buffer), c.bytes);
        EXPECT_EQ(buffer->GetCapacity(), c.capacity) << c.bytes;
        EXPECT_NE(buffer->GetData(), reinterpret_cast<const unsigned char*>(c.bytes));
    }
    EXPECT_EQ(Str(rox::ByteBuffer::New(&pool, Text(std::string_view("a\0b", 3)))), std::string("a\0b", 3));
}

TEST_F(RoxByteBufferTest, NewOfLengthIsCleared) {
    const ref<rox::ByteBuffer> buffer = rox::ByteBuffer::NewOfLength(&pool, 100);
    EXPECT_EQ(Str(buffer), std::string(100, '\0'));
    buffer->MutableData()[99] = 'z';
    EXPECT_EQ(Str(buffer), std::string(99, '\0') + "z");
}

TEST_F(RoxByteBufferTest, ArrayReallocKeepsTheContents) {
    rox::SizedObjectArray<1, RoxMempool> array(&pool);
    EXPECT_EQ(array.GetData(), nullptr);
    array.Realloc(0);
    EXPECT_EQ(array.GetCapacity(), 8u);
    EXPECT_EQ(array.GetLength(), 0u);
    std::fill_n(array.GetData(), 5, static_cast<unsigned char>('k'));
    array.SetLength(5);
    array.Realloc(100);
    EXPECT_EQ(array.GetCapacity(), 100u);
    EXPECT_EQ(array.GetLength(), 5u);
    EXPECT_EQ(std::string(array.GetData(), array.GetData() + 100), "kkkkk" + std::string(95, '\0'));
    array.Realloc(5);
    EXPECT_EQ(array.GetCapacity(), 8u);
    EXPECT_DEATH(array.Realloc(4), "smaller");
}

TEST_F(RoxByteBufferTest, ClassTest) {
    const ref<rox::ByteBuffer> plain = Bytes("x");
    const ref<rox::ByteBuffer> core(new (&pool) Rox1ByteBufferCore);
    EXPECT_EQ(VkCast<rox::ByteBuffer>(plain), plain.get());
    EXPECT_EQ(VkCast<Rox1ByteBufferCore>(plain), nullptr);
    EXPECT_EQ(VkCast<rox::ByteBuffer>(core), core.get());
    EXPECT_EQ(VkCast<Rox1ByteBufferCore>(core), core.get());
}

TEST_F(Rox1ByteBufferCoreTest, AppendByteDoubles) {
    const ref<Rox1ByteBufferCore> buffer(new (&pool) Rox1ByteBufferCore);
    std::string expected;
    for (unsigned i = 0; i < 100; ++i) {
        buffer->AppendByte(static_cast<unsigned char>(i));
        expected.push_back(static_cast<char>(i));
        const unsigned capacity = i < 8 ? 8 : i < 16 ? 16 : i < 32 ? 32 : i < 64 ? 64 : 128;
        ASSERT_EQ(buffer->GetCapacity(), capacity) << i;
    }
    EXPECT_EQ(Str(buffer), expected);
}

TEST_F(Rox1ByteBufferCoreTest, AppendBytesReallocatesEachTime) {
    const ref<Rox1ByteBufferCore> buffer(new (&pool) Rox1ByteBufferCore(&pool));
    const auto append = [&](std::string_view bytes) {
        buffer->AppendBytes(reinterpret_cast<const unsigned char*>(bytes.data()),
                            static_cast<unsigned>(bytes.size()));
        return buffer->GetCapacity();
    };
    EXPECT_EQ(append(""), 0u);
    EXPECT_EQ(append("abc"), 8u);
    EXPECT_EQ(append("defgh"), 8u);
    buffer->AppendByte('i');  // full at 8
    EXPECT_EQ(buffer->GetCapacity(), 16u);
    EXPECT_EQ(append("jk"), 11u);  // exactly, although there was room
    EXPECT_EQ(append(""), 11u);
    EXPECT_EQ(Str(buffer), "abcdefghijk");
}

TEST_F(Rox1ByteBufferCoreTest, FEqualLooksAtLengthAndBytes) {
    const auto make = [this](std::string_view bytes, bool fBytewise) {
        ref<Rox1ByteBufferCore> buffer(new (&pool) Rox1ByteBufferCore);
        if (fBytewise) {
            for (const char c : bytes) buffer->AppendByte(static_cast<unsigned char>(c));
        } else {
            buffer->AppendBytes(reinterpret_cast<const unsigned char*>(bytes.data()),
                                static_cast<unsigned>(bytes.size()));
        }
        return buffer;
    };
    const ref<Rox1ByteBufferCore> doubled = make("123456789", true);
    const ref<Rox1ByteBufferCore> exact = make("123456789", false);
    EXPECT_NE(doubled->GetCapacity(), exact->GetCapacity());
    EXPECT_TRUE(doubled->FEqual(exact.get()));
    EXPECT_TRUE(make("", true)->FEqual(make("", false).get()));
    EXPECT_FALSE(make("", true)->FEqual(exact.get()));
    EXPECT_FALSE(make("12345678", true)->FEqual(exact.get()));
    EXPECT_FALSE(make("123456780", true)->FEqual(exact.get()));
    EXPECT_FALSE(
        make(std::string_view("a\0b", 3), true)->FEqual(make(std::string_view("a\0c", 3), true).get()));
}

TEST_F(Rox1ByteBufferCoreTest, MoreThanTheLimitAsserts) {
    const ref<Rox1ByteBufferCore> buffer(new (&pool) Rox1ByteBufferCore);
    buffer->AppendByte('x');
    const unsigned char byte = 0;
    EXPECT_DEATH(buffer->AppendBytes(&byte, UINT32_MAX), "too many");
}

TEST_F(RoxByteBufferTest, OfATextSharesItsBytes) {
    ref<rox::ByteBuffer> slice;
    {
        const RoxString text(&pool, "0123456789");
        const ref<rox::ByteBuffer> all = rox::ByteBuffer::NewOfText(&pool, text, 0, 10);
        EXPECT_EQ(all->GetData(), reinterpret_cast<const unsigned char*>(text.Utf8()));
        EXPECT_EQ(all->GetLength(), 10u);
        EXPECT_EQ(all->GetCapacity(), 0u);
        slice = rox::ByteBuffer::NewSlice(&pool, rox::ByteBuffer::NewOfText(&pool, text, 2, 5), 1, 3);
        EXPECT_EQ(slice->GetData(), all->GetData() + 3);
    }
    // It holds the text, which nobody else does any more.
    EXPECT_EQ(std::string(reinterpret_cast<const char*>(slice->GetData()), slice->GetLength()), "345");
}

TEST_F(RoxByteBufferTest, OfNoTextHoldsNothing) {
    const ref<rox::ByteBuffer> empty = rox::ByteBuffer::NewOfText(&pool, RoxString(), 0, 0);
    EXPECT_TRUE(empty->FEmpty());
    EXPECT_EQ(empty->GetData(), nullptr);
    EXPECT_TRUE(rox::ByteBuffer::NewOfText(&pool, RoxString("abc"), 3, 0)->FEmpty());
}

TEST_F(RoxByteBufferTest, OutsideATextEndsTheProcess) {
    const RoxString text("abc");
    EXPECT_DEATH(rox::ByteBuffer::NewOfText(&pool, text, 4, 0), "range outside its text");
    EXPECT_DEATH(rox::ByteBuffer::NewOfText(&pool, text, 1, 3), "range outside its text");
    EXPECT_DEATH(rox::ByteBuffer::NewOfText(&pool, text, 1, UINT32_MAX), "range outside its text");
}

}  // namespace
