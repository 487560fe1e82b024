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
        } else if (!StepFields()) {
            Close();
        }
    }
}

/// Writes fields from the last one down until an object has been opened; false when no field is left.
bool ObjectEncoder::StepFields() {
    Frame& frame = stackM.Top();
    const StructPlan* const plan = frame.pPlan;
    const auto* const object = reinterpret_cast<const unsigned char*>(frame.pObject);
    uint64_t candidates = frame.candidates;
    unsigned char* p = outM.Begin();
    for (;;) {
        while (candidates == 0) {
            if (frame.nGroupsLeft == 0) {
                outM.Commit(p);
                return false;
            }
            candidates = plan->FindSet(object, --frame.nGroupsLeft);
        }
        const auto bit = 63 - static_cast<uint32_t>(__builtin_clzll(candidates));
        candidates ^= uint64_t{1} << bit;
        const PlannedField& field = plan->Slot(frame.nGroupsLeft * StructPlan::nGroupG + bit);
        const unsigned char* const member = object + field.storageOffset;
        p = outM.Room(p, maxPlainG);
        switch (field.kind) {
            case SORN_DATA_TYPE_BOOL:
                p = WritePlain(SORN_DATA_TYPE_BOOL, member, p);
                break;
            case SORN_DATA_TYPE_CHANNEL:
            case SORN_DATA_TYPE_CURRENCY:
            case SORN_DATA_TYPE_FLOAT:
                p = WritePlain(field.Type(), member, p);
                break;
            case SORN_DATA_TYPE_DATE:
            case SORN_DATA_TYPE_S32:
                p = WritePlain(SORN_DATA_TYPE_S32, member, p);
                break;
            case SORN_DATA_TYPE_DATETIME:
            case SORN_DATA_TYPE_S64:
                p = WritePlain(SORN_DATA_TYPE_S64, member, p);
                break;
            case SORN_DATA_TYPE_LONG_ID:
            case SORN_DATA_TYPE_U64:
                p = WritePlain(SORN_DATA_TYPE_U64, member, p);
                break;
            case SORN_DATA_TYPE_ENUM:
            case SORN_DATA_TYPE_INT_ID:
            case SORN_DATA_TYPE_TIME:
            case SORN_DATA_TYPE_U32:
                p = WritePlain(SORN_DATA_TYPE_U32, member, p);
                break;
            case SORN_DATA_TYPE_STRING:
            case SORN_DATA_TYPE_STRING_ID:
                p = WriteText(outM, *reinterpret_cast<const RoxString*>(member), p);
                break;
            default:
                frame.candidates = candidates;
                outM.Commit(p);
                if (StartField(frame, field)) return true;
                p = outM.Begin();
                continue;
        }
        p = field.WriteTag(p);
    }
}

/// Writes a field, or, when it holds objects or bodies, opens the last one; true when one has been opened.
bool ObjectEncoder::StartField(Frame& frame, const PlannedField& field) {
    const DataType type = field.Type();
    const FieldSource source(MemberOf(*frame.pObject, field), field.FMulti());
    if (!FHoldsObjects(type) && type != SORN_DATA_TYPE_KNOWN_DICT_AS_LAZY) {
        WriteElements(field, source);
        return false;
    }
    frame.nElements = source.Count(type);
    frame.pField = &field;
    return frame.nElements != 0 && OpenElement(frame);
}

/// Opens the last of the elements that are left and not null; false when there is none. `frame` may move.
bool ObjectEncoder::OpenElement(Frame& frame) {
    const PlannedField& field = *frame.pField;
    const FieldSource source(MemberOf(*frame.pObject, field), field.FMulti());
    while (frame.nElements != 0) {
        const uint32_t i = --frame.nElements;
        if (field.Type() == SORN_DATA_TYPE_KNOWN_DICT_AS_LAZY) {
            if (OpenLazyBody(source.SharedAt<LazyDict>(i), &field, frame.nesting)) return true;
        } else if (const auto* const object = source.ReferenceAt<SornObject>(i)) {
            const Form form = field.Type() == SORN_DATA_TYPE_OBJECT ? SUBDICT : KNOWN_FIELD;
            Open(*object, form, &field, nullptr, frame.nesting);
            return true;
        }
    }
    return false;
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

/// Writes what stands before the object.
inline void ObjectEncoder::Close() {
    const Frame& frame = stackM.Top();
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
    RoxCore::DownRef(held);
}

}  // namespace sorn
