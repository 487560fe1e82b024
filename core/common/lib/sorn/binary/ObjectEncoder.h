#pragma once

#include <cstdint>

#include "rox/RoxWorkStack.h"
#include "sorn/binary/ReverseBuffer.h"
#include "sorn/convert/FieldAccess.h"
#include "sorn/convert/StructTable.h"
#include "sorn/dict/LazyBody.h"
#include "sorn/model/FieldInfo.h"
#include "sorn/model/SornObject.h"

namespace sorn {

/// Writes objects from their end to their begin: fields from the last slot down, elements from the last one
/// down, so that every length is known when it is written. A stack of its own instead of recursion. One
/// encoder makes one walk.
class ObjectEncoder {
 public:
    /// What stands before an object's fields.
    enum Form : uint8_t {
        FIELDS,       ///< nothing
        SUBDICT,      ///< their length
        KNOWN_VALUE,  ///< the struct's id and their length
        KNOWN_FIELD,  ///< the length of a KNOWN_VALUE and that
    };

    /// Writes into the buffer; what the walk needs is made in the pool.
    ObjectEncoder(RoxMempool* pool, StructTable table, ReverseBuffer& out)
        : pMempoolM(pool), tableM(table), outM(out), stackM(pool) {}
    ~ObjectEncoder();

    void Object(const SornObject& object, Form form);
    /// The fields by the slots of `info`.
    void Fields(const StructInfo& info, const SornObject& object);
    /// A single field's value without its tag; nothing for a null reference.
    void SingleField(const FieldInfo& field, const SornObject& object);
    /// Tag and value of each element.
    void MultiField(uint32_t tag, const FieldInfo& field, const SornObject& object);
    /// A body as KNOWN_FIELD; nothing for null.
    void LazyBody(const ref<LazyDict>& body);

 private:
    /// An object under way, or one field of it.
    struct Frame {
        const SornObject* pObject;
        const FieldInfo* vFieldInfo;
        uint32_t slot;            ///< the slots below it are left, apart from those of `candidates`
        uint64_t candidates;      ///< of the slots from `slot` on: those that are left to be looked at
        uint32_t nElements;       ///< elements that are left of the field of objects under way
        const FieldInfo* pField;  ///< that field
        uint32_t tag;             ///< its tag; 0 for none
        uint32_t headTag;         ///< the tag that stands before the object; 0 for none
        size_t end;               ///< bytes behind the object
        RoxCore* pHeld;           ///< what keeps the object alive, or null
        uint32_t nLazyLevels;     ///< lazy bodies around
        Form form;
        bool isMulti;  ///< how the field under way holds its values
    };

    void Run();
    bool StepFields();
    static uint64_t FindCandidates(const Frame& frame, uint32_t first, uint32_t n);
    bool StartField(Frame& frame, const FieldInfo& field, bool isMulti, uint32_t tag);
    bool OpenElement(Frame& frame);
    bool OpenLazyBody(const ref<LazyDict>& body, uint32_t tag, uint32_t nLazyLevels);
    void Open(const SornObject& object, Form form, uint32_t headTag, RoxCore* held, uint32_t nLazyLevels);
    void PushField(const FieldInfo& field, const SornObject& object, bool isMulti, uint32_t tag);
    void Close();
    void WriteElements(const FieldInfo& field, const FieldSource& source, uint32_t tag);
    void WriteText(const RoxString& text, uint32_t tag);
    void WriteBytes(const rox::ByteBuffer* bytes, uint32_t tag);
    void WriteAnyDict(const Dict* dict, uint32_t tag);

    RoxMempool* pMempoolM;
    StructTable tableM;
    ReverseBuffer& outM;
    RoxWorkStack<Frame, 8> stackM;
};

}  // namespace sorn
