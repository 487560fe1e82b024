#include "sorn/model/SornHashTable.h"

#include <gtest/gtest.h>

#include <map>
#include <random>
#include <string>
#include <vector>

namespace sorn {
namespace {

using KeyUtil = SornHashTableUtilTemplate<const char*>;
using ValueUtil = SornHashTableUtilTemplate<RoxString>;

/// The shape of the global string table.
using StringTable =
    SornHashTable<const char*, RoxString, 3079, 256, KeyUtil::DefaultHash, KeyUtil::DefaultKeyCompare,
                  ValueUtil::DefaultValueCompare, KeyUtil::DefaultClear, ValueUtil::DefaultClear>;

uint32_t SameHash(const char* const&) {
    return 4294967295U;
}

/// One entry of its own, and all keys in one bucket.
using CrowdedTable =
    SornHashTable<const char*, RoxString, 1, 256, SameHash, KeyUtil::DefaultKeyCompare,
                  ValueUtil::DefaultValueCompare, KeyUtil::DefaultClear, ValueUtil::DefaultClear>;

// 20 bytes an entry behind 8 on the 32-bit target, 40 behind 16 on 64-bit hosts.
constexpr int nEntriesPerBlock = sizeof(void*) == 4 ? 12 : 6;
constexpr size_t blockBytes = sizeof(void*) == 4 ? 248 : 256;

std::vector<std::string> MakeKeys(int count) {
    std::vector<std::string> keys;
    for (int i = 0; i < count; ++i) keys.push_back("key" + std::to_string(i));
    return keys;
}

/// What a block of n bytes adds to the used bytes of a pool.
size_t UsedBytesOf(size_t n) {
    RoxMempool pool("measure");
    void* const block = pool.Malloc(n);
    const size_t used = pool.GetUsedBytes();
    pool.Free(block);
    return used;
}

size_t BucketBytes(int32_t nBuckets) {
    return nBuckets == 53 ? 0 : UsedBytesOf(static_cast<size_t>(nBuckets) * sizeof(void*));
}

class SornHashTableTest : public testing::Test {
 protected:
    /// Adds keys until the table has `count`, each with its own text as value (on the general heap).
    void Fill(int count) {
        for (int i = tableM.GetEntryCount(); i < count; ++i) {
            const char* const key = keysM[static_cast<size_t>(i)].c_str();
            RoxString* value = nullptr;
            ASSERT_FALSE(tableM.Put(key, value)) << key;
            ASSERT_NE(value, nullptr);
            ASSERT_TRUE(value->FEmpty()) << key;
            *value = key;
        }
    }
    void ExpectAll(int count) {
        for (int i = 0; i < count; ++i) {
            const std::string other = keysM[static_cast<size_t>(i)];
            RoxString* value = nullptr;
            ASSERT_TRUE(tableM.Put(other.c_str(), value)) << other;
            ASSERT_STREQ(value->Utf8(), other.c_str());
        }
    }

    const std::vector<std::string> keysM = MakeKeys(40000);
    RoxMempool poolM{"table"};
    StringTable tableM{&poolM};
};

TEST_F(SornHashTableTest, BeginsEmptyAndWithoutMemoryOfItsOwn) {
    EXPECT_EQ(tableM.GetMempool(), &poolM);
    EXPECT_EQ(tableM.GetSizeIndex(), 0);
    EXPECT_EQ(tableM.GetBucketCount(), 53);
    EXPECT_EQ(tableM.GetEntryCount(), 0);
    Fill(39);
    EXPECT_EQ(poolM.GetUsedBytes(), 0U);
}

TEST_F(SornHashTableTest, SameTextAtTwoAddressesIsOneEntry) {
    const std::string first = "recording";
    const std::string second = "recording";
    ASSERT_NE(first.c_str(), second.c_str());
    RoxString* a = nullptr;
    RoxString* b = nullptr;
    EXPECT_FALSE(tableM.Put(first.c_str(), a));
    *a = "value";
    EXPECT_TRUE(tableM.Put(second.c_str(), b));
    EXPECT_EQ(a, b);
    EXPECT_STREQ(b->Utf8(), "value");
    EXPECT_EQ(tableM.GetEntryCount(), 1);
}

TEST_F(SornHashTableTest, KeyIsKeptAsThePointerGiven) {
    char key[] = "aaa";
    RoxString* value = nullptr;
    tableM.Put(key, value);
    key[0] = 'b';  // seen by the table, whose stored hash is still that of "aaa"
    RoxString* other = nullptr;
    EXPECT_FALSE(tableM.Put("aaa", other));
    EXPECT_NE(other, value);
}

TEST_F(SornHashTableTest, NullKeyIsAKeyOfItsOwn) {
    RoxString* null = nullptr;
    RoxString* empty = nullptr;
    RoxString* again = nullptr;
    EXPECT_FALSE(tableM.Put(nullptr, null));
    EXPECT_FALSE(tableM.Put("", empty));
    EXPECT_NE(null, empty);
    EXPECT_TRUE(tableM.Put(nullptr, again));
    EXPECT_EQ(again, null);
}

TEST_F(SornHashTableTest, GrowsWithTheFirstKeyPastEachLimit) {
    const struct {
        int nKeys;
        int32_t nBuckets;
        int32_t sizeIndex;
    } cases[] = {
        {39, 53, 0},      {40, 769, 1},     {576, 769, 1},    {577, 3079, 2},    {2309, 3079, 2},
        {2310, 12289, 3}, {9216, 12289, 3}, {9217, 49157, 4}, {36867, 49157, 4}, {36868, 98317, 5},
    };
    std::vector<RoxString*> values;
    for (const auto& each : cases) {
        Fill(each.nKeys);
        EXPECT_EQ(tableM.GetBucketCount(), each.nBuckets) << each.nKeys;
        EXPECT_EQ(tableM.GetSizeIndex(), each.sizeIndex) << each.nKeys;
        EXPECT_EQ(tableM.GetEntryCount(), each.nKeys);
        ExpectAll(each.nKeys);
        EXPECT_EQ(tableM.GetEntryCount(), each.nKeys);
        const int nBeyond = each.nKeys > 3079 ? each.nKeys - 3079 : 0;
        const int nBlocks = (nBeyond + nEntriesPerBlock - 1) / nEntriesPerBlock;
        EXPECT_EQ(poolM.GetUsedBytes(),
                  BucketBytes(each.nBuckets) + static_cast<size_t>(nBlocks) * UsedBytesOf(blockBytes))
            << each.nKeys;
    }
}

TEST_F(SornHashTableTest, KnownKeyAtTheLimitDoesNotGrow) {
    Fill(39);
    ExpectAll(39);
    EXPECT_EQ(tableM.GetBucketCount(), 53);
}

TEST_F(SornHashTableTest, EntriesStayWhereTheyAre) {
    std::map<std::string, RoxString*> places;
    for (int i = 0; i < 4000; ++i) {
        const std::string& key = keysM[static_cast<size_t>(i)];
        tableM.Put(key.c_str(), places[key]);
    }
    for (const auto& [key, place] : places) {
        RoxString* value = nullptr;
        EXPECT_TRUE(tableM.Put(key.c_str(), value));
        EXPECT_EQ(value, place) << key;
    }
}

TEST(SornHashTableLimits, AreThreeQuartersUpToIndexTwelve) {
    const int32_t limits[] = {39,     576,    2309,   9216,    36867,   73737,
                              147459, 294930, 589824, 1179651, 2359304, 4718601};
    for (int32_t index = 0; index < 12; ++index) {
        EXPECT_FALSE(StringTable::FGrowsAt(75, index, limits[index] - 1)) << index;
        EXPECT_TRUE(StringTable::FGrowsAt(75, index, limits[index])) << index;
        EXPECT_FALSE(StringTable::FGrowsAt(75, index, limits[index] + 1)) << index;
    }
    EXPECT_FALSE(StringTable::FGrowsAt(75, 12, 9437187));  // 12582917 buckets are the most
}

TEST_F(SornHashTableTest, BlocksComeWithTheFirstKeyPastTheEntriesAtHand) {
    ASSERT_EQ(StringTable::nEntriesPerBlockG, nEntriesPerBlock);
    ASSERT_EQ(sizeof(StringTable::Block), blockBytes);
    const size_t buckets = BucketBytes(12289);
    const size_t block = UsedBytesOf(blockBytes);
    const struct {
        int nKeys;
        size_t nBlocks;
    } cases[] = {
        {3079, 0},
        {3080, 1},
        {3079 + nEntriesPerBlock, 1},
        {3080 + nEntriesPerBlock, 2},  // 3092 on the 32-bit target
        {3079 + 2 * nEntriesPerBlock, 2},
        {3080 + 2 * nEntriesPerBlock, 3},
    };
    for (const auto& each : cases) {
        Fill(each.nKeys);
        EXPECT_EQ(poolM.GetUsedBytes(), buckets + each.nBlocks * block) << each.nKeys;
    }
}

TEST_F(SornHashTableTest, ClearGivesBackBlocksAndBuckets) {
    for (const int nKeys : {0, 1, 39, 40, 577, 3079, 3080, 3079 + nEntriesPerBlock, 3090, 5000, 10000}) {
        Fill(nKeys);
        tableM.Clear();
        EXPECT_EQ(tableM.GetEntryCount(), 0) << nKeys;
        EXPECT_EQ(tableM.GetSizeIndex(), 0) << nKeys;
        EXPECT_EQ(tableM.GetBucketCount(), 53) << nKeys;
        EXPECT_EQ(poolM.GetUsedBytes(), 0U) << nKeys;
    }
}

TEST_F(SornHashTableTest, WorksAfterClearAsBefore) {
    for (int round = 0; round < 3; ++round) {
        Fill(3079);
        EXPECT_EQ(poolM.GetUsedBytes(), BucketBytes(12289)) << "no entry was lost";
        Fill(3080);
        EXPECT_EQ(poolM.GetUsedBytes(), BucketBytes(12289) + UsedBytesOf(blockBytes));
        ExpectAll(3080);
        tableM.Clear();
    }
}

TEST_F(SornHashTableTest, ClearReleasesValues) {
    RoxMempool texts("texts");
    for (size_t i = 0; i < 3500; ++i) {
        RoxString* value = nullptr;
        tableM.Put(keysM[i].c_str(), value);
        *value = RoxString(&texts, "text");
    }
    EXPECT_GE(texts.GetUsedBytes(), 3500 * sizeof "text");
    tableM.Clear();
    EXPECT_EQ(texts.GetUsedBytes(), 0U);
}

TEST(SornHashTable, DestructorClears) {
    RoxMempool pool("table");
    RoxMempool texts("texts");
    const std::vector<std::string> keys = MakeKeys(3500);
    {
        StringTable table(&pool);
        for (const std::string& key : keys) {
            RoxString* value = nullptr;
            table.Put(key.c_str(), value);
            *value = RoxString(&texts, "text");
        }
        EXPECT_GT(pool.GetUsedBytes(), 0U);
    }
    EXPECT_EQ(pool.GetUsedBytes(), 0U);
    EXPECT_EQ(texts.GetUsedBytes(), 0U);
}

TEST(SornHashTable, WorksOnTheGeneralHeap) {
    const std::vector<std::string> keys = MakeKeys(3500);
    StringTable table(nullptr);
    RoxString* value = nullptr;
    for (const std::string& key : keys) EXPECT_FALSE(table.Put(key.c_str(), value));
    for (const std::string& key : keys) EXPECT_TRUE(table.Put(key.c_str(), value));
}

TEST(SornHashTable, KeysOfOneHashAreToldApartByText) {
    RoxMempool pool("table");
    const std::vector<std::string> keys = MakeKeys(100);
    CrowdedTable table(&pool);
    for (const std::string& key : keys) {
        RoxString* value = nullptr;
        EXPECT_FALSE(table.Put(key.c_str(), value));
        *value = key.c_str();
    }
    for (const std::string& key : keys) {
        RoxString* value = nullptr;
        EXPECT_TRUE(table.Put(key.c_str(), value));
        EXPECT_STREQ(value->Utf8(), key.c_str());
    }
    table.Clear();
    EXPECT_EQ(pool.GetUsedBytes(), 0U);
}

TEST(SornHashTable, InitializedEntriesAreUsedInOrderBeforeABlock) {
    RoxMempool pool("table");
    CrowdedTable::Entry more[3];
    CrowdedTable table(&pool);
    table.InitializeEntries(more, 3, nullptr);
    const std::vector<std::string> keys = MakeKeys(5);
    RoxString* values[5] = {};
    for (size_t i = 0; i < 4; ++i) table.Put(keys[i].c_str(), values[i]);
    EXPECT_EQ(values[1], &more[0].value);
    EXPECT_EQ(values[2], &more[1].value);
    EXPECT_EQ(values[3], &more[2].value);
    EXPECT_EQ(more[2].block, nullptr);
    EXPECT_EQ(pool.GetUsedBytes(), 0U);
    table.Put(keys[4].c_str(), values[4]);
    EXPECT_EQ(pool.GetUsedBytes(), UsedBytesOf(sizeof(CrowdedTable::Block)));
    *values[1] = "text";
    table.Clear();
    EXPECT_EQ(more[0].key, nullptr);
    EXPECT_TRUE(more[0].value.FEmpty());
}

TEST_F(SornHashTableTest, AgreesWithAMapOverManySteps) {
    std::mt19937 random(20260719);
    std::map<std::string, std::string> model;
    for (int step = 0; step < 60000; ++step) {
        if (random() % 9973 == 0) {
            tableM.Clear();
            model.clear();
        }
        const std::string& key = keysM[random() % 6000];
        RoxString* value = nullptr;
        const bool fExisted = tableM.Put(key.c_str(), value);
        ASSERT_EQ(fExisted, model.contains(key)) << step;
        ASSERT_EQ(value->Utf8(), model[key]) << step;
        model[key] = std::to_string(step);
        *value = model[key].c_str();
        ASSERT_EQ(static_cast<size_t>(tableM.GetEntryCount()), model.size());
    }
}

}  // namespace
}  // namespace sorn
