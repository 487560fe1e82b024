#include "sorn/typedjson/ObjectWriter.h"

#include <algorithm>
#include <cstring>

#include "rox/RoxAssert.h"
#include "sorn/convert/FieldAccess.h"
#include "sorn/dict/Dict.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/json/StringWriter.h"
#include "sorn/model/CopyShort.h"

namespace sorn {

namespace {

constexpr char typeNameG[] = "type";

bool FBelowType(const char* name) {
    const auto first = static_cast<unsigned char>(name[0]);
    return first != typeNameG[0] ? first < typeNameG[0] : std::strcmp(name, typeNameG) < 0;
}

/// The slot that has "type" in front, which need not have a value; behind all slots when there is none.
int32_t FindAnchor(const StructInfo& info, OrvoVersion version) {
    for (int32_t slot = info.nFields - 1; slot >= 0; --slot) {
        const FieldInfo& field = info.vFieldInfo[slot];
        if (!field.FHole() && field.FHoldsIn(version) && FBelowType(info.FieldName(field))) return slot;
    }
    return info.nFields;
}

/// Which of n slots, from 1 to 32, may have something to write: a bit for each. What cannot be told by a
/// presence byte may. Without branches: which fields of a record are present is hard to predict.
uint32_t FindCandidates(const SornObject& object, const FieldInfo* vField, unsigned n) {
    const auto* const bytes = reinterpret_cast<const unsigned char*>(&object);
    uint32_t candidates = 0;
    for (const FieldInfo* field = vField; field != vField + n; ++field) {
        const unsigned offset = field->presenceOffset;
        const bool isSet = bytes[offset] != 0;  // at offset 0 lies something else
        const bool hasNoByte = offset == 0;
        candidates = candidates >> 1 | static_cast<uint32_t>(isSet | hasNoByte) << 31;
    }
    return candidates >> (32 - n);
}

/// Whether a candidate has something to write.
bool FHasValue(const SornObject& object, const FieldInfo& field) {
    if (field.presenceOffset != 0) return true;
    switch (field.arity) {
        case SORN_ARITY_MULTI:
            return field.Type() < SORN_DATA_TYPE_NONE &&
                   FieldSource(object.MemberAt(field), true).Count(field.Type()) != 0;
        case SORN_ARITY_REQUIRED:
            return true;
        case SORN_ARITY_OPTIONAL:
            return static_cast<const RefBase*>(object.MemberAt(field))->GetCore() != nullptr;
        default:
            return false;
    }
}

/// Asks the processor for an object that is wanted soon: the walk looks at most of its members.
void Prefetch(const void* object) {
    if (object == nullptr) return;
    constexpr unsigned nLines = 8;
    constexpr unsigned nLine = 64;
    for (unsigned i = 0; i < nLines; ++i) __builtin_prefetch(static_cast<const char*>(object) + i * nLine);
}

/// Where the last name begins; all bytes in front of it can be read.
unsigned LastName(const StructInfo& info) {
    return info.nFields > 0 ? info.vFieldInfo[info.nFields - 1].nameOffset : 0;  // 0 in a hole
}

/// The length of the name of a slot's field. The names stand one behind the other in slot order.
size_t NameLength(const StructInfo& info, int32_t slot) {
    const unsigned offset = info.vFieldInfo[slot].nameOffset;
    const int32_t next = slot + 1;
    if (next < info.nFields && info.vFieldInfo[next].nameOffset > offset) {
        return info.vFieldInfo[next].nameOffset - offset - 1;
    }
    return std::strlen(info.pFieldNames + offset);
}

constexpr size_t maxAroundNameG = 6;  // bytes that PutName writes around a name

/// Writes a name with what stands around it. The nName bytes, and as many as nReadable behind `name`, can be
/// read; as many as nBlockG behind the end may be written.
constexpr size_t nBlockG = 32;
unsigned char* PutName(const char* name, size_t nName, size_t nReadable, bool& isFirst, unsigned char* p) {
    if (!isFirst) {
        *p++ = ',';
        *p++ = ' ';
    }
    isFirst = false;
    *p++ = '"';
    if (nName <= nBlockG && nReadable >= nBlockG) [[likely]] {
        std::memcpy(p, name, nBlockG);  // whatever its length: most names are shorter, and none alike
        p += nName;
    } else {
        p = CopyShort(name, nName, p);
    }
    std::memcpy(p, "\": ", 3);
    return p + 3;
}

}  // namespace

void ObjectWriter::BeginBody(const ref<SornObject>& object, OrvoVersion version) {
    object->UpRef();
    Open(*object, version, true);
}

void ObjectWriter::BeginField(const char* name, const FieldInfo& field, bool isMulti,
                              const SornObject& object, OrvoVersion version, bool& isFirst) {
    if (isMulti) {
        WriteMulti(name, std::strlen(name), field, object, version, isFirst);
    } else {
        WriteSingle(name, std::strlen(name), 0, field, object, version, isFirst);
    }
}

void ObjectWriter::Open(const SornObject& object, OrvoVersion version, bool isHeld) {
    const StructInfo* const info = tableM.Find(object.structId);
    RoxAssert(info != nullptr, "the object is of a struct of the schema");
    Prefetch(&object);
    outM.Byte('{');
    framesM.Push({info, &object, nullptr, 0, FindAnchor(*info, version), 0, 0, LastName(*info), version, true,
                  isHeld, false});
}

bool ObjectWriter::Run(size_t depth) {
    while (dictionaryM == nullptr) {
        if (framesM.Size() <= depth) return true;
        if (framesM.Top().pInfo != nullptr) {
            ContinueObject();
        } else {
            ContinueList();
        }
    }
    return false;
}

void ObjectWriter::ContinueObject() {
    Frame& frame = framesM.Top();
    if (!WriteSlots(frame)) return;
    if (!frame.isTypeWritten) {
        WriteType(*frame.pInfo, frame.isFirst);
        frame.isTypeWritten = true;
        frame.end = frame.pInfo->nFields;
        if (!WriteSlots(frame)) return;
    }
    outM.Byte('}');
    const SornObject* const object = frame.pObject;
    const bool isHeld = frame.isHeld;
    framesM.Pop();
    if (isHeld) RoxCore::DownRef(const_cast<SornObject*>(object));
}

/// Writes the candidates that are left, and the slots from the next one to the end of the frame. False as
/// WriteSingle is.
bool ObjectWriter::WriteSlots(Frame& frame) {
    constexpr int32_t nBlock = 32;
    const StructInfo& info = *frame.pInfo;
    const SornObject& object = *frame.pObject;
    const OrvoVersion version = frame.version;
    for (;;) {
        while (frame.candidates != 0) {
            const int32_t slot = frame.block + __builtin_ctz(frame.candidates);
            frame.candidates &= frame.candidates - 1;
            const FieldInfo& field = info.vFieldInfo[slot];
            if (!FHasValue(object, field) || !field.FHoldsIn(version)) continue;
            const char* const name = info.FieldName(field);
            const size_t nName = NameLength(info, slot);
            if (field.arity == SORN_ARITY_MULTI) {
                if (!WriteMulti(name, nName, field, object, version, frame.isFirst)) return false;
            } else {
                const size_t nReadable =
                    frame.lastName - std::min(frame.lastName, unsigned{field.nameOffset});
                if (!WriteSingle(name, nName, nReadable, field, object, version, frame.isFirst)) return false;
            }
        }
        if (frame.next >= frame.end) return true;
        frame.block = frame.next;
        frame.next = std::min(frame.next + nBlock, frame.end);
        frame.candidates = FindCandidates(object, info.vFieldInfo + frame.block,
                                          static_cast<unsigned>(frame.next - frame.block));
    }
}

void ObjectWriter::ContinueList() {
    Frame& frame = framesM.Top();
    const FieldSource source(frame.pObject->MemberAt(*frame.pField), true);
    while (frame.next < frame.end) {
        const auto i = static_cast<unsigned>(frame.next++);
        if (frame.next < frame.end) Prefetch(source.ReferenceAt<RoxCore>(i + 1));
        if (source.ReferenceAt<RoxCore>(i) == nullptr) continue;
        if (!frame.isFirst) outM.Byte(',');
        frame.isFirst = false;
        if (!WriteReference(frame.pField->Type(), source, i, frame.version)) return;
    }
    outM.Byte(']');
    framesM.Pop();
}

void ObjectWriter::WriteName(const char* name, size_t nName, bool& isFirst, JsonOutput& out) {
    if (nName <= maxShortNameG) [[likely]] {
        unsigned char* const p = out.Room(static_cast<unsigned>(nName + maxAroundNameG));
        out.Written(PutName(name, nName, 0, isFirst, p));
        return;
    }
    if (!isFirst) out.Literal(", ");
    isFirst = false;
    out.Byte('"');
    out.Bytes(name, nName);
    out.Literal("\": ");
}

void ObjectWriter::WriteType(const StructInfo& info, bool& isFirst) {
    const size_t n = std::strlen(info.name);
    WriteName(typeNameG, sizeof typeNameG - 1, isFirst, outM);
    if (n > maxShortNameG) {
        outM.Byte('"');
        outM.Bytes(info.name, n);
        outM.Byte('"');
        return;
    }
    unsigned char* p = outM.Room(static_cast<unsigned>(n + 2));
    *p++ = '"';
    p = CopyShort(info.name, n, p);
    *p++ = '"';
    outM.Written(p);
}

bool ObjectWriter::WriteSingle(const char* name, size_t nName, size_t nReadable, const FieldInfo& field,
                               const SornObject& object, OrvoVersion version, bool& isFirst) {
    const void* const member = object.MemberAt(field);
    const DataType type = field.Type();
    if (StorageOf(type) == FieldStorage::REFERENCE) {
        const FieldSource source(member, false);
        if (source.ReferenceAt<RoxCore>(0) == nullptr) return true;
        WriteName(name, nName, isFirst, outM);
        return WriteReference(type, source, 0, version);
    }
    if (nName <= maxShortNameG && !FLong(type, member)) [[likely]] {
        unsigned char* const p = outM.Room(static_cast<unsigned>(nName + maxAroundNameG + maxShortValueG));
        outM.Written(PutShort(field, member, PutName(name, nName, nReadable, isFirst, p)));
        return true;
    }
    WriteName(name, nName, isFirst, outM);
    WriteValue(field, member);
    return true;
}

bool ObjectWriter::WriteMulti(const char* name, size_t nName, const FieldInfo& field,
                              const SornObject& object, OrvoVersion version, bool& isFirst) {
    const DataType type = field.Type();
    if (type >= SORN_DATA_TYPE_NONE) return true;
    const FieldSource source(object.MemberAt(field), true);
    const unsigned count = source.Count(type);
    if (count == 0) return true;
    WriteName(name, nName, isFirst, outM);
    outM.Byte('[');
    const FieldStorage storage = StorageOf(type);
    if (storage == FieldStorage::REFERENCE) {
        framesM.Push(
            {nullptr, &object, &field, 0, static_cast<int32_t>(count), 0, 0, 0, version, true, false, false});
        return false;
    }
    for (unsigned i = 0; i < count; ++i) {
        if (i != 0) outM.Byte(',');
        if (storage == FieldStorage::TEXT) {
            WriteValue(field, &source.TextAt(i));
        } else {
            WriteValue(field, &source.PlainAt<unsigned char>(i));
        }
    }
    outM.Byte(']');
    return true;
}

void ObjectWriter::WriteValue(const FieldInfo& field, const void* value) {
    if (FLong(field.Type(), value)) [[unlikely]] {
        const RoxString& text = *static_cast<const RoxString*>(value);
        stringwriter::WriteQuoted(text.Utf8(), text.NByte(), outM);
    } else {
        outM.Written(PutShort(field, value, outM.Room(maxShortValueG)));
    }
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
            return WriteLazy(source.SharedAt<LazyDict>(i));
        default:
            Open(*source.ReferenceAt<SornObject>(i), version, false);
            return false;
    }
}

bool ObjectWriter::WriteLazy(const ref<LazyDict>& body) {
    LazyBodyContent content = LazyBodyToWrite(body, false, false);
    if (content.dictionary != nullptr) {
        dictionaryM = std::move(content.dictionary);
        return false;
    }
    if (content.object != nullptr) {
        BeginBody(content.object, content.version);
        return false;
    }
    if (content.text != nullptr) outM.Bytes(content.text->GetData(), content.text->GetLength());
    return true;
}

}  // namespace sorn
