// Where the writers put their bytes: nothing is lost or moved where one window ends and the next begins.
#include "sorn/json/JsonOutput.h"

#include <gtest/gtest.h>

#include <cstring>
#include <string>

#include "json/Support.h"

namespace {

using jsontest::String;
using sorn::ByteBuffer;

/// Writes pieces of a size through Room until there are n bytes; what is written.
std::string Fill(sorn::JsonOutput& out, size_t n, unsigned nPiece) {
    std::string expected;
    while (expected.size() < n) {
        const std::string piece(nPiece, static_cast<char>('a' + expected.size() / nPiece % 26));
        // More room than is used, as writers ask for the most that a value may take.
        unsigned char* const room = out.Room(sorn::JsonOutput::maxRoomG);
        std::memcpy(room, piece.data(), nPiece);
        out.Written(room + nPiece);
        expected += piece;
    }
    return expected;
}

TEST(JsonOutput, BuffersKeepWhatStandsInThem) {
    RoxMempool pool("output");
    for (const size_t n : {0u, 1u, 3000u, 3073u, 4000u, 4096u, 4097u, 9000u, 100000u}) {
        for (const size_t nBefore : {0u, 1u, 255u, 5000u}) {
            for (const unsigned nPiece : {1u, 7u, 1024u}) {
                ByteBuffer buffer(&pool);
                const std::string before(nBefore, '-');
                buffer.AppendBytes(before.data(), static_cast<unsigned>(nBefore));
                std::string expected = before;
                {
                    sorn::JsonBufferOutput out(buffer);
                    expected += Fill(out, n, nPiece);
                }
                ASSERT_EQ(String(buffer), expected) << n << " " << nBefore << " " << nPiece;
            }
        }
    }
}

TEST(JsonOutput, AShortTextMakesTheBufferGrowOnce) {
    RoxMempool pool("output");
    ByteBuffer buffer(&pool);
    {
        sorn::JsonBufferOutput out(buffer);
        Fill(out, 3000, 100);
        EXPECT_EQ(buffer.GetLength(), 0u);
        EXPECT_EQ(buffer.GetCapacity(), 0u);
    }
    EXPECT_EQ(buffer.GetLength(), 3000u);
    EXPECT_LT(buffer.GetCapacity(), 4000u);
}

TEST(JsonOutput, TextsOfAllSizes) {
    RoxMempool pool("output");
    for (const size_t n : {0u, 1u, 3072u, 3073u, 4096u, 9000u, 100000u}) {
        for (const unsigned nPiece : {1u, 7u, 1024u}) {
            sorn::JsonTextOutput out(&pool);
            const std::string expected = Fill(out, n, nPiece);
            ASSERT_EQ(String(out.Take()), expected) << n << " " << nPiece;
        }
    }
    EXPECT_EQ(pool.GetUsedBytes(), 0u);
}

}  // namespace
