#pragma once

#include <cstdint>

#include "rox/RoxWorkStack.h"
#include "rox/ref.h"
#include "sorn/binary/StructPlan.h"
#include "sorn/binary/WireValues.h"
#include "sorn/convert/FieldAccess.h"
#include "sorn/convert/ObjectBudget.h"
#include "sorn/convert/StructTable.h"
#include "sorn/dict/LazyBody.h"
#include "sorn/model/FieldInfo.h"
#include "sorn/model/SornObject.h"

namespace sorn {

/// Reads objects, with a stack of its own instead of recursion. Nested lengths are not compared with the end
/// of what is around them, but never leave the bytes that the reading was given. One decoder makes one
/// reading.
///
/// The operations give false for bad bytes, and then nothing of what was made is left, but for what an object
/// of the caller's got.
class ObjectDecoder {
 public:
    /// Reads the bytes from `begin` to `end`; all is made in the pool. With `owner`, the buffer that these
    /// bytes lie in, lazy bodies share them; without, they copy theirs.
    ObjectDecoder(RoxMempool* pool, StructTable table, const unsigned char* begin, const unsigned char* end,
                  const ref<rox::ByteBuffer>* owner = nullptr)
        : pMempoolM(pool),
          pM(begin),
          pEndM(end),
          pOwnerM(owner),
          budgetM(static_cast<uint64_t>(end - begin)),
          plansM(table),
          stackM(pool) {}

    /// Fields up to the end, all of it: of a new object, or of one that is there.
    bool Object(uint32_t structId, ref<SornObject>* out);
    bool Fields(const StructInfo& info, SornObject* object);
    /// A value without its tag, into a field: a single field's value, or one more element.
    bool Value(const FieldInfo& field, bool isMulti, SornObject* object);
    bool Subdict(uint32_t structId, ref<SornObject>* out);
    bool KnownDictValue(ref<SornObject>* out);
    bool KnownDictField(ref<SornObject>* out);
    bool LazyField(ref<LazyDict>* out);

    /// Where the reading stands.
    const unsigned char* Cursor() const { return pM; }

 private:
    /// An object under way. It belongs to the object around it from the start, but for the outermost one and
    /// the one right inside an object of the caller's: resultM holds these.
    struct Frame {
        SornObject* pObject;
        const StructPlan* pPlan;
        const unsigned char* pEnd;  ///< where its bytes end; its fields must end there, too
    };
    using Bounds = wirevalues::Bounds;
    enum class Step { DONE, OPENED, FAILED };

    bool Run();
    Step ReadFields();
    bool CloseObject();
    bool OpenObject(uint32_t structId, const unsigned char* end);
    bool OpenField(const PlannedField& field, const unsigned char* end, SornObject* object);
    bool FinishResult(bool isOpen, ref<SornObject>* out);
    ref<SornObject> NewObject(uint32_t structId, const StructPlan*& plan);
    bool ReadLength(const unsigned char* end, uint32_t& nBytes);
    bool ReadKnownHead(const unsigned char* end, uint32_t& structId, uint32_t& nBytes);
    bool ReadKnownFieldHead(const unsigned char* end, uint32_t& structId, uint32_t& nBytes);

    // Readers as those of wirevalues; `kind` is that of a PlannedField.
    const unsigned char* ReadValue(uint8_t kind, const unsigned char* p, Bounds bounds, void* member);
    template <bool isMulti>
    const unsigned char* ReadValue(DataType type, const unsigned char* p, Bounds bounds, void* member);
    const unsigned char* ReadBytes(const unsigned char* p, Bounds bounds, FieldTarget target) const;
    const unsigned char* ReadLazyBody(const unsigned char* p, Bounds bounds, ref<LazyDict>& body) const;
    const unsigned char* ReadAnyDict(const unsigned char* p, Bounds bounds, void* member, bool isMulti);

    RoxMempool* pMempoolM;
    const unsigned char* pM;
    const unsigned char* pEndM;
    const ref<rox::ByteBuffer>* pOwnerM;
    ObjectBudget budgetM;
    StructPlans plansM;
    RoxWorkStack<Frame, 8> stackM;
    ref<SornObject> resultM;
    SornObject* pCallersM = nullptr;  // the caller's object, if the reading fills one
    PlannedField callersFieldM;       // where resultM goes in it
};

}  // namespace sorn
