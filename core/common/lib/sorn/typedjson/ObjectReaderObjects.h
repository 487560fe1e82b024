#pragma once

#include <cstdint>

#include "rox/RoxWorkStack.h"
#include "sorn/model/StructInfo.h"

namespace sorn {

/// The struct of each object of a text, by its number; null where none is named.
using StructList = RoxWorkStack<const StructInfo*, 16>;

/// The numbering of the objects of a text, in the order in which they begin. An object that comes when all in
/// the list have come is met for the first time: it joins the list, and its struct is noted there. When the
/// same text is read again the list tells the structs.
class ObjectReaderObjects {
 public:
    ObjectReaderObjects(uint32_t& index, StructList& list) : indexM(index), listM(list) {}

    /// Gives the object that begins here its number. True on its first visit.
    bool Enter(uint32_t& number) {
        number = indexM++;
        if (number != listM.Size()) return false;
        listM.Push(nullptr);
        return true;
    }
    bool FNextIsNew() const { return indexM == listM.Size(); }
    void Note(uint32_t number, const StructInfo* info) { listM[number] = info; }
    /// What was noted for the object that is entered next, or null.
    const StructInfo* NextStruct() const { return indexM < listM.Size() ? listM[indexM] : nullptr; }
    /// Counts an any-dict value as one object, whatever it holds. When it holds maps the numbers lag behind
    /// from here on, and known-dict fields behind it take the structs of earlier objects: required.
    void CountAnyDict() { ++indexM; }

 private:
    uint32_t& indexM;
    StructList& listM;
};

}  // namespace sorn
