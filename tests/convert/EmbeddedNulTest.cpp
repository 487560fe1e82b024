// A text with a NUL inside is not the text before the NUL.

#include <string>

#include "convert/ConvertFixture.h"
#include "sorn/dict/StringValue.h"
#include "sornschema/EveryType.h"

namespace sorntest {

using namespace sorn;
using sornschema::EveryType;

class EmbeddedNulTest : public ConvertFixture {
 protected:
    RoxString Bytes(const std::string& bytes) {
        return RoxString::FromUtf8Bytes(&pool, static_cast<unsigned>(bytes.size()), bytes.data());
    }
    std::string WordsOfType(const std::string& type) {
        ref<Dictionary> dictionary = Dictionary::New(&pool, RoxString());
        dictionary->Add(RoxString("type"), Bytes(type));
        return Words(dictionary, 0, "old;");
    }
    bool Store(const char* name, const std::string& text, EveryType& object, std::string& words) {
        ref<DictValue> value(new (&pool) StringValue(&pool, Bytes(text), true));
        RoxString error;
        const FieldInfo* field = FindField(EveryType::structInfoG, name);
        bool isStored = Context().DictToSingleField(field, value, &object, error, 0);
        words = Text(error);
        return isStored;
    }
};

TEST_F(EmbeddedNulTest, InATypeMakesItUnknown) {
    EXPECT_NE(Object(R"({"type": "ad"})"), nullptr);
    EXPECT_EQ(WordsOfType(std::string("ad\0x", 4)), "old;no such structure type: ad");
    EXPECT_EQ(WordsOfType(std::string("ad\0", 3)), "old;no such structure type: ad");
    EXPECT_EQ(WordsOfType(std::string("\0ad", 3)), "old;no such structure type: ");
    EXPECT_EQ(WordsOfType(std::string("no\0x", 4)), "old;no such structure type: no");
}

TEST_F(EmbeddedNulTest, InTheTypeOfAnInnerDictionaryToo) {
    ref<Dictionary> inner = Dictionary::New(&pool, Bytes(std::string("everyTypeCompanion\0", 19)));
    ref<Dictionary> outer = Dictionary::New(&pool, RoxString("everyType"));
    outer->Add(RoxString("requiredObject"), inner);
    EXPECT_EQ(Words(outer),
              "no such structure type: everyTypeCompanion. Can't unmarshal inner Dictionary. "
              "Bad single field: requiredObject");
}

TEST_F(EmbeddedNulTest, InTheNumberOfAnIdIsABadDigit) {
    ref<EveryType> object(static_cast<EveryType*>(EveryType::Factory(&pool).get()));
    object->requiredIntId = 77;
    object->requiredLongId = 77;
    std::string words;
    EXPECT_TRUE(Store("requiredIntId", std::string("vuka:etc.12\0x", 13), *object, words));
    EXPECT_EQ(object->requiredIntId, 0u);
    EXPECT_TRUE(Store("requiredLongId", std::string("vuka:etc.ts.7\0", 14), *object, words));
    EXPECT_EQ(object->requiredLongId, 0u);
    EXPECT_TRUE(Store("requiredStringId", std::string("vuka:etc.a\0b", 12), *object, words));
    EXPECT_EQ(Text(object->requiredStringId), std::string("a\0b", 3));
    EXPECT_EQ(words, "");

    unsigned intId = 77;
    unsigned long long longId = 77;
    RoxString error;
    const FieldInfo* field = FindField(EveryType::structInfoG, "requiredIntId");
    RoxString text = Bytes(std::string("vuka:etc.12\0", 12));
    EXPECT_TRUE(Context().StringToIntId(&pool, field, text, error, intId));
    EXPECT_TRUE(Context().StringToLongId(&pool, field, text, error, longId));
    EXPECT_EQ(intId, 0u);
    EXPECT_EQ(longId, 0u);
    EXPECT_EQ(Text(error), "");
}

TEST_F(EmbeddedNulTest, InThePrefixOfAnIdIsAnotherPrefix) {
    ref<EveryType> object(static_cast<EveryType*>(EveryType::Factory(&pool).get()));
    std::string words;
    EXPECT_FALSE(Store("requiredIntId", std::string("vuka\0etc.12", 11), *object, words));
    EXPECT_EQ(words, "wrong prefix on idbad prefix: vukaCannot convert value for the field.");
}

}  // namespace sorntest
