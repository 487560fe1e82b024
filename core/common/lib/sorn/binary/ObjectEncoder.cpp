#include "sorn/binary/ObjectEncoder.h"

#include "rox/RoxAssert.h"
#include "sorn/binary/LazyLevels.h"
#include "sorn/binary/WireFormat.h"
#include "sorn/binary/WireWriters.h"
#include "sorn/convert/DictionarySornObject.h"
#include "sorn/dict/Dictionary.h"

namespace sorn {

using namespace wirewriters;

namespace {

/// How many elements before an object of a list is looked at, it is brought near.
constexpr uint32_t nAheadG = 2;

/// The first members of an object, which may be null. Always inlined for the reason that StructPlan::Prefetch
/// tells.
__attribute__((always_inline)) inline void Prefetch(const RoxCore* object) {
    const auto address = reinterpret_cast<uintptr_t>(object);
    __builtin_prefetch(reinterpret_cast<const void*>(address));
    __builtin_prefetch(reinterpret_cast<const void*>(address + 64));
}

const void* MemberOf(const SornObject& object, const PlannedField& field) {
    return reinterpret_cast<const unsigned char*>(&object) + field.storageOffset;
}

}  // namespace

ObjectEncoder::~ObjectEncoder() {
    for (; !stackM.FEmpty(); stackM.Pop()) RoxCore::DownRef(stackM.Top().pHeld);
}

void ObjectEncoder::Object(const SornObject& object, Form form) {
    Open(object, form, nullptr, nullptr, Nesting{});
    Run();
}

void ObjectEncoder::Fields(const StructInfo& info, const SornObject& object) {
    Frame frame{};
    frame.pObject = &object;
    frame.pPlan = &plansM.Of(info);
    frame.nGroupsLeft = frame.pPlan->NGroups();
    stackM.Push(frame);
    Run();
}

void ObjectEncoder::SingleField(const FieldInfo& field, const SornObject& object) {
    fieldM = PlannedField(field);
    fieldM.kind %= PlannedField::multiG;
    PushField(object);
    Run();
}

void ObjectEncoder::MultiField(uint32_t tag, const FieldInfo& field, const SornObject& object) {
    fieldM = PlannedField(field, tag);
    fieldM.kind = fieldM.kind % PlannedField::multiG + PlannedField::multiG;
    PushField(object);
    Run();
}

void ObjectEncoder::LazyBody(const ref<LazyDict>& body) {
    if (OpenLazyBody(body, nullptr, Nesting{})) Run();
}

/// A frame that has fieldM and nothing else.
void ObjectEncoder::PushField(const SornObject& object) {
    Frame frame{};
    frame.pObject = &object;
    stackM.Push(frame);
    StartField(stackM.Top(), fieldM);
}

void ObjectEncoder::Run() {
    while (!stackM.FEmpty()) {
        Frame& frame = stackM.Top();
        if (frame.nElements != 0) {
            OpenElement(frame);
        } else if (frame.pPlan == nullptr || !StepFields(frame)) {
            Close(frame);
        }
    }
}

/// Writes fields from the last one down to one whose elements are to be opened; false when none is left.
inline bool ObjectEncoder::StepFields(Frame& frame) {
    const StructPlan& plan = *frame.pPlan;
    const auto* const object = reinterpret_cast<const unsigned char*>(frame.pObject);
    unsigned char* p = outM.Room(outM.Begin(), maxGroupG);
    for (uint64_t fields = frame.fields;;) {
        while (fields == 0) {
            if (frame.nGroupsLeft == 0) {
                outM.Commit(p);
                return false;
            }
            fields = plan.FindSet(object, --frame.nGroupsLeft);
        }
        const WrittenField* const group = plan.WrittenOf(frame.nGroupsLeft);
        const WrittenField* field;
        p = WriteSimple(object, group, fields, field, p);
        if (field == nullptr) continue;
        outM.Commit(p);
        if (StartField(frame, plan.Slot(field->slot))) {
            frame.fields = fields;
            return true;
        }
        p = outM.Room(outM.Begin(), maxGroupG);
    }
}

/// Writes numbers and texts of a group up to a field that is neither, and gives that; null when no field is
/// left. Wants room for maxGroupG bytes before p.
inline unsigned char* ObjectEncoder::WriteSimple(const unsigned char* object, const WrittenField* group,
                                                 uint64_t& fields, const WrittenField*& other,
                                                 unsigned char* p) {
    for (uint64_t left = fields;;) {
        if (left == 0) {
            fields = 0;
            other = nullptr;
            return p;
        }
        const WrittenField* const field = group + __builtin_ctzll(left);
        left &= left - 1;
        if (field->FNumber()) {
            p = varint::WriteInRoom(field->Number(object), p);
        } else if (field->form == WrittenField::TEXT) {
            p = WriteText(outM, *reinterpret_cast<const RoxString*>(object + field->offset), p, maxGroupG);
        } else {
            fields = left;
            other = field;
            return p;
        }
        p = field->WriteTag(p);
    }
}

/// Writes a field, or makes its elements, when they are objects or bodies, those that are to be opened; true
/// when there are such.
inline bool ObjectEncoder::StartField(Frame& frame, const PlannedField& field) {
    const DataType type = field.Type();
    const FieldSource source(MemberOf(*frame.pObject, field), field.FMulti());
    if (!FHoldsObjects(type) && type != SORN_DATA_TYPE_KNOWN_DICT_AS_LAZY) {
        WriteElements(field, source);
        return false;
    }
    frame.nElements = source.Count(type);
    frame.pField = &field;
    return frame.nElements != 0;
}

/// Opens the last of the elements that are left, unless it is null.
inline void ObjectEncoder::OpenElement(Frame& frame) {
    const PlannedField& field = *frame.pField;
    const FieldSource source(MemberOf(*frame.pObject, field), field.FMulti());
    const uint32_t i = --frame.nElements;
    if (field.FMulti() && i >= nAheadG) Prefetch(source.ReferenceAt<RoxCore>(i - nAheadG));
    if (field.Type() == SORN_DATA_TYPE_KNOWN_DICT_AS_LAZY) [[unlikely]] {
        OpenLazyBody(source.SharedAt<LazyDict>(i), &field, frame.nesting);
    } else if (const auto* const object = source.ReferenceAt<SornObject>(i)) {
        const Form form = field.Type() == SORN_DATA_TYPE_OBJECT ? SUBDICT : KNOWN_FIELD;
        Open(*object, form, &field, nullptr, frame.nesting);
    }
}

/// Opens the object that a body converts to; false when there is no body.
bool ObjectEncoder::OpenLazyBody(const ref<LazyDict>& body, const PlannedField* headTag, Nesting nesting) {
    if (body == nullptr) return false;
    const ref<SornObject> object = EnterLazyBody(body, nesting) ? ObjectOfLazyBody(body) : NewTooDeepObject();
    if (object == nullptr) return false;
    object->UpRef();
    Open(*object, KNOWN_FIELD, headTag, object.get(), nesting);
    return true;
}

/// Makes `nesting` that of the body's object; false for a body beyond the limits.
bool ObjectEncoder::EnterLazyBody(const ref<LazyDict>& body, Nesting& nesting) {
    if (++nesting.nLazyLevels > maxLazyLevelsG) return false;
    const uint32_t nText = TextBytesOfLazyBody(body);
    if (nesting.isInText) return textBudgetM.TakeInner(nText);
    textBudgetM.AddOuter(nText);
    nesting.isInText = nText != 0;
    return true;
}

ref<SornObject> ObjectEncoder::NewTooDeepObject() const {
    ref<SornObject> object;
    RoxString error;  // the error's dictionary fits its struct
    DictionarySornObject(pMempoolM, tableM.vStructDef, tableM.nStructDef)
        .DictionaryToSornObject(NewTooDeepError(pMempoolM), 0, object, error);
    return object;
}

/// Takes over a hold on `held`, which may be null.
inline void ObjectEncoder::Open(const SornObject& object, Form form, const PlannedField* headTag,
                                RoxCore* held, Nesting nesting) {
    const StructPlan* const plan = plansM.Find(object.structId);
    RoxAssert(plan != nullptr, "the object is of a struct of the schema");
    stackM.Emplace(&object, plan, uint64_t{0}, plan->NGroups(), uint32_t{0},
                   static_cast<const PlannedField*>(nullptr), headTag, outM.Count(), held, nesting, form);
}

/// Writes what stands before the top frame's object.
inline void ObjectEncoder::Close(const Frame& frame) {
    if (frame.form != FIELDS) {
        unsigned char* p = outM.Room(outM.Begin(), 2 * maxHeadG);
        p = varint::WriteInRoom(outM.Count(p) - frame.end, p);
        if (frame.form != SUBDICT) {
            p = varint::WriteInRoom(wireformat::TagOf(frame.pObject->structId, wireformat::BYTES), p);
        }
        if (frame.form == KNOWN_FIELD) p = varint::WriteInRoom(outM.Count(p) - frame.end, p);
        outM.Commit(frame.pHeadTag == nullptr ? p : frame.pHeadTag->WriteTag(p));
    }
    RoxCore* const held = frame.pHeld;
    stackM.Pop();
    if (held != nullptr) [[unlikely]]
        RoxCore::DownRef(held);
}

}  // namespace sorn
