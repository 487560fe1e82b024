#include "sorn/model/StructInfoMap.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <string>
#include <vector>

#include "sorn/model/Schema.h"
#include "sorn/model/StructInfo.h"

namespace sorn {
namespace {

/// All structs of the schema, by ascending id.
std::vector<const StructInfo*> AllStructs() {
    std::vector<const StructInfo*> structs;
    for (uint32_t id = 0; id < Schema::nStructDefG; ++id) {
        if (Schema::vStructDefG[id] != nullptr) structs.push_back(Schema::vStructDefG[id]);
    }
    return structs;
}

/// The home entry of a name, worked out from the back: the sum of byte times 31 to the power of its distance
/// from the end, in 32 bits, modulo the table's size.
size_t HomeOf(const std::string& name) {
    uint64_t sum = 0;
    uint64_t power = 1;
    for (auto byte = name.rbegin(); byte != name.rend(); ++byte) {
        sum += static_cast<unsigned char>(*byte) * power;
        power = power * 31 % 4294967296;
    }
    return static_cast<size_t>(sum % 4294967296 % Schema::structNameHashTableSizeG);
}

TEST(StructInfoMap, FindsEveryStruct) {
    ASSERT_EQ(AllStructs().size(), 286U);
    for (const StructInfo* info : AllStructs()) {
        const std::string name = info->name;  // another address
        EXPECT_EQ(StructInfoMap::LookupStructByName(name.c_str()), info) << name;
    }
}

TEST(StructInfoMap, FindsRecording) {
    const StructInfo* const info = StructInfoMap::LookupStructByName("recording");
    ASSERT_NE(info, nullptr);
    EXPECT_STREQ(info->name, "recording");
}

TEST(StructInfoMap, GivesNullForWhatIsNoStruct) {
    for (const char* name :
         {"", "Recording", "RECORDING", "recordin", "recordingX", "recording ", " recording", "errorCode",
          "type", "\xFF\xFE", "an unknown name of more than a few bytes"}) {
        EXPECT_EQ(StructInfoMap::LookupStructByName(name), nullptr) << name;
    }
}

TEST(StructInfoMap, EndsFromEveryHomeEntry) {
    std::vector<bool> fSeen(Schema::structNameHashTableSizeG);
    for (int i = 0; i < 20000; ++i) {
        const std::string name = "no struct " + std::to_string(i);
        fSeen[HomeOf(name)] = true;
        ASSERT_EQ(StructInfoMap::LookupStructByName(name.c_str()), nullptr) << name;
    }
    EXPECT_EQ(std::count(fSeen.begin(), fSeen.end(), true), Schema::structNameHashTableSizeG);
}

StructInfo Named(const char* name) {
    return {name, nullptr, 1, nullptr, nullptr, nullptr, nullptr};
}

TEST(StructInfoMap, SearchGoesOnFromTheFirstEntry) {
    // Of four entries, "c" (99), "g" (103) and "k" (107) have the last as home.
    const StructInfo c = Named("c");
    const StructInfo g = Named("g");
    const StructInfo k = Named("k");
    const StructInfo* const table[] = {&g, &k, nullptr, &c};
    EXPECT_EQ(StructInfoMap::LookupInTable(table, 4, "c"), &c);
    EXPECT_EQ(StructInfoMap::LookupInTable(table, 4, "g"), &g);
    EXPECT_EQ(StructInfoMap::LookupInTable(table, 4, "k"), &k);
    EXPECT_EQ(StructInfoMap::LookupInTable(table, 4, "o"), nullptr);
    EXPECT_EQ(StructInfoMap::LookupInTable(table, 4, "a"), nullptr);  // 97, home at "k"
}

TEST(StructInfoMap, BytesCountAsUnsigned) {
    const StructInfo high = Named("\xFF");
    const StructInfo* table[11] = {};
    table[255 % 11] = &high;
    EXPECT_EQ(StructInfoMap::LookupInTable(table, 11, "\xFF"), &high);
}

TEST(StructInfoMap, HashWrapsAtThirtyTwoBits) {
    // Seven bytes of 122: 122 * (31^7 - 1) / 30 = 111884630714, of which 32 bits are 215481018.
    const StructInfo seven = Named("zzzzzzz");
    const StructInfo* table[1000] = {};
    table[18] = &seven;
    EXPECT_EQ(StructInfoMap::LookupInTable(table, 1000, "zzzzzzz"), &seven);
}

TEST(StructInfoMap, TableIsTheOneOfTheRule) {
    ASSERT_EQ(Schema::structNameHashTableSizeG, 661U);
    std::vector<std::string> names;
    for (const StructInfo* info : AllStructs()) names.emplace_back(info->name);
    std::sort(names.begin(), names.end());  // by unsigned bytes, as char_traits compares
    std::vector<std::string> table(661);
    int nOffHome = 0;
    size_t furthest = 0;
    for (const std::string& name : names) {
        const size_t home = HomeOf(name);
        size_t distance = 0;
        while (!table[(home + distance) % 661].empty()) ++distance;
        table[(home + distance) % 661] = name;
        if (distance != 0) ++nOffHome;
        furthest = std::max(furthest, distance);
    }
    EXPECT_EQ(nOffHome, 54);
    EXPECT_EQ(furthest, 7U);
    for (size_t i = 0; i < table.size(); ++i) {
        const StructInfo* const entry = Schema::structNameHashTableG[i];
        EXPECT_EQ(table[i], entry == nullptr ? "" : entry->name) << i;
    }
}

}  // namespace
}  // namespace sorn
