#pragma once

#include <cstddef>
#include <cstdint>
#include <new>

#include "rox/RoxMempool.h"
#include "sorn/model/SornHashTableUtil.h"

namespace sorn {

/// A chained hash table whose first nEntries entries are part of the table itself; more come in overflow
/// blocks of at most blockBytes bytes each. Entries never move, so a value's address holds until Clear. Keys
/// are kept as given.
///
/// The functions: Hash and KeyCompare find a key; KeyClear and ValueClear empty an entry that Clear gives
/// back; ValueCompare completes the set of a value's functions and is not called. Overflow blocks and all
/// bucket arrays but the first come from the table's pool (null: the general heap), which must outlive the
/// table. No locks.
template <class K, class V, int nEntries, int blockBytes, uint32_t (*Hash)(const K&),
          bool (*KeyCompare)(const K&, const K&), bool (*ValueCompare)(const V&, const V&),
          void (*KeyClear)(K&), void (*ValueClear)(V&)>
class SornHashTable {
 public:
    struct Block;

    struct Entry {
        Block* block = nullptr;  ///< the overflow block that holds the entry; null for a preallocated one
        union {
            uint32_t hash;        ///< in use: hash of the key
            Entry* previousFree;  ///< free: the previous free entry
        };
        Entry* next = nullptr;  ///< in use: the next entry of the bucket; free: the next free entry
        K key{};
        V value{};

        Entry() : previousFree(nullptr) {}
    };

    static constexpr size_t blockHeaderBytesG =
        (sizeof(RoxMempool*) + sizeof(int32_t) + alignof(Entry) - 1) / alignof(Entry) * alignof(Entry);
    static constexpr int nEntriesPerBlockG =
        static_cast<int>((static_cast<size_t>(blockBytes) - blockHeaderBytesG) / sizeof(Entry));

    struct Block {
        RoxMempool* pool;
        int32_t nFree = nEntriesPerBlockG;
        Entry entries[static_cast<size_t>(nEntriesPerBlockG)];

        explicit Block(RoxMempool* p) : pool(p) {}
    };
    static_assert(nEntriesPerBlockG > 0 && sizeof(Block) <= static_cast<size_t>(blockBytes));

    /// An empty table that takes its memory from `pool`.
    explicit SornHashTable(RoxMempool* pool) : poolM(pool) { InitializeEntries(entriesM, nEntries, nullptr); }
    SornHashTable(const SornHashTable&) = delete;
    SornHashTable& operator=(const SornHashTable&) = delete;
    ~SornHashTable() { Clear(); }

    /// Finds or adds a key. True: it existed. False: a new entry with an empty value was added. `value`
    /// points to the entry's value in either case.
    bool Put(const K& key, V*& value) {
        const uint32_t hash = Hash(key);
        for (Entry* entry = *BucketOf(hash); entry != nullptr; entry = entry->next) {
            if (entry->hash == hash && KeyCompare(entry->key, key)) {
                value = &entry->value;
                return true;
            }
        }
        if (FGrowsAt(loadFactorM, sizeIndexM, nEntriesUsedM)) Grow();
        Entry* const entry = TakeFree();
        entry->hash = hash;
        entry->key = key;
        PutInBucket(entry);
        ++nEntriesUsedM;
        value = &entry->value;
        return false;
    }

    /// Empties the table: back to the first buckets, all blocks given back to the pool.
    void Clear() {
        for (int32_t i = 0; i < nBucketsM; ++i) {
            for (Entry* entry = bucketsM[i]; entry != nullptr;) {
                Entry* const next = entry->next;
                GiveBack(entry);
                entry = next;
            }
        }
        FreeBuckets();
        sizeIndexM = 0;
        nBucketsM = nFirstBucketsG;
        bucketsM = firstBucketsM;
        for (Entry*& bucket : firstBucketsM) bucket = nullptr;
        nEntriesUsedM = 0;
    }

    /// Sets the block of `count` entries and appends them to the free list, which must not have them yet.
    void InitializeEntries(Entry* entries, int count, Block* block) {
        for (int i = 0; i < count; ++i) {
            entries[i].block = block;
            AppendFree(&entries[i]);
        }
    }

    /// Whether a table with hashTableSizesG[sizeIndex] buckets and that many entries grows before it takes a
    /// new key. Equality is enough: the count passes each limit one by one.
    static bool FGrowsAt(int32_t loadFactorPercent, int32_t sizeIndex, int32_t nEntriesUsed) {
        return sizeIndex < lastSizeIndexG &&
               nEntriesUsed == loadFactorPercent * SornHashTableUtil::hashTableSizesG[sizeIndex] / 100;
    }

    RoxMempool* GetMempool() const { return poolM; }
    int32_t GetSizeIndex() const { return sizeIndexM; }
    int32_t GetBucketCount() const { return nBucketsM; }
    int32_t GetEntryCount() const { return nEntriesUsedM; }

 private:
    static constexpr int32_t nFirstBucketsG = 53;
    static constexpr int32_t lastSizeIndexG =
        12;  // bucket arrays of 48 MiB on the 32-bit target; no larger ones

    Entry** BucketOf(uint32_t hash) { return &bucketsM[hash % static_cast<uint32_t>(nBucketsM)]; }

    void PutInBucket(Entry* entry) {
        Entry** const bucket = BucketOf(entry->hash);
        entry->next = *bucket;
        *bucket = entry;
    }

    void Grow() {
        Entry** const oldBuckets = bucketsM;
        const int32_t nOldBuckets = nBucketsM;
        const int32_t nBuckets = SornHashTableUtil::hashTableSizesG[sizeIndexM + 1];
        bucketsM =
            static_cast<Entry**>(RoxMempool::CallocIn(poolM, static_cast<size_t>(nBuckets) * sizeof(Entry*)));
        nBucketsM = nBuckets;
        for (int32_t i = 0; i < nOldBuckets; ++i) {
            for (Entry* entry = oldBuckets[i]; entry != nullptr;) {
                Entry* const next = entry->next;
                PutInBucket(entry);
                entry = next;
            }
        }
        if (oldBuckets != firstBucketsM) RoxMempool::FreeIn(poolM, oldBuckets);
        ++sizeIndexM;
    }

    void FreeBuckets() {
        if (sizeIndexM >= 1) RoxMempool::FreeIn(poolM, bucketsM);
    }

    /// Takes the head of the free list, which gets the entries of a new block when it is empty.
    Entry* TakeFree() {
        if (freeM == nullptr) {
            Block* const block = new (RoxMempool::MallocIn(poolM, sizeof(Block))) Block(poolM);
            InitializeEntries(block->entries, nEntriesPerBlockG, block);
        }
        Entry* const entry = freeM;
        UnlinkFree(entry);
        if (entry->block != nullptr) --entry->block->nFree;
        return entry;
    }

    /// Empties an entry and puts it back into the free list; with the last one of a block, the block goes.
    void GiveBack(Entry* entry) {
        KeyClear(entry->key);
        ValueClear(entry->value);
        AppendFree(entry);
        Block* const block = entry->block;
        if (block == nullptr || ++block->nFree != nEntriesPerBlockG) return;
        for (Entry& each : block->entries) UnlinkFree(&each);
        RoxMempool* const pool = block->pool;
        block->~Block();
        RoxMempool::FreeIn(pool, block);
    }

    void AppendFree(Entry* entry) {
        if (freeM == nullptr) {
            entry->previousFree = entry;
            entry->next = entry;
            freeM = entry;
            return;
        }
        Entry* const last = freeM->previousFree;
        last->next = entry;
        entry->previousFree = last;
        entry->next = freeM;
        freeM->previousFree = entry;
    }

    void UnlinkFree(Entry* entry) {
        if (entry->next == entry) {
            freeM = nullptr;
            return;
        }
        entry->previousFree->next = entry->next;
        entry->next->previousFree = entry->previousFree;
        if (freeM == entry) freeM = entry->next;
    }

    RoxMempool* poolM;
    int32_t loadFactorM = 75;  // percent
    int32_t sizeIndexM = 0;    // into SornHashTableUtil::hashTableSizesG
    int32_t nBucketsM = nFirstBucketsG;
    int32_t nEntriesUsedM = 0;
    Entry* firstBucketsM[nFirstBucketsG] = {};
    Entry** bucketsM = firstBucketsM;
    Entry entriesM[static_cast<size_t>(nEntries)];
    Entry* freeM = nullptr;  // head of a circular doubly linked list
};

}  // namespace sorn
