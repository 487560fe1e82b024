#include "kelbaselib/InMemoryBytestream.h"

#include <gtest/gtest.h>

#include <string>
#include <thread>
#include <vector>

#include "kelbaselib/InMemoryBytesource.h"
#include "rox/RoxMempool.h"

namespace {

using kelbaselib::Bytesource;
using kelbaselib::InMemoryBytestream;

std::string ReadAll(Bytesource& source, unsigned piece) {
    std::string all;
    std::string buffer(piece, '\0');
    for (;;) {
        unsigned n = source.Read(buffer.data(), piece);
        if (n == 0) {
            return all;
        }
        all.append(buffer, 0, n);
    }
}

std::string Pattern(size_t n) {
    std::string text(n, '\0');
    for (size_t i = 0; i < n; ++i) {
        text[i] = static_cast<char>((i * 131 + (i >> 7)) & 0xFF);
    }
    return text;
}

}  // namespace

TEST(InMemoryBytestreamTest, EmptyStreamHasEnded) {
    InMemoryBytestream stream;
    char byte = 0;
    EXPECT_EQ(0u, stream.Read(&byte, 1));
    EXPECT_EQ(0u, stream.GetLength());
    EXPECT_EQ(nullptr, stream.GetData());
    EXPECT_EQ(0u, stream.GetAvailable());
    EXPECT_EQ(0u, stream.Write(nullptr, 0));
    Bytesource* source = stream.NewSource();
    EXPECT_EQ(0u, source->Read(&byte, 1));
    source->Release();
}

TEST(InMemoryBytestreamTest, ReadsBackInPiecesOfAnySize) {
    std::string text = Pattern(100000);
    for (unsigned piece : {1u, 7u, 512u, 16384u, 99999u, 100000u, 200000u}) {
        InMemoryBytestream stream;
        for (size_t i = 0; i < text.size(); i += piece) {
            unsigned n = static_cast<unsigned>(std::min<size_t>(piece, text.size() - i));
            ASSERT_EQ(n, stream.Write(text.data() + i, n));
        }
        EXPECT_EQ(text, std::string(reinterpret_cast<const char*>(stream.GetData()), stream.GetLength()));
        EXPECT_EQ(text, ReadAll(stream, piece));
        EXPECT_EQ(0u, stream.GetAvailable());
        char byte = 0;
        EXPECT_EQ(0u, stream.Read(&byte, 1));  // still ended
    }
}

TEST(InMemoryBytestreamTest, SourcesAreIndependentAndBeginAtTheStart) {
    InMemoryBytestream stream;
    stream.Write("abcdef", 6);
    char buffer[4] = {};
    EXPECT_EQ(4u, stream.Read(buffer, 4));
    Bytesource* one = stream.NewSource();
    EXPECT_EQ(6u, one->GetAvailable());
    EXPECT_EQ(2u, one->Read(buffer, 2));
    EXPECT_EQ("ab", std::string(buffer, 2));
    Bytesource* two = one->NewSource();
    EXPECT_EQ("abcdef", ReadAll(*two, 4));
    EXPECT_EQ("cdef", ReadAll(*one, 3));
    EXPECT_EQ("ef", ReadAll(stream, 3));
    EXPECT_EQ(0u, one->Read(buffer, 0));
    one->Release();
    two->Release();
}

TEST(InMemoryBytestreamTest, SourcesOutliveTheStreamAndEachOther) {
    RoxMempool pool("streams");
    Bytesource* last = nullptr;
    {
        InMemoryBytestream stream(&pool);
        stream.Write("kept", 4);
        Bytesource* first = stream.NewSource();
        last = first->NewSource();
        first->Release();
    }
    EXPECT_GT(pool.GetUsedBytes(), 0u);
    EXPECT_EQ("kept", ReadAll(*last, 3));
    last->Release();
    EXPECT_EQ(0u, pool.GetUsedBytes());
}

TEST(InMemoryBytestreamTest, StreamHandedOnAsASourceEndsWithRelease) {
    RoxMempool pool("streams");
    InMemoryBytestream* stream = new InMemoryBytestream(&pool);
    stream->Write("body", 4);
    Bytesource* source = stream;
    Bytesource* second = source->NewSource();
    source->Release();
    EXPECT_EQ("body", ReadAll(*second, 100));
    second->Release();
    EXPECT_EQ(0u, pool.GetUsedBytes());
}

TEST(InMemoryBytestreamTest, SourceSeesLaterWrites) {
    InMemoryBytestream stream;
    stream.Write("ab", 2);
    Bytesource* source = stream.NewSource();
    EXPECT_EQ("ab", ReadAll(*source, 10));
    std::string more = Pattern(50000);
    stream.Write(more.data(), 50000);
    EXPECT_EQ(50000u, source->GetAvailable());
    EXPECT_EQ(more, ReadAll(*source, 1000));
    source->Release();
}

namespace {

using kelbaselib::InMemoryBytesource;

InMemoryBytesource* SourceOf(InMemoryBytestream& stream) {
    return dynamic_cast<InMemoryBytesource*>(stream.NewSource());
}

std::string ReleasedText(InMemoryBytesource* source) {
    const std::string text = ReadAll(*source, 3);
    source->Release();
    return text;
}

}  // namespace

TEST(InMemoryBytestreamTest, RangesOfASource) {
    InMemoryBytestream stream;
    stream.Write("abcdefgh", 8);
    InMemoryBytesource* const source = SourceOf(stream);
    EXPECT_EQ("abcdefgh", ReleasedText(source->NewRange(0, 8)));
    EXPECT_EQ("cde", ReleasedText(source->NewRange(2, 5)));
    EXPECT_EQ("h", ReleasedText(source->NewRange(7, 4294967295u)));
    EXPECT_EQ("", ReleasedText(source->NewRange(3, 3)));
    EXPECT_EQ("", ReleasedText(source->NewRange(5, 3)));
    EXPECT_EQ("", ReleasedText(source->NewRange(9, 12)));
    char two[2];
    EXPECT_EQ(2u, source->Read(two, 2));
    EXPECT_EQ("cd", ReleasedText(source->NewRange(0, 2)));  // from where the source stands
    InMemoryBytesource* const range = source->NewRange(1, 5);
    EXPECT_EQ("efg", ReleasedText(range->NewRange(1, 9)));  // and within it
    EXPECT_EQ(4u, range->GetAvailable());
    EXPECT_EQ(2u, range->Read(two, 2));
    EXPECT_EQ(2u, range->GetAvailable());
    EXPECT_EQ("fg", std::string(reinterpret_cast<const char*>(range->GetData()), 2));
    InMemoryBytesource* const again = dynamic_cast<InMemoryBytesource*>(range->NewSource());
    EXPECT_EQ("defg", ReleasedText(again));  // a range from its start
    EXPECT_EQ("fg", ReleasedText(range));
    EXPECT_EQ("cdefgh", ReleasedText(source));
}

TEST(InMemoryBytestreamTest, ARangeStandsWhateverIsWritten) {
    RoxMempool pool("streams");
    InMemoryBytesource* range = nullptr;
    {
        InMemoryBytestream stream(&pool);
        stream.Write("abcd", 4);
        InMemoryBytesource* const source = SourceOf(stream);
        range = source->NewRange(1, 4);
        const std::string more = Pattern(50000);
        stream.Write(more.data(), 50000);  // moves the bytes
        EXPECT_EQ(50004u, source->GetAvailable());
        EXPECT_EQ(3u, range->GetAvailable());
        source->Release();
    }
    EXPECT_EQ(50004u, range->GetStorage().GetLength());
    EXPECT_EQ("bcd", ReleasedText(range));
    EXPECT_EQ(0u, pool.GetUsedBytes());
}

TEST(InMemoryBytestreamTest, SourceOfAnEmptyStream) {
    InMemoryBytestream stream;
    InMemoryBytesource* const source = SourceOf(stream);
    EXPECT_EQ(nullptr, source->GetData());
    EXPECT_EQ("", ReleasedText(source->NewRange(0, 10)));
    EXPECT_EQ("", ReleasedText(source));
}

TEST(InMemoryBytestreamTest, GrowthCopiesLittle) {
    RoxMempool pool("streams");
    InMemoryBytestream stream(&pool);
    std::string byte = "x";
    const unsigned char* data = nullptr;
    unsigned nMoves = 0;
    for (unsigned i = 0; i < 1000000; ++i) {
        stream.Write(byte.data(), 1);
        nMoves += stream.GetData() != data ? 1u : 0u;
        data = stream.GetData();
    }
    EXPECT_EQ(1000000u, stream.GetLength());
    EXPECT_LE(nMoves, 21u);  // 2^20 > 1,000,000
}

TEST(InMemoryBytestreamTest, TakesItsOwnBytes) {
    for (size_t length : {1u, 2u, 64u, 1000u, 40000u}) {
        for (size_t offset : {size_t{0}, length / 2, length - 1}) {
            RoxMempool pool("streams");
            InMemoryBytestream stream(&pool);
            std::string expected = Pattern(length);
            stream.Write(expected.data(), static_cast<unsigned>(length));
            for (int i = 0; i < 6; ++i) {  // each at least half as long again: the storage moves on the way
                unsigned n = static_cast<unsigned>(expected.size() - offset);
                EXPECT_EQ(n, stream.Write(stream.GetData() + offset, n));
                expected += expected.substr(offset);
            }
            EXPECT_EQ(expected, ReadAll(stream, 4096)) << length << " " << offset;
        }
    }
}

TEST(InMemoryBytestreamTest, FinishedStreamIsReadByManyThreads) {
    InMemoryBytestream stream;
    std::string text = Pattern(20000);
    stream.Write(text.data(), 20000);
    std::vector<std::thread> threads;
    for (int i = 0; i < 4; ++i) {
        threads.emplace_back([&] {
            for (int k = 0; k < 20; ++k) {
                Bytesource* source = stream.NewSource();
                EXPECT_EQ(text, ReadAll(*source, 512));
                source->Release();
            }
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
}

namespace {

/// The order of the virtual operations, as code that knows them by their places calls them.
using ReadOperation = unsigned (*)(void* self, void* buffer, unsigned capacity);
using NewSourceOperation = void* (*)(void* self);
using ReleaseOperation = void (*)(void* self);
using WriteOperation = unsigned (*)(void* self, const void* bytes, unsigned count);

void* Place(void* object, unsigned i) {
    return (*static_cast<void***>(object))[i];
}

}  // namespace

TEST(InMemoryBytestreamTest, VirtualOperationsHaveTheirPlaces) {
    InMemoryBytestream* stream = new InMemoryBytestream;
    void* sink = static_cast<kelbaselib::Bytesink*>(stream);
    void* source = static_cast<Bytesource*>(stream);
    EXPECT_EQ(3u, reinterpret_cast<WriteOperation>(Place(sink, 0))(sink, "abc", 3));
    char buffer[8] = {};
    EXPECT_EQ(3u, reinterpret_cast<ReadOperation>(Place(source, 0))(source, buffer, 8));
    EXPECT_STREQ("abc", buffer);
    void* second = reinterpret_cast<NewSourceOperation>(Place(source, 1))(source);
    EXPECT_EQ(2u, reinterpret_cast<ReadOperation>(Place(second, 0))(second, buffer, 2));
    reinterpret_cast<ReleaseOperation>(Place(second, 3))(second);
    reinterpret_cast<ReleaseOperation>(Place(source, 3))(source);
}
