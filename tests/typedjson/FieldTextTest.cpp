// The text of fields apart from that of their data types: what is left out, what does not exist, ids that are
// cut, names and separators.

#include "typedjson/FieldWriterFixture.h"

namespace sorntest {

using namespace sorn;
using sornschema::EveryType;

using FieldTextTest = FieldWriterFixture;

TEST_F(FieldTextTest, NullReferences) {
    for (const char* name : {"requiredBytes", "requiredAnyDict", "requiredKnownDict", "requiredLazy",
                             "requiredObject", "optionalObject", "optionalLazy"}) {
        EXPECT_EQ(Single(*New<EveryType>(), Field(name)), "") << name;
    }
    const ref<EveryType> object = New<EveryType>();
    object->multiObject.Add(nullptr);
    EXPECT_EQ(Multi(*object, Field("multiObject")), R"("k": [])");
    object->multiObject.Add(Companion(1).get());
    object->multiObject.Add(nullptr);
    object->multiObject.Add(Companion(2).get());
    object->multiObject.Add(nullptr);
    EXPECT_EQ(
        Multi(*object, Field("multiObject")),
        R"("k": [{"type": "everyTypeCompanion", "number": 1},{"type": "everyTypeCompanion", "number": 2}])");
    for (RoxGenericArray* array : {&object->multiBytes, &object->multiAnyDict, &object->multiLazy})
        array->Add(nullptr);
    object->multiBytes.Add(Bytes("Man").get());
    object->multiAnyDict.Add(AnyDict("{}").get());
    object->multiLazy.Add(Lazy("{}").get());
    EXPECT_EQ(Multi(*object, Field("multiBytes")), R"("k": ["TWFu"])");
    EXPECT_EQ(Multi(*object, Field("multiAnyDict")), R"("k": [{}])");
    EXPECT_EQ(Multi(*object, Field("multiLazy")), R"("k": [{}])");
}

TEST_F(FieldTextTest, DataTypesThatDoNotExist) {
    const ref<EveryType> object = New<EveryType>();
    object->requiredS32 = 1;
    int32_t element = 1;
    object->multiS32.Add(&element);
    for (unsigned type = 21; type < 32; ++type) {
        FieldInfo field = Field("requiredS32");
        field.dataType = type & 31;
        EXPECT_EQ(Single(*object, field), "\"k\": ") << type;
        field = Field("multiS32");
        field.dataType = type & 31;
        EXPECT_EQ(Multi(*object, field), "") << type;
    }
}

TEST_F(FieldTextTest, AnEnumerationThatDoesNotExist) {
    const ref<EveryType> object = New<EveryType>();
    object->requiredEnum = 1;
    FieldInfo field = Field("requiredEnum");
    // None, a struct's id, one between the enumerations, and one behind all of them.
    for (const unsigned short typeRef : std::initializer_list<unsigned short>{0, 129, 669, 65535}) {
        field.typeRef = typeRef;
        EXPECT_EQ(Single(*object, field), R"("k": "INVALID_VALUE:1")") << typeRef;
    }
}

TEST_F(FieldTextTest, IdsOfStructsThatDoNotExist) {
    const ref<EveryType> object = New<EveryType>();
    for (const char* name : {"requiredIntId", "requiredLongId", "requiredStringId"}) {
        FieldInfo field = Field(name);
        for (const unsigned short typeRef : std::initializer_list<unsigned short>{0, 1, 65535}) {
            field.typeRef = typeRef;
            EXPECT_EQ(Single(*object, field), R"("k": "XXX")") << name << ' ' << typeRef;
        }
    }
}

TEST_F(FieldTextTest, IdsAreCutAt99Bytes) {
    const ref<EveryType> object = New<EveryType>();
    // "vuka:etc." are 9 bytes.
    for (const size_t n : {89u, 90u, 91u, 5000u}) {
        object->requiredStringId = RoxString(&pool, std::string(n, 'x').c_str());
        EXPECT_EQ(Single(*object, Field("requiredStringId")),
                  "\"k\": \"vuka:etc." + std::string(std::min<size_t>(n, 90), 'x') + "\"");
    }
    // The cut counts the bytes of the id and not those of their escapes.
    object->requiredStringId = RoxString(&pool, std::string(95, '"').c_str());
    std::string escaped;
    for (int i = 0; i < 90; ++i) escaped += "\\\"";
    EXPECT_EQ(Single(*object, Field("requiredStringId")), "\"k\": \"vuka:etc." + escaped + "\"");
}

TEST_F(FieldTextTest, BytesOfAllLengths) {
    // Around the pieces in which the text is written; the text of n times three zero bytes is n times "AAAA".
    const ref<EveryType> object = New<EveryType>();
    for (const unsigned n : {1u, 767u, 768u, 769u, 1535u, 1536u, 1537u, 100000u}) {
        object->requiredBytes = Bytes(std::string(n, '\0'));
        std::string expected(n / 3 * 4, 'A');
        if (n % 3 == 1) expected += "AA==";
        if (n % 3 == 2) expected += "AAA=";
        EXPECT_EQ(Single(*object, Field("requiredBytes")), "\"k\": \"" + expected + "\"") << n;
    }
}

TEST_F(FieldTextTest, NamesAndSeparators) {
    JsonSornObject writer(&pool);
    const ref<EveryType> object = New<EveryType>();
    ByteBuffer out(&pool);
    bool first = true;
    writer.WriteFieldName("a", out, first);
    EXPECT_FALSE(first);
    writer.WriteFieldName("b\"", out, first);  // as it is
    writer.SingleFieldToJson("c", &Field("requiredS32"), object.get(), out, first, 0);
    writer.SingleFieldToJson("d", &Field("requiredObject"), object.get(), out, first, 0);  // null
    writer.MultiFieldToJson("e", &Field("multiS32"), object.get(), out, first, 0);         // empty
    writer.SingleFieldToJson("", &Field("requiredBool"), object.get(), out, first, 0);
    EXPECT_EQ(Text(out), R"("a": , "b"": , "c": 0, "": false)");
    ByteBuffer nothing(&pool);
    first = true;
    writer.SingleFieldToJson("d", &Field("requiredObject"), object.get(), nothing, first, 0);
    writer.MultiFieldToJson("e", &Field("multiS32"), object.get(), nothing, first, 0);
    EXPECT_TRUE(first);
    const std::string longName(5000, 'n');
    writer.WriteFieldName(longName.c_str(), nothing, first);
    EXPECT_EQ(Text(nothing), "\"" + longName + "\": ");
}

TEST_F(FieldTextTest, BodiesOnTheirOwn) {
    JsonSornObject writer(&pool);
    ByteBuffer out(&pool);
    const ref<LazyDict> body = Lazy(" {\"b\":1,\"a\":2}");
    writer.LazyToJson(body.get(), out);
    writer.LazyToJson(nullptr, out);
    EXPECT_EQ(Text(out), " {\"b\":1,\"a\":2}");
    const ref<LazyDict> object = LazyDict::FromSornObject(&pool, Companion(3), 0);
    writer.LazyToJson(object.get(), out);
    const ref<LazyDict> dictionary = LazyDict::FromDictionary(&pool, Parse(R"({"b":1,"a":2})"), 0);
    writer.LazyToJson(dictionary.get(), out);
    EXPECT_EQ(Text(out),
              " {\"b\":1,\"a\":2}"
              R"({"type": "everyTypeCompanion", "number": 3}{"a": 2, "b": 1})");
}

}  // namespace sorntest
