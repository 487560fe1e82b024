// Sections: the marked form, and the pass that resolves it.

#include "sorn/binary/ProtoBufByteOutputStream.h"

#include <functional>

#include "binary/BinaryFixture.h"
#include "sorn/binary/GoogleInt.h"
#include "support/SmallStack.h"

namespace sorntest {

using namespace sorn;

namespace {

using Stream = ProtoBufByteOutputStream;

void Write(Stream& stream, const std::string& hex) {
    const std::string bytes = Bytes(hex);
    stream.WriteBytes(reinterpret_cast<const unsigned char*>(bytes.data()),
                      static_cast<unsigned>(bytes.size()));
}

void Append(Stream& stream, const std::string& hex) {
    for (const char c : Bytes(hex)) stream.AppendByte(static_cast<unsigned char>(c));
}

}  // namespace

TEST(ProtoBufByteOutputStreamTest, MarkedAndFinalForm) {
    struct Case {
        const char* name;
        std::function<void(Stream&)> write;
        const char* marked;
        const char* final;
    };
    const Case cases[] = {
        {"nothing", [](Stream&) {}, "", ""},
        {"an empty section",
         [](Stream& s) {
             s.StartSection();
             s.EndSection();
         },
         "01 64 02 64", "00"},
        {"literal bytes", [](Stream& s) { Write(s, "00 01 02 63 65 FF"); }, "00 01 02 63 65 FF",
         "00 01 02 63 65 FF"},
        {"a literal escape byte", [](Stream& s) { s.WriteByte(0x64); }, "64 64", "64"},
        {"escape bytes in a section",
         [](Stream& s) {
             s.StartSection();
             Write(s, "64 64");
             s.EndSection();
         },
         "01 64 64 64 64 64 02 64", "02 64 64"},
        {"what looks like markers",
         [](Stream& s) {
             s.StartSection();
             Write(s, "01 64 02");
             s.EndSection();
         },
         "01 64 01 64 64 02 02 64", "03 01 64 02"},
        {"an end marker's bytes",
         [](Stream& s) {
             s.StartSection();
             Write(s, "02 64 61 64");
             s.EndSection();
         },
         "01 64 02 64 64 61 64 64 02 64", "04 02 64 61 64"},
        {"the number 100", [](Stream& s) { GoogleInt::WriteGoogleU32(100, s); }, "64 64", "64"},
        {"a text", [](Stream& s) { s.WriteString(RoxString("bd")); }, "01 64 62 64 64 02 64", "02 62 64"},
        {"an empty text", [](Stream& s) { s.WriteString(RoxString()); }, "01 64 02 64", "00"},
        {"sections in sections",
         [](Stream& s) {
             s.WriteByte(0x0A);
             s.StartSection();
             s.WriteByte(0x12);
             s.WriteString(RoxString("a"));
             s.StartSection();
             s.EndSection();
             s.WriteByte(0x13);
             s.EndSection();
             s.WriteByte(0x14);
         },
         "0A 01 64 12 01 64 61 02 64 01 64 02 64 13 02 64 14", "0A 05 12 01 61 00 13 14"},
    };
    for (const Case& each : cases) {
        SCOPED_TRACE(each.name);
        Stream stream;
        each.write(stream);
        EXPECT_EQ(Hex(stream.GetData(), stream.GetSize()), each.marked);
        EXPECT_EQ(Finished(stream), each.final);
    }
}

TEST(ProtoBufByteOutputStreamTest, LengthsOfOneToThreeBytes) {
    struct Case {
        size_t n;
        const char* length;
    };
    for (const Case& each :
         {Case{99, "63"}, Case{100, "64"}, Case{101, "65"}, Case{127, "7F"}, Case{128, "80 01"},
          Case{228, "E4 01"}, Case{16383, "FF 7F"}, Case{16384, "80 80 01"}}) {
        SCOPED_TRACE(each.n);
        for (const char filling : {'a', 'd', '\2'}) {
            const std::string text(each.n, filling);
            Stream stream;
            stream.WriteString(
                RoxString::FromUtf8Bytes(nullptr, static_cast<unsigned>(text.size()), text.data()));
            EXPECT_EQ(Finished(stream), Hex(Bytes(each.length) + text));
        }
    }
}

TEST(ProtoBufByteOutputStreamTest, BytesOneByOneAndTogether) {
    std::string bytes;
    for (unsigned i = 0; i < 3000; ++i) bytes += static_cast<char>(i % 7 == 0 ? 0x64 : i);
    Stream together;
    together.WriteBytes(reinterpret_cast<const unsigned char*>(bytes.data()), 3000);
    Stream oneByOne;
    for (const char c : bytes) oneByOne.WriteByte(static_cast<unsigned char>(c));
    EXPECT_EQ(Hex(together.GetData(), together.GetSize()), Hex(oneByOne.GetData(), oneByOne.GetSize()));
    EXPECT_EQ(Finished(together), Hex(bytes));
}

TEST(ProtoBufByteOutputStreamTest, InsertByte) {
    struct Case {
        const char* name;
        const char* contents;
        size_t cursor;
        size_t destination;
        size_t nGrown;
        size_t destinationAfter;
        const char* after;
    };
    const Case cases[] = {
        {"room", "61 62 63 64", 1, 3, 0, 2, "61 62 EE 64"},
        {"the last room", "61 62 63 64", 2, 3, 0, 2, "61 62 EE 64"},
        {"no room, in the middle", "61 62 63 64", 2, 2, 1, 2, "61 62 EE 63 64"},
        {"no room, at the begin", "61 62", 0, 0, 1, 0, "EE 61 62"},
        {"no room, at the end, a full array", "61 62 63 64", 4, 4, 1, 4, "61 62 63 64 EE"},
        {"no room, at the end, with capacity left", "61 62 63", 3, 3, 1, 3, "61 62 63 EE"},
        {"an empty array", "", 0, 0, 1, 0, "EE"},
    };
    for (const Case& each : cases) {
        SCOPED_TRACE(each.name);
        Stream stream;
        Append(stream, each.contents);
        size_t cursor = each.cursor;
        size_t destination = each.destination;
        EXPECT_EQ(stream.InsertByte(0xEE, cursor, destination), each.nGrown);
        EXPECT_EQ(cursor, each.cursor);
        EXPECT_EQ(destination, each.destinationAfter);
        EXPECT_EQ(Hex(stream.GetData(), stream.GetSize()), each.after);
    }
}

TEST(ProtoBufByteOutputStreamTest, InsertLength) {
    struct Case {
        unsigned length;
        size_t cursor;  // of an array 61 62 63 64
        size_t destination;
        size_t nGrown;
        size_t destinationAfter;
        const char* after;
    };
    const Case cases[] = {
        {0, 1, 3, 0, 2, "61 62 00 64"},
        {127, 1, 3, 0, 2, "61 62 7F 64"},
        {128, 1, 3, 0, 1, "61 80 01 64"},
        {300, 2, 4, 0, 2, "61 62 AC 02"},
        {0, 2, 2, 1, 2, "61 62 00 63 64"},
        {300, 2, 2, 2, 2, "61 62 AC 02 63 64"},
        {300, 2, 3, 1, 2, "61 62 AC 02 64"},  // the byte that goes in first has room, the other has none
        {0x10000000, 0, 0, 5, 0, "80 80 80 80 01 61 62 63 64"},
        {0xFFFFFFFF, 4, 4, 5, 4, "61 62 63 64 FF FF FF FF 0F"},
        {0xFFFFFFFF, 0, 4, 1, 0, "FF FF FF FF 0F"},
    };
    for (const Case& each : cases) {
        SCOPED_TRACE(each.after);
        Stream stream;
        Append(stream, "61 62 63 64");
        size_t cursor = each.cursor;
        size_t destination = each.destination;
        EXPECT_EQ(stream.InsertLength(each.length, cursor, destination), each.nGrown);
        EXPECT_EQ(cursor, each.cursor);
        EXPECT_EQ(destination, each.destinationAfter);
        EXPECT_EQ(Hex(stream.GetData(), stream.GetSize()), each.after);
    }
}

TEST(ProtoBufByteOutputStreamTest, FinishOneSectionStopsAtTheSectionsStart) {
    Stream stream;
    Append(stream, "61 01 64 62 01 64 63 02 64");  // an outer section that is still open
    size_t cursor = stream.GetSize();
    size_t destination = stream.GetSize();
    EXPECT_EQ(stream.FinishOneSection(cursor, destination), 0u);
    EXPECT_EQ(cursor, 1u);
    EXPECT_EQ(Hex(stream.GetData() + destination, stream.GetSize() - destination), "62 01 63");
}

TEST(ProtoBufByteOutputStreamTest, TheBeginOfTheArrayEndsASection) {
    Stream stream;
    Append(stream, "61 62 02 64");
    size_t cursor = 4;
    size_t destination = 4;
    EXPECT_EQ(stream.FinishOneSection(cursor, destination), 0u);
    EXPECT_EQ(cursor, 0u);
    EXPECT_EQ(Hex(stream.GetData() + destination, stream.GetSize() - destination), "02 61 62");
}

TEST(ProtoBufByteOutputStreamTest, GrowthInsideCountsInTheLengthsAround) {
    // Three ends without starts leave room for six bytes, and the lengths take nine: the innermost of 20,000
    // is A0 9C 01, each one around it three more.
    Stream stream;
    for (unsigned i = 0; i < 20'000; ++i) stream.AppendByte('a');
    Append(stream, "02 64 02 64 02 64 7A");
    const unsigned char* data = nullptr;
    unsigned length = 0;
    EXPECT_EQ(stream.Finish(data, length), 3u);
    const std::string expected = Bytes("A6 9C 01 A3 9C 01 A0 9C 01") + std::string(20'000, 'a') + "z";
    EXPECT_EQ(std::string(reinterpret_cast<const char*>(data), length) == expected, true);
}

TEST(ProtoBufByteOutputStreamTest, MarkedFormsThatNobodyWrites) {
    struct Case {
        const char* marked;
        const char* final;
    };
    // An escape byte with nothing before it; one before an unknown kind is that kind's byte.
    for (const Case& each :
         {Case{"64", ""}, Case{"64 61", "61"}, Case{"07 64 61", "07 61"}, Case{"02 64", "00"}}) {
        SCOPED_TRACE(each.marked);
        Stream stream;
        Append(stream, each.marked);
        EXPECT_EQ(Finished(stream), each.final);
    }
}

TEST(ProtoBufByteOutputStreamTest, AMillionSectionsInOneAnother) {
    constexpr unsigned nLevels = 1'000'000;
    RunOnSmallStack([] {
        Stream stream;
        for (unsigned i = 0; i < nLevels; ++i) stream.StartSection();
        for (unsigned i = 0; i < nLevels; ++i) stream.EndSection();
        const unsigned char* data = nullptr;
        unsigned length = 0;
        EXPECT_EQ(stream.Finish(data, length), 0u);
        // From the inside out: 00, 01 00, 02 01 00, ...
        const unsigned char* p = data + length;
        uint64_t n = 0;
        for (unsigned i = 0; i < nLevels; ++i) {
            const std::string expected = Varint(n);
            p -= expected.size();
            ASSERT_GE(p, data);
            ASSERT_EQ(std::memcmp(p, expected.data(), expected.size()), 0) << i;
            n += expected.size();
        }
        EXPECT_EQ(p, data);
    });
}

}  // namespace sorntest
