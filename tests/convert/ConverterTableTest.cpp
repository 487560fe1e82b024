// A converter takes the structs of ids, and those of objects on the way to dictionaries, from the table that
// it was made with.

#include <string>
#include <vector>

#include "convert/ConvertFixture.h"
#include "sornschema/EveryType.h"
#include "sornschema/EveryTypeCompanion.h"

namespace sorntest {

using namespace sorn;
using sornschema::EveryType;
using sornschema::EveryTypeCompanion;

constexpr uint32_t companionId = 5919;

class ConverterTableTest : public ConvertFixture {
 protected:
    ConverterTableTest()
        : companionM(EveryTypeCompanion::structInfoG),
          vStructDefM(Schema::vStructDefG, Schema::vStructDefG + Schema::nStructDefG) {
        companionM.idPrefix = "other:";
        vStructDefM[companionId] = &companionM;
    }
    DictionarySornObject TableContext() {
        return DictionarySornObject(&pool, vStructDefM.data(), static_cast<uint32_t>(vStructDefM.size()));
    }
    std::string TextOf(const char* name, const SornObject& object) {
        const FieldInfo* field = FindField(EveryType::structInfoG, name);
        ref<Dictionary> out = Dictionary::New(&pool, RoxString());
        if (field->arity == SORN_ARITY_MULTI) {
            TableContext().MultiFieldToDict(RoxString("x"), field, &object, out, 0);
        } else {
            TableContext().SingleFieldToDict(RoxString("x"), field, &object, out, 0);
        }
        return Text(out->ToJson(false));
    }
    /// The object, or null and the words.
    ref<EveryType> Read(const std::string& entry, std::string& words) {
        ref<SornObject> object;
        RoxString error;
        TableContext().DictionaryToSornObject(Parse(R"({"type": "everyType", )" + entry + "}"), 0, object,
                                              error);
        words = Text(error);
        return ref<EveryType>(static_cast<EveryType*>(object.get()));
    }
    const FieldInfo* Field(const char* name) { return FindField(EveryType::structInfoG, name); }

    StructInfo companionM;
    std::vector<const StructInfo*> vStructDefM;
};

const char* const vIdsG[] = {"IntId", "LongId", "StringId"};

TEST_F(ConverterTableTest, IdsAreWrittenWithThePrefixOfTheTable) {
    ref<EveryType> object(static_cast<EveryType*>(EveryType::Factory(&pool).get()));
    object->requiredIntId = 12;
    object->requiredLongId = 12;
    object->requiredStringId = RoxString("12");
    object->multiStringId.Add(RoxString("12"));
    for (const char* type : vIdsG)
        EXPECT_EQ(TextOf((std::string("required") + type).c_str(), *object), R"({"x": "other:12"})") << type;
    EXPECT_EQ(TextOf("multiStringId", *object), R"({"x": ["other:12"]})");
    ref<Dictionary> whole = TableContext().SornObjectToDictionary(object.get(), 0);
    EXPECT_EQ(Text(whole->GetString(RoxString("requiredLongId"))), "other:12");
    vStructDefM[companionId] = nullptr;
    const std::string noStruct = "{\"x\": \"\x58\x58\x58\"}";
    for (const char* type : vIdsG)
        EXPECT_EQ(TextOf((std::string("required") + type).c_str(), *object), noStruct) << type;
    vStructDefM.resize(companionId);  // or too short for the id
    EXPECT_EQ(TextOf("requiredIntId", *object), noStruct);
}

TEST_F(ConverterTableTest, IdsAreReadWithThePrefixOfTheTable) {
    std::string words;
    ref<EveryType> object = Read(
        R"("optionalIntId": "other:12", "requiredLongId": "other:13", "multiStringId": ["other:a", "other:b"])",
        words);
    ASSERT_NE(object, nullptr) << words;
    EXPECT_EQ(object->optionalIntId, 12u);
    EXPECT_EQ(object->requiredLongId, 13u);
    EXPECT_EQ(Text(object->multiStringId.At(1)), "b");
    for (const char* type : vIdsG) {
        EXPECT_EQ(Read("\"required" + std::string(type) + R"(": "vuka:etc.12")", words), nullptr);
        EXPECT_EQ(words,
                  "wrong prefix on idbad prefix: vuka:etc.12Cannot convert value for the field.. "
                  "Bad single field: required" +
                      std::string(type));
    }
    vStructDefM[companionId] = nullptr;
    for (const char* type : vIdsG) {
        EXPECT_EQ(Read("\"multi" + std::string(type) + R"(": ["vuka:etc.12"])", words), nullptr);
        EXPECT_EQ(words,
                  "no struct for idbad prefix: vuka:etc.12Bad value in field: . Bad multi field: multi" +
                      std::string(type));
    }
}

TEST_F(ConverterTableTest, SingleValuesAreReadWithThePrefixOfTheTable) {
    ref<EveryType> object(static_cast<EveryType*>(EveryType::Factory(&pool).get()));
    ref<DictValue> value(Parse(R"({"x": "other:7"})")->Find("x"));
    RoxString error;
    EXPECT_TRUE(TableContext().DictToSingleField(Field("requiredIntId"), value, object.get(), error, 0));
    EXPECT_EQ(object->requiredIntId, 7u);
    EXPECT_TRUE(TableContext().DictToMultiField(Field("multiStringId"), value, object.get(), error, 0));
    EXPECT_EQ(Text(object->multiStringId.At(0)), "7");
    vStructDefM[companionId] = nullptr;
    EXPECT_FALSE(TableContext().DictToSingleField(Field("requiredIntId"), value, object.get(), error, 0));
    EXPECT_EQ(Text(error), "no struct for idbad prefix: other:7Cannot convert value for the field.");
}

TEST_F(ConverterTableTest, IdConversionsByThemselves) {
    unsigned intId = 77;
    unsigned long long longId = 77;
    RoxString stringId;
    RoxString error;
    RoxString text("other:8");
    DictionarySornObject context = TableContext();
    EXPECT_TRUE(context.StringToIntId(&pool, Field("requiredIntId"), text, error, intId));
    EXPECT_TRUE(context.StringToLongId(&pool, Field("requiredLongId"), text, error, longId));
    EXPECT_TRUE(context.StringToStringId(&pool, Field("requiredStringId"), text, error, stringId));
    EXPECT_EQ(intId, 8u);
    EXPECT_EQ(longId, 8u);
    EXPECT_EQ(Text(stringId), "8");
    EXPECT_EQ(Text(error), "");
    vStructDefM[companionId] = nullptr;
    for (bool isDone : {context.StringToIntId(&pool, Field("requiredIntId"), text, error, intId),
                        context.StringToLongId(&pool, Field("requiredLongId"), text, error, longId),
                        context.StringToStringId(&pool, Field("requiredStringId"), text, error, stringId)}) {
        EXPECT_FALSE(isDone);
    }
    const std::string words = "no struct for idbad prefix: other:8";
    EXPECT_EQ(Text(error), words + words + words);
    EXPECT_EQ(intId, 8u);
}

TEST_F(ConverterTableTest, ObjectsAreWrittenWithTheFieldsOfTheTable) {
    companionM.name = "renamed";
    companionM.nFields = 7;  // without the last one, "number"
    ref<SornObject> object = Object(R"({"type": "everyTypeCompanion", "number": 5, "label": "x"})");
    EXPECT_EQ(Text(TableContext().SornObjectToDictionary(object.get(), 0)->ToJson(false)),
              R"({"label": "x", "type": "renamed"})");
    // Structs are found by name in the schema: the table has no say in it.
    std::string words;
    EXPECT_NE(Read(R"("requiredObject": {"type": "everyTypeCompanion", "number": 5})", words), nullptr);
    EXPECT_EQ(Read(R"("requiredObject": {"type": "renamed"})", words), nullptr);
    EXPECT_EQ(words,
              "no such structure type: renamed. Can't unmarshal inner Dictionary. Bad single field: "
              "requiredObject");
}

}  // namespace sorntest
