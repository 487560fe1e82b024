// Reading: what is taken and what is refused. Invariants for untrusted input: 1, 2, 6, 8, 9.

#include "binary/UnmarshalFixture.h"
#include "sornschema/EveryTypeLazy.h"
#include "sornschema/EveryTypePlain.h"

namespace sorntest {

using namespace sorn;
using sornschema::EveryType;
using sornschema::EveryTypeCompanion;
using sornschema::EveryTypeLazy;
using sornschema::EveryTypePlain;

class UnmarshalTest : public UnmarshalFixture {};

TEST_F(UnmarshalTest, ValuesThatAreRefused) {
    struct Case {
        const char* name;
        const char* values[8];
    };
    const Case cases[] = {
        {"Bool", {"", "02", "80", "80 02", "FF FF FF FF 0F"}},
        {"Bytes", {"", "01", "03 61 62", "FF FF FF FF 0F 61", "FF FF FF FF FF FF FF FF FF 01 61"}},
        {"Channel",
         {"", "00", "01", "01 2D", "02 2D 31", "07 69 6E 76 61 6C 69 64", "03 37 2D", "04 37 2D 32 20"}},
        {"Currency",
         {"", "00", "03 55 53 44", "04 55 53 44 2E", "06 55 53 44 2E 2D 31", "07 69 6E 76 61 6C 69 64"}},
        {"Date", {"", "80", "80 80 80 80 80 00"}},
        {"DateTime", {"", "80", "80 80 80 80 80 80 80 80 80 80 00"}},
        {"AnyDict", {"", "01", "0A 00", "03 12 01 61", "02 22 00", "FF FF FF FF 0F"}},
        {"Enum", {"", "80", "80 80 80 80 80 00"}},
        {"Float", {"", "00 00 00 00 00 00 F0"}},
        {"IntId", {"", "80", "80 80 80 80 80 00"}},
        {"LongId", {"", "80", "80 80 80 80 80 80 80 80 80 80 00"}},
        {"StringId", {"", "01", "02 61"}},
        {"KnownDict",
         {"", "00", "01 FA", "03 FA F1 02", "04 FA F1 02 01", "02 02 00", "02 0A 00", "05 FA F1 02 00"}},
        {"Lazy", {"", "01", "02 61", "FF FF FF FF 0F 61"}},
        {"Object", {"", "01", "01 38", "02 38 80", "FF FF FF FF 0F", "FF FF FF FF FF FF FF FF FF 01"}},
        {"S64", {"", "80", "80 80 80 80 80 80 80 80 80 80 00"}},
        {"S32", {"", "80", "80 80 80 80 80 00"}},
        {"String", {"", "01", "02 61", "FF FF FF FF 0F 61", "FF FF FF FF FF FF FF FF FF 01 61"}},
        {"Time", {"", "80", "80 80 80 80 80 00"}},
        {"U32", {"", "80", "80 80 80 80 80 00"}},
        {"U64", {"", "80", "80 80 80 80 80 80 80 80 80 80 00"}},
    };
    for (const Case& each : cases) {
        for (const char* arity : {"multi", "optional", "required"}) {
            const std::string name = std::string(arity) + each.name;
            const OneFieldStruct one(name);
            const std::string tag = Hex(one.Tag(2)) + " ";
            for (const char* value : each.values) {
                if (value == nullptr) break;
                EXPECT_EQ(OneField(name.c_str(), tag + value), "refused") << name << ": " << value;
            }
        }
    }
}

TEST_F(UnmarshalTest, DataTypesThatDoNotExist) {
    const OneFieldStruct one("optionalS32");
    FieldInfo field = one.Field();
    const ref<SornObject> object = EveryType::Factory(&pool);
    for (unsigned type = 21; type < 32; ++type) {
        field.dataType = type & 31;
        const ExactBytes bytes(Bytes("01 01 01 01"));
        const unsigned char* cursor = bytes.Begin();
        EXPECT_FALSE(Codec().UnmarshalOneSingleValue(&field, &cursor, bytes.End(), object.get()));
        EXPECT_FALSE(Codec().UnmarshalOneMultiValue(&field, &cursor, bytes.End(), object.get()));
    }
}

TEST_F(UnmarshalTest, LongerFormsOfNumbers) {
    EXPECT_EQ(Companion("B8 80 00 86 80 80 80 00"), "38 06");
    EXPECT_EQ(Companion("32 81 80 80 80 00 78"), "32 01 78");
    EXPECT_EQ(OneField("optionalBool", Hex(OneFieldStruct("optionalBool").Tag(0)) + " 81 00"), "B8 01 01");
}

TEST_F(UnmarshalTest, FieldsThatAreMissingOrComeTwice) {
    EXPECT_EQ(Again(EveryTypePlain::structIdG, ""), "08 00");  // a required field at its default
    EXPECT_EQ(Companion("38 06 38 08"), "38 08");
    EXPECT_EQ(Companion("32 01 78 32 00"), "32 00");
    EXPECT_EQ(Companion("0A 02 38 06 0A 03 32 01 78"), "0A 03 32 01 78");
    EXPECT_EQ(Companion("12 00 38 06 12 02 38 08"), "12 00 12 02 38 08 38 06");  // in slot order again
    // An any dict gets the entries of both.
    EXPECT_EQ(Companion("22 07 22 05 32 01 61 42 00 22 07 22 05 32 01 62 42 00"),
              "22 0E 22 05 32 01 61 42 00 22 05 32 01 62 42 00");
}

TEST_F(UnmarshalTest, KnownDictFields) {
    // The first length bounds the two numbers behind it, and nothing else.
    EXPECT_EQ(Companion("2A 06 FA F1 02 02 38 06"), "2A 06 FA F1 02 02 38 06");
    EXPECT_EQ(Companion("2A 06 FA F1 02 00 38 06"), "2A 04 FA F1 02 00 38 06");  // the rest: fields around it
    EXPECT_EQ(Companion("2A 04 FA F1 02 02 38 06"), "2A 06 FA F1 02 02 38 06");
    EXPECT_EQ(Companion("2A 03 FA F1 02 02 38 06"), "refused");
    EXPECT_EQ(Companion("2A 02 FA F1 02 00"), "refused");
    EXPECT_EQ(Companion("2A 05 FA F1 02 00"), "refused");  // beyond all bytes
    // The low bits of the struct's tag are not looked at: FF F1 02 is 5919 * 8 + 7.
    EXPECT_EQ(Companion("2A 06 FF F1 02 02 38 06"), "2A 06 FA F1 02 02 38 06");
    // No struct has id 1, 5930 is an enumeration's, 5932 is behind the table, 536870911 the largest that can
    // come.
    for (const char* tag : {"0A 00", "D2 F2 02 00", "E2 F2 02 00", "FF FF FF FF 0F 00", "02 00"}) {
        EXPECT_EQ(Companion("2A " + Hex(Varint(Bytes(tag).size())) + " " + tag), "refused") << tag;
        ref<SornObject> object;
        const ExactBytes bytes(Bytes(tag));
        EXPECT_FALSE(Codec().UnmarshalKnownDict(bytes.Begin(), bytes.Size(), &object)) << tag;
        EXPECT_EQ(object, nullptr);
    }
}

TEST_F(UnmarshalTest, LengthsInsideLengths) {
    // An object's length may go beyond the end of the one around it, which then does not end where it should.
    EXPECT_EQ(Companion("0A 02 0A 02 38 06"), "refused");
    EXPECT_EQ(Companion("0A 04 0A 02 38 06"), "0A 04 0A 02 38 06");
    EXPECT_EQ(Companion("0A 05 0A 02 38 06"), "refused");
    EXPECT_EQ(Companion("0A 02 2A 04 FA F1 02 00"), "refused");
    EXPECT_EQ(Companion("0A 01 38 06"), "refused");
    // What lies in the object that goes too far is read nevertheless.
    testing::internal::CaptureStdout();
    EXPECT_EQ(Companion("0A 02 0A 02 40 06"), "refused");
    EXPECT_EQ(testing::internal::GetCapturedStdout(),
              "field number '8' out of range in 'everyTypeCompanion'\n");
}

TEST_F(UnmarshalTest, Cursors) {
    const ExactBytes bytes(Bytes("06 FA F1 02 02 38 06 77"));
    const unsigned char* const end = bytes.End();
    ref<SornObject> object;
    const unsigned char* cursor = bytes.Begin();
    EXPECT_TRUE(Codec().UnmarshalKnownDictField(&cursor, end, &object));
    EXPECT_EQ(cursor, end - 1);
    EXPECT_EQ(FieldsOf(object), "38 06");
    cursor = bytes.Begin() + 1;
    EXPECT_TRUE(Codec().UnmarshalKnownDictValue(&cursor, end, &object));
    EXPECT_EQ(cursor, end - 1);
    cursor = bytes.Begin() + 4;
    EXPECT_TRUE(Codec().UnmarshalSubdict(&cursor, end, EveryTypeCompanion::structIdG, &object));
    EXPECT_EQ(cursor, end - 1);
    cursor = bytes.Begin() + 5;
    EXPECT_TRUE(Codec().UnmarshalDict(&cursor, end - 1, EveryTypeCompanion::structIdG, &object));
    EXPECT_EQ(cursor, end - 1);
    EXPECT_EQ(FieldsOf(object), "38 06");
    ref<LazyDict> body;
    cursor = bytes.Begin();
    EXPECT_TRUE(Codec().UnmarshalKnownDictAsLazyField(&cursor, end, &body));
    EXPECT_EQ(cursor, end - 1);
    EXPECT_EQ(Hex(*body->GetStoredBytes()), "FA F1 02 02 38 06");
    EXPECT_EQ(body->GetRep(), LazyDict::REP_PROTOBUF);
}

TEST_F(UnmarshalTest, WholeBuffers) {
    const std::string whole = "FA F1 02 02 38 06";
    for (const auto& [hex, isTaken] : {std::pair<std::string, bool>{whole, true},
                                       {whole + " 00", false},
                                       {whole + " 38 06", false},
                                       {"", false},
                                       {"FA F1 02", false},
                                       {"FA F1 02 03 38 06", false}}) {
        SCOPED_TRACE(hex);
        const ExactBytes bytes(Bytes(hex));
        const ref<SornObject> before = EveryTypePlain::Factory(&pool);
        ref<SornObject> object = before;
        EXPECT_EQ(Codec().UnmarshalKnownDict(bytes.Begin(), bytes.Size(), &object), isTaken);
        EXPECT_EQ(object == before, !isTaken);
        ref<SornObject> shared = before;
        const auto n = static_cast<uint32_t>(bytes.Size());
        EXPECT_EQ(Codec().UnmarshalKnownDict(rox::ByteBuffer::New(&pool, bytes.Begin(), n), &shared),
                  isTaken);
        EXPECT_EQ(shared == before, !isTaken);
    }
    const ExactBytes bytes(Bytes("38 06"));
    ref<SornObject> object;
    EXPECT_FALSE(Codec().Unmarshal(bytes.Begin(), -1, EveryTypeCompanion::structIdG, &object));
    EXPECT_FALSE(Codec().UnmarshalKnownDict(bytes.Begin(), -1, &object));
    EXPECT_FALSE(Codec().Unmarshal(bytes.Begin(), 0, 0, &object));
    EXPECT_FALSE(Codec().Unmarshal(bytes.Begin(), 0, Schema::nStructDefG, &object));
    EXPECT_FALSE(Codec().Unmarshal(bytes.Begin(), 0, UINT32_MAX, &object));
    EXPECT_TRUE(Codec().Unmarshal(bytes.Begin(), 0, EveryTypeCompanion::structIdG, &object));
}

TEST_F(UnmarshalTest, LazyFields) {
    const auto* info = &EveryTypeLazy::structInfoG;
    const auto read = [&](const std::string& hex) {
        return ref<EveryTypeLazy>(static_cast<EveryTypeLazy*>(Read(EveryTypeLazy::structIdG, hex).get()));
    };
    EXPECT_EQ(info->nFields, 3);
    EXPECT_EQ(read("12 00")->body, nullptr);
    EXPECT_EQ(read("12 02 00 61")->body, nullptr);  // 0 is the first byte of no body
    EXPECT_EQ(Hex(*read("12 02 38 06")->body->GetStoredBytes()), "38 06");
    EXPECT_EQ(read("12 02 7B 7D")->body->GetRep(), LazyDict::REP_JSON);
    EXPECT_EQ(read("12 01 FF")->body->GetRep(), LazyDict::REP_PROTOBUF);  // nothing is decoded now
    const ref<EveryTypeLazy> several = read("0A 00 0A 01 7A 0A 00");
    ASSERT_EQ(several->bodies.GetCount(), 3u);
    EXPECT_EQ(several->bodies.At(0), nullptr);
    EXPECT_NE(several->bodies.At(1), nullptr);
    EXPECT_EQ(several->bodies.At(2), nullptr);
    ref<LazyDict> body = several->body;
    const ExactBytes bytes(Bytes("00"));
    const unsigned char* cursor = bytes.Begin();
    EXPECT_TRUE(Codec().UnmarshalKnownDictAsLazyField(&cursor, bytes.End(), &body));
    EXPECT_EQ(body, nullptr);
    EXPECT_FALSE(Codec().UnmarshalKnownDictAsLazyField(&cursor, bytes.End(), &body));
}

/// Of an object of the caller's, a failure leaves what came before it, and no object that is not whole.
TEST_F(UnmarshalTest, FailureInAnObjectThatIsThere) {
    for (const char* hex : {"38 06 0A 02 38 80", "38 06 0A 04 0A 02 38 80", "38 06 12 02 38 80",
                            "38 06 12 04 12 02 38 80", "38 06 2A 05 FA F1 02 01 38"}) {
        SCOPED_TRACE(hex);
        const ref<SornObject> object = EveryTypeCompanion::Factory(&pool);
        const ExactBytes bytes(Bytes(hex));
        const unsigned char* cursor = bytes.Begin();
        EXPECT_FALSE(
            Codec().UnmarshalFields(&EveryTypeCompanion::structInfoG, &cursor, bytes.End(), object.get()));
        EXPECT_EQ(FieldsOf(object), "38 06");
    }
    const ref<SornObject> object = EveryTypeCompanion::Factory(&pool);
    const ExactBytes bytes(Bytes("0A 02 38 06 12 02 38 06 12 04 0A 02 38 08 2A 04 FA F1 02 00"));
    const unsigned char* cursor = bytes.Begin();
    EXPECT_TRUE(
        Codec().UnmarshalFields(&EveryTypeCompanion::structInfoG, &cursor, bytes.End(), object.get()));
    EXPECT_EQ(FieldsOf(object), Hex(bytes.Begin(), static_cast<size_t>(bytes.Size())));
}

TEST_F(UnmarshalTest, FullContainers) {
    struct Case {
        const char* name;
        const char* value;
    };
    const Case cases[] = {{"multiBool", "01"},  {"multiString", "01 61"}, {"multiS64", "03"},
                          {"multiBytes", "00"}, {"multiObject", "00"},    {"multiAnyDict", "00"},
                          {"multiLazy", "00"}};
    for (const Case& each : cases) {
        SCOPED_TRACE(each.name);
        const OneFieldStruct one(each.name);
        const std::string element = one.Tag(0) + Bytes(each.value);
        std::string elements;
        for (unsigned i = 0; i < 65535; ++i) elements += element;
        for (const bool isFull : {false, true}) {
            const ref<SornObject> target = EveryType::Factory(&pool);
            const ExactBytes bytes(isFull ? elements + element : elements);
            const unsigned char* cursor = bytes.Begin();
            EXPECT_EQ(Codec().UnmarshalFields(&one.Info(), &cursor, bytes.End(), target.get()), !isFull);
            EXPECT_EQ(FieldSource(target->MemberAt(one.Field()), true).Count(one.Field().Type()), 65535u);
        }
    }
}

TEST_F(UnmarshalTest, DictFromSornObject) {
    EXPECT_EQ(JsonOf(Codec().DictFromSornObject(Read(EveryTypeCompanion::structIdG, "32 01 78 38 06"))),
              R"({"label": "x", "number": 3, "type": "everyTypeCompanion"})");
}

}  // namespace sorntest
