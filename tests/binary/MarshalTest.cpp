// The forms around values: objects, known dicts, bodies, dictionaries without a schema. Invariant for
// untrusted input: 12.

#include "binary/ValueRows.h"
#include "sorn/dict/ArrayValue.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/dict/NullValue.h"
#include "sornschema/Error.h"
#include "sornschema/EveryTypeLazy.h"
#include "sornschema/EveryTypePlain.h"

namespace sorntest {

using namespace sorn;
using sornschema::Error;
using sornschema::EveryType;
using sornschema::EveryTypeCompanion;
using sornschema::EveryTypeLazy;

class MarshalTest : public BinaryFixture {
 protected:
    using Stream = ProtoBufByteOutputStream;

    std::string Body(const ref<Dict>& dict) {
        return Written([&](Stream& s) { Codec().MarshalAnyDict(dict.get(), s); });
    }
};

TEST_F(MarshalTest, FormsOfAnObject) {
    const int three = 3;
    const ref<SornObject> object = Companion(&pool, &three);
    EXPECT_EQ(Written([&](Stream& s) { Codec().Marshal(object.get(), s); }), "38 06");
    EXPECT_EQ(Written([&](Stream& s) { Codec().MarshalDict(object.get(), s); }), "38 06");
    EXPECT_EQ(
        Written([&](Stream& s) { Codec().MarshalFields(&EveryTypeCompanion::structInfoG, object.get(), s); }),
        "38 06");
    EXPECT_EQ(Written([&](Stream& s) { Codec().MarshalSubdict(object.get(), s); }), "02 38 06");
    EXPECT_EQ(Written([&](Stream& s) { Codec().MarshalKnownDictValue(object.get(), s); }),
              "FA F1 02 02 38 06");
    EXPECT_EQ(Written([&](Stream& s) { Codec().MarshalKnownDict(object.get(), s); }), "FA F1 02 02 38 06");
    EXPECT_EQ(Written([&](Stream& s) { Codec().MarshalKnownDictField(object.get(), s); }),
              "06 FA F1 02 02 38 06");
    const ref<LazyDict> body = LazyDict::FromSornObject(&pool, object, 0);
    EXPECT_EQ(Written([&](Stream& s) { Codec().MarshalKnownDictAsLazyField(body.get(), s); }),
              "06 FA F1 02 02 38 06");
}

TEST_F(MarshalTest, NoFieldSet) {
    const ref<SornObject> object = Companion(&pool, nullptr);
    EXPECT_EQ(FieldsOf(object), "");
    const ref<rox::ByteBuffer> bytes = Codec().MarshalKnownDict(object.get());
    EXPECT_EQ(Hex(*bytes), "FA F1 02 00");
    EXPECT_GE(bytes->GetCapacity(), 8u);
}

/// A struct of the catalogue: id 975, 975 * 8 + 2 = 7802 = 0x1E7A.
TEST_F(MarshalTest, StructIdInFront) {
    const ref<SornObject> object = Schema::FindStruct(975)->Factory(&pool);
    const std::string fields = FieldsOf(object);
    EXPECT_EQ(Hex(*Codec().MarshalKnownDict(object.get())), Hex(Bytes("FA 3C") + Section(Bytes(fields))));
}

TEST_F(MarshalTest, PresentAndEmpty) {
    const ref<SornObject> object = Companion(&pool, nullptr);
    auto& companion = static_cast<EveryTypeCompanion&>(*object);
    companion.label = RoxString("x");
    EXPECT_EQ(FieldsOf(object), "");
    companion.label_isSet = 1;
    EXPECT_EQ(FieldsOf(object), "32 01 78");
    companion.label = RoxString();
    EXPECT_EQ(FieldsOf(object), "32 00");
    companion.dict = MakeDict(&pool);
    EXPECT_EQ(FieldsOf(object), "22 00 32 00");
}

/// Required fields go out whatever they hold: plainId in slot 1.
TEST_F(MarshalTest, RequiredFieldAtItsDefault) {
    EXPECT_EQ(FieldsOf(sornschema::EveryTypePlain::Factory(&pool)), "08 00");
}

/// 0x64, which the section stream escapes, as a tag, as a length of 100 and as a text's bytes: single at the
/// end.
TEST_F(MarshalTest, TheEscapeOfTheStreamIsNotSeen) {
    const OneFieldStruct one("multiString");
    const ref<SornObject> object = EveryType::Factory(&pool);
    FieldTarget(object->MemberAt(one.Field()), true).StoreText(RoxString(std::string(100, 'd').c_str()));
    EXPECT_EQ(Written([&](Stream& s) { Codec().MarshalMultiField(0x64, &one.Field(), object.get(), s); }),
              Hex(std::string(102, 'd')));
}

TEST_F(MarshalTest, ObjectsInObjects) {
    const int three = 3;
    const ref<SornObject> object = Companion(&pool, nullptr);
    auto& companion = static_cast<EveryTypeCompanion&>(*object);
    companion.child = Companion(&pool, &three);
    companion.children.Add(Companion(&pool, nullptr).get());
    companion.children.Add(Companion(&pool, &three).get());
    companion.known =
        Error::Factory(&pool);  // its required fields code and text; id 346 * 8 + 2 = 2770 = 0xAD2
    EXPECT_EQ(FieldsOf(object), "0A 02 38 06 12 00 12 02 38 06 2A 07 D2 15 04 08 00 1A 00");
    // Written by the struct that it is of, not by the one that the field names.
    companion.child = sornschema::EveryTypePlain::Factory(&pool);
    companion.known = nullptr;
    companion.children.Destroy();
    EXPECT_EQ(FieldsOf(object), "0A 02 08 00");
}

TEST_F(MarshalTest, NullReferencesLeaveNothing) {
    for (const char* type : {"AnyDict", "Bytes", "KnownDict", "Lazy", "Object"}) {
        for (const char* arity : {"multi", "optional", "required"}) {
            SCOPED_TRACE(std::string(arity) + type);
            const OneFieldStruct one(std::string(arity) + type);
            const ref<SornObject> object = EveryType::Factory(&pool);
            if (one.Field().arity == SORN_ARITY_MULTI) {
                auto& array = *static_cast<RoxGenericArray*>(object->MemberAt(one.Field()));
                array.Add(nullptr);
                array.Add(nullptr);
            }
            EXPECT_EQ(Written([&](Stream& s) { Codec().MarshalFields(&one.Info(), object.get(), s); }), "");
            EXPECT_EQ(Written([&](Stream& s) {
                          one.Field().arity == SORN_ARITY_MULTI
                              ? Codec().MarshalMultiField(10, &one.Field(), object.get(), s)
                              : Codec().MarshalSingleField(&one.Field(), object.get(), s);
                      }),
                      "");
        }
    }
    EXPECT_EQ(Written([&](Stream& s) { Codec().MarshalKnownDictAsLazyField(nullptr, s); }), "");
    // Among others, which stay.
    const ref<SornObject> object = Companion(&pool, nullptr);
    auto& children = static_cast<EveryTypeCompanion&>(*object).children;
    children.Add(nullptr);
    children.Add(Companion(&pool, nullptr).get());
    children.Add(nullptr);
    EXPECT_EQ(FieldsOf(object), "12 00");
}

TEST_F(MarshalTest, BodiesThatConvertAndBodiesThatDoNot) {
    const ref<SornObject> object = EveryTypeLazy::Factory(&pool);
    auto& lazy = static_cast<EveryTypeLazy&>(*object);
    lazy.body = LazyDict::FromJsonString(&pool, R"({"type":"everyTypeCompanion","number":3})", 0);
    EXPECT_EQ(FieldsOf(object), "12 06 FA F1 02 02 38 06");
    // An error, id 346: code 3 in slot 1, the words in slot 3.
    const std::string words = "Dictionary has no 'type' field.";
    const std::string fields = Bytes("08 03 1A") + Section(words);
    const std::string field = Bytes("0A") + Section(Bytes("D2 15") + Section(fields));
    lazy.body = nullptr;
    lazy.bodies.Add(LazyDict::FromJsonString(&pool, "{}", 0).get());
    EXPECT_EQ(FieldsOf(object), Hex(field));
}

TEST_F(MarshalTest, BodiesInBodiesUpToTheLimit) {
    // The innermost one holds a number; each level is a body in slot 2 of the one around it.
    const int three = 3;
    const auto nested = [&](unsigned nBodies) {
        ref<SornObject> object = Companion(&pool, &three);
        for (unsigned i = 0; i < nBodies; ++i) {
            const ref<LazyDict> body = LazyDict::FromSornObject(&pool, object, 0);
            object = EveryTypeLazy::Factory(&pool);
            static_cast<EveryTypeLazy&>(*object).body = body;
        }
        return object;
    };
    // 5924 * 8 + 2 = 47394 = 0xB922: A2 F2 02.
    const auto expected = [](unsigned nBodies, const std::string& innermost) {
        std::string value = innermost;
        std::string fields;
        for (unsigned i = 0; i < nBodies; ++i) {
            fields = Bytes("12") + Section(value);
            value = Bytes("A2 F2 02") + Section(fields);
        }
        return Hex(fields);
    };
    const std::string number = Bytes("FA F1 02 02 38 06");
    EXPECT_EQ(FieldsOf(nested(1)), expected(1, number));
    EXPECT_EQ(FieldsOf(nested(1000)), expected(1000, number));
    const std::string error =
        Bytes("D2 15") + Section(Bytes("08 03 1A") + Section(std::string("lazy bodies nested too deeply")));
    EXPECT_EQ(FieldsOf(nested(1001)), expected(1001, error));
    EXPECT_EQ(FieldsOf(nested(1500)), expected(1001, error));
}

TEST_F(MarshalTest, AnyDictForms) {
    const ref<Dict> dict = DictOf(R"({"a":"b"})");
    EXPECT_EQ(Body(dict), "22 08 32 01 61 42 03 12 01 62");
    EXPECT_EQ(Written([&](Stream& s) { Codec().MarshalAnyDictWithLength(dict.get(), s); }),
              "0A 22 08 32 01 61 42 03 12 01 62");
    EXPECT_EQ(Written([&](Stream& s) { Codec().MarshalAnyDictField(dict.get(), RoxString("a"), s); }),
              "32 01 61 42 03 12 01 62");
    EXPECT_EQ(Written([&](Stream& s) { Codec().MarshalAnyDictValue(dict.get(), RoxString("a"), 0, s); }),
              "12 01 62");
    EXPECT_EQ(Written([&](Stream& s) { Codec().MarshalAnyDictValue(dict.get(), RoxString("a"), 1, s); }), "");
    EXPECT_EQ(Written([&](Stream& s) { Codec().MarshalAnyDictField(dict.get(), RoxString("z"), s); }),
              "32 01 7A");
    const ref<Dict> empty = MakeDict(&pool);
    EXPECT_EQ(Body(empty), "");
    EXPECT_EQ(Written([&](Stream& s) { Codec().MarshalAnyDictWithLength(empty.get(), s); }), "00");
}

TEST_F(MarshalTest, AnyDictBodies) {
    struct Case {
        const char* json;
        const char* hex;
    };
    const Case cases[] = {
        // Two strings of one name; names sorted, whatever their order was.
        {R"({"n":["x","y"]})", "22 0D 32 01 6E 42 03 12 01 78 42 03 12 01 79"},
        {R"({"c":"","b":"","a":""})",
         "22 07 32 01 61 42 02 12 00 22 07 32 01 62 42 02 12 00 22 07 32 01 63 42 02 12 00"},
        {R"({"b":"","ab":"","a":""})",
         "22 07 32 01 61 42 02 12 00 22 08 32 02 61 62 42 02 12 00 22 07 32 01 62 42 02 12 00"},
        // A dictionary as a value: straight its entries.
        {R"({"o":{"i":"v"}})", "22 0F 32 01 6F 42 0A 22 08 32 01 69 42 03 12 01 76"},
        {R"({"o":{}})", "22 05 32 01 6F 42 00"},
        {R"({"o":[{},"s",{"i":"v"}]})",
         "22 16 32 01 6F 42 00 42 03 12 01 73 42 0A 22 08 32 01 69 42 03 12 01 76"},
        // Nothing is left of an array in an array, nor of a null; of no values, the name.
        {R"({"o":[["x"],"s"]})", "22 0A 32 01 6F 42 00 42 03 12 01 73"},
        {R"({"o":null})", "22 05 32 01 6F 42 00"},
        {R"({"o":[]})", "22 03 32 01 6F"},
        {R"({"":"d"})", "22 07 32 00 42 03 12 01 64"},
    };
    for (const Case& each : cases) {
        SCOPED_TRACE(each.json);
        EXPECT_EQ(Body(DictOf(each.json)), each.hex);
    }
}

TEST_F(MarshalTest, ValuesThatDictSees) {
    const ref<Dict> dict = MakeDict(&pool);
    // A lazy body goes out as the dictionary that it is; null as an empty value.
    dict->AddLazyDict(RoxString("l"), LazyDict::FromJsonString(&pool, R"({"i":"v"})", 0));
    EXPECT_EQ(Body(dict), "22 0F 32 01 6C 42 0A 22 08 32 01 69 42 03 12 01 76");
    EXPECT_EQ(Written([&](Stream& s) { Codec().MarshalAnyDictValue(dict.get(), RoxString("l"), 0, s); }),
              "22 08 32 01 69 42 03 12 01 76");
    // Of values that stand beside each other in a Dictionary, Dict sees the first.
    const ref<Dictionary> several = Dictionary::New(&pool, RoxString());
    several->Add(RoxString("n"), RoxString("x"));
    several->Add(RoxString("n"), RoxString("y"));
    EXPECT_EQ(Body(ref<Dict>(new (&pool) Dict(several))), "22 08 32 01 6E 42 03 12 01 78");
    const ref<Dictionary> nulls = Dictionary::New(&pool, RoxString());
    nulls->Add(RoxString("n"), ref<DictValue>());
    nulls->Add(RoxString("o"), ref<LazyDict>());
    EXPECT_EQ(Body(ref<Dict>(new (&pool) Dict(nulls))), "22 03 32 01 6E 22 05 32 01 6F 42 00");
}

TEST_F(MarshalTest, BodiesInDictionariesUpToTheLimit) {
    const auto nested = [&](unsigned nBodies) {
        ref<Dict> dict = MakeDict(&pool);
        for (unsigned i = 0; i < nBodies; ++i) {
            const ref<LazyDict> body = LazyDict::FromDict(&pool, dict, 0);
            dict = MakeDict(&pool);
            dict->AddLazyDict(RoxString("n"), body);
        }
        return dict;
    };
    const auto expected = [](unsigned nBodies, std::string value) {
        for (unsigned i = 0; i < nBodies; ++i)
            value = Bytes("22") + Section(Bytes("32 01 6E 42") + Section(value));
        return Hex(value);
    };
    EXPECT_EQ(Body(nested(1000)), expected(1000, ""));
    std::string error;
    const std::pair<std::string, std::string> entries[] = {
        {"code", "badArgument"}, {"text", "lazy bodies nested too deeply"}, {"type", "error"}};
    for (const auto& [name, text] : entries) {
        const std::string value = Bytes("42") + Section(Bytes("12") + Section(text));
        error += Bytes("22") + Section(Bytes("32") + Section(name) + value);
    }
    EXPECT_EQ(Body(nested(1001)), expected(1001, error));
    EXPECT_EQ(Body(nested(1200)), expected(1001, error));
}

/// Records longer than the buffer's first blocks, and one text that is longer than any block.
TEST_F(MarshalTest, ManyBlocks) {
    for (const size_t n : {100u, 2035u, 2040u, 2048u, 2049u, 5000u, 65536u, 300000u}) {
        SCOPED_TRACE(n);
        std::string text;
        for (size_t i = 0; i < n; ++i) text += static_cast<char>('a' + i % 26);
        const ref<SornObject> object = EveryTypeCompanion::Factory(&pool);
        auto& companion = static_cast<EveryTypeCompanion&>(*object);
        const int three = 3;
        std::string children;
        for (unsigned i = 0; i < 700; ++i) {
            companion.children.Add(Companion(&pool, &three).get());
            children += Bytes("12 02 38 06");
        }
        companion.label_isSet = 1;
        companion.label = RoxString::FromUtf8Bytes(&pool, static_cast<unsigned>(n), text.data());
        companion.child = Companion(&pool, &three);
        const std::string fields = Bytes("0A 02 38 06") + children + Bytes("32") + Section(text);
        const std::string expected = Bytes("FA F1 02") + Section(fields);
        const ref<rox::ByteBuffer> bytes = Codec().MarshalKnownDict(object.get());
        EXPECT_EQ(std::string(bytes->GetData(), bytes->GetData() + bytes->GetLength()), expected);
        EXPECT_EQ(Written([&](Stream& s) { Codec().MarshalKnownDict(object.get(), s); }), Hex(expected));
    }
}

}  // namespace sorntest
