#include "sorn/model/InternedString.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <atomic>
#include <map>
#include <random>
#include <set>
#include <string>
#include <thread>
#include <vector>

#include "rox/RoxMempool.h"
#include "sorn/model/Schema.h"
#include "sorn/model/StructInfo.h"

namespace sorn {
namespace {

constexpr uint32_t typeIdEnumG = 1361;

/// Every name of the schema: structs, fields and enumeration values, at the addresses of the metadata. The
/// type id enumeration, whose names are those of all structs and enumerations, is left out.
std::vector<const char*> AllNames() {
    std::vector<const char*> names;
    for (uint32_t id = 0; id < Schema::nStructDefG; ++id) {
        const StructInfo* const info = Schema::vStructDefG[id];
        if (info == nullptr) continue;
        names.push_back(info->name);
        for (int slot = 0; slot < info->nFields; ++slot) {
            const FieldInfo& field = info->vFieldInfo[slot];
            if (!field.FHole()) names.push_back(info->FieldName(field));
        }
    }
    for (uint32_t id = 0; id < Schema::nEnumDefG; ++id) {
        if (id == typeIdEnumG) continue;
        const EnumDef* const def = Schema::vEnumDefG[id];
        for (uint32_t value = 0; def != nullptr && value < def->count; ++value) {
            if (def->NameOf(value) != nullptr) names.push_back(def->NameOf(value));
        }
    }
    return names;
}

/// Each test begins and ends without a table.
class InternedStringTest : public testing::Test {
 protected:
    InternedStringTest() { DestroyGlobalSornHashTable(); }
    ~InternedStringTest() override { DestroyGlobalSornHashTable(); }

    RoxMempool poolM{"interned"};
};

TEST_F(InternedStringTest, OneStringForEachText) {
    const std::string first = "recording";
    const std::string second = "recording";
    const RoxString* const a = InternedString(&poolM, first.c_str());
    EXPECT_STREQ(a->Utf8(), "recording");
    EXPECT_EQ(InternedString(&poolM, second.c_str()), a);
    EXPECT_EQ(InternedString(nullptr, "recording"), a);
    EXPECT_NE(InternedString(&poolM, "recordings"), a);
}

TEST_F(InternedStringTest, CopiesShareTheRepresentation) {
    const RoxString a = *InternedString(&poolM, "recording");
    const RoxString b = *InternedString(&poolM, "recording");
    EXPECT_EQ(a.GetRepN(), b.GetRepN());
    EXPECT_NE(a.GetRepN(), nullptr);
}

TEST_F(InternedStringTest, TextLiesOnTheGeneralHeap) {
    EXPECT_EQ(InternedString(&poolM, "recording")->GetMempool(), nullptr);
    EXPECT_EQ(poolM.GetUsedBytes(), 0U);
}

TEST_F(InternedStringTest, EmptyTextIsAName) {
    EXPECT_TRUE(InternedString(&poolM, "")->FEmpty());
    EXPECT_EQ(InternedString(&poolM, ""), InternedString(&poolM, ""));
}

TEST_F(InternedStringTest, TheFirstCallersPoolServesTheTable) {
    RoxMempool other("other");
    std::vector<std::string> names;
    for (int i = 0; i < 40; ++i) names.push_back("name" + std::to_string(i));
    InternedString(&poolM, names[0].c_str());
    for (size_t i = 1; i < 39; ++i) InternedString(&other, names[i].c_str());
    EXPECT_EQ(poolM.GetUsedBytes(), 0U);
    InternedString(&other, names[39].c_str());
    EXPECT_GE(poolM.GetUsedBytes(), 769 * sizeof(void*));
    EXPECT_EQ(other.GetUsedBytes(), 0U);
    DestroyGlobalSornHashTable();
    EXPECT_EQ(poolM.GetUsedBytes(), 0U);
}

TEST_F(InternedStringTest, DestroyWithoutATableDoesNothing) {
    DestroyGlobalSornHashTable();
    DestroyGlobalSornHashTable();
    EXPECT_STREQ(InternedString(&poolM, "recording")->Utf8(), "recording");
}

TEST_F(InternedStringTest, TableComesAgainAfterDestroy) {
    for (int round = 0; round < 3; ++round) {
        RoxMempool pool("round");
        for (const char* name : AllNames()) ASSERT_STREQ(InternedString(&pool, name)->Utf8(), name);
        DestroyGlobalSornHashTable();
        EXPECT_EQ(pool.GetUsedBytes(), 0U);
    }
}

TEST_F(InternedStringTest, CopyOutlivesTheTable) {
    const RoxString copy = *InternedString(&poolM, "recording");
    DestroyGlobalSornHashTable();
    EXPECT_STREQ(copy.Utf8(), "recording");
    EXPECT_NE(InternedString(&poolM, "recording")->GetRepN(), copy.GetRepN());
}

TEST_F(InternedStringTest, AllNamesOfTheSchemaNeedNoBlock) {
    std::set<std::string> distinct;
    for (const char* name : AllNames()) {
        distinct.insert(name);
        InternedString(&poolM, name);
    }
    EXPECT_GT(distinct.size(), 2309U);  // more than 3079 buckets are good for
    EXPECT_LE(distinct.size(), 3079U);
    RoxMempool buckets("buckets");
    void* const array = buckets.Malloc(12289 * sizeof(void*));
    EXPECT_EQ(poolM.GetUsedBytes(), buckets.GetUsedBytes()) << "the bucket array and nothing else";
    buckets.Free(array);
}

TEST_F(InternedStringTest, SecondWalkAllocatesNothing) {
    const std::vector<const char*> names = AllNames();
    for (const char* name : names) InternedString(&poolM, name);
    const size_t used = poolM.GetUsedBytes();
    std::map<std::string, const RoxString*> places;
    for (const char* name : names) places[name] = InternedString(&poolM, name);
    for (const char* name : names) EXPECT_EQ(InternedString(&poolM, name), places[name]) << name;
    EXPECT_EQ(poolM.GetUsedBytes(), used);
}

TEST_F(InternedStringTest, EightThreadsGetTheSameStrings) {
    constexpr unsigned nThreads = 8;
    const std::vector<const char*> names = AllNames();
    std::vector<std::vector<const RoxString*>> found(nThreads, std::vector<const RoxString*>(names.size()));
    std::atomic<unsigned> nReady = 0;
    std::atomic<size_t> nWrong = 0;
    std::vector<std::thread> threads;
    for (unsigned t = 0; t < nThreads; ++t) {
        threads.emplace_back([&, t] {
            std::vector<size_t> order(names.size());
            for (size_t i = 0; i < order.size(); ++i) order[i] = i;
            std::shuffle(order.begin(), order.end(), std::mt19937(t));
            ++nReady;
            while (nReady < nThreads) std::this_thread::yield();
            for (const size_t i : order) {
                found[t][i] = InternedString(&poolM, names[i]);
                const RoxString copy = *found[t][i];  // the count is shared by all threads
                if (!copy.FEqual(names[i])) ++nWrong;
            }
        });
    }
    for (std::thread& thread : threads) thread.join();
    EXPECT_EQ(nWrong, 0U);
    for (unsigned t = 1; t < nThreads; ++t) EXPECT_EQ(found[t], found[0]) << t;
}

}  // namespace
}  // namespace sorn
