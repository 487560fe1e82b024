// The grammar of the first line: every row through the line's own reader, the model, the packetizer and the
// unmarshaller. Invariants for untrusted input: 1, 2, 8.

#include "sorn/rpc/FirstLine.h"

#include <gtest/gtest.h>

#include "rpc/FramingFixture.h"
#include "rpc/ModelReader.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/rpc/OrvoRpcV2Packetizer.h"

namespace sorntest {

using namespace sorn;
using namespace std::string_literals;

namespace {

constexpr char fieldsG[] = "First line does not have expected number of fields (3)";
constexpr char magicG[] = "First line of message does not start with 'ORPC/2'";
constexpr char headerNumberG[] = "Invalid header length - not a number";
constexpr char headerLongG[] = "Declared header length too long";
constexpr char bodyNumberG[] = "Invalid body length - not a number";
constexpr char bodyLongG[] = "Declared body length too long";
constexpr char lineLongG[] = "First line too long";
constexpr uint32_t untouchedG = 77;

struct Row {
    std::string input;
    const char* words;      ///< null: none
    uint32_t headerLength;  ///< untouchedG: not stored
    uint32_t bodyLength;
    uint32_t length;
};

/// A good line.
Row Good(const std::string& line, uint32_t headerLength, uint32_t bodyLength) {
    return {line + "\r\n", nullptr, headerLength, bodyLength, static_cast<uint32_t>(line.size() + 2)};
}
/// A line with a fault before its first number, in it, and in its second number.
Row Bad(const std::string& line, const char* words, uint32_t headerLength = untouchedG) {
    return {line + "\r\n", words, headerLength, untouchedG, static_cast<uint32_t>(line.size() + 2)};
}
/// No line yet, or one that cannot come any more.
Row Unfinished(const std::string& input) {
    return {input, nullptr, untouchedG, untouchedG, 0};
}
Row Overlong(const std::string& input) {
    return {input, lineLongG, untouchedG, untouchedG, static_cast<uint32_t>(input.size())};
}

const std::string blanks100G(100, ' ');
const std::string zeros100G(100, '0');

const Row vRowsG[] = {
    // As it should be.
    Good("ORPC/2 26 0", 26, 0),
    Good("ORPC/2 0 0", 0, 0),
    Good("ORPC/2 1048576 5242880", 1048576, 5242880),
    {"ORPC/2 26 0\r\nORPC/2 1 1\r\n", nullptr, 26, 0, 13},
    {"ORPC/2 26 0\r\n\r\n", nullptr, 26, 0, 13},
    // Limits and one past each; both.
    Bad("ORPC/2 1048577 0", headerLongG),
    Bad("ORPC/2 26 5242881", bodyLongG, 26),
    Bad("ORPC/2 1048576 5242881", bodyLongG, 1048576),
    Bad("ORPC/2 1048577 5242881", headerLongG),
    // Numbers around the widths of words.
    Bad("ORPC/2 2147483647 0", headerLongG),
    Bad("ORPC/2 2147483648 0", headerLongG),
    Bad("ORPC/2 4294967295 0", headerLongG),
    Bad("ORPC/2 4294967296 0", headerLongG),
    Bad("ORPC/2 4294967297 0", headerLongG),
    Bad("ORPC/2 9223372036854775807 0", headerLongG),
    Bad("ORPC/2 9223372036854775808 0", headerLongG),
    Bad("ORPC/2 18446744073709551615 0", headerLongG),
    Bad("ORPC/2 18446744073709551616 0", headerLongG),
    Bad("ORPC/2 18446744073709551617 0", headerLongG),
    Bad("ORPC/2 1" + zeros100G + " 0", headerLongG),
    Bad("ORPC/2 26 2147483648", bodyLongG, 26),
    Bad("ORPC/2 26 4294967296", bodyLongG, 26),
    Bad("ORPC/2 26 18446744073709551616", bodyLongG, 26),
    Bad("ORPC/2 26 18446744073709551617", bodyLongG, 26),
    // Signs.
    Bad("ORPC/2 -1 0", headerLongG),
    Bad("ORPC/2 26 -1", bodyLongG, 26),
    Bad("ORPC/2 -4294967296 0", headerLongG),
    Bad("ORPC/2 -4294967270 0", headerLongG),
    Bad("ORPC/2 -18446744073709551615 0", headerLongG),
    Bad("ORPC/2 -18446744073709551616 0", headerLongG),
    Bad("ORPC/2 -18446744073709551590 0", headerLongG),
    Good("ORPC/2 -0 -00", 0, 0),
    Good("ORPC/2 +5 +0", 5, 0),
    Bad("ORPC/2 - 0", headerNumberG),
    Bad("ORPC/2 + 0", headerNumberG),
    Bad("ORPC/2 +-5 0", headerNumberG),
    Bad("ORPC/2 --5 0", headerNumberG),
    Bad("ORPC/2 26 -", bodyNumberG, 26),
    // A number ends at the first character that is no digit of it.
    Good("ORPC/2 12ab 3-4", 12, 3),
    Good("ORPC/2 0x5 0x6", 0, 0),
    Good("ORPC/2 1e3 2.9", 1, 2),
    Good("ORPC/2 5, 6;", 5, 6),
    Good("ORPC/2 5\xC3\xA9 6\xE2\x82\xAC", 5, 6),
    Bad("ORPC/2 ab 0", headerNumberG),
    Bad("ORPC/2 26 ab", bodyNumberG, 26),
    Bad("ORPC/2 x5 y6", headerNumberG),
    Bad("ORPC/2 \xD9\xA3 0", headerNumberG),  // a digit of another script
    Good("ORPC/2 0026 0000", 26, 0),
    Good("ORPC/2 " + zeros100G + "26 " + zeros100G + "7", 26, 7),
    // Blanks between the fields count one by one, those around the line not at all.
    Bad("ORPC/2  26 0", fieldsG),
    Bad("ORPC/2 26  0", fieldsG),
    Bad("ORPC/2 26", fieldsG),
    Bad("ORPC/2 26 ", fieldsG),
    Bad("ORPC/2", fieldsG),
    Bad("ORPC/2 26 0 1", fieldsG),
    Bad("", fieldsG),
    Bad("   ", fieldsG),
    Bad("x", fieldsG),
    Good("ORPC/2 26 0   ", 26, 0),
    Good("   ORPC/2 26 0", 26, 0),
    Good(" \t\n\v\f\rORPC/2 26 0\r\f\v\n\t ", 26, 0),
    Good(blanks100G + "ORPC/2 26 0" + blanks100G, 26, 0),
    // Other white space parts no fields; before a number it is skipped.
    Bad("ORPC/2\t26\t0", fieldsG),
    Bad("ORPC/2 26\t0", fieldsG),
    Good("ORPC/2 \t26 \v\f0", 26, 0),
    Good("ORPC/2 \n26\t \r0", 26, 0),
    Bad("ORPC/2 \t 0", headerNumberG),
    Bad("ORPC/2\xC2\xA0"
        "26 0",
        fieldsG),  // a no-break space is no blank
    // The magic.
    Bad("ORPC/3 26 0", magicG),
    Bad("orpc/2 26 0", magicG),
    Bad("ORPC/22 26 0", magicG),
    Bad("ORPC/ 26 0", magicG),
    Bad("xORPC/2 26 0", magicG),
    Bad("ORPC/2\t 26 0", magicG),
    Bad("\xEF\xBB\xBFORPC/2 26 0", magicG),
    Bad("26 0 ORPC/2", magicG),
    Bad("x  ", fieldsG),
    Bad("a b c", magicG),
    // NULs are characters like others.
    Good("ORPC/2 5\0"
         "9 6\0x"s,
         5, 6),
    Bad("ORPC/2 \0"
        "5 0"s,
        headerNumberG),
    Bad("ORPC/2\0 5 0"s, magicG),
    Bad("\0ORPC/2 5 0"s, magicG),
    Bad("ORPC/2 5 \0"s, bodyNumberG, 5),
    // Line ends that are none.
    {"ORPC/2 26 0\n", nullptr, untouchedG, untouchedG, 0},
    {"ORPC/2 26 0\r", nullptr, untouchedG, untouchedG, 0},
    {"ORPC/2 26 0\n\r", nullptr, untouchedG, untouchedG, 0},
    Bad("ORPC/2 26 0\nRpcId: 7\n", fieldsG),
    Good("ORPC/2 26 0\nRpcId:7\n\n", 26, 0),  // a bare line feed ends the number, as any other character
    Good("ORPC/2 26 0\r", 26, 0),
    // How long an input may go on without an end.
    Unfinished(""),
    Unfinished("O"),
    Unfinished("\r"),
    Unfinished(std::string(24, 'x')),
    Unfinished(std::string(25, 'x')),
    Overlong(std::string(26, 'x')),
    Overlong(std::string(27, 'x')),
    Unfinished("ORPC/2 1048576 5242880"),
    Unfinished("ORPC/2 1048576 5242880\r"),
    Unfinished(std::string(25, '\0')),
    Overlong(std::string(26, '\0')),
    Overlong("ORPC/2 26 0\nRpcId: 7\nType: cancel\n\n"),
    Overlong(std::string(24, 'x') + "\r\xC3"),
    Unfinished(
        "\xE2\x82\xAC\xE2\x82\xAC\xE2\x82\xAC\xE2\x82\xAC\xE2\x82\xAC\xE2\x82\xAC\xE2\x82\xAC\xE2\x82\xAC"),
    Overlong(
        "\xE2\x82\xAC\xE2\x82\xAC\xE2\x82\xAC\xE2\x82\xAC\xE2\x82\xAC\xE2\x82\xAC\xE2\x82\xAC\xE2\x82\xAC"
        "12"),
    // With an end a line may be of any length.
    Bad(std::string(22, 'x'), fieldsG),
    Bad(std::string(25, 'x'), fieldsG),
    Bad(std::string(1000, 'x'), fieldsG),
};

}  // namespace

class FirstLineTest : public FramingFixture {
 protected:
    /// Whether the line counts as read: also an input that is one overlong line.
    static bool FTrue(const Row& row) {
        return row.length != 0 && (row.words == nullptr || std::string(row.words) == lineLongG);
    }
};

TEST_F(FirstLineTest, ItsOwnReader) {
    for (const Row& row : vRowsG) {
        SCOPED_TRACE(row.input);
        FirstLine line;
        line.headerLength = line.bodyLength = line.length = untouchedG;
        RoxString error("before");
        EXPECT_EQ(line.Parse(row.input, error), FTrue(row));
        EXPECT_EQ(Str(error), row.words != nullptr ? row.words : "before");
        EXPECT_EQ(line.headerLength, row.headerLength);
        EXPECT_EQ(line.bodyLength, row.bodyLength);
        EXPECT_EQ(line.length, row.length);
    }
}

TEST_F(FirstLineTest, TheModel) {
    for (const Row& row : vRowsG) {
        SCOPED_TRACE(row.input);
        ModelReader::Line line{untouchedG, untouchedG, untouchedG};
        std::string error = "before";
        EXPECT_EQ(ModelReader::ReadFirstLine(row.input, line, error), FTrue(row));
        EXPECT_EQ(error, row.words != nullptr ? row.words : "before");
        EXPECT_EQ(line.headerLength, row.headerLength);
        EXPECT_EQ(line.bodyLength, row.bodyLength);
        EXPECT_EQ(line.length, row.length);
    }
}

TEST_F(FirstLineTest, ThePacketizer) {
    for (const Row& row : vRowsG) {
        SCOPED_TRACE(row.input);
        const bool isSeen = row.length != 0;
        const uint32_t header = row.headerLength == untouchedG ? 0 : row.headerLength;
        const uint32_t body = row.bodyLength == untouchedG ? 0 : row.bodyLength;
        const uint32_t all = static_cast<uint32_t>(row.input.size());
        const uint32_t packet = !isSeen ? 0 : FTrue(row) ? row.length + header + body : all;
        OrvoRpcV2Packetizer packetizer(&pool);
        packetizer.UpdateInput(Text(row.input));
        EXPECT_EQ(packetizer.firstLineParsed, isSeen);
        EXPECT_EQ(packetizer.headerLength, header);
        EXPECT_EQ(packetizer.bodyLength, body);
        EXPECT_EQ(packetizer.firstLineLength, row.length);
        EXPECT_EQ(packetizer.packetLength, packet);
        EXPECT_EQ(packetizer.complete, isSeen && packet <= all);
        EXPECT_EQ(Str(packetizer.lastError), row.words != nullptr ? row.words : "");
    }
}

/// In front of all that it declares the line alone decides.
TEST_F(FirstLineTest, TheUnmarshaller) {
    for (const Row& row : vRowsG) {
        SCOPED_TRACE(row.input);
        std::string expected = "before";
        if (row.words != nullptr) expected = row.words;
        // An overlong line, and one that declares nothing, leaves an empty block.
        if (expected == lineLongG || (FTrue(row) && row.headerLength + row.bodyLength == 0)) {
            expected = "Missing rpcId";
        } else if (FTrue(row)) {
            continue;  // sizes are the subject of other tests
        }
        EXPECT_EQ(ByLibrary(row.input, false, "before"), "refused: " + expected);
        EXPECT_EQ(ByModel(row.input, false, "before"), "refused: " + expected);
    }
}

/// The positions of the block and the body count characters, those of the first line too.
TEST_F(FirstLineTest, CharactersOfSeveralBytesMoveWhatFollows) {
    // "ORPC/2 26 0", an accented letter and the end are 15 bytes and 14 characters: the block begins one
    // late.
    EXPECT_EQ(ByLibrary("ORPC/2 26 0\xC3\xA9\r\nXRpcId: 7\r\nType: cancel\r\n\r\n"), "read: cancel 7");
    EXPECT_EQ(ByLibrary("ORPC/2 26 0\xC3\xA9\r\n\xE2\x82\xACRpcId: 7\r\nType: cancel\r\n\r\n"),
              "read: cancel 7");
    EXPECT_EQ(ByLibrary("ORPC/2 26 0\xC3\xA9\r\nRpcId: 7\r\nType: cancel\r\n\r\n"),
              "refused: Size of header (25) does not match expected (26)");
}

}  // namespace sorntest
