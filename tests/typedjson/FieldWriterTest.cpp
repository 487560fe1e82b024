// The text of single and repeated fields of every data type.

#include <algorithm>
#include <functional>
#include <initializer_list>

#include "typedjson/FieldWriterFixture.h"

namespace sorntest {

using namespace sorn;
using sornschema::EveryType;

using FieldWriterTest = FieldWriterFixture;

template <class T>
void Add(RoxGenericIntArray& array, std::initializer_list<T> values) {
    for (const T& value : values) array.Add(&value);
}

TEST_F(FieldWriterTest, SingleValuesOfEveryDataType) {
    struct Row {
        const char* field;
        std::function<void(EveryType&)> set;
        const char* value;
    };
    const Row vRow[] = {
        {"requiredBool", [](EveryType& o) { o.requiredBool = true; }, "true"},
        {"requiredBool", [](EveryType&) {}, "false"},
        {"requiredBytes", [&](EveryType& o) { o.requiredBytes = Bytes("Man"); }, R"("TWFu")"},
        {"requiredBytes", [&](EveryType& o) { o.requiredBytes = Bytes("Ma"); }, R"("TWE=")"},
        {"requiredBytes", [&](EveryType& o) { o.requiredBytes = Bytes("\xFB\xFF"); }, R"("+/8=")"},
        {"requiredBytes", [&](EveryType& o) { o.requiredBytes = Bytes(""); }, R"("")"},
        {"requiredChannel", [](EveryType& o) { o.requiredChannel = ChannelNumber(7, 2); }, R"("7-2")"},
        {"requiredChannel", [](EveryType& o) { o.requiredChannel = ChannelNumber(7); }, R"("7")"},
        {"requiredChannel", [](EveryType&) {}, R"("invalid")"},
        {"requiredCurrency", [](EveryType& o) { o.requiredCurrency = Currency(-100, "USD"); },
         R"("USD.-100")"},
        {"requiredCurrency", [](EveryType& o) { o.requiredCurrency = Currency(1, "\"\\\n"); },
         R"("\"\\\n.1")"},
        {"requiredCurrency", [](EveryType&) {}, R"("invalid")"},
        {"requiredDate", [](EveryType& o) { o.requiredDate = Date(365); }, R"("1971-01-01")"},
        {"requiredDateTime", [](EveryType& o) { o.requiredDateTime = DateTime(2145916799999); },
         R"("2037-12-31 23:59:59")"},
        {"requiredAnyDict", [&](EveryType& o) { o.requiredAnyDict = AnyDict(R"({"b":1,"a":"x"})"); },
         R"({"a": "x", "b": 1})"},
        {"requiredAnyDict", [&](EveryType& o) { o.requiredAnyDict = AnyDict("{}"); }, "{}"},
        {"requiredEnum", [](EveryType& o) { o.requiredEnum = 2; }, R"("green")"},
        {"requiredEnum", [](EveryType& o) { o.requiredEnum = 5; }, R"("blue")"},
        {"requiredEnum", [](EveryType& o) { o.requiredEnum = 3; }, R"("INVALID_VALUE:3")"},
        {"requiredEnum", [](EveryType&) {}, R"("INVALID_VALUE:0")"},
        {"requiredEnum", [](EveryType& o) { o.requiredEnum = 6; }, R"("INVALID_VALUE:6")"},
        {"requiredEnum", [](EveryType& o) { o.requiredEnum = 4294967295u; }, R"("INVALID_VALUE:4294967295")"},
        {"enumFromZero", [](EveryType&) {}, R"("small")"},
        {"requiredFloat", [](EveryType& o) { o.requiredFloat = 1.5; }, R"("1.5")"},
        {"requiredFloat", [](EveryType& o) { o.requiredFloat = 3; }, R"("3.0")"},
        {"requiredFloat", [](EveryType& o) { o.requiredFloat = 1e20; }, R"("1e+20.0")"},
        {"requiredFloat", [](EveryType& o) { o.requiredFloat = 0.123456789; }, R"("0.12345679")"},
        {"requiredIntId", [](EveryType& o) { o.requiredIntId = 12; }, R"("vuka:etc.12")"},
        {"requiredIntId", [](EveryType& o) { o.requiredIntId = 4294967295u; }, R"("vuka:etc.4294967295")"},
        {"idWithoutPrefixInt", [](EveryType& o) { o.idWithoutPrefixInt = 12; }, R"("12")"},
        {"idWithoutStructInt", [](EveryType& o) { o.idWithoutStructInt = 12; }, R"("XXX")"},
        {"requiredLongId", [](EveryType& o) { o.requiredLongId = 12345; }, R"("vuka:etc.12345")"},
        {"requiredLongId", [](EveryType& o) { o.requiredLongId = (uint64_t{2} << 48) + 12345; },
         R"("vuka:etc.ts.12345")"},
        {"idWithoutPrefixLong", [](EveryType& o) { o.idWithoutPrefixLong = uint64_t{1} << 47; },
         R"("140737488355328")"},
        {"requiredStringId", [](EveryType& o) { o.requiredStringId = RoxString("a\"b"); },
         R"("vuka:etc.a\"b")"},
        {"requiredStringId", [](EveryType&) {}, R"("vuka:etc.")"},
        {"idWithoutStructString", [](EveryType& o) { o.idWithoutStructString = RoxString("a"); }, R"("XXX")"},
        {"requiredKnownDict", [&](EveryType& o) { o.requiredKnownDict = Plain(7); },
         R"({"type": "everyTypePlain", "plainId": "7"})"},
        {"requiredLazy", [&](EveryType& o) { o.requiredLazy = Lazy(" {\"k\":1 }"); }, R"( {"k":1 })"},
        {"requiredObject", [&](EveryType& o) { o.requiredObject = Companion(-5); },
         R"({"type": "everyTypeCompanion", "number": -5})"},
        {"requiredS64", [](EveryType& o) { o.requiredS64 = INT64_MIN; }, R"("-9223372036854775808")"},
        {"requiredS32", [](EveryType& o) { o.requiredS32 = INT32_MIN; }, "-2147483648"},
        {"requiredString",
         [](EveryType& o) { o.requiredString = RoxString("a\"\\b\n\x01\x03/\\u00e9\xC3\xA9"); },
         "\"a\\\"\\\\b\\n\\u0001\x03/\\u00e9\xC3\xA9\""},
        {"requiredString", [](EveryType& o) { o.requiredString = Bytes0(std::string("a\0b", 3)); },
         R"("a\u0000b")"},
        {"requiredString", [](EveryType&) {}, R"("")"},
        {"requiredTime", [](EveryType& o) { o.requiredTime = Time(86399999); }, R"("23:59:59")"},
        {"requiredU32", [](EveryType& o) { o.requiredU32 = 4294967295u; }, "4294967295"},
        {"requiredU64", [](EveryType& o) { o.requiredU64 = UINT64_MAX; }, R"("18446744073709551615")"},
        // Neither the presence nor the arity is asked.
        {"optionalS32", [](EveryType& o) { o.optionalS32 = 4; }, "4"},
    };
    for (const Row& row : vRow) {
        SCOPED_TRACE(row.field);
        const ref<EveryType> object = New<EveryType>();
        row.set(*object);
        EXPECT_EQ(Single(*object, Field(row.field)), std::string("\"k\": ") + row.value);
    }
}

TEST_F(FieldWriterTest, RepeatedValuesOfEveryDataType) {
    struct Row {
        const char* field;
        std::function<void(EveryType&)> set;
        const char* values;
    };
    const Row vRow[] = {
        {"multiBool",
         [](EveryType& o) {
             Add<unsigned char>(o.multiBool, {1, 0, 1});
         },
         "true,false,true"},
        {"multiBytes",
         [&](EveryType& o) {
             o.multiBytes.Add(Bytes("Man").get());
             o.multiBytes.Add(Bytes("M").get());
         },
         R"("TWFu","TQ==")"},
        {"multiChannel",
         [](EveryType& o) {
             Add(o.multiChannel, {ChannelNumber(1), ChannelNumber(), ChannelNumber(2, 3)});
         },
         R"("1","invalid","2-3")"},
        {"multiCurrency",
         [](EveryType& o) {
             Add(o.multiCurrency, {Currency(5, "EUR"), Currency()});
         },
         R"("EUR.5","invalid")"},
        {"multiDate",
         [](EveryType& o) {
             Add(o.multiDate, {Date(0), Date(-1)});
         },
         R"("1970-01-01","1969-12-31")"},
        {"multiDateTime",
         [](EveryType& o) {
             Add(o.multiDateTime, {DateTime(0), DateTime(86400000)});
         },
         R"("1970-01-01 00:00:00","1970-01-02 00:00:00")"},
        {"multiAnyDict",
         [&](EveryType& o) {
             o.multiAnyDict.Add(AnyDict(R"({"a":[1,2]})").get());
             o.multiAnyDict.Add(AnyDict("{}").get());
         },
         R"({"a": [1, 2]},{})"},
        {"multiEnum",
         [](EveryType& o) {
             Add<uint32_t>(o.multiEnum, {1, 4, 5});
         },
         R"("red","INVALID_VALUE:4","blue")"},
        {"multiFloat",
         [](EveryType& o) {
             Add(o.multiFloat, {0.5, -2.0});
         },
         R"("0.5","-2.0")"},
        {"multiIntId",
         [](EveryType& o) {
             Add<uint32_t>(o.multiIntId, {1, 2});
         },
         R"("vuka:etc.1","vuka:etc.2")"},
        {"multiKnownDict",
         [&](EveryType& o) {
             o.multiKnownDict.Add(Plain(1).get());
             o.multiKnownDict.Add(Companion(2).get());
         },
         R"({"type": "everyTypePlain", "plainId": "1"},{"type": "everyTypeCompanion", "number": 2})"},
        {"multiLazy",
         [&](EveryType& o) {
             o.multiLazy.Add(Lazy("{\"a\":1}").get());
             o.multiLazy.Add(Lazy("{}").get());
         },
         R"({"a":1},{})"},
        {"multiLongId",
         [](EveryType& o) {
             Add<uint64_t>(o.multiLongId, {3, (uint64_t{16384} << 48) + 4});
         },
         R"("vuka:etc.3","vuka:etc.vod.4")"},
        {"idWithoutStructLong",
         [](EveryType& o) {
             Add<uint64_t>(o.idWithoutStructLong, {3, 4});
         },
         R"("XXX","XXX")"},
        {"multiObject",
         [&](EveryType& o) {
             o.multiObject.Add(Companion(1).get());
             o.multiObject.Add(Companion(2).get());
         },
         R"({"type": "everyTypeCompanion", "number": 1},{"type": "everyTypeCompanion", "number": 2})"},
        {"multiS32",
         [](EveryType& o) {
             Add<int32_t>(o.multiS32, {1, -2, 3});
         },
         "1,-2,3"},
        {"multiS32", [](EveryType& o) { Add<int32_t>(o.multiS32, {7}); }, "7"},
        {"multiS64",
         [](EveryType& o) {
             Add<int64_t>(o.multiS64, {1500, -1});
         },
         R"("1500","-1")"},
        {"multiString",
         [](EveryType& o) {
             o.multiString.Add(RoxString("a"));
             o.multiString.Add(RoxString());
             o.multiString.Add(RoxString("\""));
         },
         R"("a","","\"")"},
        {"multiStringId",
         [](EveryType& o) {
             o.multiStringId.Add(RoxString("a"));
             o.multiStringId.Add(RoxString("b"));
         },
         R"("vuka:etc.a","vuka:etc.b")"},
        {"idWithoutPrefixString", [](EveryType& o) { o.idWithoutPrefixString.Add(RoxString("a")); },
         R"("a")"},
        {"multiTime",
         [](EveryType& o) {
             Add(o.multiTime, {Time(0), Time(3661000)});
         },
         R"("00:00:00","01:01:01")"},
        {"multiU32",
         [](EveryType& o) {
             Add<uint32_t>(o.multiU32, {0, 4294967295u});
         },
         "0,4294967295"},
        {"multiU64",
         [](EveryType& o) {
             Add<uint64_t>(o.multiU64, {0, 10});
         },
         R"("0","10")"},
    };
    for (const Row& row : vRow) {
        SCOPED_TRACE(row.field);
        const ref<EveryType> object = New<EveryType>();
        EXPECT_EQ(Multi(*object, Field(row.field)), "");
        row.set(*object);
        EXPECT_EQ(Multi(*object, Field(row.field)), std::string("\"k\": [") + row.values + "]");
    }
}

}  // namespace sorntest
