#include <cstring>
#include <string>

#include "convert/ConvertFixture.h"
#include "sorn/dict/ArrayValue.h"
#include "sorn/dict/Dict.h"
#include "sorn/dict/LazyDictValue.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/dict/StringValue.h"
#include "sorn/lazy/LazyDict.h"
#include "sorn/model/Schema.h"
#include "sornschema/EveryType.h"
#include "sornschema/EveryTypeCompanion.h"
#include "sornschema/EveryTypePlain.h"

namespace sorntest {

using namespace sorn;
using sornschema::EveryType;
using sornschema::EveryTypeCompanion;

class ObjectToDictionaryTest : public ConvertFixture {
 protected:
    ref<EveryType> New() { return ref<EveryType>(static_cast<EveryType*>(EveryType::Factory(&pool).get())); }
    ref<EveryTypeCompanion> NewCompanion() {
        return ref<EveryTypeCompanion>(
            static_cast<EveryTypeCompanion*>(EveryTypeCompanion::Factory(&pool).get()));
    }
    const FieldInfo* Field(const char* name) { return FindField(EveryType::structInfoG, name); }
    /// The JSON text of one field's entry alone, by the operations for single fields.
    std::string Entry(const char* name, const SornObject& object) {
        const FieldInfo* field = Field(name);
        ref<Dictionary> out = Dictionary::New(&pool, RoxString());
        if (field->arity == SORN_ARITY_MULTI) {
            Context().MultiFieldToDict(RoxString("x"), field, &object, out, 0);
        } else {
            Context().SingleFieldToDict(RoxString("x"), field, &object, out, 0);
        }
        return Text(out->ToJson(false));
    }
    template <class T>
    std::string Single(const char* name, T EveryType::*member, const T& value) {
        ref<EveryType> object = New();
        (*object).*member = value;
        return Entry(name, *object);
    }
    template <class T>
    std::string Multi(const char* name, RoxGenericIntArray EveryType::*member,
                      std::initializer_list<T> values) {
        ref<EveryType> object = New();
        for (const T& value : values) ((*object).*member).Add(&value);
        return Entry(name, *object);
    }
    ref<rox::ByteBuffer> Bytes(const char* text) {
        return rox::ByteBuffer::New(&pool, text, static_cast<uint32_t>(strlen(text)));
    }
};

TEST_F(ObjectToDictionaryTest, NumbersAndBools) {
    EXPECT_EQ(Single("requiredBool", &EveryType::requiredBool, true), R"({"x": true})");
    EXPECT_EQ(Single("requiredBool", &EveryType::requiredBool, false), R"({"x": false})");
    EXPECT_EQ(Single("requiredS32", &EveryType::requiredS32, int32_t{-2147483647 - 1}),
              R"({"x": -2147483648})");
    EXPECT_EQ(Single("requiredU32", &EveryType::requiredU32, uint32_t{4294967295u}), R"({"x": 4294967295})");
    EXPECT_EQ(Single("requiredS64", &EveryType::requiredS64, int64_t{-5}), R"({"x": "-5"})");
    EXPECT_EQ(Single("requiredU64", &EveryType::requiredU64, UINT64_MAX), R"({"x": "18446744073709551615"})");
    EXPECT_EQ(Single("requiredFloat", &EveryType::requiredFloat, 2.5), R"({"x": "2.5"})");
    EXPECT_EQ(Single("requiredFloat", &EveryType::requiredFloat, 1e20), R"({"x": "1e+20.0"})");
    EXPECT_EQ(Multi<uint8_t>("multiBool", &EveryType::multiBool, {1, 0, 1}), R"({"x": [true, false, true]})");
    EXPECT_EQ(Multi<int32_t>("multiS32", &EveryType::multiS32, {-1}), R"({"x": [-1]})");
    EXPECT_EQ(Multi<uint32_t>("multiU32", &EveryType::multiU32, {0, 7}), R"({"x": [0, 7]})");
    EXPECT_EQ(Multi<int64_t>("multiS64", &EveryType::multiS64, {-1, 2}), R"({"x": ["-1", "2"]})");
    EXPECT_EQ(Multi<uint64_t>("multiU64", &EveryType::multiU64, {1}), R"({"x": ["1"]})");
    EXPECT_EQ(Multi<double>("multiFloat", &EveryType::multiFloat, {0.5, 3}), R"({"x": ["0.5", "3.0"]})");
}

TEST_F(ObjectToDictionaryTest, NeedQuotesAsTheTypesSay) {
    ref<EveryType> object = New();
    ref<Dictionary> dictionary = object->ToDictionary(0);
    auto quotes = [&](const char* name) {
        return static_cast<StringValue*>(dictionary->Find(RoxString(name)))->FNeedQuotes();
    };
    for (const char* name : {"requiredBool", "requiredFloat", "requiredS32", "requiredU32"})
        EXPECT_FALSE(quotes(name)) << name;
    for (const char* name : {"requiredChannel", "requiredCurrency", "requiredDate", "requiredDateTime",
                             "requiredTime", "requiredEnum", "requiredIntId", "requiredLongId",
                             "requiredStringId", "requiredS64", "requiredString", "requiredU64"}) {
        EXPECT_TRUE(quotes(name)) << name;
    }
}

TEST_F(ObjectToDictionaryTest, ScalarsWithTextForms) {
    EXPECT_EQ(Single("requiredChannel", &EveryType::requiredChannel, ChannelNumber(7)), R"({"x": "7"})");
    EXPECT_EQ(Single("requiredChannel", &EveryType::requiredChannel, ChannelNumber()), R"({"x": "invalid"})");
    EXPECT_EQ(Single("requiredCurrency", &EveryType::requiredCurrency, Currency(100, "USD")),
              R"({"x": "USD.100"})");
    EXPECT_EQ(Single("requiredDate", &EveryType::requiredDate, Date(11017)), R"({"x": "2000-03-01"})");
    EXPECT_EQ(Single("requiredDateTime", &EveryType::requiredDateTime, DateTime(86400999)),
              R"({"x": "1970-01-02 00:00:00"})");
    EXPECT_EQ(Single("requiredTime", &EveryType::requiredTime, Time(86399000)), R"({"x": "23:59:59"})");
    EXPECT_EQ(Multi<ChannelNumber>("multiChannel", &EveryType::multiChannel,
                                   {ChannelNumber(7, 2), ChannelNumber(0)}),
              R"({"x": ["7-2", "0"]})");
    EXPECT_EQ(Multi<Currency>("multiCurrency", &EveryType::multiCurrency, {Currency(), Currency(-1, "EUR")}),
              R"({"x": ["invalid", "EUR.-1"]})");
    EXPECT_EQ(Multi<Date>("multiDate", &EveryType::multiDate, {Date(0), Date(1)}),
              R"({"x": ["1970-01-01", "1970-01-02"]})");
    EXPECT_EQ(Multi<DateTime>("multiDateTime", &EveryType::multiDateTime, {DateTime(0)}),
              R"({"x": ["1970-01-01 00:00:00"]})");
    EXPECT_EQ(Multi<Time>("multiTime", &EveryType::multiTime, {Time(0), Time(1999)}),
              R"({"x": ["00:00:00", "00:00:01"]})");
}

TEST_F(ObjectToDictionaryTest, Enumerations) {
    struct Row {
        uint32_t value;
        const char* text;
    };
    for (const Row& row :
         {Row{0, "INVALID_VALUE:0"}, Row{1, "red"}, Row{2, "green"}, Row{3, "INVALID_VALUE:3"},
          Row{5, "blue"}, Row{6, "INVALID_VALUE:6"}, Row{4294967295u, "INVALID_VALUE:4294967295"}}) {
        EXPECT_EQ(Single("requiredEnum", &EveryType::requiredEnum, row.value),
                  std::string(R"({"x": ")") + row.text + "\"}");
    }
    EXPECT_EQ(Single("enumFromZero", &EveryType::enumFromZero, uint32_t{0}), R"({"x": "small"})");
    EXPECT_EQ(Multi<uint32_t>("multiEnum", &EveryType::multiEnum, {5, 99}),
              R"({"x": ["blue", "INVALID_VALUE:99"]})");
    EXPECT_EQ(Words(R"({"type": "everyType", "requiredEnum": "INVALID_VALUE:99"})"),
              "bad enum item nameCannot convert value for the field.. Bad single field: requiredEnum");
    FieldInfo field = *Field("requiredEnum");
    field.typeRef = 0;  // no enumeration
    ref<EveryType> object = New();
    object->requiredEnum = 1;
    ref<Dictionary> out = Dictionary::New(&pool, RoxString());
    Context().SingleFieldToDict(RoxString("x"), &field, object.get(), out, 0);
    EXPECT_EQ(Text(out->GetString(RoxString("x"))), "INVALID_VALUE:1");
}

constexpr const char* noStruct = "\x58\x58\x58";  // the marker text of an id without a struct

TEST_F(ObjectToDictionaryTest, Ids) {
    EXPECT_EQ(Single("requiredIntId", &EveryType::requiredIntId, uint32_t{1234}),
              R"({"x": "vuka:etc.1234"})");
    EXPECT_EQ(Single("requiredLongId", &EveryType::requiredLongId, (uint64_t{2} << 48) + 7),
              R"({"x": "vuka:etc.ts.7"})");
    EXPECT_EQ(Single("requiredLongId", &EveryType::requiredLongId, uint64_t{5}), R"({"x": "vuka:etc.5"})");
    EXPECT_EQ(Single("requiredStringId", &EveryType::requiredStringId, RoxString("some id")),
              R"({"x": "vuka:etc.some id"})");
    EXPECT_EQ(Single("idWithoutPrefixInt", &EveryType::idWithoutPrefixInt, uint32_t{12}), R"({"x": "12"})");
    EXPECT_EQ(Single("idWithoutPrefixLong", &EveryType::idWithoutPrefixLong, uint64_t{12}), R"({"x": "12"})");
    EXPECT_EQ(Single("idWithoutStructInt", &EveryType::idWithoutStructInt, uint32_t{12}),
              std::string(R"({"x": ")") + noStruct + "\"}");
    EXPECT_EQ(Single("idWithoutStructString", &EveryType::idWithoutStructString, RoxString("a")),
              std::string(R"({"x": ")") + noStruct + "\"}");
    EXPECT_EQ(Multi<uint32_t>("multiIntId", &EveryType::multiIntId, {1, 2}),
              R"({"x": ["vuka:etc.1", "vuka:etc.2"]})");
    EXPECT_EQ(Multi<uint64_t>("multiLongId", &EveryType::multiLongId, {uint64_t{4} << 48}),
              R"({"x": ["vuka:etc.xxx.0"]})");
    EXPECT_EQ(Multi<uint64_t>("idWithoutStructLong", &EveryType::idWithoutStructLong, {1, 2}),
              std::string(R"({"x": [")") + noStruct + R"(", ")" + noStruct + R"("]})");
    ref<EveryType> object = New();
    object->multiStringId.Add(RoxString(""));
    object->multiStringId.Add(RoxString("b"));
    EXPECT_EQ(Entry("multiStringId", *object), R"({"x": ["vuka:etc.", "vuka:etc.b"]})");
    object->idWithoutPrefixString.Add(RoxString("b"));
    EXPECT_EQ(Entry("idWithoutPrefixString", *object), R"({"x": ["b"]})");
}

TEST_F(ObjectToDictionaryTest, IdsAreCutAfter99Bytes) {
    struct Row {
        size_t nId;
        size_t nText;
    };
    for (const Row& row : {Row{89, 98}, Row{90, 99}, Row{91, 99}, Row{200, 99}}) {  // the prefix has 9 bytes
        std::string expected = "vuka:etc." + std::string(row.nText - 9, 'i');
        EXPECT_EQ(Single("requiredStringId", &EveryType::requiredStringId,
                         RoxString(std::string(row.nId, 'i').c_str())),
                  "{\"x\": \"" + expected + "\"}");
    }
}

TEST_F(ObjectToDictionaryTest, IdsWithoutAStructCannotBeRead) {
    EXPECT_EQ(Words(R"({"type": "everyType", "idWithoutStructInt": "12"})", 0, "old;"),
              "old;no struct for idbad prefix: 12Cannot convert value for the field.. Bad single field: "
              "idWithoutStructInt");
    EXPECT_EQ(Words(R"({"type": "everyType", "idWithoutStructLong": "12"})", 0, "old;"),
              "old;no struct for idbad prefix: 12Bad value in field: . Bad multi field: idWithoutStructLong");
    EXPECT_EQ(ObjectOf<EveryType>(R"({"type": "everyType", "idWithoutPrefixInt": "12"})")->idWithoutPrefixInt,
              12u);
}

TEST_F(ObjectToDictionaryTest, StringsAreShared) {
    ref<EveryType> object = New();
    object->requiredString = RoxString("text");
    ref<Dictionary> dictionary = object->ToDictionary(0);
    EXPECT_EQ(dictionary->GetString(RoxString("requiredString")).GetRepN(), object->requiredString.GetRepN());
    EXPECT_EQ(Entry("requiredString", *New()), R"({"x": ""})");
    object->multiString.Add(RoxString("a"));
    object->multiString.Add(RoxString(""));
    EXPECT_EQ(Entry("multiString", *object), R"({"x": ["a", ""]})");
}

TEST_F(ObjectToDictionaryTest, Bytes) {
    EXPECT_EQ(Single("requiredBytes", &EveryType::requiredBytes, Bytes("Man")), R"({"x": "TWFu"})");
    EXPECT_EQ(Single("requiredBytes", &EveryType::requiredBytes, Bytes("")), R"({"x": ""})");
    ref<EveryType> object = New();
    object->multiBytes.Add(Bytes("Ma").get());
    object->multiBytes.Add(Bytes("").get());
    EXPECT_EQ(Entry("multiBytes", *object), R"({"x": ["TWE=", ""]})");
}

TEST_F(ObjectToDictionaryTest, AnyDictsAreTheVerySame) {
    ref<EveryType> object = New();
    object->requiredAnyDict = MakeDict(&pool);
    object->multiAnyDict.Add(object->requiredAnyDict.get());
    ref<Dictionary> dictionary = object->ToDictionary(0);
    EXPECT_EQ(dictionary->GetDictionary(RoxString("requiredAnyDict")),
              object->requiredAnyDict->GetDictionary());
    EXPECT_EQ(dictionary->GetArray(RoxString("multiAnyDict"))->At(0),
              object->requiredAnyDict->GetDictionary().get());
    dictionary->GetDictionary(RoxString("requiredAnyDict"))->Add(RoxString("later"), RoxString("x"));
    EXPECT_EQ(Text(object->requiredAnyDict->GetString("later", 0)), "x");
}

TEST_F(ObjectToDictionaryTest, Objects) {
    ref<EveryTypeCompanion> inner = NewCompanion();
    inner->number = 3;
    inner->number_isSet = 1;
    ref<EveryType> object = New();
    object->requiredObject = inner;
    object->requiredKnownDict = sornschema::EveryTypePlain::Factory(&pool);
    object->multiObject.Add(inner.get());
    object->multiObject.Add(inner.get());
    EXPECT_EQ(Entry("requiredObject", *object), R"({"x": {"number": 3, "type": "everyTypeCompanion"}})");
    EXPECT_EQ(Entry("requiredKnownDict", *object), R"({"x": {"plainId": "0", "type": "everyTypePlain"}})");
    EXPECT_EQ(
        Entry("multiObject", *object),
        R"({"x": [{"number": 3, "type": "everyTypeCompanion"}, {"number": 3, "type": "everyTypeCompanion"}]})");
}

TEST_F(ObjectToDictionaryTest, LazyBodiesAreSharedAndRepeatedOnesBecomeValuesOfTheName) {
    ref<LazyDict> one = LazyDict::FromJsonString(&pool, RoxString(R"({"n": 1})"), 0);
    ref<LazyDict> two = LazyDict::FromJsonString(&pool, RoxString(R"({"n": 2})"), 0);
    ref<EveryType> object = New();
    object->requiredEnum = 1;
    object->requiredLazy = one;
    object->multiLazy.Add(one.get());
    object->multiLazy.Add(nullptr);
    object->multiLazy.Add(two.get());
    EXPECT_EQ(Entry("multiLazy", *object), R"({"x": {"n": 1}, "x": {"n": 2}})");
    ref<Dictionary> dictionary = object->ToDictionary(0);
    EXPECT_EQ(dictionary->CountValues(RoxString("multiLazy")), 2u);
    EXPECT_EQ(LazyDictValue::BodyOf(*dictionary->Find(RoxString("requiredLazy"))), one);
    // On the way back only the first value of the name is taken.
    ref<SornObject> back;
    RoxString error;
    ASSERT_TRUE(Context().DictionaryToSornObject(dictionary, 0, back, error)) << error.Utf8();
    EXPECT_EQ(static_cast<EveryType&>(*back).multiLazy.GetCount(), 1u);
    EXPECT_EQ(static_cast<EveryType&>(*back).multiLazy.At(0), one.get());
}

TEST_F(ObjectToDictionaryTest, NullReferencesAreLeftOutEverywhere) {
    ref<EveryType> object = New();
    for (const char* name :
         {"requiredAnyDict", "requiredBytes", "requiredKnownDict", "requiredLazy", "requiredObject",
          "optionalAnyDict", "optionalBytes", "optionalKnownDict", "optionalLazy", "optionalObject"}) {
        EXPECT_EQ(Entry(name, *object), "{}") << name;
    }
    for (RoxGenericArray EveryType::*member :
         {&EveryType::multiAnyDict, &EveryType::multiBytes, &EveryType::multiKnownDict, &EveryType::multiLazy,
          &EveryType::multiObject}) {
        ((*object).*member).Add(nullptr);
    }
    for (const char* name : {"multiAnyDict", "multiBytes", "multiKnownDict", "multiLazy", "multiObject"}) {
        EXPECT_EQ(Entry(name, *object), "{}") << name;
    }
    object->multiObject.Add(NewCompanion().get());
    object->multiBytes.Add(Bytes("Man").get());
    EXPECT_EQ(Entry("multiObject", *object), R"({"x": [{"type": "everyTypeCompanion"}]})");
    EXPECT_EQ(Entry("multiBytes", *object), R"({"x": ["TWFu"]})");
}

TEST_F(ObjectToDictionaryTest, AnEmptyObjectHasItsTypeAndItsRequiredFields) {
    EXPECT_EQ(
        Json(New()),
        R"({"limitedRequired": false, "requiredBool": false, "requiredChannel": "invalid", "requiredCurrency": "invalid", )"
        R"("requiredDate": "1970-01-01", "requiredDateTime": "1970-01-01 00:00:00", "requiredEnum": "INVALID_VALUE:0", )"
        R"("requiredFloat": "0.0", "requiredIntId": "vuka:etc.0", "requiredLongId": "vuka:etc.0", "requiredS32": 0, )"
        R"("requiredS64": "0", "requiredString": "", "requiredStringId": "vuka:etc.", "requiredTime": "00:00:00", )"
        R"("requiredU32": 0, "requiredU64": "0", "type": "everyType", "variantRequired": ""})");
    EXPECT_EQ(Json(NewCompanion()), R"({"type": "everyTypeCompanion"})");
}

TEST_F(ObjectToDictionaryTest, OptionalFieldsFollowTheirPresence) {
    ref<EveryTypeCompanion> object = NewCompanion();
    object->number = 5;
    EXPECT_EQ(Json(object), R"({"type": "everyTypeCompanion"})");
    object->number_isSet = 1;
    object->label_isSet = 200;  // any byte but 0
    EXPECT_EQ(Json(object), R"({"label": "", "number": 5, "type": "everyTypeCompanion"})");
}

TEST_F(ObjectToDictionaryTest, UnknownDataTypesAddNothing) {
    ref<EveryType> object = New();
    for (unsigned type = 21; type < 32; ++type) {
        FieldInfo field = *Field("requiredS32");
        field.dataType = type & 0x1F;
        ref<Dictionary> out = Dictionary::New(&pool, RoxString());
        Context().SingleFieldToDict(RoxString("x"), &field, object.get(), out, 0);
        EXPECT_EQ(Text(out->ToJson(false)), "{}") << type;
    }
}

TEST_F(ObjectToDictionaryTest, FormsOfAnObject) {
    ref<EveryTypeCompanion> object = NewCompanion();
    object->number = 5;
    object->number_isSet = 1;
    EXPECT_EQ(Text(object->ToString(false, 0)), R"({"number": 5, "type": "everyTypeCompanion"})");
    EXPECT_EQ(Text(object->ToString(true, 0)),
              "{\n    \"number\": 5, \n    \"type\": \"everyTypeCompanion\"\n}");
    ref<Dict> dict = object->ToDict(0);
    EXPECT_EQ(Text(dict->GetString("number", 0)), "5");
    EXPECT_EQ(dict->GetMempool(), &pool);
    EXPECT_EQ(object->ToDictionary(0)->GetMempool(), &pool);
}

TEST_F(ObjectToDictionaryTest, IdConversionsByThemselves) {
    const FieldInfo* field = Field("requiredIntId");
    const FieldInfo* none = Field("idWithoutStructInt");
    unsigned intId = 77;
    unsigned long long longId = 77;
    RoxString stringId("before");
    RoxString error("old;");
    EXPECT_TRUE(Context().StringToIntId(&pool, field, RoxString("vuka:etc.12"), error, intId));
    EXPECT_EQ(intId, 12u);
    EXPECT_TRUE(Context().StringToLongId(&pool, field, RoxString("vuka:etc.vod.1"), error, longId));
    EXPECT_EQ(longId, (16384ull << 48) + 1);
    EXPECT_TRUE(Context().StringToStringId(&pool, field, RoxString("vuka:etc.vod.1"), error, stringId));
    EXPECT_EQ(Text(stringId), "vod.1");
    EXPECT_EQ(Text(error), "old;");
    EXPECT_FALSE(Context().StringToIntId(&pool, field, RoxString("vuka:et.12"), error, intId));
    EXPECT_EQ(Text(error), "old;wrong prefix on idbad prefix: vuka:et.12");
    error = "";
    EXPECT_FALSE(Context().StringToLongId(&pool, none, RoxString("12"), error, longId));
    EXPECT_EQ(Text(error), "no struct for idbad prefix: 12");
    EXPECT_FALSE(Context().StringToStringId(&pool, none, RoxString("12"), error, stringId));
    EXPECT_EQ(Text(error), "no struct for idbad prefix: 12no struct for idbad prefix: 12");
    EXPECT_EQ(intId, 12u);
    EXPECT_EQ(Text(stringId), "vod.1");
}

}  // namespace sorntest
