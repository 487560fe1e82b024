// Reading fields that the struct has not got, and tags that nobody writes. Invariants for untrusted input: 1,
// 2, 9.

#include "binary/UnmarshalFixture.h"

namespace sorntest {

using namespace sorn;
using sornschema::EveryType;
using sornschema::EveryTypeCompanion;

class UnknownFieldsTest : public UnmarshalFixture {};

TEST_F(UnknownFieldsTest, UnknownFields) {
    struct Case {
        unsigned structId;
        const char* hex;
        const char* lines;
        const char* again;  ///< a companion's number, or "refused"
    };
    const unsigned companion = EveryTypeCompanion::structIdG;  // eight slots, 0 to 7
    const char* const eight = "field number '8' out of range in 'everyTypeCompanion'\n";
    const Case cases[] = {
        {companion, "40 05 38 06", eight, "38 06"},
        {companion, "40 FF FF FF FF FF FF FF FF FF 01 38 06", eight, "38 06"},
        {companion, "41 01 02 03 04 05 06 07 08 38 06", eight, "38 06"},
        {companion, "42 03 38 06 07 38 08", eight, "38 08"},
        {companion, "42 00", eight, ""},
        {companion, "42 81 80 80 80 10 07 38 06", eight, "38 06"},  // of 2^32 + 1 the low bits count
        {companion, "00 05 38 06", "field number '0' undefined in 'everyTypeCompanion'\n", "38 06"},
        {companion, "F8 FF FF FF 0F 05", "field number '536870911' out of range in 'everyTypeCompanion'\n",
         ""},
        {companion, "40", eight, "refused"},
        {companion, "41 01 02 03 04 05 06 07", eight, "refused"},
        {companion, "42 03 38 06", eight, "refused"},
        {companion, "42", eight, "refused"},
        {companion, "43", eight, "refused"},
        {companion, "44", eight, "refused"},
        {companion, "45 01 02 03 04", eight, "refused"},
        {companion, "46 00", eight, "refused"},
        {companion, "47 00", eight, "refused"},
        {companion, "40 80 80 80 80 80 80 80 80 80 80 01", eight, "refused"},
        {EveryType::structIdG, "80 04", "field number '64' undefined in 'everyType'\n", "refused"},
    };
    for (const Case& each : cases) {
        SCOPED_TRACE(each.hex);
        testing::internal::CaptureStdout();
        const std::string again = Again(each.structId, each.hex);
        EXPECT_EQ(testing::internal::GetCapturedStdout(), each.lines);
        EXPECT_EQ(again, each.again);
    }
    testing::internal::CaptureStdout();
    EXPECT_NE(Read(EveryType::structIdG, "80 04 05 40 00 88 05 01"),
              nullptr);  // 64 a hole, 8 known, 81 the last + 1
    EXPECT_EQ(testing::internal::GetCapturedStdout(),
              "field number '64' undefined in 'everyType'\nfield number '81' out of range in 'everyType'\n");
}

TEST_F(UnknownFieldsTest, SkipFieldValue) {
    struct Case {
        unsigned wireType;
        const char* hex;
        int nUsed;  ///< -1: refused
    };
    const Case cases[] = {
        {0, "05", 1},
        {0, "80 80 80 80 80 80 80 80 80 01 07", 10},
        {0, "80", -1},
        {0, "", -1},
        {1, "01 02 03 04 05 06 07 08", 8},
        {1, "01 02 03 04 05 06 07", -1},
        {2, "00", 1},
        {2, "02 61 62 63", 3},
        {2, "02 61", -1},
        {2, "80 80 80 80 10", 5},                  // 2^32: nothing is left of it
        {2, "FF FF FF FF 0F 61", -1},              // 2^32 - 1
        {2, "80 80 80 80 08 61", -1},              // 2^31
        {2, "FF FF FF FF FF FF FF FF FF 01", -1},  // 2^64 - 1
        {3, "00 00", -1},
        {4, "00 00", -1},
        {5, "00 00 00 00 00", -1},
        {6, "00 00", -1},
        {7, "00 00", -1},
    };
    for (const Case& each : cases) {
        SCOPED_TRACE(std::to_string(each.wireType) + ": " + each.hex);
        const ExactBytes bytes(Bytes(each.hex));
        const unsigned char* cursor = bytes.Begin();
        EXPECT_EQ(Codec().SkipFieldValue(each.wireType, &cursor, bytes.End()), each.nUsed >= 0);
        if (each.nUsed >= 0) {
            EXPECT_EQ(cursor - bytes.Begin(), each.nUsed);
        }
    }
}

/// The bits of the wire type in a known field's tag are not looked at: 7 and 6 are a number and a text.
TEST_F(UnknownFieldsTest, WireTypeOfKnownFields) {
    for (const char* tag : {"38", "39", "3A", "3B", "3C", "3D", "3E", "3F"}) {
        EXPECT_EQ(Companion(std::string(tag) + " 06"), "38 06");
    }
    for (const char* tag : {"30", "31", "32", "33", "34", "35", "36", "37"}) {
        EXPECT_EQ(Companion(std::string(tag) + " 01 78"), "32 01 78");
    }
}

/// 0x64 is what the section stream escapes, and as a tag field 12 of wire type 4, the end of a group in
/// formats that have groups.
TEST_F(UnknownFieldsTest, TagsOfGroups) {
    for (const char* tag : {"63", "64", "66", "67"}) {
        SCOPED_TRACE(tag);
        for (const char* behind : {"", " 00", " 64", " 38 06", " 01 02 03 04 05 06 07 08"}) {
            testing::internal::CaptureStdout();
            EXPECT_EQ(Companion(std::string("38 06 ") + tag + behind), "refused");
            EXPECT_EQ(testing::internal::GetCapturedStdout(),
                      "field number '12' out of range in 'everyTypeCompanion'\n");
        }
        // Around an object that is read already: nothing of it is left.
        testing::internal::CaptureStdout();
        EXPECT_EQ(Companion(std::string("0A 02 38 06 ") + tag), "refused");
        testing::internal::GetCapturedStdout();
        // Neither entries nor items of dictionaries have such tags.
        EXPECT_EQ(Companion(std::string("22 02 ") + tag + " 00"), "refused");
        EXPECT_EQ(Companion(std::string("22 07 22 05 32 01 61 ") + tag + " 00"), "refused");
    }
    // As the tag of a known field they are read as what the field is: slot 12 of everyType.
    const FieldInfo& field = EveryType::structInfoG.vFieldInfo[12];
    const OneFieldStruct one(EveryType::structInfoG.FieldName(field));
    for (const ValueRow& row : ValueRows(&pool)) {
        if (EveryType::structInfoG.FieldName(field) != std::string("multi") + row.name) continue;
        const std::string written = Hex(one.Tag(row.wireType)) + " " + row.first;
        for (const char* tag : {"63", "64", "66", "67"}) {
            EXPECT_EQ(OneField(EveryType::structInfoG.FieldName(field), std::string(tag) + " " + row.first),
                      written);
        }
    }
}

}  // namespace sorntest
