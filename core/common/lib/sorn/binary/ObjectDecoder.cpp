#include "sorn/binary/ObjectDecoder.h"

#include "sorn/binary/UnknownField.h"
#include "sorn/binary/Varint.h"
#include "sorn/binary/WireFormat.h"
#include "sorn/model/StructInfo.h"

namespace sorn {

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
    stackM.Push({object, &info, pEndM});
    return Run();
}

bool ObjectDecoder::Value(const FieldInfo& field, bool isMulti, SornObject* object) {
    if (!FHoldsObjects(field.Type())) {
        const unsigned char* const behind = ReadValue(field, isMulti, pM, pEndM, object);
        if (behind == nullptr) return false;
        pM = behind;
        return true;
    }
    pCallersM = object;
    return OpenField(field, isMulti, pEndM, object) && Run();
}

bool ObjectDecoder::FinishResult(bool isOpen, ref<SornObject>* out) {
    if (!isOpen || !Run()) return false;
    *out = std::move(resultM);
    return true;
}

bool ObjectDecoder::Run() {
    while (!stackM.FEmpty()) {
        const Step step = ReadFields();
        if (step == Step::FAILED || (step == Step::DONE && !CloseObject())) return false;
    }
    return true;
}

/// Reads fields until an object is opened, or the object under way is at its end.
ObjectDecoder::Step ObjectDecoder::ReadFields() {
    const Frame frame = stackM.Top();
    const StructInfo& info = *frame.pInfo;
    const unsigned char* p = pM;
    while (p < frame.pEnd) {
        uint32_t tag = 0;
        p = varint::Read(p, frame.pEnd, tag);
        if (p == nullptr) return Step::FAILED;
        const uint32_t number = tag >> wireformat::wireTypeBitsG;
        if (number >= static_cast<uint32_t>(info.nFields) || info.vFieldInfo[number].FHole()) [[unlikely]] {
            p = PassUnknownField(info, tag, p, frame.pEnd);
            if (p == nullptr) return Step::FAILED;
            continue;
        }
        // The tag's wire type is not looked at: the value is what the field says.
        const FieldInfo& field = info.vFieldInfo[number];
        if (field.presenceOffset != 0) reinterpret_cast<char*>(frame.pObject)[field.presenceOffset] = 1;
        const bool isMulti = field.arity == SORN_ARITY_MULTI;
        if (FHoldsObjects(field.Type())) {
            pM = p;
            return OpenField(field, isMulti, frame.pEnd, frame.pObject) ? Step::OPENED : Step::FAILED;
        }
        p = ReadValue(field, isMulti, p, frame.pEnd, frame.pObject);
        if (p == nullptr) return Step::FAILED;
    }
    pM = p;
    return Step::DONE;
}

/// Ends an object, whose bytes must be used up exactly: an object inside may have gone beyond them.
bool ObjectDecoder::CloseObject() {
    const Frame frame = stackM.Top();
    stackM.Pop();
    if (pM != frame.pEnd) return false;
    if (pCallersM == nullptr || frame.pObject != resultM.get()) return true;
    const FieldTarget target(pCallersM->MemberAt(*pCallersFieldM), callersFieldIsMultiM);
    return target.StoreReference(std::exchange(resultM, nullptr));
}

/// Opens the object that a field's value is.
bool ObjectDecoder::OpenField(const FieldInfo& field, bool isMulti, const unsigned char* end,
                              SornObject* object) {
    uint32_t structId = field.typeRef;
    uint32_t nBytes = 0;
    const bool isRead = field.Type() == SORN_DATA_TYPE_OBJECT ? ReadLength(end, nBytes)
                                                              : ReadKnownFieldHead(end, structId, nBytes);
    if (!isRead) return false;
    const unsigned char* const innerEnd = pM + nBytes;
    if (object == pCallersM) {
        pCallersFieldM = &field;
        callersFieldIsMultiM = isMulti;
        return OpenObject(structId, innerEnd);
    }
    const StructInfo* info = nullptr;
    ref<SornObject> inner = NewObject(structId, info);
    if (inner == nullptr) return false;
    stackM.Push({inner.get(), info, innerEnd});
    void* const member = object->MemberAt(field);
    if (isMulti) return static_cast<RoxGenericArray*>(member)->Add(inner.get());
    *static_cast<RefBase*>(member) = std::move(inner);
    return true;
}

/// Opens an object that resultM holds.
bool ObjectDecoder::OpenObject(uint32_t structId, const unsigned char* end) {
    const StructInfo* info = nullptr;
    resultM = NewObject(structId, info);
    if (resultM == nullptr) return false;
    stackM.Push({resultM.get(), info, end});
    return true;
}

/// Null for an id that names no struct, and beyond the budget.
ref<SornObject> ObjectDecoder::NewObject(uint32_t structId, const StructInfo*& info) {
    info = tableM.Find(structId);
    if (info == nullptr || !budgetM.Take(*info)) return nullptr;
    ref<SornObject> object = info->Factory(pMempoolM);
    object->SetDebugLockOwner(0);
    return object;
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

}  // namespace sorn
