#include "sorn/binary/ObjectDecoder.h"

#include "sorn/binary/UnknownField.h"
#include "sorn/binary/Varint.h"
#include "sorn/binary/WireFormat.h"

namespace sorn {

namespace {

void* MemberOf(SornObject* object, const PlannedField& field) {
    return reinterpret_cast<unsigned char*>(object) + field.storageOffset;
}

/// Reads a tag at p, which lies before the end; one of up to two bytes at once.
inline const unsigned char* ReadTag(const unsigned char* p, const unsigned char* end, uint32_t& tag) {
    tag = p[0];
    if (tag < 0x80) return p + 1;
    if (end - p >= 2 && p[1] < 0x80) [[likely]] {
        tag = (tag & 0x7F) | uint32_t{p[1]} << 7;
        return p + 2;
    }
    return varint::Read(p, end, tag);
}

}  // namespace

bool ObjectDecoder::Object(uint32_t structId, ref<SornObject>* out) {
    return FinishResult(OpenObject(structId, pEndM), out);
}

bool ObjectDecoder::Subdict(uint32_t structId, ref<SornObject>* out) {
    uint32_t nBytes = 0;
    return FinishResult(ReadLength(pEndM, nBytes) && OpenObject(structId, pM + nBytes), out);
}

bool ObjectDecoder::KnownDictValue(ref<SornObject>* out) {
    uint32_t structId = 0;
    uint32_t nBytes = 0;
    return FinishResult(ReadKnownHead(pEndM, structId, nBytes) && OpenObject(structId, pM + nBytes), out);
}

bool ObjectDecoder::KnownDictField(ref<SornObject>* out) {
    uint32_t structId = 0;
    uint32_t nBytes = 0;
    return FinishResult(ReadKnownFieldHead(pEndM, structId, nBytes) && OpenObject(structId, pM + nBytes),
                        out);
}

bool ObjectDecoder::Fields(const StructInfo& info, SornObject* object) {
    pCallersM = object;
    stackM.Push({object, &plansM.Of(info), pEndM});
    return Run();
}

bool ObjectDecoder::Value(const FieldInfo& field, bool isMulti, SornObject* object) {
    PlannedField planned(field);
    planned.kind = static_cast<uint8_t>(planned.Type() + (isMulti ? PlannedField::multiG : 0));
    if (!FHoldsObjects(field.Type())) {
        const unsigned char* const behind =
            ReadValue(planned.kind, pM, {pEndM, pEndM}, object->MemberAt(field));
        if (behind == nullptr) return false;
        pM = behind;
        return true;
    }
    pCallersM = object;
    return OpenField(planned, pEndM, object) && Run();
}

bool ObjectDecoder::FinishResult(bool isOpen, ref<SornObject>* out) {
    if (!isOpen || !Run()) return false;
    *out = std::move(resultM);
    return true;
}

/// Null for an id that names no struct, and beyond the budget.
inline ref<SornObject> ObjectDecoder::NewObject(uint32_t structId, const StructPlan*& plan) {
    plan = plansM.Find(structId);
    if (plan == nullptr || !budgetM.TakeBytes(plan->ObjectBytes())) return nullptr;
    ref<SornObject> object = plan->Info().Factory(pMempoolM);
    object->SetDebugLockOwner(0);
    return object;
}

/// Opens an object that resultM holds.
bool ObjectDecoder::OpenObject(uint32_t structId, const unsigned char* end) {
    const StructPlan* plan = nullptr;
    resultM = NewObject(structId, plan);
    if (resultM == nullptr) return false;
    stackM.Push({resultM.get(), plan, end});
    return true;
}

/// Reads the length of what follows, which must lie in the bytes of the reading, but may go beyond `end`.
bool ObjectDecoder::ReadLength(const unsigned char* end, uint32_t& nBytes) {
    const unsigned char* const behind = varint::Read(pM, end, nBytes);
    if (behind == nullptr || nBytes > static_cast<size_t>(pEndM - behind)) return false;
    pM = behind;
    return true;
}

bool ObjectDecoder::ReadKnownHead(const unsigned char* end, uint32_t& structId, uint32_t& nBytes) {
    uint32_t tag = 0;
    const unsigned char* const behind = varint::Read(pM, end, tag);
    if (behind == nullptr) return false;
    pM = behind;
    structId = tag >> wireformat::wireTypeBitsG;
    return ReadLength(end, nBytes);
}

/// The length in front bounds the two numbers of the value's head and nothing else: the reading goes on
/// behind the value, wherever that length ends.
bool ObjectDecoder::ReadKnownFieldHead(const unsigned char* end, uint32_t& structId, uint32_t& nBytes) {
    uint32_t nValue = 0;
    return ReadLength(end, nValue) && ReadKnownHead(pM + nValue, structId, nBytes);
}

/// Ends an object, whose bytes must be used up exactly: an object inside may have gone beyond them.
bool ObjectDecoder::CloseObject() {
    const Frame frame = stackM.Top();
    stackM.Pop();
    if (pM != frame.pEnd) return false;
    if (pCallersM == nullptr || frame.pObject != resultM.get()) return true;
    const FieldTarget target(MemberOf(pCallersM, callersFieldM), callersFieldM.FMulti());
    return target.StoreReference(std::exchange(resultM, nullptr));
}

/// Opens the object that a field's value is.
inline bool ObjectDecoder::OpenField(const PlannedField& field, const unsigned char* end,
                                     SornObject* object) {
    uint32_t structId = field.typeRef;
    uint32_t nBytes = 0;
    const bool isRead = field.Type() == SORN_DATA_TYPE_OBJECT ? ReadLength(end, nBytes)
                                                              : ReadKnownFieldHead(end, structId, nBytes);
    if (!isRead) return false;
    const unsigned char* const innerEnd = pM + nBytes;
    if (object == pCallersM) {
        callersFieldM = field;
        return OpenObject(structId, innerEnd);
    }
    const StructPlan* plan = nullptr;
    ref<SornObject> inner = NewObject(structId, plan);
    if (inner == nullptr) return false;
    stackM.Push({inner.get(), plan, innerEnd});
    void* const member = MemberOf(object, field);
    if (!field.FMulti()) {
        *static_cast<RefBase*>(member) = std::move(inner);
        return true;
    }
    if (!static_cast<RoxGenericArray*>(member)->AddHeld(inner.get())) return false;
    inner.TakeCore();
    return true;
}

/// Reads fields until an object is opened, or the object under way is at its end.
ObjectDecoder::Step ObjectDecoder::ReadFields() {
    const Frame frame = stackM.Top();
    const StructPlan& plan = *frame.pPlan;
    const Bounds bounds{frame.pEnd, pEndM};
    const unsigned char* p = pM;
    while (p < bounds.end) {
        uint32_t tag = 0;
        p = ReadTag(p, bounds.end, tag);
        if (p == nullptr) return Step::FAILED;
        const uint32_t slot = tag >> wireformat::wireTypeBitsG;
        if (slot >= plan.NSlots() || plan.Slot(slot).kind == PlannedField::holeG) [[unlikely]] {
            p = PassUnknownField(plan.Info(), tag, p, bounds.end);
            if (p == nullptr) return Step::FAILED;
            continue;
        }
        // The tag's wire type is not looked at: the value is what the field says.
        const PlannedField& field = plan.Slot(slot);
        auto* const object = reinterpret_cast<unsigned char*>(frame.pObject);
        if (field.presenceOffset != 0) object[field.presenceOffset] = 1;
        void* const member = object + field.storageOffset;
        switch (field.kind) {
            case SORN_DATA_TYPE_BOOL:
                p = wirevalues::ReadBool<false>(p, bounds, member);
                break;
            case SORN_DATA_TYPE_DATE:
            case SORN_DATA_TYPE_S32:
                p = wirevalues::ReadSigned<false, uint32_t>(p, bounds, member);
                break;
            case SORN_DATA_TYPE_DATETIME:
            case SORN_DATA_TYPE_S64:
                p = wirevalues::ReadSigned<false, uint64_t>(p, bounds, member);
                break;
            case SORN_DATA_TYPE_ENUM:
            case SORN_DATA_TYPE_INT_ID:
            case SORN_DATA_TYPE_TIME:
            case SORN_DATA_TYPE_U32:
                p = wirevalues::ReadUnsigned<false, uint32_t>(p, bounds, member);
                break;
            case SORN_DATA_TYPE_LONG_ID:
            case SORN_DATA_TYPE_U64:
                p = wirevalues::ReadUnsigned<false, uint64_t>(p, bounds, member);
                break;
            case SORN_DATA_TYPE_STRING:
            case SORN_DATA_TYPE_STRING_ID:
                p = wirevalues::ReadText<false>(p, bounds, pMempoolM, member);
                break;
            case SORN_DATA_TYPE_OBJECT:
            case SORN_DATA_TYPE_KNOWN_DICT:
            case SORN_DATA_TYPE_OBJECT + PlannedField::multiG:
            case SORN_DATA_TYPE_KNOWN_DICT + PlannedField::multiG:
                pM = p;
                return OpenField(field, frame.pEnd, frame.pObject) ? Step::OPENED : Step::FAILED;
            default:
                p = ReadValue(field.kind, p, bounds, member);
        }
        if (p == nullptr) return Step::FAILED;
    }
    pM = p;
    return Step::DONE;
}

bool ObjectDecoder::Run() {
    while (!stackM.FEmpty()) {
        const Step step = ReadFields();
        if (step == Step::FAILED || (step == Step::DONE && !CloseObject())) return false;
    }
    return true;
}

}  // namespace sorn
