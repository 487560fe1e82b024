#include <gtest/gtest.h>

#include <string>

#include "sorn/model/Schema.h"
#include "sorn/model/StructInfo.h"
#include "sorn/model/StructInfoMap.h"

namespace sorn {
namespace {

FieldInfo Field(uint8_t firstVersion, uint8_t lastVersion) {
    return {firstVersion, lastVersion, SORN_DATA_TYPE_S32, SORN_ARITY_OPTIONAL, 0, 0, 0, 0};
}

const FieldInfo hole = {0, 0, SORN_DATA_TYPE_NONE, SORN_ARITY_NONE, 0, 0, 0, 0};
const FieldInfo fields[] = {hole,          Field(7, 42), Field(10, 20), Field(22, 42),
                            Field(30, 42), hole,         Field(7, 42)};
const FieldInfo variantsOf3[] = {Field(7, 21)};
const FieldInfo variantsOf4[] = {Field(20, 25), Field(7, 22)};  // 20 to 22 are in both; 26 to 29 in none
const FieldInfo variantsOf5[] = {Field(7, 42)};
const FieldInfo variantsOf6[] = {Field(9, 9)};  // inside the current record's range
const FieldInfoHistory history[] = {{0, nullptr},     {0, nullptr},     {0, nullptr},    {1, variantsOf3},
                                    {2, variantsOf4}, {1, variantsOf5}, {1, variantsOf6}};

StructInfo MakeStruct() {
    return {"made", nullptr, 7, fields, history, "", nullptr};
}

TEST(SelectFieldVariant, TakesTheFirstRecordThatHolds) {
    const StructInfo made = MakeStruct();
    const struct {
        int slot;
        int version;
        const FieldInfo* expected;
    } cases[] = {
        // A hole, whatever the version and its history.
        {0, 0, nullptr},
        {0, 7, nullptr},
        {5, 0, nullptr},
        {5, 7, nullptr},
        // Without a version the current record, untested.
        {1, 0, &fields[1]},
        {2, 0, &fields[2]},
        {3, 0, &fields[3]},
        {4, 0, &fields[4]},
        // A field of all versions, and what lies outside.
        {1, 7, &fields[1]},
        {1, 42, &fields[1]},
        {1, 6, nullptr},
        {1, 43, nullptr},
        {1, -1, nullptr},
        {1, 263, nullptr},  // 7 in the low byte
        // A field of some versions.
        {2, 9, nullptr},
        {2, 10, &fields[2]},
        {2, 20, &fields[2]},
        {2, 21, nullptr},
        // One older variant.
        {3, 7, &variantsOf3[0]},
        {3, 21, &variantsOf3[0]},
        {3, 22, &fields[3]},
        {3, 42, &fields[3]},
        // Two: the first that holds, and none in the gap.
        {4, 19, &variantsOf4[1]},
        {4, 20, &variantsOf4[0]},
        {4, 22, &variantsOf4[0]},
        {4, 25, &variantsOf4[0]},
        {4, 26, nullptr},
        {4, 29, nullptr},
        {4, 30, &fields[4]},
        // A variant goes before the current record.
        {6, 8, &fields[6]},
        {6, 9, &variantsOf6[0]},
        {6, 10, &fields[6]},
    };
    for (const auto& each : cases) {
        EXPECT_EQ(made.SelectFieldVariant(each.slot, each.version), each.expected)
            << "slot " << each.slot << ", version " << each.version;
    }
}

struct VariantCase {
    const char* structName;
    int slot;
    const char* fieldName;
    int version;
    bool fOlder;
    Arity arity;
    DataType type;
};

TEST(SelectFieldVariant, FindsTheOlderFormsOfTheSchema) {
    const VariantCase cases[] = {
        {"audioStream", 1, "audioStreamFormat", 7, true, SORN_ARITY_REQUIRED, SORN_DATA_TYPE_ENUM},
        {"audioStream", 1, "audioStreamFormat", 21, true, SORN_ARITY_REQUIRED, SORN_DATA_TYPE_ENUM},
        {"audioStream", 1, "audioStreamFormat", 22, false, SORN_ARITY_OPTIONAL, SORN_DATA_TYPE_ENUM},
        {"audioStream", 1, "audioStreamFormat", 42, false, SORN_ARITY_OPTIONAL, SORN_DATA_TYPE_ENUM},
        {"audioStream", 1, "audioStreamFormat", 0, false, SORN_ARITY_OPTIONAL, SORN_DATA_TYPE_ENUM},
        {"audioStream", 2, "audioStreamId", 21, true, SORN_ARITY_REQUIRED, SORN_DATA_TYPE_INT_ID},
        {"audioStream", 2, "audioStreamId", 22, false, SORN_ARITY_OPTIONAL, SORN_DATA_TYPE_INT_ID},
        {"localApplicationDataRemove", 2, "key", 25, true, SORN_ARITY_MULTI, SORN_DATA_TYPE_STRING},
        {"localApplicationDataRemove", 2, "key", 26, false, SORN_ARITY_MULTI, SORN_DATA_TYPE_STRING},
        {"viewStartEvent", 14, "timestampMilliseconds", 11, true, SORN_ARITY_OPTIONAL, SORN_DATA_TYPE_S64},
        {"viewStartEvent", 14, "timestampMilliseconds", 12, false, SORN_ARITY_REQUIRED, SORN_DATA_TYPE_S64},
        {"viewStopEvent", 13, "timestampMilliseconds", 11, true, SORN_ARITY_OPTIONAL, SORN_DATA_TYPE_S64},
        {"viewStopEvent", 13, "timestampMilliseconds", 12, false, SORN_ARITY_REQUIRED, SORN_DATA_TYPE_S64},
    };
    for (const VariantCase& each : cases) {
        SCOPED_TRACE(std::string(each.structName) + "." + each.fieldName + " at " +
                     std::to_string(each.version));
        const StructInfo* const info = StructInfoMap::LookupStructByName(each.structName);
        ASSERT_NE(info, nullptr);
        const FieldInfo& current = info->vFieldInfo[each.slot];
        const FieldInfo* const field = info->SelectFieldVariant(each.slot, each.version);
        ASSERT_NE(field, nullptr);
        EXPECT_EQ(field != &current, each.fOlder);
        EXPECT_EQ(field->arity, each.arity);
        EXPECT_EQ(field->Type(), each.type);
        EXPECT_STREQ(info->FieldName(*field), each.fieldName);
        const FieldInfoHistory& slotHistory = info->vFieldInfoHistory[each.slot];
        ASSERT_EQ(slotHistory.nVariants, 1);
        EXPECT_NE(slotHistory.vVariants[0].storageOffset, current.storageOffset) << "a member of its own";
        EXPECT_EQ(slotHistory.vVariants[0].presenceOffset != 0,
                  slotHistory.vVariants[0].arity == SORN_ARITY_OPTIONAL);
    }
}

TEST(SelectFieldVariant, FieldOfOldVersionsOnly) {
    const StructInfo* const info = StructInfoMap::LookupStructByName("viewStopEvent");
    ASSERT_NE(info, nullptr);
    int slot = 0;
    while (slot < info->nFields && (info->vFieldInfo[slot].FHole() ||
                                    std::string("airTime") != info->FieldName(info->vFieldInfo[slot]))) {
        ++slot;
    }
    ASSERT_LT(slot, info->nFields);
    EXPECT_EQ(info->SelectFieldVariant(slot, 11), &info->vFieldInfo[slot]);
    EXPECT_EQ(info->SelectFieldVariant(slot, 12), nullptr);
    EXPECT_EQ(info->SelectFieldVariant(slot, 0), &info->vFieldInfo[slot]);
}

TEST(SelectFieldVariant, OnlyFiveFieldsHaveOlderForms) {
    int nVariants = 0;
    for (uint32_t id = 0; id < Schema::nStructDefG; ++id) {
        const StructInfo* const info = Schema::vStructDefG[id];
        if (info == nullptr) continue;
        for (int slot = 0; slot < info->nFields; ++slot) {
            const FieldInfoHistory& slotHistory = info->vFieldInfoHistory[slot];
            nVariants += slotHistory.nVariants;
            EXPECT_EQ(slotHistory.vVariants == nullptr, slotHistory.nVariants == 0)
                << info->name << " slot " << slot;
        }
    }
    EXPECT_EQ(nVariants, 5);
}

}  // namespace
}  // namespace sorn
