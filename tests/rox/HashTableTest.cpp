#include "rox/_RoxHashTable.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <chrono>
#include <map>
#include <set>
#include <string>

#include "Random.h"
#include "rox/RoxHashStringToCore.h"
#include "support/SmallStack.h"

namespace {

class Item : public RoxCore {
 public:
    explicit Item(unsigned n) : number(n) {}
    unsigned number;
};

using Table = RoxHashStringToCore<Item>;

RoxString Name(RoxMempool* pool, unsigned i) {
    return RoxString::Format(pool, "name%u", i);
}

ref<Item> Make(RoxMempool* pool, unsigned i) {
    return new (pool) Item(i);
}

std::map<std::string, unsigned> Contents(Table& table) {
    std::map<std::string, unsigned> contents;
    for (_RoxHashTableIter iter(table); iter.FCurrent(); iter.Next()) {
        bool fNew = contents.emplace(Table::KeyOf(iter).Utf8(), Table::ValueOf(iter)->number).second;
        EXPECT_TRUE(fNew) << Table::KeyOf(iter).Utf8();
    }
    EXPECT_EQ(contents.size(), table.Count());
    return contents;
}

}  // namespace

TEST(HashTableTest, EmptyTableAllocatesNothing) {
    RoxMempool pool("tables");
    Table table(&pool, 5, roxMempoolUserSorn, 0);
    EXPECT_EQ(0u, table.Count());
    EXPECT_EQ(nullptr, table.Find("x"));
    EXPECT_EQ(nullptr, table.Find(""));
    EXPECT_FALSE(table.Remove(RoxString("x")));
    EXPECT_FALSE(_RoxHashTableIter(table).FCurrent());
    table.Clear();
    EXPECT_EQ(0u, pool.GetUsedBytes());
    EXPECT_EQ(&pool, table.GetMempool());
    EXPECT_EQ(3, table.GetUser());
    EXPECT_EQ(0u, table.GetLockId());
}

TEST(HashTableTest, StoreTakesHoldsAndRemoveDropsThem) {
    RoxMempool pool("tables");
    RoxString key(&pool, "title");
    ref<Item> item = Make(&pool, 4);
    size_t before = pool.GetUsedBytes();
    {
        Table table(&pool);
        table.Add(key, item.get());
        EXPECT_EQ(2u, item->GetRefCount());
        EXPECT_EQ(item.get(), table.Find(key));
        EXPECT_EQ(item.get(), table.Find("title"));
        EXPECT_EQ(item.get(), table.FindBytes("titles", 5));
        EXPECT_EQ(item.get(), table.Find(RoxString("title")));  // by text, not by representation
        EXPECT_EQ(nullptr, table.Find("Title"));
        EXPECT_EQ(nullptr, table.Find("titles"));
        const char* kept = key.Utf8();
        key = RoxString();
        EXPECT_STREQ("title", kept);  // the table still holds it
        EXPECT_TRUE(table.Remove(RoxString("title")));
        EXPECT_EQ(1u, item->GetRefCount());
        EXPECT_FALSE(table.Remove(RoxString("title")));
        EXPECT_EQ(0u, table.Count());
        key = RoxString(&pool, "title");
        table.Add(key, item.get());
    }
    EXPECT_EQ(1u, item->GetRefCount());
    EXPECT_EQ(before, pool.GetUsedBytes());
}

TEST(HashTableTest, EmptyTextIsAKey) {
    RoxMempool pool("tables");
    for (unsigned nOthers : {0u, 40u}) {
        Table table(&pool);
        for (unsigned i = 0; i < nOthers; ++i) {
            table.Add(Name(&pool, i), Make(&pool, i).get());
        }
        table.Add(RoxString(), Make(&pool, 77).get());
        EXPECT_EQ(77u, table.Find(RoxString())->number);
        EXPECT_EQ(77u, table.Find("")->number);
        EXPECT_TRUE(table.Remove(RoxString()));
        EXPECT_EQ(nullptr, table.Find(""));
        EXPECT_EQ(nOthers, table.Count());
    }
}

TEST(HashTableTest, KeysWithNulBytesDiffer) {
    RoxMempool pool("tables");
    Table table(&pool);
    table.Add(RoxString::FromUtf8Bytes(&pool, 3, "a\0b"), Make(&pool, 1).get());
    table.Add(RoxString::FromUtf8Bytes(&pool, 3, "a\0c"), Make(&pool, 2).get());
    table.Add(RoxString(&pool, "a"), Make(&pool, 3).get());
    EXPECT_EQ(1u, table.FindBytes("a\0b", 3)->number);
    EXPECT_EQ(2u, table.FindBytes("a\0c", 3)->number);
    EXPECT_EQ(3u, table.Find("a")->number);
}

TEST(HashTableTest, NullValuesAreAllowed) {
    RoxMempool pool("tables");
    Table table(&pool);
    table.Add(RoxString(&pool, "none"), nullptr);
    EXPECT_NE(nullptr, table._Lookup(RoxString("none").GetRepN()));
    EXPECT_EQ(nullptr, table.Find("none"));
    EXPECT_EQ(1u, table.Count());
}

TEST(HashTableTest, EverySizeAcrossTheChangeToAnIndex) {
    for (unsigned initialSize : {0u, 1u, 5u, 16u, 17u, 1000u}) {
        RoxMempool pool("tables");
        {
            Table table(&pool, initialSize);
            for (unsigned n = 1; n <= 80; ++n) {
                table.Add(Name(&pool, n), Make(&pool, n).get());
                ASSERT_EQ(n, table.Count());
                for (unsigned i = 1; i <= n; ++i) {
                    Item* found = table.Find(Name(nullptr, i));
                    ASSERT_TRUE(found != nullptr && found->number == i) << n << " " << i;
                    ASSERT_EQ(found, table.Find(Name(nullptr, i).Utf8()));
                }
                ASSERT_EQ(nullptr, table.Find(Name(nullptr, n + 1)));
                ASSERT_EQ(nullptr, table.Find("name0"));
            }
            EXPECT_EQ(80u, Contents(table).size());
        }
        EXPECT_EQ(0u, pool.GetUsedBytes());
    }
}

TEST(HashTableTest, RemovalDuringAWalkVisitsEachEntryOnce) {
    for (unsigned n : {1u, 2u, 5u, 16u, 17u, 100u, 5000u}) {
        for (unsigned modulus : {1u, 2u, 3u, 7u}) {
            RoxMempool pool("tables");
            Table table(&pool);
            for (unsigned i = 0; i < n; ++i) {
                table.Add(Name(&pool, i), Make(&pool, i).get());
            }
            std::set<unsigned> visited;
            for (_RoxHashTableIter iter(table); iter.FCurrent(); iter.Next()) {
                unsigned number = Table::ValueOf(iter)->number;
                EXPECT_TRUE(visited.insert(number).second) << number;
                if (number % modulus == 0) {
                    iter.RemoveCurrent();
                    EXPECT_FALSE(iter.FCurrent());
                    iter.RemoveCurrent();  // nothing there any more
                }
            }
            EXPECT_EQ(n, visited.size());
            for (unsigned i = 0; i < n; ++i) {
                EXPECT_EQ(i % modulus != 0, table.Find(Name(nullptr, i)) != nullptr);
            }
            EXPECT_EQ(n - (n + modulus - 1) / modulus, table.Count());
            EXPECT_EQ(table.Count(), Contents(table).size());
            // The table goes on.
            for (unsigned i = 0; i < n; i += modulus) {
                table.Add(Name(&pool, i), Make(&pool, i + 100000).get());
            }
            EXPECT_EQ(n, Contents(table).size());
            EXPECT_EQ(100000u, table.Find("name0")->number);
        }
    }
}

namespace {

/// Milliseconds that it takes to empty a table of n entries, one fresh walk for each.
double MillisecondsToDrain(unsigned n) {
    RoxMempool pool("tables");
    Table table(&pool);
    for (unsigned i = 0; i < n; ++i) {
        table.Add(Name(&pool, i), nullptr);
    }
    auto start = std::chrono::steady_clock::now();
    while (table.Count() != 0) {
        _RoxHashTableIter iter(table);
        iter.RemoveCurrent();
    }
    std::chrono::duration<double, std::milli> time = std::chrono::steady_clock::now() - start;
    EXPECT_FALSE(_RoxHashTableIter(table).FCurrent());
    return time.count();
}

}  // namespace

TEST(HashTableTest, FreshWalksEmptyATableInTimeOfItsSize) {
    // 16 times the entries: 256 times the time if each walk began at the first slot that ever was.
    constexpr unsigned n = 12500;
    double small = MillisecondsToDrain(n);
    double large = MillisecondsToDrain(16 * n);
    for (int i = 0; i < 4; ++i) {
        small = std::min(small, MillisecondsToDrain(n));
        large = std::min(large, MillisecondsToDrain(16 * n));
    }
    EXPECT_LT(large, 150 * small);
}

TEST(HashTableTest, WalksBeginAtTheFirstEntryWhateverHappenedBefore) {
    for (unsigned n : {3u, 16u, 17u, 200u}) {
        RoxMempool pool("tables");
        Table table(&pool);
        for (unsigned i = 0; i < n; ++i) {
            table.Add(Name(&pool, i), Make(&pool, i).get());
        }
        for (unsigned i = n / 2; i != 0; --i) {  // from the middle back to the front: a gap that closes late
            ASSERT_TRUE(table.Remove(Name(nullptr, i - 1)));
            ASSERT_EQ(n - (n / 2 - i + 1), Contents(table).size());
        }
        for (unsigned i = 0; i < 2 * n; ++i) {  // the storage grows, or is rebuilt, behind the gap
            table.Add(Name(&pool, n + i), Make(&pool, i).get());
            ASSERT_EQ(n - n / 2 + i + 1, Contents(table).size());
        }
        while (table.Count() != 0) {
            _RoxHashTableIter iter(table);
            ASSERT_TRUE(iter.FCurrent());
            iter.RemoveCurrent();
        }
        table.Add(Name(&pool, 0), Make(&pool, 5).get());
        EXPECT_EQ(1u, Contents(table).size());
        table.Clear();
        table.Add(Name(&pool, 1), Make(&pool, 6).get());
        EXPECT_EQ(1u, Contents(table).size());
    }
}

TEST(HashTableTest, ATableThatLostItsEntriesShrinks) {
    for (unsigned nLeft : {0u, 1u, 5u, 16u, 17u, 300u}) {
        RoxMempool pool("tables");
        Table table(&pool);
        for (unsigned i = 0; i < 20000; ++i) {
            table.Add(Name(&pool, i), Make(&pool, i).get());
        }
        const size_t usedByOne = pool.GetUsedBytes() / 20000;
        for (unsigned i = nLeft; i < 20000; ++i) {
            ASSERT_TRUE(table.Remove(Name(nullptr, i)));
        }
        EXPECT_LE(pool.GetUsedBytes(), (4 * nLeft + 40) * usedByOne) << nLeft;
        EXPECT_EQ(nLeft, Contents(table).size());
        for (unsigned i = 0; i < 100; ++i) {
            EXPECT_EQ(i < nLeft, table.Find(Name(nullptr, i)) != nullptr) << i;
        }
        table.Add(Name(&pool, 50000), Make(&pool, 1).get());
        EXPECT_EQ(nLeft + 1, Contents(table).size());
    }
}

TEST(HashTableTest, ATableEmptiedByAWalkShrinksAtTheNextStore) {
    for (bool fIfAbsent : {false, true}) {
        RoxMempool pool("tables");
        Table table(&pool);
        for (unsigned i = 0; i < 20000; ++i) {
            table.Add(Name(&pool, i), Make(&pool, i).get());
        }
        unsigned nVisited = 0;
        for (_RoxHashTableIter iter(table); iter.FCurrent(); iter.Next()) {
            ++nVisited;
            if (Table::ValueOf(iter)->number != 7) {
                iter.RemoveCurrent();
            }
        }
        EXPECT_EQ(20000u, nVisited);
        EXPECT_GT(pool.GetUsedBytes(), 100000u);  // the walk itself leaves the slots where they are
        if (fIfAbsent) {
            bool fStored = false;
            RoxString key = Name(&pool, 7);
            table._StoreIfAbsent(key.GetRepN(), fStored);
            EXPECT_FALSE(fStored);
        } else {
            table.Add(Name(&pool, 8), Make(&pool, 8).get());
        }
        EXPECT_LT(pool.GetUsedBytes(), 4096u);
        EXPECT_EQ(7u, table.Find("name7")->number);
        EXPECT_EQ(fIfAbsent ? 1u : 2u, Contents(table).size());
    }
}

TEST(HashTableTest, ClearEmptiesAndTheTableGoesOn) {
    RoxMempool pool("tables");
    Table table(&pool);
    for (unsigned n : {3u, 50u}) {
        for (unsigned i = 0; i < n; ++i) {
            table.Add(Name(&pool, i), Make(&pool, i).get());
        }
        table.Clear();
        EXPECT_EQ(0u, table.Count());
        EXPECT_EQ(nullptr, table.Find("name1"));
        EXPECT_EQ(0u, pool.GetUsedBytes());
    }
}

TEST(HashTableTest, RandomWorkAgreesWithAMap) {
    RoxMempool pool("tables");
    {
        Table table(&pool, 5);
        std::map<std::string, unsigned> expected;
        Random random(99);
        for (unsigned step = 0; step < 40000; ++step) {
            // The number of names swings between few and many.
            unsigned range = step / 5000 % 2 == 0 ? 600 : 20;
            RoxString name = Name(&pool, random() % range);
            auto known = expected.find(name.Utf8());
            Item* found = table.Find(name);
            ASSERT_EQ(known != expected.end(), found != nullptr);
            if (found != nullptr) {
                ASSERT_EQ(known->second, found->number);
            }
            if (random() % 2 == 0) {
                ASSERT_EQ(known != expected.end(), table.Remove(name));
                expected.erase(name.Utf8());
            } else if (found == nullptr) {
                table.Add(name, Make(&pool, step).get());
                expected[name.Utf8()] = step;
            }
            ASSERT_EQ(expected.size(), table.Count());
        }
        EXPECT_EQ(expected, Contents(table));
    }
    EXPECT_EQ(0u, pool.GetUsedBytes());
}

TEST(HashTableTest, OneEntryThatComesAndGoesKeepsTheTableSmall) {
    RoxMempool pool("tables");
    Table table(&pool);
    for (unsigned nOthers : {0u, 30u}) {
        for (unsigned i = 0; i < nOthers; ++i) {
            table.Add(Name(&pool, 1000 + i), nullptr);
        }
        for (unsigned i = 0; i < 50000; ++i) {
            RoxString name = Name(&pool, i % 100);
            table.Add(name, nullptr);
            ASSERT_TRUE(table.Remove(name));
        }
        EXPECT_EQ(nOthers, table.Count());
    }
    EXPECT_LT(pool.GetUsedBytesHighWater(), 20000u);
}

TEST(HashTableTest, AMillionKeys) {
    constexpr unsigned n = 1000000;
    RoxMempool pool("tables");
    {
        Table table(&pool);
        ref<Item> item = Make(&pool, 1);
        for (unsigned i = 0; i < n; ++i) {
            table.Add(Name(&pool, i), item.get());
        }
        EXPECT_EQ(n, table.Count());
        EXPECT_EQ(n + 1, item->GetRefCount());
        for (unsigned i = 0; i < n; i += 7) {
            ASSERT_EQ(item.get(), table.Find(Name(nullptr, i)));
        }
        EXPECT_EQ(nullptr, table.Find(Name(nullptr, n)));
        unsigned nVisited = 0;
        for (_RoxHashTableIter iter(table); iter.FCurrent(); iter.Next()) {
            if (nVisited++ % 2 == 0) {
                iter.RemoveCurrent();
            }
        }
        EXPECT_EQ(n, nVisited);
        EXPECT_EQ(n / 2, table.Count());
        EXPECT_EQ(n / 2 + 1, item->GetRefCount());
        table.Clear();
        EXPECT_EQ(1u, item->GetRefCount());
    }
    EXPECT_EQ(0u, pool.GetUsedBytes());
}

TEST(HashTableTest, NestedTablesDieOnASmallStack) {
    class Nest : public RoxCore {
     public:
        Nest() : table(GetMempool()) {}
        RoxHashStringToCore<Nest> table;
    };
    RoxMempool pool("nests");
    RoxString key(&pool, "child");
    ref<Nest> nest = new (&pool) Nest;
    for (int i = 0; i < 200000; ++i) {
        ref<Nest> outer = new (&pool) Nest;
        outer->table.Add(key, nest.get());
        nest = outer;
    }
    RunOnSmallStack([&] { nest = nullptr; });
    key = RoxString();
    EXPECT_EQ(0u, pool.GetUsedBytes());
}

namespace {

unsigned nOwnedG = 0;
unsigned nDisownedG = 0;
void OwnNumber(RoxMempool*, _RoxHashTable::Entry*) {
    ++nOwnedG;
}
void DisownNumber(RoxMempool* pool, _RoxHashTable::Entry* entry) {
    ++nDisownedG;
    RoxMempool::FreeIn(pool, entry);
}
constexpr _RoxHashTable::Hooks numberHooksG = {&OwnNumber, &DisownNumber, &_RoxHashTable::HashU32,
                                               &_RoxHashTable::CompareU32};

void* Number(uint32_t n) {
    return reinterpret_cast<void*>(static_cast<uintptr_t>(n));
}

_RoxHashTable::Entry* NumberEntry(RoxMempool* pool, uint32_t key, uint32_t data) {
    auto* entry =
        static_cast<_RoxHashTable::Entry*>(RoxMempool::CallocIn(pool, sizeof(_RoxHashTable::Entry)));
    *entry = {Number(key), Number(data)};
    return entry;
}

}  // namespace

TEST(HashTableTest, NumbersAsKeys) {
    RoxMempool pool("numbers");
    nOwnedG = nDisownedG = 0;
    {
        _RoxHashTable table(&pool, 5, true, &numberHooksG, roxMempoolUserSorn, 9);
        EXPECT_EQ(9u, table.GetLockId());
        for (uint32_t i = 0; i < 1000; ++i) {
            table._Store(NumberEntry(&pool, i * 0x10001u, i));
        }
        table._Store(NumberEntry(&pool, 0xFFFFFFFF, 5));
        EXPECT_EQ(Number(5), table._Find(Number(0xFFFFFFFF))->pData);
        EXPECT_EQ(Number(999), table._Lookup(Number(999 * 0x10001u))->pData);
        EXPECT_EQ(nullptr, table._Lookup(Number(2)));
        EXPECT_TRUE(table._Remove(Number(0)));
        EXPECT_EQ(1u, nDisownedG);
        EXPECT_EQ(1001u, nOwnedG);
        unsigned sum = 0;
        for (_RoxHashTableIter iter(table); iter.FCurrent(); iter.Next()) {
            sum += static_cast<unsigned>(reinterpret_cast<uintptr_t>(iter.CurrentData()));
        }
        EXPECT_EQ(999u * 1000 / 2 + 5, sum);
    }
    EXPECT_EQ(1001u, nDisownedG);
    EXPECT_EQ(0u, pool.GetUsedBytes());
}

TEST(HashTableTest, TableThatDoesNotOwnCallsNoHooks) {
    RoxMempool pool("numbers");
    nOwnedG = nDisownedG = 0;
    _RoxHashTable::Entry entry = {Number(1), Number(2)};
    _RoxHashTable::Entry other = {Number(3), Number(4)};
    {
        _RoxHashTable table(&pool, 5, false, &numberHooksG, roxMempoolUserNone, 0);
        table._Store(&entry);
        table._Store(&other);
        EXPECT_EQ(&entry, table._Lookup(Number(1)));
        EXPECT_TRUE(table._Remove(Number(1)));
    }
    EXPECT_EQ(0u, nOwnedG + nDisownedG);
    EXPECT_EQ(Number(2), entry.pData);
}

TEST(HashTableTest, TableCallsTheKeyFunctionsItWasGiven) {
    constexpr _RoxHashTable::Hooks hooks = {
        nullptr, nullptr,
        [](const void* key) { return 3 * static_cast<uint32_t>(reinterpret_cast<uintptr_t>(key)); },
        [](const void* a, const void* b) {
            return static_cast<int>(reinterpret_cast<uintptr_t>(a) * 10 + reinterpret_cast<uintptr_t>(b));
        }};
    _RoxHashTable table(nullptr, 5, false, &hooks, roxMempoolUserNone, 0);
    EXPECT_EQ(21u, table._Hash(Number(7)));
    EXPECT_EQ(75, table._Compare(Number(7), Number(5)));
    Table texts(nullptr);
    RoxString a("abc");
    RoxString b("abc");
    EXPECT_EQ(_RoxHashTable::HashRoxStringRepN(b.GetRepN()), texts._Hash(a.GetRepN()));
    EXPECT_EQ(0, texts._Compare(a.GetRepN(), b.GetRepN()));
}

TEST(HashTableTest, KeyFunctions) {
    RoxString a("abc");
    RoxString b("abc");
    RoxString c("abd");
    EXPECT_EQ(0, _RoxHashTable::CmpRoxStringRepN(a.GetRepN(), b.GetRepN()));
    EXPECT_LT(_RoxHashTable::CmpRoxStringRepN(a.GetRepN(), c.GetRepN()), 0);
    EXPECT_GT(_RoxHashTable::CmpRoxStringRepN(a.GetRepN(), nullptr), 0);
    EXPECT_EQ(0, _RoxHashTable::CmpRoxStringRepN(nullptr, nullptr));
    EXPECT_EQ(_RoxHashTable::HashRoxStringRepN(a.GetRepN()), _RoxHashTable::HashRoxStringRepN(b.GetRepN()));
    EXPECT_NE(_RoxHashTable::HashRoxStringRepN(a.GetRepN()), _RoxHashTable::HashRoxStringRepN(c.GetRepN()));
    EXPECT_EQ(0, _RoxHashTable::CompareU32(Number(7), Number(7)));
    EXPECT_LT(_RoxHashTable::CompareU32(Number(7), Number(0x80000000)), 0);
    EXPECT_GT(_RoxHashTable::CompareU32(Number(0x80000000), Number(7)), 0);
    EXPECT_EQ(_RoxHashTable::HashU32(Number(7)), _RoxHashTable::HashU32(Number(7)));
}

TEST(HashTableDeathTest, LookupByTextNeedsStringKeys) {
    _RoxHashTable table(nullptr, 5, true, &numberHooksG, roxMempoolUserNone, 0);
    EXPECT_DEATH(table._LookupUtf8("x", 1), "_RoxHashTable::_LookupUtf8: the keys are no strings");
}
