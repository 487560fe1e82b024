#include <gtest/gtest.h>

#include <cstring>
#include <map>
#include <string>
#include <vector>

#include "rox/RoxGenericArray.h"
#include "rox/RoxGenericIntArray.h"
#include "rox/RoxStringArray.h"
#include "sorn/model/ChannelNumber.h"
#include "sorn/model/Currency.h"
#include "sorn/model/Date.h"
#include "sorn/model/DateTime.h"
#include "sorn/model/Schema.h"
#include "sorn/model/Time.h"
#include "sornschema/Ad.h"
#include "sornschema/RecordingSearch.h"

using sorn::FieldInfo;
using sorn::Schema;
using sorn::StructInfo;

namespace {

constexpr bool fTargetG = sizeof(void*) == 4;

// Bytes before the presence bytes: virtual table, pool, count, structId.
constexpr unsigned headerBytesG = fTargetG ? 16 : 24;

struct Extent {
    unsigned size, align;
};

template <class T>
constexpr Extent ExtentOf() {
    return {sizeof(T), alignof(T)};
}

// What a member takes. On the target the numbers are those of the layout rules; elsewhere the host's.
Extent MemberExtent(const FieldInfo& field) {
    if (field.arity == sorn::SORN_ARITY_MULTI) {
        if (fTargetG) return {16, 4};
        switch (field.dataType) {
            case sorn::SORN_DATA_TYPE_BYTESTRING:
            case sorn::SORN_DATA_TYPE_ANY_DICT:
            case sorn::SORN_DATA_TYPE_KNOWN_DICT:
            case sorn::SORN_DATA_TYPE_KNOWN_DICT_AS_LAZY:
            case sorn::SORN_DATA_TYPE_OBJECT:
                return ExtentOf<RoxGenericArray>();
            case sorn::SORN_DATA_TYPE_STRING:
            case sorn::SORN_DATA_TYPE_STRING_ID:
                return ExtentOf<RoxStringArray>();
            default:
                return ExtentOf<RoxGenericIntArray>();
        }
    }
    switch (field.dataType) {
        case sorn::SORN_DATA_TYPE_BOOL:
            return {1, 1};
        case sorn::SORN_DATA_TYPE_CHANNEL:
        case sorn::SORN_DATA_TYPE_CURRENCY:
            return {8, 4};
        case sorn::SORN_DATA_TYPE_DATE:
        case sorn::SORN_DATA_TYPE_ENUM:
        case sorn::SORN_DATA_TYPE_INT_ID:
        case sorn::SORN_DATA_TYPE_S32:
        case sorn::SORN_DATA_TYPE_TIME:
        case sorn::SORN_DATA_TYPE_U32:
            return {4, 4};
        case sorn::SORN_DATA_TYPE_DATETIME:
        case sorn::SORN_DATA_TYPE_FLOAT:
        case sorn::SORN_DATA_TYPE_LONG_ID:
        case sorn::SORN_DATA_TYPE_S64:
        case sorn::SORN_DATA_TYPE_U64:
            return {8, 8};
        default:
            return {sizeof(void*), alignof(void*)};  // strings and references are one word
    }
}

bool FReferenceType(unsigned dataType) {
    return dataType == sorn::SORN_DATA_TYPE_BYTESTRING || dataType == sorn::SORN_DATA_TYPE_ANY_DICT ||
           dataType == sorn::SORN_DATA_TYPE_KNOWN_DICT ||
           dataType == sorn::SORN_DATA_TYPE_KNOWN_DICT_AS_LAZY || dataType == sorn::SORN_DATA_TYPE_OBJECT;
}

// The forms of a struct's fields in member order: by name, older variants before the current one.
std::vector<const FieldInfo*> InMemberOrder(const StructInfo& info) {
    std::map<std::string, int> slotOf;
    for (int slot = 0; slot < info.nFields; ++slot) {
        if (!info.vFieldInfo[slot].FHole()) slotOf[info.FieldName(info.vFieldInfo[slot])] = slot;
    }
    std::vector<const FieldInfo*> forms;
    for (const auto& [name, slot] : slotOf) {
        const sorn::FieldInfoHistory& history = info.vFieldInfoHistory[slot];
        for (unsigned i = 0; i < history.nVariants; ++i) forms.push_back(&history.vVariants[i]);
        forms.push_back(&info.vFieldInfo[slot]);
    }
    return forms;
}

void CheckLayout(const StructInfo& info) {
    const std::vector<const FieldInfo*> forms = InMemberOrder(info);
    unsigned offset = headerBytesG;
    for (const FieldInfo* form : forms) {
        const bool fPresenceByte =
            form->arity == sorn::SORN_ARITY_OPTIONAL && !FReferenceType(form->dataType);
        EXPECT_EQ(form->presenceOffset, fPresenceByte ? offset : 0)
            << info.name << '.' << info.FieldName(*form);
        if (fPresenceByte) ++offset;
    }
    for (const FieldInfo* form : forms) {
        const Extent extent = MemberExtent(*form);
        offset = (offset + extent.align - 1) / extent.align * extent.align;
        EXPECT_EQ(form->storageOffset, offset) << info.name << '.' << info.FieldName(*form);
        offset += extent.size;
    }
}

TEST(LayoutTest, EveryClassFollowsTheRules) {
    for (uint32_t id = 0; id < Schema::nStructDefG; ++id) {
        if (Schema::vStructDefG[id] != nullptr) CheckLayout(*Schema::vStructDefG[id]);
    }
}

TEST(LayoutTest, NamesLieInSlotOrderWithoutGaps) {
    for (uint32_t id = 0; id < Schema::nStructDefG; ++id) {
        const StructInfo* info = Schema::vStructDefG[id];
        if (info == nullptr) continue;
        size_t expected = 0;
        for (int slot = 0; slot < info->nFields; ++slot) {
            const FieldInfo& field = info->vFieldInfo[slot];
            if (field.FHole()) continue;
            EXPECT_EQ(field.nameOffset, expected) << info->name << ' ' << slot;
            expected += std::strlen(info->FieldName(field)) + 1;
        }
    }
}

TEST(LayoutTest, ScalarsHaveTheSizesOfTheTable) {
    EXPECT_EQ(sizeof(sorn::ChannelNumber), 8u);
    EXPECT_EQ(alignof(sorn::ChannelNumber), 4u);
    EXPECT_EQ(sizeof(sorn::Currency), 8u);
    EXPECT_EQ(alignof(sorn::Currency), 4u);
    EXPECT_EQ(sizeof(sorn::Date), 4u);
    EXPECT_EQ(sizeof(sorn::Time), 4u);
    EXPECT_EQ(sizeof(sorn::DateTime), 8u);
    EXPECT_EQ(alignof(sorn::DateTime), 8u);
    EXPECT_EQ(sizeof(sorn::SornObject), headerBytesG);
}

// The record that shows every rule. `presence` counts the presence bytes from the first one; -1 is none.
const struct AdRow {
    const char* name;
    int slot;
    sorn::DataType type;
    sorn::Arity arity;
    int presence;
    unsigned typeRef;
    unsigned storageOnTarget;
} vAdG[] = {
    {"adBrandId", 1, sorn::SORN_DATA_TYPE_INT_ID, sorn::SORN_ARITY_REQUIRED, -1, 146, 24},
    {"adGroupMapForAdId", 2, sorn::SORN_DATA_TYPE_OBJECT, sorn::SORN_ARITY_MULTI, -1, 164, 28},
    {"adId", 3, sorn::SORN_DATA_TYPE_INT_ID, sorn::SORN_ARITY_REQUIRED, -1, 140, 44},
    {"adInterestForAdId", 4, sorn::SORN_DATA_TYPE_OBJECT, sorn::SORN_ARITY_OPTIONAL, -1, 169, 48},
    {"description", 5, sorn::SORN_DATA_TYPE_STRING, sorn::SORN_ARITY_OPTIONAL, 0, 0, 52},
    {"image", 14, sorn::SORN_DATA_TYPE_OBJECT, sorn::SORN_ARITY_MULTI, -1, 968, 56},
    {"imageUrl", 6, sorn::SORN_DATA_TYPE_STRING, sorn::SORN_ARITY_OPTIONAL, 1, 0, 72},
    {"isActive", 7, sorn::SORN_DATA_TYPE_BOOL, sorn::SORN_ARITY_OPTIONAL, 2, 0, 76},
    {"levelOfDetail", 8, sorn::SORN_DATA_TYPE_ENUM, sorn::SORN_ARITY_OPTIONAL, 3, 714, 80},
    {"maxStartTime", 9, sorn::SORN_DATA_TYPE_DATETIME, sorn::SORN_ARITY_OPTIONAL, 4, 0, 88},
    {"minEndTime", 10, sorn::SORN_DATA_TYPE_DATETIME, sorn::SORN_ARITY_OPTIONAL, 5, 0, 96},
    {"offerId", 11, sorn::SORN_DATA_TYPE_STRING_ID, sorn::SORN_ARITY_REQUIRED, -1, 423, 104},
    {"shortDescription", 12, sorn::SORN_DATA_TYPE_STRING, sorn::SORN_ARITY_REQUIRED, -1, 0, 108},
    {"title", 13, sorn::SORN_DATA_TYPE_STRING, sorn::SORN_ARITY_REQUIRED, -1, 0, 112},
};

TEST(LayoutTest, AdInFull) {
    const StructInfo& info = sornschema::Ad::structInfoG;
    EXPECT_EQ(Schema::vStructDefG[140], &info);
    EXPECT_STREQ(info.name, "ad");
    EXPECT_STREQ(info.idPrefix, "vuka:ad.");
    EXPECT_EQ(info.nFields, 15);
    EXPECT_EQ(info.vFieldInfo, sornschema::Ad::vFieldInfoG);
    EXPECT_EQ(info.vFieldInfoHistory, sornschema::Ad::vFieldInfoHistoryG);
    EXPECT_EQ(info.pFieldNames, sornschema::Ad::pFieldNamesG);
    EXPECT_EQ(info.Factory, &sornschema::Ad::Factory);
    EXPECT_TRUE(info.vFieldInfo[0].FHole());
    ASSERT_EQ(sizeof(sornschema::Ad::vFieldInfoG) / sizeof(FieldInfo), 15u);
    ASSERT_EQ(sizeof(vAdG) / sizeof(vAdG[0]), 14u);
    for (const AdRow& row : vAdG) {
        const FieldInfo& field = info.vFieldInfo[row.slot];
        EXPECT_STREQ(info.FieldName(field), row.name);
        EXPECT_EQ(field.dataType, row.type) << row.name;
        EXPECT_EQ(field.arity, row.arity) << row.name;
        EXPECT_EQ(field.typeRef, row.typeRef) << row.name;
        EXPECT_EQ(field.firstVersion, 7) << row.name;
        EXPECT_EQ(field.lastVersion, std::strcmp(row.name, "imageUrl") == 0 ? 7 : 42) << row.name;
        const unsigned presence = row.presence < 0 ? 0 : headerBytesG + static_cast<unsigned>(row.presence);
        EXPECT_EQ(field.presenceOffset, presence) << row.name;
        if (fTargetG) {
            EXPECT_EQ(field.storageOffset, row.storageOnTarget) << row.name;
        }
    }
    if (fTargetG) {
        EXPECT_EQ(sizeof(sornschema::Ad), 120u);
    }
}

TEST(LayoutTest, FieldInfoPacksItsWord) {
    // dataType in bits 0 to 4, arity in 5 and 6, presenceOffset from 7 on.
    const FieldInfo field = {1,      2,     sorn::SORN_DATA_TYPE_STRING, sorn::SORN_ARITY_MULTI, 509, 0x1234,
                             0x5678, 0x9abc};
    const unsigned word = 17u | 2u << 5 | 509u << 7;
    const unsigned char vExpected[] = {1, 2, word & 0xff, word >> 8, 0x34, 0x12, 0x78, 0x56, 0xbc, 0x9a};
    static_assert(sizeof(vExpected) == sizeof(field));
    EXPECT_EQ(std::memcmp(&field, vExpected, sizeof(field)), 0);
}

TEST(LayoutTest, MemberOfAKeywordNameKeepsItsFieldName) {
    const StructInfo& info = sornschema::RecordingSearch::structInfoG;
    EXPECT_STREQ(info.FieldName(info.vFieldInfo[37]), "namespace");
    ref<sorn::SornObject> object = info.Factory(nullptr);
    auto* search = static_cast<sornschema::RecordingSearch*>(object.get());
    search->namespace_ = 1;
    search->namespace_isSet = 1;
    EXPECT_EQ(*static_cast<uint32_t*>(object->MemberAt(info.vFieldInfo[37])), 1u);
    EXPECT_EQ(*(reinterpret_cast<unsigned char*>(object.get()) + info.vFieldInfo[37].presenceOffset), 1);
}

}  // namespace
