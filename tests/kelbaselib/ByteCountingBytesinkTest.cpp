#include "kelbaselib/ByteCountingBytesink.h"

#include <gtest/gtest.h>

TEST(ByteCountingBytesinkTest, CountsAndKeepsNothing) {
    kelbaselib::ByteCountingBytesink counting;
    kelbaselib::Bytesink& sink = counting;
    EXPECT_EQ(0u, counting.GetWrittenBytes());
    EXPECT_EQ(3u, sink.Write("abc", 3));
    EXPECT_EQ(0u, sink.Write(nullptr, 0));
    EXPECT_EQ(2u, sink.Write("de", 2));
    EXPECT_EQ(5u, counting.GetWrittenBytes());
}

TEST(ByteCountingBytesinkTest, CountsBeyond32Bits) {
    kelbaselib::ByteCountingBytesink counting;
    // The bytes are never looked at.
    EXPECT_EQ(4294967295u, counting.Write(nullptr, 4294967295u));
    EXPECT_EQ(4294967295u, counting.Write(nullptr, 4294967295u));
    EXPECT_EQ(8589934590u, counting.GetWrittenBytes());
}
