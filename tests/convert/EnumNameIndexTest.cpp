#include "sorn/convert/EnumNameIndex.h"

#include <cstring>
#include <string>
#include <thread>
#include <vector>

#include "convert/ConvertFixture.h"
#include "sorn/model/Schema.h"
#include "sornschema/EveryType.h"

namespace sorntest {

using namespace sorn;

namespace {

constexpr uint32_t untouched = 123456789;

/// The value that the first equal name has, worked out here, or `untouched`.
uint32_t Walked(const EnumDef& def, const std::string& name) {
    for (uint32_t i = 0; i < def.count; ++i) {
        if (def.names[i] != nullptr && name == def.names[i]) return i;
    }
    return untouched;
}

uint32_t Found(const EnumDef& def, const std::string& name) {
    uint32_t value = untouched;
    bool isFound = EnumNameIndex::Find(def, name.c_str(), name.size(), value);
    EXPECT_EQ(isFound, value != untouched) << name;
    return value;
}

std::vector<const EnumDef*> AllEnums() {
    std::vector<const EnumDef*> vDef;
    for (uint32_t id = 0; id < Schema::nEnumDefG; ++id) {
        if (Schema::vEnumDefG[id] != nullptr) vDef.push_back(Schema::vEnumDefG[id]);
    }
    return vDef;
}

void FindAllNames() {
    for (const EnumDef* def : AllEnums()) {
        for (uint32_t i = 0; i < def->count; ++i) {
            if (def->names[i] == nullptr) continue;
            const uint32_t value = Found(*def, def->names[i]);
            ASSERT_STREQ(def->NameOf(value), def->names[i]);
        }
    }
}

class EnumNameIndexTest : public ::testing::Test {
 protected:
    void SetUp() override { EnumNameIndex::DestroyAll(); }
    void TearDown() override { EnumNameIndex::DestroyAll(); }
};

}  // namespace

TEST_F(EnumNameIndexTest, AnswersAsTheWalkDoesForAllEnumerations) {
    unsigned nLong = 0;
    for (const EnumDef* def : AllEnums()) {
        if (def->count > EnumNameIndex::longestWalkG) ++nLong;
        for (uint32_t i = 0; i < def->count; ++i) {
            if (def->names[i] == nullptr) continue;
            const std::string name = def->names[i];
            ASSERT_EQ(Found(*def, name), Walked(*def, name)) << name;
            for (const std::string& other :
                 {name + "x", name.substr(1), name.substr(0, name.size() - 1), "X" + name}) {
                ASSERT_EQ(Found(*def, other), Walked(*def, other)) << other;
            }
        }
        EXPECT_EQ(Found(*def, ""), untouched);
        EXPECT_EQ(Found(*def, "no such name at all"), untouched);
    }
    EXPECT_GE(nLong, 12u);
}

TEST_F(EnumNameIndexTest, TheLowestOfEqualNamesCounts) {
    std::vector<const char*> vName(100, nullptr);
    vName[3] = "a";
    vName[4] = "b";
    vName[5] = "a";
    vName[99] = "b";
    vName[98] = "";
    const EnumDef def{100, vName.data()};
    for (int i = 0; i < 2; ++i) {  // making the index, then with it
        EXPECT_EQ(Found(def, "a"), 3u);
        EXPECT_EQ(Found(def, "b"), 4u);
        EXPECT_EQ(Found(def, ""), 98u);
        EXPECT_EQ(Found(def, "c"), untouched);
    }
    EnumNameIndex::DestroyAll();  // the names go
}

TEST_F(EnumNameIndexTest, LengthsAroundTheLongestWalk) {
    for (uint32_t count : {0u, 1u, 31u, 32u, 33u, 34u}) {
        std::vector<std::string> vText;
        for (uint32_t i = 0; i < count; ++i) vText.push_back("name" + std::to_string(i));
        std::vector<const char*> vName;
        for (const std::string& text : vText) vName.push_back(text.c_str());
        const EnumDef def{count, vName.data()};
        for (uint32_t i = 0; i < count; ++i) EXPECT_EQ(Found(def, vText[i]), i) << count;
        EXPECT_EQ(Found(def, "name" + std::to_string(count)), untouched);
        EnumNameIndex::DestroyAll();
    }
}

TEST_F(EnumNameIndexTest, NoNamesAtAll) {
    const std::vector<const char*> vName(40, nullptr);
    const EnumDef def{40, vName.data()};
    EXPECT_EQ(Found(def, "a"), untouched);
    EnumNameIndex::DestroyAll();
}

TEST_F(EnumNameIndexTest, ManyThreadsAskFirst) {
    for (int i = 0; i < 5; ++i) {
        EnumNameIndex::DestroyAll();
        std::vector<std::thread> vThread;
        for (int j = 0; j < 8; ++j) vThread.emplace_back([] { FindAllNames(); });
        for (std::thread& thread : vThread) thread.join();
    }
}

class EnumConversionTest : public ConvertFixture {};

// A sender may pick the name that a walk would reach last.
TEST_F(EnumConversionTest, ManyElementsOfTheLastNameOfTheLongestEnumeration) {
    const EnumDef* longest = nullptr;
    uint32_t id = 0;
    for (uint32_t i = 0; i < Schema::nEnumDefG; ++i) {
        const EnumDef* def = Schema::vEnumDefG[i];
        if (def == nullptr || (longest != nullptr && def->count <= longest->count)) continue;
        longest = def;
        id = i;
    }
    ASSERT_EQ(longest->count, 5934u);
    uint32_t lastValue = longest->count - 1;
    while (longest->names[lastValue] == nullptr) --lastValue;
    const std::string lastName = longest->names[lastValue];
    FieldInfo field = *FindField(sornschema::EveryType::structInfoG, "multiEnum");
    field.typeRef = static_cast<uint16_t>(id);
    ref<SornObject> object = sornschema::EveryType::Factory(&pool);
    ref<Dictionary> dictionary = Dictionary::New(&pool, RoxString());
    const std::string withNul = lastName + '\0' + 'x';
    dictionary->Add(RoxString("last"), RoxString(lastName.c_str()));
    dictionary->Add(RoxString("nul"),
                    RoxString::FromUtf8Bytes(&pool, static_cast<unsigned>(withNul.size()), withNul.data()));
    ref<DictValue> last(dictionary->Find("last"));
    RoxString error;
    for (unsigned i = 0; i < 65535; ++i)
        ASSERT_TRUE(Context().DictToMultiField(&field, last, object.get(), error, 0)) << i;
    const auto& values = static_cast<sornschema::EveryType&>(*object).multiEnum;
    uint32_t value = 0;
    memcpy(&value, values.At(65534), sizeof value);
    EXPECT_EQ(value, lastValue);
    ref<SornObject> other = sornschema::EveryType::Factory(&pool);
    ref<DictValue> nul(dictionary->Find("nul"));
    EXPECT_FALSE(Context().DictToMultiField(&field, nul, other.get(), error, 0));
    EXPECT_EQ(Text(error), "bad enum item nameBad value in field: ");
}

}  // namespace sorntest
