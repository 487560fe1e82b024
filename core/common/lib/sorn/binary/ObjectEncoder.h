#pragma once

#include <cstdint>

#include "rox/RoxWorkStack.h"
#include "sorn/binary/LazyLevels.h"
#include "sorn/binary/ReverseBuffer.h"
#include "sorn/binary/StructPlan.h"
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
        : pMempoolM(pool), tableM(table), outM(out), plansM(table), stackM(pool) {}
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
    /// What a place of the walk lies in.
    struct Nesting {
        uint16_t nLazyLevels = 0;  ///< lazy bodies
        bool isInText = false;     ///< one of them is JSON text
    };
    static_assert(maxLazyLevelsG < UINT16_MAX);
    /// An object under way, or one field of it.
    struct Frame {
        const SornObject* pObject;
        const StructPlan* pPlan;       ///< null for a frame of one field
        uint64_t fields;               ///< those left of the group under way, as FindSet gives them
        uint32_t nGroupsLeft;          ///< groups that are left; then comes the one under way
        uint32_t nElements;            ///< elements that are left of the field of objects under way
        const PlannedField* pField;    ///< that field
        const PlannedField* pHeadTag;  ///< whose tag stands before the object; null for none
        size_t end;                    ///< bytes behind the object
        RoxCore* pHeld;                ///< what keeps the object alive, or null
        Nesting nesting;
        Form form;
    };

    /// The bytes of a group of fields all of which are single numbers, with what is overwritten before them.
    static constexpr size_t maxGroupG =
        StructPlan::nGroupG * (varint::maxBytes64G + WrittenField::maxTagBytesG);

    void Run();
    // What Run calls for every object is inlined into it by force, and what is rare is kept out: together
    // they are too large for the compiler's taste, and the calls would take a tenth of the time.
    __attribute__((always_inline)) bool StepFields(Frame& frame);
    __attribute__((always_inline)) unsigned char* WriteSimple(const unsigned char* object,
                                                              const WrittenField* group, uint64_t& fields,
                                                              const WrittenField*& other, unsigned char* p);
    __attribute__((always_inline)) bool StartField(Frame& frame, const PlannedField& field);
    __attribute__((always_inline)) void OpenElement(Frame& frame);
    __attribute__((always_inline)) void Open(const SornObject& object, Form form, const PlannedField* headTag,
                                             RoxCore* held, Nesting nesting);
    __attribute__((always_inline)) void Close(const Frame& frame);
    __attribute__((noinline)) bool OpenLazyBody(const ref<LazyDict>& body, const PlannedField* headTag,
                                                Nesting nesting);
    bool EnterLazyBody(const ref<LazyDict>& body, Nesting& nesting);
    ref<SornObject> NewTooDeepObject() const;
    void PushField(const SornObject& object);
    __attribute__((noinline)) void WriteElements(const PlannedField& field, const FieldSource& source);
    unsigned char* WriteBytes(const rox::ByteBuffer& bytes, unsigned char* p);
    unsigned char* WriteAnyDict(const Dict& dict, unsigned char* p);

    RoxMempool* pMempoolM;
    StructTable tableM;
    ReverseBuffer& outM;
    StructPlans plansM;
    PlannedField fieldM;  // of a walk over one field
    LazyTextBudget textBudgetM;
    RoxWorkStack<Frame, 8> stackM;
};

}  // namespace sorn
