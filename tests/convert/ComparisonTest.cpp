#include <cmath>
#include <limits>

#include "convert/ConvertFixture.h"
#include "sorn/dict/Dict.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/lazy/LazyDict.h"
#include "sorn/model/Schema.h"
#include "sornschema/EveryType.h"
#include "sornschema/EveryTypeCompanion.h"
#include "sornschema/EveryTypeTyped.h"

namespace sorntest {

using namespace sorn;
using sornschema::EveryType;
using sornschema::EveryTypeCompanion;
using sornschema::EveryTypeTyped;

class ComparisonTest : public ConvertFixture {
 protected:
    ref<EveryType> New() { return ref<EveryType>(static_cast<EveryType*>(EveryType::Factory(&pool).get())); }
    /// An object with that one entry.
    ref<SornObject> With(const std::string& entry) {
        return Object(R"({"type": "everyTypeCompanion", )" + entry + "}");
    }
    const FieldInfo* Field(const char* name) { return FindField(EveryType::structInfoG, name); }
    template <class T>
    bool SingleEquals(const char* name, T a, T b) {
        return SornObject::SingleFieldEquals(Field(name), &a, &b);
    }
    template <class T>
    bool MultiEquals(const char* name, std::initializer_list<T> a, std::initializer_list<T> b) {
        RoxGenericIntArray arrayA(sizeof(T), &pool);
        RoxGenericIntArray arrayB(sizeof(T), &pool);
        for (const T& value : a) arrayA.Add(&value);
        for (const T& value : b) arrayB.Add(&value);
        return SornObject::MultiFieldEquals(Field(name), &arrayA, &arrayB);
    }
    bool MultiReferencesEqual(const char* name, std::initializer_list<RoxCore*> a,
                              std::initializer_list<RoxCore*> b) {
        RoxGenericArray arrayA(&pool);
        RoxGenericArray arrayB(&pool);
        for (RoxCore* p : a) arrayA.Add(p);
        for (RoxCore* p : b) arrayB.Add(p);
        return SornObject::MultiFieldEquals(Field(name), &arrayA, &arrayB);
    }
    ref<Dict> ADict(const char* text) {
        ref<Dict> dict = MakeDict(&pool);
        dict->AddString("a", text);
        return dict;
    }
    ref<LazyDict> Lazy(const char* json) { return LazyDict::FromJsonString(&pool, RoxString(json), 0); }
};

TEST_F(ComparisonTest, NewObjects) {
    ref<SornObject> companion = EveryTypeCompanion::Factory(&pool);
    EXPECT_TRUE(*companion == *EveryTypeCompanion::Factory(&pool));
    EXPECT_FALSE(*companion != *EveryTypeCompanion::Factory(&pool));
    EXPECT_FALSE(*companion == *Schema::FindStruct(140)->Factory(&pool));
    // A multi bytestring field is never equal, even when empty.
    ref<EveryType> object = New();
    EXPECT_FALSE(*object == *object);
}

TEST_F(ComparisonTest, NewObjectsOfEveryRealStructAreEqual) {
    for (uint32_t id = 0; id <= 5918; ++id) {
        const StructInfo* info = Schema::FindStruct(id);
        if (info == nullptr) continue;
        EXPECT_TRUE(*info->Factory(&pool) == *info->Factory(&pool)) << info->name;
    }
}

TEST_F(ComparisonTest, Presence) {
    EXPECT_TRUE(*With(R"("label": "")") == *With(R"("label": "")"));
    EXPECT_FALSE(*With(R"("label": "")") == *With(R"("number": 0)"));
    EXPECT_FALSE(*With(R"("label": "")") == *EveryTypeCompanion::Factory(&pool));
    EXPECT_FALSE(*EveryTypeCompanion::Factory(&pool) == *With(R"("number": 0)"));
    ref<EveryTypeCompanion> a =
        ObjectOf<EveryTypeCompanion>(R"({"type": "everyTypeCompanion", "number": 5})");
    ref<EveryTypeCompanion> b =
        ObjectOf<EveryTypeCompanion>(R"({"type": "everyTypeCompanion", "number": 6})");
    EXPECT_FALSE(*a == *b);
    a->number_isSet = b->number_isSet = 0;  // then the members do not count
    EXPECT_TRUE(*a == *b);
    a->number_isSet = 1;
    b->number_isSet = 255;
    b->number = 5;
    EXPECT_TRUE(*a == *b);
}

TEST_F(ComparisonTest, Numbers) {
    EXPECT_TRUE(SingleEquals("optionalBool", true, true));
    EXPECT_FALSE(SingleEquals("optionalBool", true, false));
    EXPECT_TRUE(SingleEquals("optionalS32", -1, -1));
    EXPECT_FALSE(SingleEquals("optionalS32", 1, 1 << 24));
    EXPECT_TRUE(SingleEquals("optionalU32", 0x80000001u, 0x80000001u));
    EXPECT_FALSE(SingleEquals("optionalU32", 1u, 0x80000001u));
    EXPECT_TRUE(SingleEquals("optionalIntId", 0x80000001u, 0x80000001u));
    EXPECT_FALSE(SingleEquals("optionalIntId", 1u, 0x10001u));
    EXPECT_TRUE(SingleEquals("optionalDate", Date(-1), Date(-1)));
    EXPECT_FALSE(SingleEquals("optionalDate", Date(1), Date(0x10001)));
    EXPECT_TRUE(SingleEquals("optionalTime", Time(1), Time(1)));
    EXPECT_FALSE(SingleEquals("optionalTime", Time(1), Time(-1)));
    EXPECT_TRUE(SingleEquals("optionalS64", INT64_MIN, INT64_MIN));
    EXPECT_FALSE(SingleEquals("optionalS64", int64_t{1}, (int64_t{1} << 40) + 1));
    EXPECT_TRUE(SingleEquals("optionalU64", UINT64_MAX, UINT64_MAX));
    EXPECT_FALSE(SingleEquals("optionalU64", uint64_t{1}, (uint64_t{1} << 63) + 1));
    EXPECT_TRUE(SingleEquals("optionalLongId", (uint64_t{2} << 48) + 7, (uint64_t{2} << 48) + 7));
    EXPECT_FALSE(SingleEquals("optionalLongId", uint64_t{7}, (uint64_t{2} << 48) + 7));
    EXPECT_TRUE(SingleEquals("optionalDateTime", DateTime(int64_t{1} << 32), DateTime(int64_t{1} << 32)));
    EXPECT_FALSE(SingleEquals("optionalDateTime", DateTime(0), DateTime(int64_t{1} << 32)));
    EXPECT_TRUE(SingleEquals("optionalChannel", ChannelNumber(7), ChannelNumber(7)));
    EXPECT_FALSE(SingleEquals("optionalChannel", ChannelNumber(7), ChannelNumber(7, 1)));
    EXPECT_FALSE(SingleEquals("optionalChannel", ChannelNumber(7, 1), ChannelNumber(8, 1)));
    EXPECT_TRUE(SingleEquals("optionalCurrency", Currency(1, "USD"), Currency(1, "USD")));
    EXPECT_FALSE(SingleEquals("optionalCurrency", Currency(1, "USD"), Currency(1, "EUR")));
    EXPECT_FALSE(SingleEquals("optionalCurrency", Currency(1, "USD"), Currency(2, "USD")));
}

TEST_F(ComparisonTest, Floats) {
    const double nan = std::numeric_limits<double>::quiet_NaN();
    EXPECT_FALSE(SingleEquals("optionalFloat", nan, nan));
    EXPECT_TRUE(SingleEquals("optionalFloat", 0.0, -0.0));
    EXPECT_FALSE(SingleEquals("optionalFloat", 1.0, std::nextafter(1.0, 2.0)));
    EXPECT_FALSE(MultiEquals("multiFloat", {1.0, nan}, {1.0, nan}));
    EXPECT_TRUE(MultiEquals("multiFloat", {1.0, 0.0}, {1.0, -0.0}));
}

TEST_F(ComparisonTest, EnumerationsCompareTheirLow16Bits) {
    EXPECT_TRUE(SingleEquals("optionalEnum", 1u, 0x10001u));
    EXPECT_FALSE(SingleEquals("optionalEnum", 0x8000u, 0u));
    EXPECT_TRUE(MultiEquals("multiEnum", {5u, 2u}, {5u, 0xFFFF0002u}));
    EXPECT_FALSE(MultiEquals("multiEnum", {5u, 2u}, {5u, 3u}));
}

TEST_F(ComparisonTest, TextsCompareAllBytes) {
    EXPECT_TRUE(SingleEquals("optionalString", RoxString("a"), RoxString("a")));
    EXPECT_FALSE(SingleEquals("optionalString", RoxString("a"), RoxString("A")));
    EXPECT_TRUE(SingleEquals("optionalStringId", RoxString("a"), RoxString("a")));
    EXPECT_FALSE(
        SingleEquals("optionalStringId", RoxString("a"), RoxString::FromUtf8Bytes(&pool, 3, "a\0b")));
    RoxStringArray a(&pool);
    RoxStringArray b(&pool);
    EXPECT_TRUE(SornObject::MultiFieldEquals(Field("multiString"), &a, &b));
    a.Add(RoxString("x"));
    EXPECT_FALSE(SornObject::MultiFieldEquals(Field("multiString"), &a, &b));
    b.Add(RoxString("x"));
    EXPECT_TRUE(SornObject::MultiFieldEquals(Field("multiStringId"), &a, &b));
    a.Add(RoxString("y"));
    b.Add(RoxString("z"));
    EXPECT_FALSE(SornObject::MultiFieldEquals(Field("multiString"), &a, &b));
    EXPECT_FALSE(SornObject::MultiFieldEquals(Field("multiStringId"), &a, &b));
}

TEST_F(ComparisonTest, RepeatedNumbers) {
    EXPECT_TRUE(MultiEquals<uint8_t>("multiBool", {1, 0}, {1, 0}));
    EXPECT_FALSE(MultiEquals<uint8_t>("multiBool", {1, 0}, {1, 1}));
    EXPECT_FALSE(MultiEquals<uint8_t>("multiBool", {1}, {1, 0}));
    EXPECT_TRUE(MultiEquals<int32_t>("multiS32", {1}, {1}));               // inside the container
    EXPECT_FALSE(MultiEquals<int32_t>("multiS32", {1, 2, 3}, {1, 2, 4}));  // outside
    EXPECT_TRUE(MultiEquals<uint32_t>("multiU32", {1, 0x80000001u}, {1, 0x80000001u}));
    EXPECT_FALSE(MultiEquals<uint32_t>("multiU32", {1, 1}, {1, 0x80000001u}));
    EXPECT_TRUE(MultiEquals<int64_t>("multiS64", {1, INT64_MIN}, {1, INT64_MIN}));
    EXPECT_FALSE(MultiEquals<int64_t>("multiS64", {1, 2}, {1, int64_t{2} << 32}));
    EXPECT_TRUE(MultiEquals<uint64_t>("multiU64", {1, UINT64_MAX}, {1, UINT64_MAX}));
    EXPECT_FALSE(MultiEquals<uint64_t>("multiU64", {1, 1}, {1, (uint64_t{1} << 63) + 1}));
}

TEST_F(ComparisonTest, RepeatedIds) {
    constexpr uint64_t longId = (uint64_t{2} << 48) + 7;
    EXPECT_TRUE(MultiEquals<uint32_t>("multiIntId", {1, 0x80000001u}, {1, 0x80000001u}));
    EXPECT_FALSE(MultiEquals<uint32_t>("multiIntId", {1, 1}, {1, 0x10001u}));
    EXPECT_FALSE(MultiEquals<uint32_t>("multiIntId", {1, 2}, {2, 1}));
    EXPECT_TRUE(MultiEquals<uint64_t>("multiLongId", {1, longId}, {1, longId}));
    EXPECT_FALSE(MultiEquals<uint64_t>("multiLongId", {1, 7}, {1, longId}));
    EXPECT_FALSE(MultiEquals<uint64_t>("multiLongId", {1}, {}));
}

TEST_F(ComparisonTest, RepeatedMoments) {
    EXPECT_TRUE(MultiEquals<Date>("multiDate", {}, {}));
    EXPECT_TRUE(MultiEquals<Date>("multiDate", {Date(1), Date(-1)}, {Date(1), Date(-1)}));
    EXPECT_FALSE(MultiEquals<Date>("multiDate", {Date(1), Date(1)}, {Date(1), Date(0x10001)}));
    EXPECT_TRUE(MultiEquals<Time>("multiTime", {Time(1), Time(-1)}, {Time(1), Time(-1)}));
    EXPECT_FALSE(MultiEquals<Time>("multiTime", {Time(1), Time(1)}, {Time(1), Time(0x1000001)}));
    const DateTime late(int64_t{1} << 32);
    EXPECT_TRUE(MultiEquals<DateTime>("multiDateTime", {DateTime(1), late}, {DateTime(1), late}));
    EXPECT_FALSE(MultiEquals<DateTime>("multiDateTime", {DateTime(1), DateTime(0)}, {DateTime(1), late}));
}

TEST_F(ComparisonTest, RepeatedPairs) {
    const ChannelNumber seven(7);
    const ChannelNumber sub(7, 1);
    EXPECT_TRUE(MultiEquals<ChannelNumber>("multiChannel", {seven, sub}, {seven, sub}));
    EXPECT_FALSE(MultiEquals<ChannelNumber>("multiChannel", {seven, seven}, {seven, sub}));
    EXPECT_FALSE(MultiEquals<ChannelNumber>("multiChannel", {seven, sub}, {seven, ChannelNumber(8, 1)}));
    const Currency dollar(1, "USD");
    EXPECT_TRUE(MultiEquals<Currency>("multiCurrency", {Currency(), dollar}, {Currency(), dollar}));
    EXPECT_FALSE(MultiEquals<Currency>("multiCurrency", {dollar, dollar}, {dollar, Currency(1, "EUR")}));
    EXPECT_FALSE(MultiEquals<Currency>("multiCurrency", {dollar, dollar}, {dollar, Currency(2, "USD")}));
    EXPECT_FALSE(MultiEquals<Currency>("multiCurrency", {Currency()}, {Currency(0, "USD")}));
}

TEST_F(ComparisonTest, BytesAreNeverEqual) {
    ref<rox::ByteBuffer> bytes = rox::ByteBuffer::New(&pool, "x", 1);
    EXPECT_FALSE(SingleEquals("optionalBytes", bytes, bytes));
    EXPECT_FALSE(SingleEquals("optionalBytes", ref<rox::ByteBuffer>(), ref<rox::ByteBuffer>()));
    EXPECT_FALSE(MultiReferencesEqual("multiBytes", {}, {}));
    EXPECT_FALSE(MultiReferencesEqual("multiBytes", {bytes.get()}, {bytes.get()}));
}

TEST_F(ComparisonTest, AnyDicts) {
    EXPECT_TRUE(SingleEquals("optionalAnyDict", ADict("x"), ADict("x")));
    EXPECT_FALSE(SingleEquals("optionalAnyDict", ADict("x"), ADict("y")));
    EXPECT_FALSE(SingleEquals("optionalAnyDict", ADict("x"), ref<Dict>()));
    EXPECT_TRUE(SingleEquals("requiredAnyDict", ref<Dict>(), ref<Dict>()));
    ref<Dict> x = ADict("x");
    ref<Dict> y = ADict("y");
    EXPECT_TRUE(MultiReferencesEqual("multiAnyDict", {x.get()}, {y.get()}));
    EXPECT_FALSE(MultiReferencesEqual("multiAnyDict", {x.get()}, {x.get(), x.get()}));
    EXPECT_FALSE(MultiReferencesEqual("multiAnyDict", {x.get()}, {nullptr}));
    EXPECT_TRUE(MultiReferencesEqual("multiAnyDict", {nullptr}, {nullptr}));
}

TEST_F(ComparisonTest, LazyBodies) {
    EXPECT_TRUE(SingleEquals("optionalLazy", Lazy(R"({"a": "b"})"), Lazy(R"({ "a" :"b"})")));
    EXPECT_FALSE(SingleEquals("optionalLazy", Lazy(R"({"a": "b"})"), Lazy(R"({"a": "c"})")));
    EXPECT_FALSE(SingleEquals("optionalLazy", Lazy("{}"), ref<LazyDict>()));
    EXPECT_TRUE(SingleEquals("requiredLazy", ref<LazyDict>(), ref<LazyDict>()));
    ref<LazyDict> a = Lazy("{}");
    ref<LazyDict> b = Lazy(" {}");
    ref<LazyDict> c = Lazy(R"({"a": "c"})");
    EXPECT_TRUE(MultiReferencesEqual("multiLazy", {a.get(), nullptr}, {b.get(), nullptr}));
    EXPECT_FALSE(MultiReferencesEqual("multiLazy", {a.get()}, {c.get()}));
}

TEST_F(ComparisonTest, Objects) {
    ref<SornObject> a = With(R"("number": 1)");
    ref<SornObject> same = With(R"("number": 1)");
    ref<SornObject> other = With(R"("number": 2)");
    ref<SornObject> otherStruct = Object(R"({"type": "everyTypePlain"})");
    EXPECT_TRUE(SingleEquals("optionalObject", a, same));
    EXPECT_FALSE(SingleEquals("optionalObject", a, other));
    EXPECT_TRUE(SingleEquals("optionalKnownDict", a, same));
    EXPECT_FALSE(SingleEquals("optionalKnownDict", a, otherStruct));
    EXPECT_FALSE(SingleEquals("requiredObject", a, ref<SornObject>()));
    EXPECT_FALSE(SingleEquals("requiredObject", ref<SornObject>(), a));
    EXPECT_TRUE(SingleEquals("requiredObject", ref<SornObject>(), ref<SornObject>()));
    EXPECT_TRUE(
        MultiReferencesEqual("multiObject", {a.get(), same.get(), nullptr}, {same.get(), a.get(), nullptr}));
    EXPECT_FALSE(MultiReferencesEqual("multiObject", {a.get(), other.get()}, {other.get(), a.get()}));
    EXPECT_TRUE(MultiReferencesEqual("multiKnownDict", {a.get(), nullptr}, {same.get(), nullptr}));
    EXPECT_FALSE(MultiReferencesEqual("multiKnownDict", {a.get()}, {other.get()}));
    EXPECT_FALSE(MultiReferencesEqual("multiKnownDict", {a.get()}, {nullptr}));
    EXPECT_FALSE(MultiReferencesEqual("multiKnownDict", {a.get()}, {}));
}

TEST_F(ComparisonTest, DifferencesBehindAndInsideSubObjectsAreFound) {
    const std::string child =
        R"("child": {"type": "everyTypeCompanion", "children": [{"type": "everyTypeCompanion", "number": 1}]})";
    const std::string inner =
        R"("child": {"type": "everyTypeCompanion", "children": [{"type": "everyTypeCompanion", "number": 2}]})";
    EXPECT_TRUE(*With(child + R"(, "number": 1)") == *With(child + R"(, "number": 1)"));
    EXPECT_FALSE(*With(child + R"(, "number": 1)") == *With(child + R"(, "number": 2)"));
    EXPECT_FALSE(*With(child) == *With(inner));
    EXPECT_TRUE(*With(inner) == *With(inner));
}

TEST_F(ComparisonTest, OlderVariantsAreNotCompared) {
    ref<SornObject> a = Schema::FindStruct(2867)->Factory(&pool);  // viewStartEvent
    ref<SornObject> b = Schema::FindStruct(2867)->Factory(&pool);
    const StructInfo& info = *Schema::FindStruct(2867);
    const FieldInfo& older = info.vFieldInfoHistory[14].vVariants[0];
    *static_cast<int64_t*>(a->MemberAt(older)) = 5;
    a->SetPresent(older);
    EXPECT_TRUE(*a == *b);
}

TEST_F(ComparisonTest, UnknownDataTypes) {
    for (unsigned type = 21; type < 32; ++type) {
        FieldInfo field = *Field("requiredS32");
        field.dataType = type & 0x1F;
        int32_t value = 1;
        EXPECT_FALSE(SornObject::SingleFieldEquals(&field, &value, &value)) << type;
        RoxGenericIntArray empty(4);
        EXPECT_FALSE(SornObject::MultiFieldEquals(&field, &empty, &empty)) << type;
    }
}

TEST_F(ComparisonTest, Clone) {
    ref<SornObject> object =
        With(R"("number": 1, "label": "x", "dict": {"a": ["b"]}, "child": {"type": "everyTypeCompanion"})");
    ref<SornObject> clone = object->Clone(object->structId);
    ASSERT_NE(clone, nullptr);
    EXPECT_NE(clone, object);
    EXPECT_TRUE(*clone == *object);
    EXPECT_NE(static_cast<EveryTypeCompanion&>(*clone).child,
              static_cast<EveryTypeCompanion&>(*object).child);
    EXPECT_EQ(clone->GetMempool(), &pool);
}

TEST_F(ComparisonTest, TheIdGivenToCloneDoesNotChangeTheStruct) {
    ref<SornObject> object = With(R"("number": 1)");
    ref<SornObject> clone = object->Clone(140);
    ASSERT_NE(clone, nullptr);
    EXPECT_EQ(clone->structId, object->structId);
    EXPECT_TRUE(*clone == *object);
    EXPECT_DEATH(object->Clone(1), "Clone");
}

// The field shares its name with the entry of the struct's name: it then has two values, of which the first
// is read, both as the struct and as the field.
TEST_F(ComparisonTest, CloneOfAStructWithATypeFieldOfItsOwn) {
    ref<EveryTypeTyped> object(static_cast<EveryTypeTyped*>(EveryTypeTyped::Factory(&pool).get()));
    object->number = 5;
    object->number_isSet = 1;
    object->type = RoxString("ad");
    object->type_isSet = 1;
    EXPECT_EQ(Json(object), R"({"number": 5, "type": "everyTypeTyped", "type": "ad"})");
    for (unsigned hint : {140u, object->structId}) {
        ref<SornObject> clone = object->Clone(hint);
        ASSERT_NE(clone, nullptr);
        ASSERT_EQ(clone->structId, object->structId);
        EXPECT_EQ(static_cast<EveryTypeTyped&>(*clone).number, 5);
        EXPECT_EQ(Text(static_cast<EveryTypeTyped&>(*clone).type), "everyTypeTyped");
    }
}

TEST_F(ComparisonTest, CloneKeepsBytesAndFailsOnWhatATextCannotSay) {
    ref<EveryType> object = New();
    object->requiredEnum = 1;
    object->requiredBytes = rox::ByteBuffer::New(&pool, "\0\xFF", 2);
    ref<SornObject> clone = object->Clone(object->structId);
    ASSERT_NE(clone, nullptr);
    const rox::ByteBuffer& bytes = *static_cast<EveryType&>(*clone).requiredBytes;
    EXPECT_EQ(std::string(reinterpret_cast<const char*>(bytes.GetData()), bytes.GetLength()),
              std::string("\0\xFF", 2));
    object->requiredEnum = 3;  // no such value
    EXPECT_EQ(object->Clone(object->structId), nullptr);
}

}  // namespace sorntest
