#pragma once

#include <cstdint>

#include "rox/RoxString.h"
#include "rox/ref.h"
#include "sorn/dict/DictValue.h"
#include "sorn/dict/LazyBody.h"
#include "sorn/model/FieldInfo.h"
#include "sorn/model/OrvoVersion.h"
#include "sorn/model/SornObject.h"
#include "sorn/typedjson/ObjectReaderObjects.h"

namespace kelbaselib {
class Bytesource;
}

namespace sorn {

class ByteBuffer;
class Dict;
class InputPointerBytesource;

/// The codec between objects and JSON text without a Dictionary between.
class JsonSornObject {
 public:
    explicit JsonSornObject(RoxMempool* pool);

    // Writing (JsonSornObjectWrite.cpp).

    // Text is compact. An object's fields stand in slot order at `version` (0: all fields in their current
    // form, else those that hold in it; sub-objects alike, but not what lies in lazy and any-dict fields),
    // and "type" stands in front of the last slot whose name sorts below it, whether or not that slot has a
    // value, or behind all fields when there is none. Older forms of fields are never written. Null
    // references are left out, in lists too, and so are lazy bodies that cannot be read. Writing cannot fail:
    // a number without a name in its enumeration is written as "INVALID_VALUE:" and the number, an id without
    // a struct as "XXX", and ids are cut at 99 bytes. The objects are only read, and nesting of any kind is
    // bounded by memory alone.

    /// The whole text of an object, in the pool.
    RoxString SornObjectToJson(const SornObject* object, OrvoVersion version);
    /// The same, appended.
    void SornObjectToJson(const SornObject* object, OrvoVersion version, ByteBuffer& out);
    /// Appends a name in quotes, as it is, and what goes between it and its value; a separator goes before it
    /// unless `first`, which becomes false.
    void WriteFieldName(const char* name, ByteBuffer& out, bool& first);
    /// Appends one field of arity 0 or 1 under a name of the caller's: whether it is present, and whether it
    /// holds in the version, is not asked. A null reference and a lazy body that cannot be read write
    /// nothing, not even the name; of a data type that does not exist only the name is written.
    void SingleFieldToJson(const char* name, const FieldInfo* field, const SornObject* object,
                           ByteBuffer& out, bool& first, OrvoVersion version);
    /// The same for a field of arity 2: without elements, and for a data type that does not exist, nothing.
    /// Elements that are all left out give an empty list.
    void MultiFieldToJson(const char* name, const FieldInfo* field, const SornObject* object, ByteBuffer& out,
                          bool& first, OrvoVersion version);
    /// Appends a body's compact text; null, and a body that cannot be read, write nothing.
    void LazyToJson(const LazyDict* body, ByteBuffer& out);

    // Reading (JsonSornObjectRead.cpp).

    // The text is read twice: the first pass tests the syntax and notes the struct that the "type" of each
    // object names, which may stand anywhere in it; the second makes the objects. Keys come in any order,
    // unknown ones are dropped, what is missing keeps its default, and the version is not looked at. Behind
    // the closing brace nothing is read. Nesting is bounded by memory alone.
    //
    // On failure words grow in `err` from the inside out, behind what it holds already; some replace it. None
    // come from inside objects and dictionaries in fields, and none at all for a text without a "type" or
    // with an unknown one. Their number is bounded (ObjectReaderWords::maxBytesG). A single value in a
    // repeated field is an element; arrays in arrays are flattened. An array for another field is refused,
    // one without elements too. A 65,536th element is refused, and so are objects that take more than
    // ObjectBudget gives for the text.

    /// From memory; a negative length counts as 0. On failure `*out` is null.
    bool JsonToSornObject(const unsigned char* data, int length, OrvoVersion version, ref<SornObject>* out,
                          RoxString& err);
    /// From two sources that the given one makes and that are released here; itself it is not read.
    /// bytesRead: what the first pass took, in whole reads of up to 16,384 bytes, so it may be more than the
    /// text.
    bool JsonToSornObject(kelbaselib::Bytesource* source, unsigned& bytesRead, OrvoVersion version,
                          ref<SornObject>* out, RoxString& err);
    /// From two cursors at the start of the same text, one for each pass.
    bool JsonToSornObject(InputPointerBytesource& first, InputPointerBytesource& second, OrvoVersion version,
                          ref<SornObject>* out, RoxString& err);

    // The parts of a read. They go on with the numbering of objects that the last read left: the object that
    // comes when all in the list have come is noted there and skipped, whatever struct is given. An any-dict
    // field counts as one object and is never noted: the numbers that have run past the list with it belong
    // to no object of the list, and an object behind it is made of the struct that is given, a known dict of
    // none. Without a field a value is dropped. The object's other fields and presence bytes are left alone;
    // after a failure a repeated field keeps the elements in front of the bad one. `depth` limits nothing. A
    // single value for a repeated field and an element or array for another one are refused.

    /// An object of a struct; null in `*out` (which may be missing) for one that is skipped.
    bool Unmarshal(int depth, InputPointerBytesource& cursor, const StructInfo* info, ref<SornObject>* out,
                   RoxString& err);
    /// The value of a key.
    bool ReadFieldValue(int depth, InputPointerBytesource& cursor, const FieldInfo* field,
                        ref<SornObject> object, RoxString& err);
    /// An array, or one element without brackets.
    bool ArrayValueFromJson(int depth, InputPointerBytesource& cursor, const FieldInfo* field,
                            ref<SornObject> object, RoxString& err);
    /// An element, or an array in the array.
    bool ArrayValueReadFieldValue(int depth, InputPointerBytesource& cursor, const FieldInfo* field,
                                  ref<SornObject> object, RoxString& err);
    bool UnmarshalOneSingleValue(int depth, InputPointerBytesource& cursor, const FieldInfo* field,
                                 ref<SornObject> object, RoxString& err);
    bool UnmarshalOneMultiValue(int depth, InputPointerBytesource& cursor, const FieldInfo* field,
                                ref<SornObject> object, RoxString& err);

    // Dictionaries without a schema: all scalars become texts, a name with several values has an array. A map
    // must have a key, and an array in an array is refused. A Dict that is there is added to. Words replace
    // what `err` holds.

    /// A value that must be a map.
    bool UnmarshalAnyDict(InputPointerBytesource& cursor, ref<Dict>* out);
    bool UnmarshalAnyDict(int depth, InputPointerBytesource& cursor, ref<Dict>* out, RoxString& err);
    /// A map (type LAZY_DICT) or a scalar (type STRING).
    bool UnmarshalAnyDictValue(int depth, InputPointerBytesource& cursor, dictvalue::Type& type,
                               RoxString& text, ref<Dict>& dict, RoxString& err);
    /// A key with its value or values.
    bool UnmarshalAnyDictField(int depth, InputPointerBytesource& cursor, const ref<Dict>& dict,
                               RoxString& err);

 private:
    RoxMempool* pMempoolM;                 // of everything made here
    const StructInfo* const* vStructDefM;  // Schema::vStructDefG
    uint32_t nStructDefM;
    uint32_t objectIndexM = 0;  // number of the object that is entered next
    StructList structListM;     // of the text that was read last; on the general heap
};

}  // namespace sorn
