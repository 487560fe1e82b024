#pragma once

#include "rox/RoxString.h"
#include "rox/RoxWorkStack.h"
#include "rox/ref.h"
#include "sorn/convert/ErrorWords.h"
#include "sorn/convert/StructTable.h"
#include "sorn/convert/ValueReader.h"
#include "sorn/model/OrvoVersion.h"
#include "sorn/model/SornObject.h"
#include "sorn/model/StructInfo.h"

namespace sorn {

class ArrayValue;
class Dictionary;

/// The walk from a dictionary to an object, with a stack of its own instead of recursion, so that nesting
/// costs memory of the pool and none of the thread's stack. One builder makes one conversion.
class ObjectBuilder {
 public:
    /// The table gives ids their prefixes; structs are found by name in the schema. `error` is the caller's
    /// string, which gets the words of a failure.
    ObjectBuilder(RoxMempool* pool, StructTable table, OrvoVersion version, RoxString& error);
    ~ObjectBuilder();

    /// The whole object, or null.
    ref<SornObject> Build(Dictionary* dictionary);
    /// Stores one value in a field of an object that is there: a single field's value, or one more element.
    bool StoreValue(const FieldInfo* field, bool isMulti, DictValue* value, SornObject* object);

 private:
    /// An object under construction. The stack holds a reference on each object that it makes; dictionaries
    /// and arrays live in the tree that is read. The lowest frame of StoreValue has no struct: it stands for
    /// one value of one field.
    struct Frame {
        const StructInfo* pInfo;
        Dictionary* pDictionary;
        SornObject* pObject;
        const FieldInfo* pField;  ///< the field under way
        ArrayValue* pArray;       ///< the elements under way, or null
        uint32_t nextElement;
        int32_t slot;
        bool isMulti;  ///< how the field under way takes its values
    };

    bool Run();
    bool Step();
    bool NextField();
    bool StartSingle(DictValue* value);
    bool StartMulti(DictValue* value);
    bool ConvertValue(DictValue* value);
    bool OpenObject(Dictionary* dictionary);
    bool CloseObject();
    bool Fail(const char* words, const char* name);
    void AddFieldWords(const Frame& frame);
    void Unwind();
    void PopFrame();

    RoxMempool* pMempoolM;
    OrvoVersion versionM;
    ErrorWords wordsM;
    ValueReader readerM;
    RoxWorkStack<Frame, 8> stackM;
    ref<SornObject> resultM;
};

}  // namespace sorn
