#pragma once

#include <cstddef>
#include <cstdint>

#include "rox/RoxLockId.h"
#include "rox/RoxMempool.h"
#include "rox/RoxMempoolUser.h"

class RoxStringRepN;

/// Hash table of two-word entries, which its users allocate with the pool's Calloc. Entries never move. Up to
/// 16 entries are searched by a linear scan, more through an index. At most 2^30 entries. Allocates nothing
/// before the first _Store. A table that has lost most of its entries shrinks at the next _Store or _Remove,
/// so that walks cost what is there. Not thread-safe.
class _RoxHashTable {
 public:
    struct Entry {
        void* pKey;
        void* pData;
    };

    /// What the table asks of its users. Must outlive the table.
    struct Hooks {
        /// Takes what holds the table needs on key and data.
        void (*own)(RoxMempool* pool, Entry* entry);
        /// Drops these holds and frees the entry to the pool.
        void (*disown)(RoxMempool* pool, Entry* entry);
        uint32_t (*hash)(const void* key);
        /// 0 when the keys are equal.
        int (*compare)(const void* a, const void* b);
    };

    /// `initialSize`: entries that the first allocation makes room for. `fOwn` false: own and disown are
    /// never called, and the entries stay their maker's. The pool may be null.
    _RoxHashTable(RoxMempool* pool, unsigned initialSize, bool fOwn, const Hooks* hooks, RoxMempoolUser user,
                  RoxLockId lockId);
    _RoxHashTable(const _RoxHashTable&) = delete;
    _RoxHashTable& operator=(const _RoxHashTable&) = delete;
    /// Disowns all entries.
    ~_RoxHashTable();

    /// The entry of that key, or null.
    Entry* _Lookup(const void* key) const;
    Entry* _Find(const void* key) const { return _Lookup(key); }
    /// In a table of string keys: the entry whose key has these bytes, or null. No string is made for it.
    Entry* _LookupUtf8(const char* bytes, size_t n) const;
    /// Inserts an entry, whose key must not be in the table.
    void _Store(Entry* entry);
    /// Looks the key up and, when it is not there, stores a new entry of it without data; `fStored` tells
    /// which. With one search only. A new entry takes over the caller's hold on the key, so that `own` is not
    /// called, and its data word is the caller's to fill.
    Entry* _StoreIfAbsent(void* key, bool& fStored);
    /// Removes the entry of that key and disowns it. False when there is none.
    bool _Remove(const void* key);
    /// Removes all entries.
    void Clear();

    /// The functions for keys that the table was given.
    uint32_t _Hash(const void* key) const { return pHooksM->hash(key); }
    int _Compare(const void* a, const void* b) const { return pHooksM->compare(a, b); }

    unsigned Count() const { return nLiveM; }
    /// Asks the processor for what a walk reads first.
    void _Prefetch() const { __builtin_prefetch(vEntryM); }
    RoxMempool* GetMempool() const { return pMempoolM; }
    RoxMempoolUser GetUser() const { return userM; }
    RoxLockId GetLockId() const { return lockIdM; }

    /// Hash and comparison of RoxStringRepN* keys by text; null is the empty text.
    static uint32_t HashRoxStringRepN(const void* key);
    static int CmpRoxStringRepN(const void* a, const void* b);
    /// The same for 32-bit numbers that stand in the key word itself.
    static uint32_t HashU32(const void* key);
    static int CompareU32(const void* a, const void* b);

 private:
    friend class _RoxHashTableIter;
    static constexpr unsigned noSlot = 0xFFFFFFFF;

    bool FIndexed() const { return indexMaskM != 0; }
    /// By slot: a quick mark of the key, its hash once the table is indexed.
    uint32_t* Tags() const { return reinterpret_cast<uint32_t*>(vEntryM + capacityM); }
    /// Open addressing: slot + 1, or 0; only in tables above the linear limit.
    uint32_t* Index() const { return Tags() + capacityM; }
    bool FStringKeys() const { return pHooksM->hash == &HashRoxStringRepN; }
    uint32_t TagOf(const void* key) const;
    unsigned FindSlot(const void* key) const;
    template <class Equal>
    unsigned Search(uint32_t tag, Equal equal) const;
    unsigned FindSlotTagged(uint32_t tag, const void* key) const;
    void Put(Entry* entry, uint32_t tag);
    void RemoveSlot(unsigned slot);
    void MakeRoom();
    void ShrinkIfSparse();
    void Rebuild(unsigned capacity);
    void IndexSlot(unsigned slot);

    RoxMempool* pMempoolM;
    const Hooks* pHooksM;
    Entry** vEntryM =
        nullptr;  // by slot, in order of arrival, null where one was removed; tags and index follow
    uint32_t nLiveM = 0;
    uint32_t nSlotM = 0;
    uint32_t firstSlotM = 0;  // no entry before it: walks of a table emptied from the front start here
    uint32_t capacityM = 0;
    uint32_t indexMaskM = 0;  // 0 without an index
    uint32_t initialSizeM;
    RoxLockId lockIdM;
    RoxMempoolUser userM;
    bool fOwnM;
};
