#pragma once

#include "rox/RoxWorkStack.h"
#include "rox/_RoxHashTableIter.h"
#include "sorn/dict/ArrayCore.h"
#include "sorn/dict/Dictionary.h"

namespace sorn {

/// The walk over a dictionary's names and their values for writers and comparers, in table order: no
/// references are taken, and nothing is allocated but what PushSorted makes the caller's stack grow by. It
/// holds until the dictionary changes.
class DictionaryEntries {
 public:
    /// One name with its values; holds as long as the walk.
    class Name {
     public:
        Name() = default;
        Name(RoxStringRepN* key, DictValue* value) : pKeyM(key), pValueM(value) {}

        /// Null for the empty name.
        RoxStringRepN* GetRepN() const { return pKeyM; }
        const char* Utf8() const { return pKeyM != nullptr ? pKeyM->GetBytes() : ""; }
        uint32_t NByte() const { return pKeyM != nullptr ? pKeyM->GetLength() : 0; }
        RoxString ToRoxString() const { return RoxString(pKeyM); }

        unsigned CountValues() const {
            const ArrayCore* const several = ArrayCore::From(pValueM);
            return several == nullptr ? 1 : several->CountValues();
        }
        /// Value i, which must be below the count; null where a program added null.
        DictValue* At(unsigned i) const {
            const ArrayCore* const several = ArrayCore::From(pValueM);
            return several == nullptr ? pValueM : several->At(i);
        }
        /// The value when there is one, else their holder, whose tag no value has; may be null.
        const DictValue* GetStored() const { return pValueM; }
        /// The values when there are several, else null.
        const RoxGenericArray* GetSeveral() const {
            const ArrayCore* const several = ArrayCore::From(pValueM);
            return several == nullptr ? nullptr : &several->GetValues();
        }

     private:
        friend class DictionaryEntries;

        RoxStringRepN* pKeyM = nullptr;
        DictValue* pValueM = nullptr;
    };

    // The runtime's iterator can remove, and so asks for a table that may change; this walk does not.
    explicit DictionaryEntries(const Dictionary& dictionary)
        : iterM(const_cast<RoxHashStringToCore<RoxCore>&>(dictionary.tableM)) {}

    bool FCurrent() const { return iterM.FCurrent(); }
    Name Current() const {
        return Name(static_cast<RoxStringRepN*>(iterM.CurrentKey()), ValueOf(iterM.CurrentData()));
    }
    void Next() { iterM.Next(); }

    /// The number of names, as opposed to Dictionary::CountNames.
    static unsigned Count(const Dictionary& dictionary) { return dictionary.tableM.Count(); }
    /// Asks the processor for what the walk over a dictionary reads first.
    static void Prefetch(const Dictionary& dictionary) { dictionary.tableM._Prefetch(); }
    /// Looks a name up; false when the dictionary has not got it.
    static bool Find(const Dictionary& dictionary, const Name& name, Name& found) {
        const _RoxHashTable::Entry* const entry = dictionary.tableM._Lookup(name.GetRepN());
        if (entry == nullptr) return false;
        found = Name(static_cast<RoxStringRepN*>(entry->pKey), ValueOf(entry->pData));
        return true;
    }

    /// Pushes all names in ascending byte order, the lowest first: they are the topmost Count(dictionary)
    /// frames then.
    template <unsigned nInline>
    static void PushSorted(const Dictionary& dictionary, RoxWorkStack<Name, nInline>& stack) {
        const size_t first = stack.Size();
        for (DictionaryEntries names(dictionary); names.FCurrent(); names.Next()) {
            DictValue* const value = ValueOf(names.iterM.CurrentData());
            __builtin_prefetch(value);  // the values lie anywhere, and are wanted soon
            stack.Emplace(static_cast<RoxStringRepN*>(names.iterM.CurrentKey()), value);
        }
        if (stack.Size() - first > 1) Sort(&stack[first], stack.Size() - first);
    }
    /// Sorts n names by strcmp of their bytes; names that are one up to a NUL byte by what follows it.
    static void Sort(Name* names, size_t n);

 private:
    static DictValue* ValueOf(void* data) { return static_cast<DictValue*>(static_cast<RoxCore*>(data)); }

    _RoxHashTableIter iterM;
};

}  // namespace sorn
