#pragma once

#include <cstdint>

#include "rox/_RoxHashTable.h"
#include "rox/_RoxHashTableIter.h"

/// Table from 32-bit numbers to words of which ValueOwner (static Own and Disown of a V*) tells how the table
/// holds them. Not thread-safe.
template <class V, class ValueOwner>
class RoxHashIntTable : public _RoxHashTable {
 public:
    explicit RoxHashIntTable(RoxMempool* pool, unsigned initialSize = 10,
                             RoxMempoolUser user = roxMempoolUserNone, RoxLockId lockId = 0)
        : _RoxHashTable(pool, initialSize, true, &hooksG, user, lockId) {}

    /// The value of that key, or null; no hold of the caller's own.
    V* Find(uint32_t key) const {
        const Entry* const entry = _Lookup(KeyWord(key));
        return entry == nullptr ? nullptr : static_cast<V*>(entry->pData);
    }
    /// Stores a value under a key, in place of the one that was there.
    void Store(uint32_t key, V* value) {
        ValueOwner::Own(value);
        bool fStored = false;
        Entry* const entry = _StoreIfAbsent(KeyWord(key), fStored);
        V* const old = fStored ? nullptr : static_cast<V*>(entry->pData);
        entry->pData = value;
        ValueOwner::Disown(old);
    }
    /// False when the key is not in the table.
    bool Remove(uint32_t key) { return _Remove(KeyWord(key)); }

    static uint32_t KeyOf(const _RoxHashTableIter& iter) { return KeyNumber(iter.CurrentKey()); }
    static V* ValueOf(const _RoxHashTableIter& iter) { return static_cast<V*>(iter.CurrentData()); }

 private:
    static void* KeyWord(uint32_t key) { return reinterpret_cast<void*>(static_cast<uintptr_t>(key)); }
    static uint32_t KeyNumber(const void* word) {
        return static_cast<uint32_t>(reinterpret_cast<uintptr_t>(word));
    }
    static void Own(RoxMempool*, Entry* entry) { ValueOwner::Own(static_cast<V*>(entry->pData)); }
    static void Disown(RoxMempool* pool, Entry* entry) {
        V* const value = static_cast<V*>(entry->pData);
        RoxMempool::FreeIn(pool, entry);
        ValueOwner::Disown(value);
    }

    static constexpr Hooks hooksG = {&Own, &Disown, &HashU32, &CompareU32};
};
