#include "rox/_RoxHashTable.h"

#include <algorithm>
#include <cstring>
#include <string_view>

#include "rox/RoxAssert.h"
#include "rox/RoxHashBytes.h"
#include "rox/RoxStringRepN.h"
#include "rox/_RoxHashTableIter.h"

namespace {

// Tables up to this size are scanned: that costs less than the keyed hash of a name.
constexpr uint32_t linearLimit = 16;
constexpr uint32_t maxEntries = uint32_t{1} << 30;

std::string_view TextOf(const void* key) {
    const RoxStringRepN* rep = static_cast<const RoxStringRepN*>(key);
    return rep != nullptr ? std::string_view(rep->GetBytes(), rep->GetLength()) : std::string_view();
}

bool FEqualText(const void* key, std::string_view text) {
    std::string_view other = TextOf(key);
    return other.size() == text.size() &&
           (text.empty() || memcmp(other.data(), text.data(), text.size()) == 0);
}

/// Tells names apart well enough for a scan. Without a key, as nothing depends on its quality beyond 16
/// entries.
uint32_t QuickTag(std::string_view text) {
    size_t n = text.size();
    uint32_t head = 0;
    uint32_t tail = 0;
    if (n >= sizeof(head)) {
        memcpy(&head, text.data(), sizeof(head));
        memcpy(&tail, text.data() + n - sizeof(tail), sizeof(tail));
    } else {
        for (char c : text) {
            head = head << 8 | static_cast<unsigned char>(c);
        }
    }
    return (head * 0x9E3779B1u) ^ (tail * 0x85EBCA77u) ^ static_cast<uint32_t>(n);
}

}  // namespace

_RoxHashTable::_RoxHashTable(RoxMempool* pool, unsigned initialSize, bool fOwn, const Hooks* hooks,
                             RoxMempoolUser user, RoxLockId lockId)
    : pMempoolM(pool),
      pHooksM(hooks),
      initialSizeM(std::clamp(initialSize, 1u, maxEntries)),
      lockIdM(lockId),
      userM(user),
      fOwnM(fOwn) {}

_RoxHashTable::~_RoxHashTable() {
    Clear();
}

uint32_t _RoxHashTable::TagOf(const void* key) const {
    return !FIndexed() && FStringKeys() ? QuickTag(TextOf(key)) : _Hash(key);
}

/// The slot in use with that tag for whose key `equal` is true, or noSlot.
template <class Equal>
inline unsigned _RoxHashTable::Search(uint32_t tag, Equal equal) const {
    const uint32_t* const tags = Tags();
    if (!FIndexed()) {
        for (unsigned slot = 0; slot < nSlotM; ++slot) {
            if (tags[slot] == tag && vEntryM[slot] != nullptr && equal(vEntryM[slot]->pKey)) {
                return slot;
            }
        }
        return noSlot;
    }
    // Slots of removed entries stay in the index, and at least half of the index is 0.
    const uint32_t* const index = Index();
    for (uint32_t i = tag & indexMaskM; index[i] != 0; i = (i + 1) & indexMaskM) {
        unsigned slot = index[i] - 1;
        if (tags[slot] == tag && vEntryM[slot] != nullptr && equal(vEntryM[slot]->pKey)) {
            return slot;
        }
    }
    return noSlot;
}

unsigned _RoxHashTable::FindSlot(const void* key) const {
    if (nLiveM == 0) {
        return noSlot;
    }
    return FindSlotTagged(TagOf(key), key);
}

inline unsigned _RoxHashTable::FindSlotTagged(uint32_t tag, const void* key) const {
    if (FStringKeys()) {
        std::string_view text = TextOf(key);
        return Search(tag, [&](const void* other) { return other == key || FEqualText(other, text); });
    }
    return Search(tag, [&](const void* other) { return _Compare(other, key) == 0; });
}

_RoxHashTable::Entry* _RoxHashTable::_Lookup(const void* key) const {
    unsigned slot = FindSlot(key);
    return slot == noSlot ? nullptr : vEntryM[slot];
}

_RoxHashTable::Entry* _RoxHashTable::_LookupUtf8(const char* bytes, size_t n) const {
    RoxAssert(FStringKeys(), "_RoxHashTable::_LookupUtf8: the keys are no strings");
    if (nLiveM == 0) {
        return nullptr;
    }
    std::string_view text(bytes, n);
    uint32_t tag = FIndexed() ? RoxHashBytes(bytes, n) : QuickTag(text);
    unsigned slot = Search(tag, [&](const void* other) { return FEqualText(other, text); });
    return slot == noSlot ? nullptr : vEntryM[slot];
}

void _RoxHashTable::_Store(Entry* entry) {
    ShrinkIfSparse();
    Put(entry, TagOf(entry->pKey));
    if (fOwnM) {
        pHooksM->own(pMempoolM, entry);
    }
}

_RoxHashTable::Entry* _RoxHashTable::_StoreIfAbsent(void* key, bool& fStored) {
    ShrinkIfSparse();
    uint32_t tag = TagOf(key);
    unsigned slot = FindSlotTagged(tag, key);
    fStored = slot == noSlot;
    if (!fStored) {
        return vEntryM[slot];
    }
    Entry* entry = new (RoxMempool::MallocIn(pMempoolM, sizeof(Entry))) Entry{key, nullptr};
    Put(entry, tag);
    return entry;
}

/// Stores an entry whose key has that tag as the table stands.
inline void _RoxHashTable::Put(Entry* entry, uint32_t tag) {
    if (nSlotM == capacityM) {
        bool fWasIndexed = FIndexed();
        MakeRoom();
        if (fWasIndexed != FIndexed()) {
            tag = TagOf(entry->pKey);
        }
    }
    vEntryM[nSlotM] = entry;
    Tags()[nSlotM] = tag;
    if (FIndexed()) {
        IndexSlot(nSlotM);
    }
    ++nSlotM;
    ++nLiveM;
}

bool _RoxHashTable::_Remove(const void* key) {
    // Before the removal, not behind it: what is disowned may change this table, or end it.
    ShrinkIfSparse();
    unsigned slot = FindSlot(key);
    if (slot == noSlot) {
        return false;
    }
    RemoveSlot(slot);
    return true;
}

void _RoxHashTable::RemoveSlot(unsigned slot) {
    Entry* entry = vEntryM[slot];
    vEntryM[slot] = nullptr;
    --nLiveM;
    if (nLiveM == 0 && !FIndexed()) {
        nSlotM = 0;
        firstSlotM = 0;
    }
    while (firstSlotM < nSlotM && vEntryM[firstSlotM] == nullptr) {
        ++firstSlotM;
    }
    if (fOwnM) {
        pHooksM->disown(pMempoolM, entry);
    }
}

void _RoxHashTable::Clear() {
    // Detached first: what is disowned may look into this table.
    Entry** entries = vEntryM;
    unsigned n = nSlotM;
    vEntryM = nullptr;
    nLiveM = nSlotM = firstSlotM = capacityM = indexMaskM = 0;
    for (unsigned i = 0; fOwnM && i < n; ++i) {
        if (entries[i] != nullptr) {
            pHooksM->disown(pMempoolM, entries[i]);
        }
    }
    RoxMempool::FreeIn(pMempoolM, entries);
}

/// Makes a free slot at the end: by closing the gaps of removed entries if they are a quarter, else by
/// doubling.
void _RoxHashTable::MakeRoom() {
    if (capacityM == 0) {
        Rebuild(initialSizeM);
    } else if (nLiveM <= capacityM - (capacityM + 3) / 4) {
        Rebuild(capacityM);
    } else {
        RoxAssert(capacityM < maxEntries, "_RoxHashTable: too many entries");
        Rebuild(std::min(capacityM * 2, maxEntries));
    }
}

/// Closes the gaps when fewer than a quarter of the slots are in use. Never in RemoveSlot, which a walk
/// calls: its place is a slot.
inline void _RoxHashTable::ShrinkIfSparse() {
    if (nSlotM > linearLimit && nLiveM < nSlotM / 4) [[unlikely]] {
        Rebuild(std::max(linearLimit, nLiveM * 2));
    }
}

/// Moves the entries, in their order and without gaps, to new storage for `capacity` of them.
void _RoxHashTable::Rebuild(unsigned capacity) {
    bool fWasIndexed = FIndexed();
    uint64_t nIndex = 0;
    if (capacity > linearLimit) {
        for (nIndex = 2 * linearLimit; nIndex < uint64_t{2} * capacity; nIndex *= 2) {
        }
    }
    uint64_t bytes = uint64_t{capacity} * (sizeof(Entry*) + sizeof(uint32_t)) + nIndex * sizeof(uint32_t);
    RoxAssert(bytes <= SIZE_MAX / 2, "_RoxHashTable: too many entries");
    Entry** oldEntries = vEntryM;
    const uint32_t* oldTags = Tags();
    unsigned nOld = nSlotM;
    void* block = RoxMempool::MallocIn(pMempoolM, static_cast<size_t>(bytes));
    vEntryM = static_cast<Entry**>(block);
    capacityM = capacity;
    indexMaskM = static_cast<uint32_t>(nIndex - (nIndex == 0 ? 0 : 1));
    if (FIndexed()) {
        memset(Index(), 0, static_cast<size_t>(nIndex) * sizeof(uint32_t));
    }
    nSlotM = firstSlotM = 0;
    for (unsigned i = 0; i < nOld; ++i) {
        if (oldEntries[i] == nullptr) {
            continue;
        }
        vEntryM[nSlotM] = oldEntries[i];
        Tags()[nSlotM] = fWasIndexed == FIndexed() ? oldTags[i] : TagOf(oldEntries[i]->pKey);
        if (FIndexed()) {
            IndexSlot(nSlotM);
        }
        ++nSlotM;
    }
    RoxMempool::FreeIn(pMempoolM, oldEntries);
}

void _RoxHashTable::IndexSlot(unsigned slot) {
    uint32_t* const index = Index();
    uint32_t i = Tags()[slot] & indexMaskM;
    while (index[i] != 0) {
        i = (i + 1) & indexMaskM;
    }
    index[i] = slot + 1;
}

uint32_t _RoxHashTable::HashRoxStringRepN(const void* key) {
    const RoxStringRepN* rep = static_cast<const RoxStringRepN*>(key);
    return rep != nullptr ? rep->GetHash() : RoxHashBytes(nullptr, 0);
}

int _RoxHashTable::CmpRoxStringRepN(const void* a, const void* b) {
    return a == b ? 0 : TextOf(a).compare(TextOf(b));
}

uint32_t _RoxHashTable::HashU32(const void* key) {
    uint32_t number = static_cast<uint32_t>(reinterpret_cast<uintptr_t>(key));
    return RoxHashBytes(&number, sizeof(number));
}

int _RoxHashTable::CompareU32(const void* a, const void* b) {
    uint32_t x = static_cast<uint32_t>(reinterpret_cast<uintptr_t>(a));
    uint32_t y = static_cast<uint32_t>(reinterpret_cast<uintptr_t>(b));
    return (x > y) - (x < y);
}

void _RoxHashTableIter::RemoveCurrent() {
    if (FCurrent()) {
        pTableM->RemoveSlot(slotM);
    }
}
