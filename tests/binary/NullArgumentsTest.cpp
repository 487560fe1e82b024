// What null does where the codec is called: programming errors end the process.

#include <functional>

#include "binary/ValueRows.h"

namespace sorntest {

using namespace sorn;
using sornschema::EveryType;
using sornschema::EveryTypeCompanion;

class NullArgumentsTest : public BinaryFixture {};

TEST_F(NullArgumentsTest, Writing) {
    const StructInfo* const info = &EveryTypeCompanion::structInfoG;
    const FieldInfo* const field = FindField(EveryType::structInfoG, "multiString");
    const ref<SornObject> object = Companion(&pool, nullptr);
    ProtoBufByteOutputStream s;
    const RoxString name("n");
    const std::pair<const char*, std::function<void()>> cases[] = {
        {"Marshal", [&] { Codec().Marshal(nullptr, s); }},
        {"MarshalDict", [&] { Codec().MarshalDict(nullptr, s); }},
        {"MarshalFields", [&] { Codec().MarshalFields(info, nullptr, s); }},
        {"MarshalFields, struct", [&] { Codec().MarshalFields(nullptr, object.get(), s); }},
        {"MarshalSingleField", [&] { Codec().MarshalSingleField(field, nullptr, s); }},
        {"MarshalSingleField, field", [&] { Codec().MarshalSingleField(nullptr, object.get(), s); }},
        {"MarshalMultiField", [&] { Codec().MarshalMultiField(10, field, nullptr, s); }},
        {"MarshalMultiField, field", [&] { Codec().MarshalMultiField(10, nullptr, object.get(), s); }},
        {"MarshalSubdict", [&] { Codec().MarshalSubdict(nullptr, s); }},
        {"MarshalKnownDict", [&] { Codec().MarshalKnownDict(nullptr, s); }},
        {"MarshalKnownDict, buffer", [&] { Codec().MarshalKnownDict(nullptr); }},
        {"MarshalKnownDictValue", [&] { Codec().MarshalKnownDictValue(nullptr, s); }},
        {"MarshalKnownDictField", [&] { Codec().MarshalKnownDictField(nullptr, s); }},
        {"MarshalAnyDict", [&] { Codec().MarshalAnyDict(nullptr, s); }},
        {"MarshalAnyDictWithLength", [&] { Codec().MarshalAnyDictWithLength(nullptr, s); }},
        {"MarshalAnyDictField", [&] { Codec().MarshalAnyDictField(nullptr, name, s); }},
        {"MarshalAnyDictValue", [&] { Codec().MarshalAnyDictValue(nullptr, name, 0, s); }},
        {"DictFromSornObject", [&] { Codec().DictFromSornObject(nullptr); }},
    };
    for (const auto& [what, call] : cases) {
        SCOPED_TRACE(what);
        EXPECT_DEATH(call(), "ProtoBuf: a null argument");
    }
    // A null body is no mistake.
    EXPECT_EQ(
        Written([&](ProtoBufByteOutputStream& out) { Codec().MarshalKnownDictAsLazyField(nullptr, out); }),
        "");
}

TEST_F(NullArgumentsTest, Reading) {
    const unsigned id = EveryTypeCompanion::structIdG;
    const FieldInfo* const field = FindField(EveryType::structInfoG, "multiString");
    const ref<SornObject> object = Companion(&pool, nullptr);
    const ExactBytes bytes(Bytes("00"));
    const unsigned char* cursor = bytes.Begin();
    const unsigned char* const end = bytes.End();
    ref<SornObject> out;
    ref<Dict> dict;
    ref<LazyDict> body;
    const std::pair<const char*, std::function<void()>> cases[] = {
        {"Unmarshal", [&] { Codec().Unmarshal(cursor, 1, id, nullptr); }},
        {"Unmarshal, bytes", [&] { Codec().Unmarshal(nullptr, 1, id, &out); }},
        {"UnmarshalDict", [&] { Codec().UnmarshalDict(&cursor, end, id, nullptr); }},
        {"UnmarshalDict, cursor", [&] { Codec().UnmarshalDict(nullptr, end, id, &out); }},
        {"UnmarshalFields", [&] { Codec().UnmarshalFields(&EveryType::structInfoG, &cursor, end, nullptr); }},
        {"UnmarshalFields, struct", [&] { Codec().UnmarshalFields(nullptr, &cursor, end, object.get()); }},
        {"UnmarshalOneSingleValue", [&] { Codec().UnmarshalOneSingleValue(field, &cursor, end, nullptr); }},
        {"UnmarshalOneMultiValue",
         [&] { Codec().UnmarshalOneMultiValue(nullptr, &cursor, end, object.get()); }},
        {"UnmarshalSubdict", [&] { Codec().UnmarshalSubdict(&cursor, end, id, nullptr); }},
        {"UnmarshalKnownDict", [&] { Codec().UnmarshalKnownDict(cursor, 1, nullptr); }},
        {"UnmarshalKnownDict, bytes", [&] { Codec().UnmarshalKnownDict(nullptr, 1, &out); }},
        {"UnmarshalKnownDict, buffer",
         [&] { Codec().UnmarshalKnownDict(rox::ByteBuffer::New(&pool, cursor, 1), nullptr); }},
        {"UnmarshalKnownDictValue", [&] { Codec().UnmarshalKnownDictValue(&cursor, end, nullptr); }},
        {"UnmarshalKnownDictField", [&] { Codec().UnmarshalKnownDictField(nullptr, end, &out); }},
        {"UnmarshalKnownDictAsLazyField",
         [&] { Codec().UnmarshalKnownDictAsLazyField(&cursor, end, nullptr); }},
        {"UnmarshalAnyDict", [&] { Codec().UnmarshalAnyDict(&cursor, end, nullptr); }},
        {"UnmarshalAnyDictWithLength", [&] { Codec().UnmarshalAnyDictWithLength(nullptr, end, &dict); }},
        {"UnmarshalAnyDictField", [&] { Codec().UnmarshalAnyDictField(cursor, end, nullptr); }},
        {"SkipFieldValue", [&] { Codec().SkipFieldValue(0, nullptr, end); }},
    };
    for (const auto& [what, call] : cases) {
        SCOPED_TRACE(what);
        EXPECT_DEATH(call(), "ProtoBuf: a null argument");
    }
}

/// No bytes need no address, and are read as no bytes are.
TEST_F(NullArgumentsTest, NoBytes) {
    const unsigned char* cursor = nullptr;
    ref<SornObject> object;
    EXPECT_TRUE(Codec().Unmarshal(nullptr, 0, EveryTypeCompanion::structIdG, &object));
    EXPECT_EQ(FieldsOf(object), "");
    object = nullptr;
    EXPECT_FALSE(Codec().UnmarshalKnownDict(nullptr, 0, &object));
    EXPECT_FALSE(Codec().UnmarshalKnownDict(ref<rox::ByteBuffer>(), &object));
    EXPECT_FALSE(Codec().UnmarshalKnownDictField(&cursor, nullptr, &object));
    EXPECT_EQ(object, nullptr);
    EXPECT_FALSE(Codec().SkipFieldValue(0, &cursor, nullptr));
    ref<Dict> dict;
    EXPECT_FALSE(Codec().UnmarshalAnyDictWithLength(&cursor, nullptr, &dict));
    EXPECT_TRUE(Codec().UnmarshalAnyDict(&cursor, nullptr, &dict));
    EXPECT_EQ(JsonOf(dict), "{}");
}

}  // namespace sorntest
