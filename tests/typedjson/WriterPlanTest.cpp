// Structs of all shapes through the writer's plans: how many fields, how long their names, in which versions,
// and where "type" goes.

#include <algorithm>
#include <random>
#include <thread>
#include <vector>

#include "sorn/json/JsonOutput.h"
#include "sorn/typedjson/EnumTexts.h"
#include "sorn/typedjson/JsonTreeWriter.h"
#include "sorn/typedjson/WriterPlans.h"
#include "typedjson/WriterFixture.h"

namespace sorntest {

using namespace sorn;
using sornschema::EveryType;

namespace {

/// A struct made up of fields of one object, under names of its own, and what its text has to be.
class MadeStruct {
 public:
    MadeStruct() : infoM(EveryType::structInfoG), vNamesM(1, std::string()), vFieldM(1, Hole()) {
        infoM.name = "made";
    }

    static FieldInfo Hole() {
        FieldInfo hole{};
        hole.dataType = SORN_DATA_TYPE_NONE;
        hole.arity = SORN_ARITY_NONE;
        return hole;
    }
    void AddHole() { Add(Hole(), "", ""); }
    /// `value` is the text of the field's value, empty when it is not to be written.
    void Add(FieldInfo field, const std::string& name, const std::string& value) {
        vFieldM.push_back(field);
        vNamesM.push_back(name);
        vValuesM.resize(vFieldM.size());
        vValuesM.back() = value;
    }

    std::string Write(RoxMempool& pool, const SornObject& object, OrvoVersion version) {
        std::string names(1, '\0');
        for (size_t i = 0; i < vFieldM.size(); ++i) {
            if (vFieldM[i].FHole()) continue;
            vFieldM[i].nameOffset = static_cast<uint16_t>(names.size());
            names += vNamesM[i] + '\0';
        }
        infoM.nFields = static_cast<int32_t>(vFieldM.size());
        infoM.vFieldInfo = vFieldM.data();
        infoM.pFieldNames = names.c_str();
        std::vector<const StructInfo*> table(EveryType::structIdG + 1);
        table.back() = &infoM;
        JsonTextOutput out(&pool);
        const StructTable structs{table.data(), static_cast<uint32_t>(table.size())};
        JsonTreeWriter(&pool, out, JsonFormat(false), structs).Write(object, version);
        return ::sorntest::Text(out.Take());
    }

    /// The text by the rules, one slot after the other.
    std::string Expected(OrvoVersion version) const {
        size_t anchor = vFieldM.size();
        for (size_t i = 0; i < vFieldM.size(); ++i) {
            if (FHolds(i, version) && vNamesM[i] < "type") anchor = i;
        }
        std::string text;
        for (size_t i = 0; i <= vFieldM.size(); ++i) {
            if (i == anchor) text += R"(, "type": "made")";
            if (i == vFieldM.size() || !FHolds(i, version) || vValuesM[i].empty()) continue;
            text += ", \"" + vNamesM[i] + "\": " + vValuesM[i];
        }
        return "{" + text.substr(2) + "}";
    }

 private:
    bool FHolds(size_t i, OrvoVersion version) const {
        const FieldInfo& field = vFieldM[i];
        if (field.arity == SORN_ARITY_NONE) return false;
        const int number = version.Number();
        return number == 0 || (field.firstVersion <= number && number <= field.lastVersion);
    }

    StructInfo infoM;
    std::vector<std::string> vNamesM;
    std::vector<FieldInfo> vFieldM;
    std::vector<std::string> vValuesM{1};
};

class WriterPlanTest : public WriterFixture {
 protected:
    void SetUp() override {
        object = New<EveryType>();
        object->optionalS32 = -7;
        object->optionalS32_isSet = 1;
        object->optionalBool = true;
        object->optionalBool_isSet = 0xA0;  // any byte but 0
        object->optionalString = RoxString(&pool, "text");
        object->optionalString_isSet = 0;
        object->multiString.Add(RoxString("a"));
        object->multiString.Add(RoxString(&pool, std::string(300, 'b').c_str()));
    }
    void TearDown() override {
        object = nullptr;
        WriterFixture::TearDown();
    }
    void AddOne(MadeStruct& made, unsigned kind, const std::string& name, int first = 7, int last = 42) {
        static const struct {
            const char* field;
            std::string value;
        } kinds[] = {
            {"optionalS32", "-7"},    {"optionalBool", "true"},
            {"optionalString", ""},   {"multiString", "[\"a\",\"" + std::string(300, 'b') + "\"]"},
            {"multiU32", ""},         {"optionalObject", ""},
            {"requiredU64", "\"0\""}, {"requiredString", "\"\""},
        };
        const auto& row = kinds[kind % std::size(kinds)];
        FieldInfo field = Field(row.field);
        field.firstVersion = static_cast<uint8_t>(first);
        field.lastVersion = static_cast<uint8_t>(last);
        made.Add(field, name, row.value);
    }

    ref<EveryType> object;
};

TEST_F(WriterPlanTest, AnyNumberOfFields) {
    for (const unsigned n : {0u, 1u, 7u, 8u, 9u, 31u, 32u, 33u, 63u, 64u, 65u, 200u}) {
        MadeStruct made;
        for (unsigned i = 0; i < n; ++i) AddOne(made, i, "f" + std::to_string(i));
        EXPECT_EQ(made.Write(pool, *object, 0), made.Expected(0)) << n;
    }
}

TEST_F(WriterPlanTest, TheTypeInFrontOfEveryField) {
    for (const unsigned n : {1u, 8u, 32u, 33u, 70u}) {
        for (unsigned anchor = 0; anchor <= n; ++anchor) {
            MadeStruct made;
            for (unsigned i = 0; i < n; ++i) AddOne(made, i, (i <= anchor ? "a" : "u") + std::to_string(i));
            ASSERT_EQ(made.Write(pool, *object, 0), made.Expected(0)) << n << " " << anchor;
        }
        MadeStruct none;
        for (unsigned i = 0; i < n; ++i) AddOne(none, i, "typed" + std::to_string(i));
        ASSERT_EQ(none.Write(pool, *object, 0), none.Expected(0)) << n;
    }
}

TEST_F(WriterPlanTest, NamesOfEveryLength) {
    for (unsigned n = 1; n <= 300; n += n < 40 ? 1 : 13) {
        for (const char* const first : {"a", "z"}) {
            MadeStruct made;
            for (unsigned kind = 0; kind < 8; ++kind) {
                AddOne(made, kind, first + std::string(n - 1, static_cast<char>('a' + kind)));
            }
            ASSERT_EQ(made.Write(pool, *object, 0), made.Expected(0)) << n;
        }
    }
}

TEST_F(WriterPlanTest, FieldsOfAllVersionsInAnyOrder) {
    std::mt19937 generator(3);
    const auto random = [&generator] { return static_cast<unsigned>(generator()); };
    for (unsigned round = 0; round < 60; ++round) {
        MadeStruct made;
        const unsigned n = 1 + random() % 90;
        for (unsigned i = 0; i < n; ++i) {
            if (random() % 8 == 0) made.AddHole();
            const int first = random() % 3 != 0 ? 7 : static_cast<int>(7 + random() % 36);
            const int last = random() % 3 != 0 ? 42 : static_cast<int>(7 + random() % 36);
            const std::string letter(1, static_cast<char>('a' + random() % 26));
            AddOne(made, random(), letter + std::to_string(i), first, last);
        }
        for (const int version : {0, 6, 7, 8, 21, 41, 42, 43, 255, 300, -1}) {
            ASSERT_EQ(made.Write(pool, *object, version), made.Expected(version)) << round << " " << version;
        }
    }
}

TEST_F(WriterPlanTest, PlansEndAndAreMadeAnew) {
    const std::string before = Typed(object);
    WriterPlans::DestroyAll();
    WriterPlans::DestroyAll();
    EXPECT_EQ(Typed(object), before);
}

TEST_F(WriterPlanTest, ThreadsThatMakeTheSamePlans) {
    const std::string expected = Typed(object);
    for (unsigned round = 0; round < 20; ++round) {
        WriterPlans::DestroyAll();
        std::vector<std::string> texts(4);
        std::vector<std::thread> threads;
        for (std::string& text : texts) {
            threads.emplace_back([this, &text] {
                RoxMempool own("thread");
                text = ::sorntest::Text(JsonSornObject(&own).SornObjectToJson(object.get(), 0));
            });
        }
        for (std::thread& thread : threads) thread.join();
        for (const std::string& text : texts) ASSERT_EQ(text, expected);
    }
}

TEST(EnumTexts, NamesOfEveryLengthThatHasAText) {
    std::vector<std::string> names;
    for (size_t n = 1; n <= 300; ++n) names.push_back(std::string(n, static_cast<char>('a' + n % 26)));
    std::vector<const char*> pointers(1, nullptr);  // value 0 has no name
    for (const std::string& name : names) pointers.push_back(name.c_str());
    const EnumDef def{static_cast<uint32_t>(pointers.size()), pointers.data()};
    const EnumTexts* const texts = EnumTexts::Of(def);
    ASSERT_NE(texts, nullptr);
    EXPECT_EQ(EnumTexts::Of(def), texts);
    unsigned char out[EnumTexts::maxTextG + EnumTexts::nBlockG];
    for (uint32_t value = 1; value <= 300; ++value) {
        const unsigned char* const end = texts->Put(value, out);
        ASSERT_EQ(end != nullptr, names[value - 1].size() <= EnumTexts::maxTextG - 2) << value;
        if (end == nullptr) continue;
        ASSERT_EQ(std::string(reinterpret_cast<char*>(out), static_cast<size_t>(end - out)),
                  "\"" + names[value - 1] + "\"");
    }
    for (const uint32_t value : {0u, 301u, 4000000000u}) EXPECT_EQ(texts->Put(value, out), nullptr);
    WriterPlans::DestroyAll();  // the names end here
}

TEST(EnumTexts, LongEnumerationsHaveNone) {
    const std::vector<const char*> names(EnumTexts::maxCountG + 1, "n");
    const EnumDef longest{EnumTexts::maxCountG, names.data()};
    const EnumDef longer{EnumTexts::maxCountG + 1, names.data()};
    EXPECT_NE(EnumTexts::Of(longest), nullptr);
    EXPECT_EQ(EnumTexts::Of(longer), nullptr);
    WriterPlans::DestroyAll();
}

}  // namespace

}  // namespace sorntest
