#pragma once

#include "rox/RoxCoreOwner.h"
#include "rox/RoxHashTable.h"
#include "rox/RoxString.h"
#include "rox/RoxStringRepNOwner.h"
#include "rox/ref.h"

/// Table from text to counted objects of class T. Not thread-safe.
template <class T>
class RoxHashStringToCore : public RoxHashTable<RoxStringRepN*, RoxCore*, RoxString, ref<RoxCore>,
                                                RoxStringRepNOwner, RoxCoreOwner> {
    using Base =
        RoxHashTable<RoxStringRepN*, RoxCore*, RoxString, ref<RoxCore>, RoxStringRepNOwner, RoxCoreOwner>;

 public:
    using Base::Base;
    using Entry = _RoxHashTable::Entry;

    /// The value of that key without a reference of its own, or null.
    T* Find(const RoxString& key) const { return ValueOf(this->_Lookup(key.GetRepN())); }
    /// The same for text up to the NUL; makes no string.
    T* Find(const char* key) const { return ValueOf(this->_LookupUtf8(key, __builtin_strlen(key))); }
    T* FindBytes(const char* bytes, size_t n) const { return ValueOf(this->_LookupUtf8(bytes, n)); }

    /// Stores a key that is not in the table yet; takes holds on both.
    void Add(const RoxString& key, T* value) {
        Entry* entry = static_cast<Entry*>(RoxMempool::CallocIn(this->GetMempool(), sizeof(Entry)));
        entry->pKey = key.GetRepN();
        entry->pData = static_cast<RoxCore*>(value);
        this->_Store(entry);
    }
    /// False when the key is not in the table.
    bool Remove(const RoxString& key) { return this->_Remove(key.GetRepN()); }

    static RoxString KeyOf(const _RoxHashTableIter& iter) {
        return RoxString(static_cast<RoxStringRepN*>(iter.CurrentKey()));
    }
    static T* ValueOf(const _RoxHashTableIter& iter) {
        return static_cast<T*>(static_cast<RoxCore*>(iter.CurrentData()));
    }

 private:
    static T* ValueOf(const Entry* entry) {
        return entry == nullptr ? nullptr : static_cast<T*>(static_cast<RoxCore*>(entry->pData));
    }
};
