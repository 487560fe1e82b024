#include "sorn/model/Schema.h"

#include <gtest/gtest.h>

#include <set>
#include <string>
#include <vector>

#include "rox/RoxMempool.h"
#include "sorn/model/SornObject.h"
#include "sorn/model/StructInfoMap.h"

namespace sorn {
namespace {

TEST(Schema, Constants) {
    EXPECT_EQ(Schema::firstSchemaVersionG, 7);
    EXPECT_EQ(Schema::lastSchemaVersionG, 42);
    EXPECT_EQ(Schema::defaultSchemaVersionG, 42);
    EXPECT_EQ(Schema::nStructDefG, 5919U);
    EXPECT_EQ(Schema::nEnumDefG, 5801U);
    EXPECT_EQ(Schema::structNameHashTableSizeG, 661U);
}

template <class Def>
std::vector<uint32_t> IdsOf(const Def* const* table, uint32_t size) {
    std::vector<uint32_t> ids;
    for (uint32_t id = 0; id < size; ++id) {
        if (table[id] != nullptr) ids.push_back(id);
    }
    return ids;
}

TEST(Schema, IdsOfStructsAndEnumerations) {
    const std::vector<uint32_t> structs = IdsOf(Schema::vStructDefG, Schema::nStructDefG);
    ASSERT_EQ(structs.size(), 286U);
    EXPECT_EQ(structs.front(), 129U);
    EXPECT_EQ(structs.back(), 5918U);
    const std::vector<uint32_t> enums = IdsOf(Schema::vEnumDefG, Schema::nEnumDefG);
    ASSERT_EQ(enums.size(), 192U);
    EXPECT_EQ(enums.front(), 668U);
    EXPECT_EQ(enums.back(), 5800U);
    for (const uint32_t id : enums) {
        EXPECT_EQ(Schema::vStructDefG[id], nullptr) << id;
        EXPECT_EQ(Schema::FindStruct(id), nullptr) << id;
    }
    for (const uint32_t id : structs) EXPECT_EQ(Schema::FindEnum(id), nullptr) << id;
}

TEST(Schema, FindsOnlyWhatTheTablesHave) {
    ASSERT_NE(Schema::FindStruct(140), nullptr);
    EXPECT_STREQ(Schema::FindStruct(140)->name, "ad");
    EXPECT_NE(Schema::FindStruct(5918), nullptr);
    for (const uint32_t id : {0U, 1U, 128U, 5919U, 65535U, 4294967295U})
        EXPECT_EQ(Schema::FindStruct(id), nullptr) << id;
    EXPECT_NE(Schema::FindEnum(5800), nullptr);
    for (const uint32_t id : {0U, 1U, 140U, 667U, 5801U, 65535U, 4294967295U}) {
        EXPECT_EQ(Schema::FindEnum(id), nullptr) << id;
    }
}

TEST(EnumDef, NamesValues) {
    static const char* const names[] = {nullptr, "one", nullptr, "three"};
    const EnumDef def = {4, names};
    const struct {
        uint32_t value;
        const char* name;
    } cases[] = {{0, nullptr}, {1, "one"}, {2, nullptr}, {3, "three"}, {4, nullptr}, {4294967295, nullptr}};
    for (const auto& each : cases) EXPECT_STREQ(def.NameOf(each.value), each.name) << each.value;
}

/// The data types whose optional fields have no presence byte.
bool FReferenceType(DataType type) {
    return type == SORN_DATA_TYPE_BYTESTRING || type == SORN_DATA_TYPE_ANY_DICT ||
           type == SORN_DATA_TYPE_KNOWN_DICT || type == SORN_DATA_TYPE_KNOWN_DICT_AS_LAZY ||
           type == SORN_DATA_TYPE_OBJECT;
}

bool FRefersToStruct(DataType type) {
    return type == SORN_DATA_TYPE_OBJECT || type == SORN_DATA_TYPE_INT_ID || type == SORN_DATA_TYPE_LONG_ID ||
           type == SORN_DATA_TYPE_STRING_ID;
}

void ExpectSound(const FieldInfo& field) {
    EXPECT_LT(field.dataType, SORN_DATA_TYPE_NONE);
    EXPECT_LT(field.arity, SORN_ARITY_NONE);
    EXPECT_GE(field.firstVersion, Schema::firstSchemaVersionG);
    EXPECT_LE(field.lastVersion, Schema::lastSchemaVersionG);
    EXPECT_LE(field.firstVersion, field.lastVersion);
    EXPECT_EQ(field.presenceOffset != 0, field.arity == SORN_ARITY_OPTIONAL && !FReferenceType(field.Type()));
    EXPECT_GE(field.storageOffset, sizeof(SornObject) - 4) << "behind the header";
    if (field.Type() == SORN_DATA_TYPE_ENUM) {
        EXPECT_NE(Schema::FindEnum(field.typeRef), nullptr);
    } else if (field.Type() == SORN_DATA_TYPE_OBJECT ||
               (FRefersToStruct(field.Type()) && field.typeRef != 0)) {
        EXPECT_NE(Schema::FindStruct(field.typeRef), nullptr);
    } else {
        EXPECT_EQ(field.typeRef, 0);
    }
}

TEST(Schema, EverySlotIsSound) {
    int nHoles = 0;
    int nFields = 0;
    int nPrefixes = 0;
    for (const uint32_t id : IdsOf(Schema::vStructDefG, Schema::nStructDefG)) {
        const StructInfo& info = *Schema::vStructDefG[id];
        nPrefixes += info.idPrefix != nullptr ? 1 : 0;
        ASSERT_GE(info.nFields, 1) << info.name;
        EXPECT_TRUE(info.vFieldInfo[0].FHole()) << info.name;
        std::set<std::string> names;
        for (int slot = 0; slot < info.nFields; ++slot) {
            SCOPED_TRACE(std::string(info.name) + " slot " + std::to_string(slot));
            const FieldInfo& field = info.vFieldInfo[slot];
            if (field.FHole()) {
                ++nHoles;
                EXPECT_EQ(field.dataType, SORN_DATA_TYPE_NONE);
                EXPECT_EQ(field.firstVersion + field.lastVersion + field.presenceOffset, 0);
                EXPECT_EQ(field.storageOffset + field.typeRef + field.nameOffset, 0);
                continue;
            }
            ++nFields;
            ExpectSound(field);
            EXPECT_TRUE(names.insert(info.FieldName(field)).second) << info.FieldName(field);
        }
    }
    EXPECT_EQ(nHoles, 493);
    EXPECT_EQ(nFields, 2698);
    EXPECT_EQ(nPrefixes, 54);
}

TEST(FieldInfo, PacksTypeArityAndPresenceIntoOneWord) {
    const FieldInfo field = {7, 42, 0x15, 2, 0x1A5, 0x1234, 0x5678, 0x9ABC};
    const auto* const bytes = reinterpret_cast<const unsigned char*>(&field);
    EXPECT_EQ(bytes[0], 7);
    EXPECT_EQ(bytes[1], 42);
    const unsigned word = bytes[2] | static_cast<unsigned>(bytes[3]) << 8;
    EXPECT_EQ(word & 0x1F, 0x15U);
    EXPECT_EQ(word >> 5 & 3, 2U);
    EXPECT_EQ(word >> 7, 0x1A5U);
    EXPECT_EQ(field.Type(), SORN_DATA_TYPE_NONE);
}

class PresenceTest : public testing::Test {
 protected:
    /// The current record of a field of `ad`.
    static const FieldInfo& FieldOfAd(const std::string& name) {
        const StructInfo& info = *Schema::vStructDefG[140];
        for (int slot = 0; slot < info.nFields; ++slot) {
            const FieldInfo& field = info.vFieldInfo[slot];
            if (!field.FHole() && name == info.FieldName(field)) return field;
        }
        ADD_FAILURE() << name;
        return info.vFieldInfo[0];
    }

    RoxMempool poolM{"presence"};
    ref<SornObject> adM = Schema::vStructDefG[140]->Factory(&poolM);
};

TEST_F(PresenceTest, OfAValueIsItsByte) {
    const FieldInfo& field = FieldOfAd("description");
    EXPECT_FALSE(adM->FPresent(field));
    *static_cast<RoxString*>(adM->MemberAt(field)) = "text";
    EXPECT_FALSE(adM->FPresent(field)) << "the value alone does not make it present";
    adM->SetPresent(field);
    EXPECT_TRUE(adM->FPresent(field));
    EXPECT_FALSE(adM->FPresent(FieldOfAd("imageUrl")));
    EXPECT_FALSE(adM->FPresent(FieldOfAd("isActive")));
    *static_cast<RoxString*>(adM->MemberAt(field)) = RoxString();
    EXPECT_TRUE(adM->FPresent(field)) << "present and empty";
}

TEST_F(PresenceTest, OfAReferenceIsTheReference) {
    const FieldInfo& field = FieldOfAd("adInterestForAdId");
    ASSERT_EQ(field.presenceOffset, 0);
    EXPECT_FALSE(adM->FPresent(field));
    adM->SetPresent(field);
    EXPECT_FALSE(adM->FPresent(field));
    auto& member = *static_cast<ref<SornObject>*>(adM->MemberAt(field));
    member = Schema::FindStruct(field.typeRef)->Factory(&poolM);
    EXPECT_TRUE(adM->FPresent(field));
    member = nullptr;
    EXPECT_FALSE(adM->FPresent(field));
}

TEST_F(PresenceTest, MemberLiesAtItsOffset) {
    const FieldInfo& field = FieldOfAd("adBrandId");
    const SornObject& constant = *adM;
    EXPECT_EQ(static_cast<const char*>(constant.MemberAt(field)) - reinterpret_cast<const char*>(&constant),
              field.storageOffset);
    EXPECT_EQ(constant.MemberAt(field), adM->MemberAt(field));
}

}  // namespace
}  // namespace sorn
