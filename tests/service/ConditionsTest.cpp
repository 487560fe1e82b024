#include "service/Conditions.h"

#include <gtest/gtest.h>

#include <cstring>

#include "rox/RoxMempool.h"
#include "service/Query.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/model/Schema.h"
#include "sorn/typedjson/JsonSornObject.h"

namespace {

using sorn::Schema;
using sorn::service::Conditions;

/// The fields that a text has, but for its type.
class FieldsOfText final : public Conditions::Fields {
 public:
    FieldsOfText(const std::string& text, RoxMempool& pool) {
        RoxString words;
        dictionaryM = sorn::Dictionary::FromJson(RoxString(text.c_str()), words, &pool);
    }
    bool FWanted(const char* name) const override {
        return std::strcmp(name, "type") != 0 && dictionaryM->Find(name) != nullptr;
    }

 private:
    ref<sorn::Dictionary> dictionaryM;
};

class ConditionsTest : public testing::Test {
 protected:
    static std::string Whole(const char* type, const std::string& members) {
        return std::string("{\"type\":\"") + type + "\"" + (members.empty() ? "" : ",") + members + "}";
    }
    ref<sorn::SornObject> Object(const std::string& text) {
        ref<sorn::SornObject> object;
        RoxString words;
        EXPECT_TRUE(
            sorn::JsonSornObject(&pool).JsonToSornObject(reinterpret_cast<const unsigned char*>(text.data()),
                                                         static_cast<int>(text.size()), 0, &object, words))
            << text << words.Utf8();
        return object != nullptr ? object : Schema::FindStruct(5921)->Factory(&pool);
    }
    Conditions Make(const char* type, const std::string& query, const char* recordType) {
        const std::string text = Whole(type, query);
        Conditions conditions;
        const sorn::StructInfo& record = *Schema::vStructDefG[Object(Whole(recordType, ""))->structId];
        conditions.Add(*Object(text), 0, record, FieldsOfText(text, pool));
        return conditions;
    }
    bool FMatches(const std::string& query, const std::string& record) {
        return Make("everyType", query, "everyType").FMatches(*Object(Whole("everyType", record)), 0);
    }

    RoxMempool pool{"conditions"};
};

struct ValueRow {
    const char* name;  // of the fields, behind their arity
    const char* value;
    const char* other;
};

constexpr ValueRow vValueRowsG[] = {
    {"Bool", "true", "false"},
    {"Bytes", "\"AAEC\"", "\"AAED\""},
    {"Channel", "\"4-1\"", "\"4-2\""},
    {"Currency", "\"EUR.100\"", "\"USD.100\""},
    {"Date", "\"2026-11-20\"", "\"2026-11-21\""},
    {"DateTime", "\"2026-11-20 19:42:00\"", "\"2026-11-20 19:42:01\""},
    {"Enum", "\"red\"", "\"green\""},
    {"Float", "\"1.5\"", "\"1.25\""},
    {"IntId", "\"vuka:etc.7\"", "\"vuka:etc.8\""},
    {"LongId", "\"vuka:etc.70000000000\"", "\"vuka:etc.70000000001\""},
    {"S32", "-3", "3"},
    {"S64", "\"-30000000000\"", "\"30000000000\""},
    {"String", "\"a\"", "\"A\""},
    {"StringId", "\"vuka:etc.x\"", "\"vuka:etc.y\""},
    {"Time", "\"19:42:00\"", "\"19:42:01\""},
    {"U32", "3", "4"},
    {"U64", "\"3\"", "\"4\""},
    {"Object", R"({"type":"everyTypeCompanion","number":1})", R"({"type":"everyTypeCompanion","number":2})"},
    {"KnownDict", R"({"type":"everyTypeCompanion","label":"a"})",
     R"({"type":"everyTypePlain","plainId":"1"})"},
};

TEST_F(ConditionsTest, EveryTypeAndArity) {
    for (const ValueRow& row : vValueRowsG) {
        for (const char* arity : {"optional", "required", "multi"}) {
            if (std::strcmp(row.name, "Object") == 0 && std::strcmp(arity, "optional") == 0) continue;
            const std::string name = std::string("\"") + arity + row.name + "\":";
            const bool isMulti = std::strcmp(arity, "multi") == 0;
            const auto field = [&](const std::string& value) {
                return name + (isMulti ? "[" + value + "]" : value);
            };
            const std::string both = std::string(row.other) + "," + row.value;
            EXPECT_TRUE(FMatches(field(row.value), field(row.value))) << name;
            EXPECT_FALSE(FMatches(field(row.value), field(row.other))) << name;
            if (!isMulti) continue;
            EXPECT_TRUE(FMatches(field(row.value), field(both))) << name << "one of the record's";
            EXPECT_TRUE(FMatches(field(both), field(row.value))) << name << "one of the query's";
            EXPECT_FALSE(FMatches(field(row.value), "")) << name << "none";
            EXPECT_TRUE(Make("everyType", field(""), "everyType").FEmpty()) << name << "an empty list";
        }
    }
}

struct MatchRow {
    const char* query;
    const char* record;
    bool isMatch;
};

constexpr MatchRow vMatchRowsG[] = {
    {"", "", true},
    {"", R"("optionalS32":1)", true},
    {R"("optionalS32":0)", "", false},  // not set is not 0
    {R"("optionalS32":0)", R"("optionalS32":0)", true},
    {R"("optionalString":"")", R"("optionalString":"")", true},
    {R"("optionalString":"")", "", false},
    {R"("optionalFloat":"-0")", R"("optionalFloat":"0")", true},
    // All fields, one value of each.
    {R"("optionalS32":1,"optionalString":"a")", R"("optionalS32":1,"optionalString":"a")", true},
    {R"("optionalS32":1,"optionalString":"a")", R"("optionalS32":1,"optionalString":"b")", false},
    {R"("multiS32":[5,6,7])", R"("multiS32":[1,7])", true},
    {R"("multiS32":[5,6,7])", R"("multiS32":[1,8])", false},
    {R"("multiString":["b","a"])", R"("multiString":["c","a"])", true},
    // Not compared.
    {R"("optionalAnyDict":{"a":"1"})", "", true},
    {R"("optionalLazy":{"type":"everyTypePlain"})", "", true},
    // Objects agree when they have what is given; what lies deeper does not count.
    {R"("requiredObject":{"type":"everyTypeCompanion","number":1})",
     R"("requiredObject":{"type":"everyTypeCompanion","number":1,"label":"x"})", true},
    {R"("requiredObject":{"type":"everyTypeCompanion","number":1,"label":"y"})",
     R"("requiredObject":{"type":"everyTypeCompanion","number":1,"label":"x"})", false},
    {R"("requiredObject":{"type":"everyTypeCompanion"})",
     R"("requiredObject":{"type":"everyTypeCompanion","number":1})", true},
    {R"("requiredObject":{"type":"everyTypeCompanion"})", "", false},
    {R"("requiredObject":{"type":"everyTypeCompanion","child":{"type":"everyTypeCompanion","number":3}})",
     R"("requiredObject":{"type":"everyTypeCompanion","child":{"type":"everyTypeCompanion","number":4}})",
     true},
};

TEST_F(ConditionsTest, Matches) {
    for (const MatchRow& row : vMatchRowsG) {
        EXPECT_EQ(FMatches(row.query, row.record), row.isMatch) << row.query << " : " << row.record;
    }
}

TEST_F(ConditionsTest, SharedFieldsOfASearchAndItsRecord) {
    struct Row {
        const char* query;
        const char* record;
        bool isMatch;
    };
    for (const Row& row : {
             // Several states against the one of the record.
             Row{R"("state":["inProgress","complete"])", R"("state":"complete")", true},
             Row{R"("state":["inProgress","complete"])", R"("state":"scheduled")", false},
             Row{R"("recordingId":"vuka:rc.5")", R"("recordingId":"vuka:rc.5")", true},
             Row{R"("recordingId":"vuka:rc.5")", R"("recordingId":"vuka:rc.6")", false},
             Row{R"("offerId":["vuka:of.a","vuka:of.b"])", R"("offerId":"vuka:of.b")", true},
             Row{R"("channel":{"type":"channel","channelId":"vuka:ch.21"})",
                 R"("channel":{"type":"channel","channelId":"vuka:ch.21","callSign":"NLTV"})", true},
             // Fields that the record does not have.
             Row{R"("keyword":"x","isSuggested":true)", "", true},
         }) {
        const Conditions conditions = Make("recordingSearch", row.query, "recording");
        EXPECT_EQ(conditions.FMatches(*Object(Whole("recording", row.record)), 0), row.isMatch) << row.query;
    }
    EXPECT_TRUE(Make("recordingSearch", R"("keyword":"x")", "recording").FEmpty());
    // A name that both have with different types: an id of one, a text of the other.
    EXPECT_TRUE(Make("everyTypeCompanion", R"("label":"a")", "recording").FEmpty());
}

TEST_F(ConditionsTest, Identity) {
    const auto identity = [this](const std::string& query) {
        std::string text;
        Make("everyType", query, "everyType").AppendIdentity(text);
        return text;
    };
    EXPECT_EQ(identity(R"("multiS32":[2,1,2],"optionalBool":true)"),
              identity(R"("optionalBool":true,"multiS32":[1,2])"));
    const char* const different[] = {"",
                                     R"("optionalS32":1)",
                                     R"("optionalS32":2)",
                                     R"("requiredS32":1)",
                                     R"("multiS32":[1,2])",
                                     R"("multiString":["a","b"])",
                                     R"("multiString":["ab"])",
                                     R"("optionalString":"")",
                                     R"("requiredObject":{"type":"everyTypeCompanion"})",
                                     R"("requiredObject":{"type":"everyTypeCompanion","number":1})",
                                     R"("requiredKnownDict":{"type":"everyTypePlain","plainId":"1"})"};
    for (const char* one : different) {
        for (const char* other : different) {
            EXPECT_EQ(identity(one) == identity(other), one == other) << one << " : " << other;
        }
    }
}

TEST_F(ConditionsTest, Limits) {
    sorn::service::Limits limits;
    limits.maxQueryBytes = 1000;
    limits.maxQueryObjects = 2;
    sorn::service::Failure failure;
    // Eight bytes for the count of conditions; for each condition slot and count; for each value a number, a
    // length, its text and a count of objects.
    const auto text = [](size_t n) { return "\"optionalString\":\"" + std::string(n, 'x') + "\""; };
    const size_t overhead = 8 + 8 + 8 + 8 + 8 + 8;
    EXPECT_TRUE(FWithinLimits(Make("everyType", text(1000 - overhead), "everyType"), limits, failure));
    EXPECT_FALSE(FWithinLimits(Make("everyType", text(1001 - overhead), "everyType"), limits, failure));
    EXPECT_EQ(failure.code, sorn::service::ErrorCode::resourceUnavailableG);
    const std::string object = R"({"type":"everyTypeCompanion"})";
    const std::string two = R"("multiObject":[)" + object + "," + object;
    EXPECT_TRUE(FWithinLimits(Make("everyType", two + "]", "everyType"), limits, failure));
    EXPECT_FALSE(FWithinLimits(Make("everyType", two + "," + object + "]", "everyType"), limits, failure));
}

}  // namespace
