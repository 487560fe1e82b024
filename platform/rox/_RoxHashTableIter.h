#pragma once

#include "rox/_RoxHashTable.h"

/// Walks the entries of a table in no defined order. The current entry may be removed during the walk through
/// RemoveCurrent; any other change of the table ends the walk's validity.
class _RoxHashTableIter {
 public:
    explicit _RoxHashTableIter(_RoxHashTable& table) : pTableM(&table), slotM(table.firstSlotM) {
        SkipRemoved();
    }

    /// True while the walk stands on an entry: false at the end, and after RemoveCurrent until Next.
    bool FCurrent() const { return slotM < pTableM->nSlotM && pTableM->vEntryM[slotM] != nullptr; }
    /// Key and data of the current entry, if there is one.
    void* CurrentKey() const { return pTableM->vEntryM[slotM]->pKey; }
    void* CurrentData() const { return pTableM->vEntryM[slotM]->pData; }
    void Next() {
        ++slotM;
        SkipRemoved();
    }
    /// Removes and disowns the current entry, if there is one; the walk goes on with Next.
    void RemoveCurrent();

 private:
    void SkipRemoved() {
        while (slotM < pTableM->nSlotM && pTableM->vEntryM[slotM] == nullptr) {
            ++slotM;
        }
    }

    _RoxHashTable* pTableM;
    unsigned slotM;
};
