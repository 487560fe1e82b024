#include "sorn/typedjson/ObjectWriter.h"

#include <algorithm>
#include <cstring>

#include "rox/RoxAssert.h"
#include "sorn/convert/FieldAccess.h"
#include "sorn/dict/Dict.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/json/StringWriter.h"

namespace sorn {

namespace {

/// Asks the processor for an object that is wanted soon: the walk looks at most of its members.
void Prefetch(const void* object) {
    if (object == nullptr) return;
    constexpr unsigned nLines = 8;
    constexpr unsigned nLine = 64;
    for (unsigned i = 0; i < nLines; ++i) __builtin_prefetch(static_cast<const char*>(object) + i * nLine);
}

}  // namespace

void ObjectWriter::BeginBody(const ref<SornObject>& object, OrvoVersion version) {
    object->UpRef();
    Open(*object, version, true);
}

void ObjectWriter::BeginField(const char* name, const FieldInfo& field, bool isMulti,
                              const SornObject& object, OrvoVersion version, bool& isFirst) {
    WriteNamed(name, WriterPlan::StepOf(field, isMulti), object, version, isFirst);
}

bool ObjectWriter::WriteNamed(const char* name, const Step& step, const SornObject& object,
                              OrvoVersion version, bool& isFirst) {
    if (!step.FHasValue(object) || !FPrepare(step, object)) return true;
    WriteName(name, std::strlen(name), isFirst, outM);
    return WriteMember(step, object, version);
}

void ObjectWriter::Open(const SornObject& object, OrvoVersion version, bool isHeld) {
    Prefetch(&object);
    const WriterPlan* const plan = plansM.Of(object.structId);
    RoxAssert(plan != nullptr, "the object is of a struct of the schema");
    outM.Byte('{');
    const WriterPlan::View* const view = plan->ViewOf(version);
    framesM.Push({plan, &object, nullptr, 0, plan->CountGroups(), 0, 0, 0,
                  view != nullptr ? view->anchor : plan->FindAnchor(version), version, view, true, isHeld,
                  false});
}

bool ObjectWriter::Run(size_t depth) {
    while (dictionaryM == nullptr) {
        if (framesM.Size() <= depth) return true;
        if (framesM.Top().pPlan != nullptr) {
            ContinueObject();
        } else {
            ContinueList();
        }
    }
    return false;
}

void ObjectWriter::ContinueObject() {
    Frame& frame = framesM.Top();
    for (;;) {
        if (!WriteCandidates(frame)) return;
        const bool isAtAnchor = frame.anchor < frame.next * WriterPlan::nGroupG;
        if (!frame.isTypeWritten && (isAtAnchor || frame.next == frame.end)) {
            WriteType(frame);
            frame.candidates = frame.behindType;
        } else if (frame.next != frame.end) {
            NextGroup(frame);
        } else {
            break;
        }
    }
    outM.Byte('}');
    const SornObject* const object = frame.pObject;
    const bool isHeld = frame.isHeld;
    framesM.Pop();
    if (isHeld) RoxCore::DownRef(const_cast<SornObject*>(object));
}

void ObjectWriter::NextGroup(Frame& frame) {
    const unsigned group = frame.next++;
    uint32_t candidates = frame.pPlan->FindCandidates(*frame.pObject, group);
    if (frame.pView != nullptr) candidates &= frame.pView->vHolds[group];
    frame.block = group * WriterPlan::nGroupG;
    const uint32_t nInFront = frame.anchor - frame.block;  // of "type"; large when that is not in this group
    const uint32_t inFront = nInFront < WriterPlan::nGroupG ? (uint32_t{1} << nInFront) - 1 : ~uint32_t{0};
    frame.behindType = candidates & ~inFront;
    frame.candidates = candidates & inFront;
}

bool ObjectWriter::WriteOther(const Step& step, Frame& frame) {
    const SornObject& object = *frame.pObject;
    const OrvoVersion version = frame.version;
    if (step.form == WriterPlan::LONG_NAME) {
        const FieldInfo& field = *step.pField;
        const Step named = WriterPlan::StepOf(field, field.arity == SORN_ARITY_MULTI);
        return WriteNamed(frame.pPlan->Info().FieldName(field), named, object, version, frame.isFirst);
    }
    if (!FPrepare(step, object)) return true;
    outM.Written(step.PutKey(frame.isFirst, outM.Room(WriterPlan::maxKeyG + WriterPlan::nKeyBlockG)));
    frame.isFirst = false;
    return WriteMember(step, object, version);
}

void ObjectWriter::WriteType(Frame& frame) {
    const WriterPlan& plan = *frame.pPlan;
    const size_t nSkipped = frame.isFirst ? WriterPlan::nSeparatorG : 0;
    const unsigned char* const entry = plan.TypeEntry() + nSkipped;
    const size_t nEntry = plan.TypeEntryBytes() - nSkipped;
    frame.isFirst = false;
    frame.isTypeWritten = true;
    if (nEntry <= WriterPlan::nTypeBlockG) {
        unsigned char* const out = outM.Room(WriterPlan::nTypeBlockG);
        std::memcpy(out, entry, WriterPlan::nTypeBlockG);
        outM.Written(out + nEntry);
    } else {
        outM.Bytes(entry, nEntry);
    }
}

void ObjectWriter::WriteName(const char* name, size_t nName, bool& isFirst, JsonOutput& out) {
    if (!isFirst) out.Literal(", ");
    isFirst = false;
    out.Byte('"');
    out.Bytes(name, nName);
    out.Literal("\": ");
}

void ObjectWriter::ContinueList() {
    Frame& frame = framesM.Top();
    const DataType type = frame.pField->Type();
    const FieldSource source(frame.pObject->MemberAt(*frame.pField), true);
    while (frame.next < frame.end) {
        const unsigned i = frame.next++;
        if (frame.next < frame.end) Prefetch(source.ReferenceAt<RoxCore>(i + 1));
        if (source.ReferenceAt<RoxCore>(i) == nullptr || !FPrepare(type, source, i)) continue;
        if (!frame.isFirst) outM.Byte(',');
        frame.isFirst = false;
        if (!WriteReference(type, source, i, frame.version)) return;
    }
    outM.Byte(']');
    framesM.Pop();
}

bool ObjectWriter::WriteMember(const Step& step, const SornObject& object, OrvoVersion version) {
    const void* const member = step.MemberOf(object);
    switch (step.form) {
        case WriterPlan::SINGLE_REFERENCE:
            return WriteReference(step.Type(), FieldSource(member, false), 0, version);
        case WriterPlan::MULTI_REFERENCE: {
            const unsigned count = static_cast<const RoxGenericArray*>(member)->GetCount();
            outM.Byte('[');
            framesM.Push(
                {nullptr, &object, step.pField, 0, count, 0, 0, 0, 0, version, nullptr, true, false, false});
            return false;
        }
        case WriterPlan::MULTI_PLAIN:
        case WriterPlan::MULTI_TEXT:
            WriteList(step, object);
            return true;
        default:
            WriteValue(step, member);
            return true;
    }
}

void ObjectWriter::WriteList(const Step& step, const SornObject& object) {
    const FieldSource source(step.MemberOf(object), true);
    const unsigned count = source.Count(step.Type());
    outM.Byte('[');
    for (unsigned i = 0; i < count; ++i) {
        if (i != 0) outM.Byte(',');
        if (step.form == WriterPlan::MULTI_TEXT) {
            WriteValue(step, &source.TextAt(i));
        } else {
            WriteValue(step, &source.PlainAt<unsigned char>(i));
        }
    }
    outM.Byte(']');
}

bool ObjectWriter::WriteReference(DataType type, const FieldSource& source, unsigned i, OrvoVersion version) {
    switch (type) {
        case SORN_DATA_TYPE_BYTESTRING:
            WriteBytes(*source.ReferenceAt<rox::ByteBuffer>(i));
            return true;
        case SORN_DATA_TYPE_ANY_DICT:
            dictionaryM = source.ReferenceAt<Dict>(i)->GetDictionary();
            return false;
        case SORN_DATA_TYPE_KNOWN_DICT_AS_LAZY:
            return WriteLazy();
        default:
            Open(*source.ReferenceAt<SornObject>(i), version, false);
            return false;
    }
}

/// Fetches what a lazy body's text is made of. False when that is nothing: the body is left out then, with
/// whatever would stand around it.
bool ObjectWriter::FPrepare(DataType type, const FieldSource& source, unsigned i) {
    if (type != SORN_DATA_TYPE_KNOWN_DICT_AS_LAZY) [[likely]]
        return true;
    bodyM = LazyBodyToWrite(source.SharedAt<LazyDict>(i), false, false);
    return !bodyM.FNothing();
}

/// The same for a member that has a value; the elements of a list come later.
bool ObjectWriter::FPrepare(const Step& step, const SornObject& object) {
    return step.form != WriterPlan::SINGLE_REFERENCE ||
           FPrepare(step.Type(), FieldSource(step.MemberOf(object), false), 0);
}

/// Writes the body that FPrepare has fetched.
bool ObjectWriter::WriteLazy() {
    LazyBodyContent content = std::exchange(bodyM, LazyBodyContent());
    if (content.dictionary != nullptr) {
        dictionaryM = std::move(content.dictionary);
        return false;
    }
    if (content.object != nullptr) {
        BeginBody(content.object, content.version);
        return false;
    }
    outM.Bytes(content.text->GetData(), content.text->GetLength());
    return true;
}

}  // namespace sorn
