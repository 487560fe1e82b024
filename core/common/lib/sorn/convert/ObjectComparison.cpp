#include "sorn/convert/ObjectComparison.h"

#include "sorn/dict/Dict.h"
#include "sorn/dict/LazyBody.h"
#include "sorn/model/ChannelNumber.h"
#include "sorn/model/Currency.h"
#include "sorn/model/Schema.h"

namespace sorn {

namespace {

bool FEqualAnyDicts(const FieldSource& a, const FieldSource& b, unsigned i) {
    const Dict* dictA = a.ReferenceAt<Dict>(i);
    const Dict* dictB = b.ReferenceAt<Dict>(i);
    if (dictA == nullptr || dictB == nullptr) return dictA == dictB;
    // Elements of repeated fields agree whatever they hold: required of this comparison.
    return a.FMulti() || *dictA == *dictB;
}

/// One value each of a field that does not hold objects.
bool FEqualValues(DataType type, const FieldSource& a, const FieldSource& b, unsigned i) {
    switch (type) {
        case SORN_DATA_TYPE_BOOL:
            return a.PlainAt<unsigned char>(i) == b.PlainAt<unsigned char>(i);
        case SORN_DATA_TYPE_CHANNEL:
            return a.PlainAt<ChannelNumber>(i) == b.PlainAt<ChannelNumber>(i);
        case SORN_DATA_TYPE_CURRENCY:
            return a.PlainAt<Currency>(i) == b.PlainAt<Currency>(i);
        case SORN_DATA_TYPE_DATE:
        case SORN_DATA_TYPE_INT_ID:
        case SORN_DATA_TYPE_S32:
        case SORN_DATA_TYPE_TIME:
        case SORN_DATA_TYPE_U32:
            return a.PlainAt<uint32_t>(i) == b.PlainAt<uint32_t>(i);
        case SORN_DATA_TYPE_DATETIME:
        case SORN_DATA_TYPE_LONG_ID:
        case SORN_DATA_TYPE_S64:
        case SORN_DATA_TYPE_U64:
            return a.PlainAt<uint64_t>(i) == b.PlainAt<uint64_t>(i);
        case SORN_DATA_TYPE_FLOAT:
            return a.PlainAt<double>(i) == b.PlainAt<double>(i);
        // Only the low 16 bits count: required of this comparison.
        case SORN_DATA_TYPE_ENUM:
            return ((a.PlainAt<uint32_t>(i) ^ b.PlainAt<uint32_t>(i)) & 0xFFFF) == 0;
        case SORN_DATA_TYPE_STRING:
        case SORN_DATA_TYPE_STRING_ID:
            return a.TextAt(i) == b.TextAt(i);
        case SORN_DATA_TYPE_ANY_DICT:
            return FEqualAnyDicts(a, b, i);
        case SORN_DATA_TYPE_KNOWN_DICT_AS_LAZY:
            return FEqualLazyBodies(a.SharedAt<LazyDict>(i), b.SharedAt<LazyDict>(i));
        default:
            return false;
    }
}

/// Bytes are never equal, even to themselves and even where there are none: required of this comparison.
bool FComparable(DataType type) {
    return type < SORN_DATA_TYPE_NONE && type != SORN_DATA_TYPE_BYTESTRING;
}

}  // namespace

bool ObjectComparison::FEqual(const SornObject& a, const SornObject& b) {
    return OpenObjects(&a, &b) && Run();
}

bool ObjectComparison::FEqualFields(const FieldInfo& field, const FieldSource& a, const FieldSource& b) {
    Frame frame{nullptr, nullptr, nullptr, nullptr, a, b, 0, 0, 0};
    if (!StartField(frame, field, a, b)) return false;
    stackM.Push(frame);
    return Run();
}

bool ObjectComparison::Run() {
    while (!stackM.FEmpty()) {
        if (!Step()) return false;
    }
    return true;
}

bool ObjectComparison::Step() {
    Frame& frame = stackM.Top();
    if (frame.nextElement == frame.nElements) return NextField();
    unsigned i = frame.nextElement++;
    return OpenObjects(frame.a.ReferenceAt<SornObject>(i), frame.b.ReferenceAt<SornObject>(i));
}

/// Goes on to the next field that holds objects, over all others; at the end the objects are equal.
bool ObjectComparison::NextField() {
    Frame& frame = stackM.Top();
    while (frame.pInfo != nullptr && ++frame.slot < frame.pInfo->nFields) {
        const FieldInfo& field = frame.pInfo->vFieldInfo[frame.slot];
        if (field.FHole()) continue;
        if (field.arity == SORN_ARITY_OPTIONAL) {
            bool isPresent = frame.pA->FPresent(field);
            if (isPresent != frame.pB->FPresent(field)) return false;
            if (!isPresent) continue;
        }
        bool isMulti = field.arity == SORN_ARITY_MULTI;
        FieldSource a(frame.pA->MemberAt(field), isMulti);
        FieldSource b(frame.pB->MemberAt(field), isMulti);
        if (!StartField(frame, field, a, b)) return false;
        if (frame.nElements != 0) return true;
    }
    stackM.Pop();
    return true;
}

/// Compares a field at once, or leaves its elements to be opened when it holds objects.
bool ObjectComparison::StartField(Frame& frame, const FieldInfo& field, const FieldSource& a,
                                  const FieldSource& b) const {
    DataType type = field.Type();
    if (!FComparable(type)) return false;
    unsigned count = a.Count(type);
    if (count != b.Count(type)) return false;
    bool isOpened = FHoldsObjects(type);
    frame.pField = &field;
    frame.a = a;
    frame.b = b;
    frame.nextElement = 0;
    frame.nElements = isOpened ? count : 0;
    for (unsigned i = 0; !isOpened && i < count; ++i) {
        if (!FEqualValues(type, a, b, i)) return false;
    }
    return true;
}

bool ObjectComparison::OpenObjects(const SornObject* a, const SornObject* b) {
    if (a == nullptr || b == nullptr) return a == b;
    if (a->structId != b->structId) return false;
    stackM.Push(
        {Schema::vStructDefG[a->structId], a, b, nullptr, {nullptr, false}, {nullptr, false}, 0, 0, 0});
    return true;
}

}  // namespace sorn
