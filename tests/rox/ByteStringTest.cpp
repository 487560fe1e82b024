#include "rox/RoxByteString.h"

#include <gtest/gtest.h>

#include <cstring>

#include "rox/VkCast.h"
#include "rox/ref.h"

TEST(ByteStringTest, BeginsEmpty) {
    RoxMempool pool("bytes");
    ref<RoxByteString> bytes = new (&pool) RoxByteString;
    EXPECT_EQ(0u, bytes->GetLength());
    EXPECT_EQ(nullptr, bytes->GetBytes());
    bytes->SetBytes(0, 0, nullptr);
    bytes->SetLength(0);
    EXPECT_EQ(bytes.get(), VkCast<RoxByteString>(bytes.GetCore()));
}

TEST(ByteStringTest, ResizesAndStores) {
    RoxMempool pool("bytes");
    ref<RoxByteString> bytes = new (&pool) RoxByteString;
    bytes->SetLength(5);
    bytes->SetBytes(0, 5, "abcde");
    bytes->SetByte(0, 'A');
    bytes->SetBytes(3, 2, "DE");
    EXPECT_EQ(0, memcmp("AbcDE", bytes->GetBytes(), 5));
    bytes->SetLength(100000);
    EXPECT_EQ(100000u, bytes->GetLength());
    EXPECT_EQ(0, memcmp("AbcDE", bytes->GetBytes(), 5));
    bytes->SetByte(99999, 1);
    bytes->SetLength(3);
    EXPECT_EQ(0, memcmp("Abc", bytes->GetBytes(), 3));
    bytes->SetBytes(1, 2, bytes->GetBytes());  // overlapping
    EXPECT_EQ(0, memcmp("AAb", bytes->GetBytes(), 3));
    bytes->MutableBytes()[0] = 'z';
    EXPECT_EQ('z', bytes->GetBytes()[0]);
    bytes->SetLength(0);
    EXPECT_EQ(nullptr, bytes->GetBytes());
    bytes->SetLength(8);
    bytes = nullptr;
    EXPECT_EQ(0u, pool.GetUsedBytes());
}

TEST(ByteStringDeathTest, OutOfRangeAsserts) {
    ref<RoxByteString> bytes = new RoxByteString;
    bytes->SetLength(4);
    EXPECT_DEATH(bytes->SetByte(4, 0), "RoxByteString::SetByte: index out of range");
    EXPECT_DEATH(bytes->SetBytes(3, 2, "ab"), "RoxByteString::SetBytes: range out of bounds");
    EXPECT_DEATH(bytes->SetBytes(5, 0, "ab"), "RoxByteString::SetBytes: range out of bounds");
    EXPECT_DEATH(bytes->SetBytes(2, 4294967295u, "ab"), "RoxByteString::SetBytes: range out of bounds");
}
