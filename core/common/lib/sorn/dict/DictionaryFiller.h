#pragma once

#include "rox/_RoxHashTable.h"
#include "sorn/dict/ArrayCore.h"
#include "sorn/dict/Dictionary.h"

namespace sorn {

/// How the text reader adds to a dictionary: the name first, with one search that tells a name which is there
/// already, and the value when it has been read. Between the two the name has the value null.
class DictionaryFiller {
 public:
    using Place = _RoxHashTable::Entry;

    /// The place of a name. `fNew`: it is new, and took over the caller's hold on the name; else the caller
    /// keeps that.
    static Place* Open(Dictionary& dictionary, RoxStringRepN* name, bool& fNew) {
        Place* const place = dictionary.tableM._StoreIfAbsent(name, fNew);
        if (fNew) ++dictionary.nValuesM;
        return place;
    }
    /// Whether the name's first value is there and not null.
    static bool FHasValue(const Place* place) {
        DictValue* const stored = static_cast<DictValue*>(static_cast<RoxCore*>(place->pData));
        const ArrayCore* const several = ArrayCore::From(stored);
        return (several == nullptr ? stored : several->At(0)) != nullptr;
    }
    static RoxStringRepN* NameOf(const Place* place) { return static_cast<RoxStringRepN*>(place->pKey); }
    /// Gives a new place its value, which has just been made and has no other holder.
    static void Fill(Place* place, DictValue* value) {
        value->UpRef();
        place->pData = static_cast<RoxCore*>(value);
    }
    /// Takes the name of a new place, still without a value, out again.
    static void Abandon(Dictionary& dictionary, Place* place) {
        --dictionary.nValuesM;
        dictionary.tableM._Remove(place->pKey);
    }
};

}  // namespace sorn
