#pragma once

#include "rox/RoxString.h"
#include "rox/RoxWorkStack.h"
#include "rox/ref.h"
#include "sorn/convert/FieldAccess.h"
#include "sorn/convert/StructTable.h"
#include "sorn/model/OrvoVersion.h"
#include "sorn/model/SornObject.h"
#include "sorn/model/StructInfo.h"

namespace sorn {

class ArrayValue;
class Dictionary;
class DictValue;

/// The walk from an object to a dictionary, with a stack of its own instead of recursion. One builder makes
/// one conversion. Null references are left out, at every place where one can stand.
class DictionaryBuilder {
 public:
    DictionaryBuilder(RoxMempool* pool, StructTable table, OrvoVersion version)
        : pMempoolM(pool), tableM(table), versionM(version), stackM(pool) {}

    /// The whole dictionary.
    ref<Dictionary> Build(const SornObject& object);
    /// Adds one field, repeated or not, to a dictionary that is there. A name that has 65,535 values, the
    /// most that it takes, is left as it is.
    void AddField(const RoxString& name, const FieldInfo* field, bool isMulti, const SornObject& object,
                  Dictionary* out);

 private:
    /// A dictionary under construction. Containers join the ones around them before they are filled, so that
    /// the frames need no references. The lowest frame of AddField has no struct: it stands for one field.
    struct Frame {
        const StructInfo* pInfo;
        const SornObject* pObject;
        Dictionary* pDictionary;
        const FieldInfo* pField;  ///< the field under way, or null
        const RoxString* pName;   ///< its name
        ArrayValue* pArray;       ///< the array of its elements, made when the first one comes
        uint32_t nextElement;
        uint32_t nElements;
        int32_t slot;
        bool isMulti;
    };

    void Run();
    bool NextField(Frame& frame) const;
    void StartField(Frame& frame, const FieldInfo* field, const RoxString* name, bool isMulti) const;
    void AddElement(Frame& frame);
    ref<Dictionary> NewDictionary(const SornObject& object) const;
    void PushObject(const SornObject& object, Dictionary* out);
    bool Place(Frame& frame, const ref<DictValue>& value) const;
    ref<DictValue> MakeValue(const FieldInfo& field, const FieldSource& source, unsigned i) const;
    ref<DictValue> MakeReferenceValue(const FieldInfo& field, const FieldSource& source, unsigned i) const;
    RoxString MakeText(const FieldInfo& field, const FieldSource& source, unsigned i) const;
    const StructInfo& StructOf(const SornObject& object) const;

    RoxMempool* pMempoolM;
    StructTable tableM;
    OrvoVersion versionM;
    RoxWorkStack<Frame, 8> stackM;
};

}  // namespace sorn
