#pragma once

#include "rox/_RoxHashTable.h"
#include "rox/_RoxHashTableIter.h"

/// Hash and comparison of a key type, as the hooks of a table.
template <class K>
struct RoxHashKeyTraits;

template <>
struct RoxHashKeyTraits<RoxStringRepN*> {
    static constexpr auto hash = &_RoxHashTable::HashRoxStringRepN;
    static constexpr auto compare = &_RoxHashTable::CmpRoxStringRepN;
};

/// _RoxHashTable typed: K and V are what an entry's two words hold, KeyHolder and ValueHolder what callers
/// use for them, KeyOwner and ValueOwner how the table holds them (static Own and Disown).
template <class K, class V, class KeyHolder, class ValueHolder, class KeyOwner, class ValueOwner>
class RoxHashTable : public _RoxHashTable {
 public:
    using KeyType = KeyHolder;
    using ValueType = ValueHolder;

    explicit RoxHashTable(RoxMempool* pool, unsigned initialSize = 5,
                          RoxMempoolUser user = roxMempoolUserNone, RoxLockId lockId = 0)
        : _RoxHashTable(pool, initialSize, true, &hooksG, user, lockId) {}

    /// Takes a hold on the key and a reference on the value.
    static void _Own(RoxMempool*, Entry* entry) {
        KeyOwner::Own(static_cast<K>(entry->pKey));
        ValueOwner::Own(static_cast<V>(entry->pData));
    }
    /// Drops both and frees the entry.
    static void _Disown(RoxMempool* pool, Entry* entry) {
        K key = static_cast<K>(entry->pKey);
        V value = static_cast<V>(entry->pData);
        RoxMempool::FreeIn(pool, entry);
        KeyOwner::Disown(key);
        ValueOwner::Disown(value);
    }

    static constexpr Hooks hooksG = {&_Own, &_Disown, RoxHashKeyTraits<K>::hash,
                                     RoxHashKeyTraits<K>::compare};
};
