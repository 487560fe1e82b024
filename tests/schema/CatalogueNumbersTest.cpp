#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <map>
#include <set>
#include <string>
#include <tuple>
#include <vector>

#include "sorn/model/Schema.h"
#include "sorn/model/StructInfoMap.h"

using sorn::EnumDef;
using sorn::FieldInfo;
using sorn::Schema;
using sorn::StructInfo;
using sorn::StructInfoMap;

namespace {

std::map<uint32_t, const StructInfo*> AllStructs() {
    std::map<uint32_t, const StructInfo*> all;
    for (uint32_t id = 0; id < Schema::nStructDefG; ++id) {
        if (Schema::vStructDefG[id] != nullptr) all[id] = Schema::vStructDefG[id];
    }
    return all;
}

std::map<uint32_t, const EnumDef*> AllEnums() {
    std::map<uint32_t, const EnumDef*> all;
    for (uint32_t id = 0; id < Schema::nEnumDefG; ++id) {
        if (Schema::vEnumDefG[id] != nullptr) all[id] = Schema::vEnumDefG[id];
    }
    return all;
}

unsigned CountNames(const EnumDef& def) {
    return static_cast<unsigned>(
        std::count_if(def.names, def.names + def.count, [](const char* name) { return name != nullptr; }));
}

uint32_t HomeEntry(const char* name) {
    uint32_t hash = 0;
    for (; *name != '\0'; ++name) hash = hash * 31 + static_cast<unsigned char>(*name);
    return hash % Schema::structNameHashTableSizeG;
}

const EnumDef& ObjectTypes() {
    return *Schema::vEnumDefG[1361];
}

TEST(CatalogueNumbersTest, Constants) {
    EXPECT_EQ(Schema::firstSchemaVersionG, 7);
    EXPECT_EQ(Schema::lastSchemaVersionG, 42);
    EXPECT_EQ(Schema::defaultSchemaVersionG, 42);
    EXPECT_EQ(Schema::nStructDefG, 5919u);
    EXPECT_EQ(Schema::nEnumDefG, 5801u);
    EXPECT_EQ(Schema::structNameHashTableSizeG, 661u);
}

TEST(CatalogueNumbersTest, Ids) {
    const auto structs = AllStructs();
    const auto enums = AllEnums();
    EXPECT_EQ(structs.size(), 286u);
    EXPECT_EQ(enums.size(), 192u);
    EXPECT_EQ(structs.begin()->first, 129u);
    EXPECT_EQ(structs.rbegin()->first, 5918u);
    EXPECT_EQ(enums.begin()->first, 668u);
    EXPECT_EQ(enums.rbegin()->first, 5800u);
    for (const auto& [id, def] : enums) EXPECT_EQ(structs.count(id), 0u) << id;
}

TEST(CatalogueNumbersTest, Fields) {
    std::map<unsigned, unsigned> arities, dataTypes;
    unsigned nSlots = 0;
    for (const auto& [id, info] : AllStructs()) {
        ASSERT_GE(info->nFields, 1);
        EXPECT_TRUE(info->vFieldInfo[0].FHole()) << info->name;
        for (int slot = 0; slot < info->nFields; ++slot) {
            ++nSlots;
            ++arities[info->vFieldInfo[slot].arity];
            ++dataTypes[info->vFieldInfo[slot].dataType];
        }
    }
    EXPECT_EQ(arities[sorn::SORN_ARITY_OPTIONAL], 1885u);
    EXPECT_EQ(arities[sorn::SORN_ARITY_REQUIRED], 397u);
    EXPECT_EQ(arities[sorn::SORN_ARITY_MULTI], 416u);
    EXPECT_EQ(arities[sorn::SORN_ARITY_NONE], 493u);
    EXPECT_EQ(nSlots, 2698u + 493u);
    EXPECT_EQ(dataTypes[sorn::SORN_DATA_TYPE_NONE], 493u);
    for (unsigned type : {1u, 18u, 19u, 20u}) EXPECT_EQ(dataTypes[type], 0u) << type;
    EXPECT_EQ(dataTypes[sorn::SORN_DATA_TYPE_KNOWN_DICT_AS_LAZY], 3u);
}

TEST(CatalogueNumbersTest, HolesAreAllZeroButForTypeAndArity) {
    for (const auto& [id, info] : AllStructs()) {
        for (int slot = 0; slot < info->nFields; ++slot) {
            const FieldInfo& field = info->vFieldInfo[slot];
            if (!field.FHole()) continue;
            EXPECT_EQ(field.dataType, 21u);
            EXPECT_EQ(field.firstVersion + field.lastVersion + field.presenceOffset + field.storageOffset +
                          field.typeRef + field.nameOffset,
                      0)
                << info->name << ' ' << slot;
            EXPECT_EQ(info->vFieldInfoHistory[slot].nVariants, 0u);
        }
    }
}

TEST(CatalogueNumbersTest, VersionsLieInTheBounds) {
    for (const auto& [id, info] : AllStructs()) {
        for (int slot = 0; slot < info->nFields; ++slot) {
            const FieldInfo& field = info->vFieldInfo[slot];
            if (field.FHole()) continue;
            EXPECT_LE(7, field.firstVersion) << info->name << ' ' << slot;
            EXPECT_LE(field.firstVersion, field.lastVersion) << info->name << ' ' << slot;
            EXPECT_LE(field.lastVersion, 42) << info->name << ' ' << slot;
        }
    }
}

TEST(CatalogueNumbersTest, ReferencesNameTheRightKind) {
    for (const auto& [id, info] : AllStructs()) {
        for (int slot = 0; slot < info->nFields; ++slot) {
            const FieldInfo& field = info->vFieldInfo[slot];
            switch (field.dataType) {
                case sorn::SORN_DATA_TYPE_ENUM:
                    EXPECT_NE(Schema::FindEnum(field.typeRef), nullptr) << info->name << ' ' << slot;
                    break;
                case sorn::SORN_DATA_TYPE_INT_ID:
                case sorn::SORN_DATA_TYPE_LONG_ID:
                case sorn::SORN_DATA_TYPE_STRING_ID:
                    ASSERT_NE(Schema::FindStruct(field.typeRef), nullptr) << info->name << ' ' << slot;
                    EXPECT_NE(Schema::FindStruct(field.typeRef)->idPrefix, nullptr)
                        << info->name << ' ' << slot;
                    break;
                case sorn::SORN_DATA_TYPE_OBJECT:
                    EXPECT_NE(Schema::FindStruct(field.typeRef), nullptr) << info->name << ' ' << slot;
                    break;
                default:
                    EXPECT_EQ(field.typeRef, 0u) << info->name << ' ' << slot;
            }
        }
    }
}

TEST(CatalogueNumbersTest, Prefixes) {
    std::set<std::string> prefixes;
    unsigned nPrefixed = 0;
    for (const auto& [id, info] : AllStructs()) {
        if (info->idPrefix == nullptr) continue;
        ++nPrefixed;
        prefixes.insert(info->idPrefix);
        const size_t length = std::strlen(info->idPrefix);
        EXPECT_EQ(std::strncmp(info->idPrefix, "vuka:", 5), 0) << info->name;
        EXPECT_TRUE(length >= 8 && length <= 10) << info->name;
        EXPECT_EQ(info->idPrefix[length - 1], '.') << info->name;
    }
    EXPECT_EQ(nPrefixed, 54u);
    EXPECT_EQ(prefixes.size(), 54u);
}

TEST(CatalogueNumbersTest, DistinctNames) {
    std::set<std::string> names;
    for (const auto& [id, info] : AllStructs()) {
        names.insert(info->name);
        std::set<std::string> own;
        for (int slot = 0; slot < info->nFields; ++slot) {
            if (info->vFieldInfo[slot].FHole()) continue;
            const char* name = info->FieldName(info->vFieldInfo[slot]);
            names.insert(name);
            EXPECT_TRUE(own.insert(name).second) << info->name << '.' << name;
        }
    }
    EXPECT_EQ(names.size(), 1644u);
}

TEST(CatalogueNumbersTest, OlderVariants) {
    // Struct, slot, field; current: versions, arity, type; older: versions, arity, type.
    using Row = std::tuple<std::string, int, std::string, int, int, int, int, int, int, int, int>;
    std::vector<Row> rows;
    for (const auto& [id, info] : AllStructs()) {
        for (int slot = 0; slot < info->nFields; ++slot) {
            const sorn::FieldInfoHistory& history = info->vFieldInfoHistory[slot];
            if (history.nVariants == 0) {
                EXPECT_EQ(history.vVariants, nullptr) << info->name << ' ' << slot;
                continue;
            }
            ASSERT_EQ(history.nVariants, 1u);
            const FieldInfo& now = info->vFieldInfo[slot];
            const FieldInfo& older = history.vVariants[0];
            EXPECT_EQ(now.typeRef, older.typeRef);
            EXPECT_EQ(now.nameOffset, older.nameOffset);
            EXPECT_NE(now.storageOffset, older.storageOffset);
            rows.emplace_back(info->name, slot, info->FieldName(now), now.firstVersion, now.lastVersion,
                              now.arity, now.dataType, older.firstVersion, older.lastVersion, older.arity,
                              older.dataType);
        }
    }
    std::sort(rows.begin(), rows.end());
    EXPECT_EQ(rows, (std::vector<Row>{
                        {"audioStream", 1, "audioStreamFormat", 22, 42, 0, 7, 7, 21, 1, 7},
                        {"audioStream", 2, "audioStreamId", 22, 42, 0, 9, 7, 21, 1, 9},
                        {"localApplicationDataRemove", 2, "key", 26, 42, 2, 17, 7, 25, 2, 17},
                        {"viewStartEvent", 14, "timestampMilliseconds", 12, 42, 1, 15, 7, 11, 0, 15},
                        {"viewStopEvent", 13, "timestampMilliseconds", 12, 42, 1, 15, 7, 11, 0, 15},
                    }));
}

TEST(CatalogueNumbersTest, Enumerations) {
    std::map<std::string, uint32_t> open;
    unsigned nListed = 0, nWithoutZero = 0;
    for (const auto& [id, def] : AllEnums()) {
        if (def->names[0] == nullptr) ++nWithoutZero;
        if (id == 1361) continue;
        if (CountNames(*def) == 0) {
            open[ObjectTypes().names[id]] = def->count;
        } else {
            ++nListed;
            EXPECT_NE(def->names[def->count - 1], nullptr) << id;
        }
        std::set<std::string> names;
        for (uint32_t value = 0; value < def->count; ++value) {
            if (def->names[value] != nullptr) {
                EXPECT_TRUE(names.insert(def->names[value]).second) << id << ' ' << value;
            }
        }
    }
    EXPECT_EQ(nListed, 187u);
    EXPECT_EQ(nWithoutZero, 165u);
    EXPECT_EQ(
        open,
        (std::map<std::string, uint32_t>{
            {"mixApplication", 6}, {"remoteControlType", 12}, {"serviceState", 24}, {"supportedUiType", 4}}));
}

TEST(CatalogueNumbersTest, TypeNames) {
    const EnumDef& types = ObjectTypes();
    EXPECT_EQ(types.count, 5934u);
    EXPECT_EQ(CountNames(types), 286u + 192u + 2u);
    for (const auto& [id, info] : AllStructs()) EXPECT_STREQ(types.names[id], info->name);
    for (const auto& [id, def] : AllEnums()) EXPECT_NE(types.names[id], nullptr) << id;
    const std::pair<uint32_t, const char*> vKnown[] = {{129, "account"},
                                                       {130, "accountExtra"},
                                                       {463, "recording"},
                                                       {702, "errorCode"},
                                                       {1361, "orvoObjectType"},
                                                       {1362, "zipCodeInfo"},
                                                       {5800, "preferredTransportType"},
                                                       {5918, "deeplinkApplicationParameters"}};
    for (const auto& [id, name] : vKnown) EXPECT_STREQ(types.names[id], name);
    EXPECT_EQ(types.names[0], nullptr);
    EXPECT_EQ(types.names[5933], nullptr);
}

TEST(CatalogueNumbersTest, EnumerationValuesStandAtTheirNumbers) {
    const std::tuple<uint32_t, uint32_t, const char*> vCases[] = {
        {702, 0, nullptr},
        {702, 3, "badArgument"},
        {702, 32, "noDeviceBinding"},
        {687, 5, nullptr},
        {687, 6, "channelSourceType"},
        {3928, 1, "sd"},
        {3928, 99, nullptr},
        {3928, 100, "hd"},
        {3928, 200, "uhd"},
        {909, 6, "middleorvo-xmppActions"},
        {1511, 1, "128qam"},
        {1939, 14, nullptr},
        {1939, 23, "x"},
        {2506, 2, "not_explicitly_adult"},
        {688, 0, "video"},
        {994, 5, nullptr},
    };
    for (const auto& [id, value, name] : vCases)
        EXPECT_STREQ(Schema::FindEnum(id)->NameOf(value), name) << id << ' ' << value;
    EXPECT_EQ(Schema::FindEnum(702)->NameOf(33), nullptr);
}

TEST(CatalogueNumbersTest, LookupByIdOutOfPlace) {
    const uint32_t vNotStruct[] = {0, 128, 130, 668, 702, 5917, 5919, 4294967295u};
    for (uint32_t id : vNotStruct) EXPECT_EQ(Schema::FindStruct(id), nullptr) << id;
    const uint32_t vNotEnum[] = {0, 129, 667, 669, 5799, 5801, 4294967295u};
    for (uint32_t id : vNotEnum) EXPECT_EQ(Schema::FindEnum(id), nullptr) << id;
}

TEST(CatalogueNumbersTest, NameTableFollowsItsRule) {
    const uint32_t size = Schema::structNameHashTableSizeG;
    std::vector<const StructInfo*> byName;
    for (const auto& [id, info] : AllStructs()) byName.push_back(info);
    std::sort(byName.begin(), byName.end(),
              [](const StructInfo* a, const StructInfo* b) { return std::strcmp(a->name, b->name) < 0; });
    std::vector<const StructInfo*> expected(size, nullptr);
    unsigned nOffHome = 0, furthest = 0;
    for (const StructInfo* info : byName) {
        unsigned distance = 0;
        while (expected[(HomeEntry(info->name) + distance) % size] != nullptr) ++distance;
        expected[(HomeEntry(info->name) + distance) % size] = info;
        if (distance != 0) ++nOffHome;
        furthest = std::max(furthest, distance);
    }
    for (uint32_t i = 0; i < size; ++i) EXPECT_EQ(Schema::structNameHashTableG[i], expected[i]) << i;
    EXPECT_EQ(nOffHome, 54u);
    EXPECT_EQ(furthest, 7u);
}

TEST(CatalogueNumbersTest, LookupByName) {
    for (const auto& [id, info] : AllStructs()) {
        EXPECT_EQ(StructInfoMap::LookupStructByName(std::string(info->name).c_str()), info);
    }
    for (const char* name : {"Recording", "", "recordin", "recordings", "errorCode", "\xff\xfe"}) {
        EXPECT_EQ(StructInfoMap::LookupStructByName(name), nullptr) << name;
    }
}

}  // namespace
