#include <gtest/gtest.h>

#include <string>

#include "rox/RoxHashStringToCore.h"
#include "rox/RoxMempool.h"
#include "rox/RoxStringRepN.h"

namespace {

RoxStringRepN* NewKey(RoxMempool& pool, const std::string& text) {
    RoxStringRepN* key = RoxStringRepN::New(&pool, static_cast<uint32_t>(text.size()));
    text.copy(key->MutableBytes(), text.size());
    return key;
}

// Past the size from which a table has an index, so that each way of searching is used.
TEST(HashTableStoreIfAbsentTest, StoresOnceAndTakesOverTheHold) {
    RoxMempool pool("table");
    {
        RoxHashStringToCore<RoxCore> table(&pool);
        for (unsigned i = 0; i < 100; ++i) {
            bool fStored = false;
            _RoxHashTable::Entry* entry =
                table._StoreIfAbsent(NewKey(pool, "key" + std::to_string(i)), fStored);
            EXPECT_TRUE(fStored);
            EXPECT_EQ(entry->pData, nullptr);
            EXPECT_EQ(table.Count(), i + 1);
            for (unsigned j = 0; j <= i; j += 7) {
                RoxStringRepN* again = NewKey(pool, "key" + std::to_string(j));
                EXPECT_NE(table._StoreIfAbsent(again, fStored), nullptr);
                EXPECT_FALSE(fStored);
                EXPECT_EQ(table._Lookup(again)->pKey, table._StoreIfAbsent(again, fStored)->pKey);
                again->DownRef();
            }
            EXPECT_EQ(table.Count(), i + 1);
        }
        bool fStored = false;
        EXPECT_NE(table._StoreIfAbsent(nullptr, fStored), nullptr);  // the empty key
        EXPECT_TRUE(fStored);
        EXPECT_TRUE(table.Remove(RoxString()));
        EXPECT_TRUE(table.Remove(RoxString("key42")));
        EXPECT_EQ(table.Count(), 99u);
    }
    EXPECT_EQ(pool.GetUsedBytes(), 0u);
}

TEST(RoxStringRepNTest, ResizeKeepsTheBytes) {
    RoxMempool pool("text");
    RoxStringRepN* rep = NewKey(pool, "0123456789");
    for (uint32_t n : {100000u, 5000u, 4u}) {
        rep = RoxStringRepN::Resize(rep, n);
        EXPECT_EQ(rep->GetLength(), n);
        EXPECT_EQ(rep->GetBytes()[n], 0);
        EXPECT_EQ(std::string(rep->GetBytes(), 4), "0123");
    }
    RoxString text = RoxString::AdoptRepN(rep);
    EXPECT_TRUE(text.FEqual("0123"));
    text = RoxString();
    EXPECT_EQ(pool.GetUsedBytes(), 0u);
}

}  // namespace
