#pragma once

#include "rox/RoxCoreOwner.h"
#include "rox/RoxHashIntTable.h"
#include "rox/ref.h"

/// Table from 32-bit numbers to counted objects of class T, on which it holds references. Not thread-safe.
template <class T>
class RoxHashIntToCore : public RoxHashIntTable<RoxCore, RoxCoreOwner> {
    using Base = RoxHashIntTable<RoxCore, RoxCoreOwner>;

 public:
    using Base::Base;

    /// Null when the key is not in the table.
    ref<T> Find(uint32_t key) const { return ref<T>(static_cast<T*>(Base::Find(key))); }
    void Store(uint32_t key, const ref<T>& value) { Base::Store(key, value.get()); }
    static ref<T> ValueOf(const _RoxHashTableIter& iter) {
        return ref<T>(static_cast<T*>(Base::ValueOf(iter)));
    }
};
