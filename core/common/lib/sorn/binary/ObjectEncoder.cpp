#include "sorn/binary/ObjectEncoder.h"

#include <algorithm>

#include "rox/RoxAssert.h"
#include "sorn/binary/AnyDictEncoder.h"
#include "sorn/binary/LazyLevels.h"
#include "sorn/binary/WireFormat.h"
#include "sorn/convert/DictionarySornObject.h"
#include "sorn/dict/Dict.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/model/ChannelNumber.h"
#include "sorn/model/Currency.h"

namespace sorn {

namespace {

static_assert(__BYTE_ORDER__ == __ORDER_LITTLE_ENDIAN__, "doubles are copied as they lie in memory");

/// A length and a tag.
constexpr size_t maxHeadG = varint::maxBytes64G + varint::maxBytes32G;
/// A text of a scalar with its length, or a number, and a tag.
constexpr size_t maxPlainG = 24 + maxHeadG;
static_assert(ChannelNumber::maxTextBytesG <= 24 && Currency::maxTextBytesG <= 24);

/// Slots that are looked at together: a bit of a word for each.
constexpr uint32_t nCandidatesG = 64;

template <class T>
T Load(const void* member) {
    T value;
    std::memcpy(&value, member, sizeof value);
    return value;
}

template <class Scalar>
unsigned char* WriteScalarText(const void* member, unsigned char* p) {
    char text[Scalar::maxTextBytesG];
    const unsigned n = static_cast<const Scalar*>(member)->FormatTo(text);
    p -= n;
    std::memcpy(p, text, n);
    return varint::WriteBefore(n, p);
}

/// Writes a value without references so that it ends before p, where there is room for it.
inline unsigned char* WritePlain(DataType type, const void* member, unsigned char* p) {
    switch (type) {
        case SORN_DATA_TYPE_BOOL:
            return varint::WriteBefore(uint32_t{Load<uint8_t>(member)}, p);
        case SORN_DATA_TYPE_CHANNEL:
            return WriteScalarText<ChannelNumber>(member, p);
        case SORN_DATA_TYPE_CURRENCY:
            return WriteScalarText<Currency>(member, p);
        case SORN_DATA_TYPE_DATE:
        case SORN_DATA_TYPE_S32:
            return varint::WriteBefore(varint::Zigzag(Load<int32_t>(member)), p);
        case SORN_DATA_TYPE_DATETIME:
        case SORN_DATA_TYPE_S64:
            return varint::WriteBefore(varint::Zigzag(Load<int64_t>(member)), p);
        case SORN_DATA_TYPE_FLOAT:
            p -= sizeof(double);
            std::memcpy(p, member, sizeof(double));
            return p;
        case SORN_DATA_TYPE_LONG_ID:
        case SORN_DATA_TYPE_U64:
            return varint::WriteBefore(Load<uint64_t>(member), p);
        default:  // ENUM, INT_ID, TIME, U32
            return varint::WriteBefore(Load<uint32_t>(member), p);
    }
}

inline unsigned char* WriteTag(uint32_t tag, unsigned char* p) {
    return tag == 0 ? p : varint::WriteBefore(tag, p);
}

}  // namespace

ObjectEncoder::~ObjectEncoder() {
    for (; !stackM.FEmpty(); stackM.Pop()) RoxCore::DownRef(stackM.Top().pHeld);
}

void ObjectEncoder::Object(const SornObject& object, Form form) {
    Open(object, form, 0, nullptr, 0);
    Run();
}

void ObjectEncoder::Fields(const StructInfo& info, const SornObject& object) {
    Frame frame{};
    frame.pObject = &object;
    frame.vFieldInfo = info.vFieldInfo;
    frame.slot = static_cast<uint32_t>(info.nFields);
    stackM.Push(frame);
    Run();
}

void ObjectEncoder::SingleField(const FieldInfo& field, const SornObject& object) {
    PushField(field, object, false, 0);
    Run();
}

void ObjectEncoder::MultiField(uint32_t tag, const FieldInfo& field, const SornObject& object) {
    PushField(field, object, true, tag);
    Run();
}

void ObjectEncoder::LazyBody(const ref<LazyDict>& body) {
    if (OpenLazyBody(body, 0, 1)) Run();
}

/// A frame that has one field and nothing else.
void ObjectEncoder::PushField(const FieldInfo& field, const SornObject& object, bool isMulti, uint32_t tag) {
    Frame frame{};
    frame.pObject = &object;
    stackM.Push(frame);
    StartField(stackM.Top(), field, isMulti, tag);
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

/// Of n slots, 64 at most: a bit for each field that has a value, or may have one, as only its member tells.
/// Without a branch for each slot, since which fields are set cannot be foretold.
uint64_t ObjectEncoder::FindCandidates(const Frame& frame, uint32_t first, uint32_t n) {
    const auto* const object = reinterpret_cast<const unsigned char*>(frame.pObject);
    const FieldInfo* const fields = frame.vFieldInfo + first;
    uint64_t candidates = 0;
    for (uint32_t i = n; i-- > 0;) {
        const unsigned presence = fields[i].presenceOffset;
        const unsigned isField = fields[i].arity ^ SORN_ARITY_NONE;
        const unsigned isSet = presence != 0 ? object[presence] : isField;
        candidates = candidates << 1 | (isSet != 0);
    }
    return candidates;
}

/// Writes fields from the last one down until an object has been opened; false when no field is left.
bool ObjectEncoder::StepFields() {
    Frame& frame = stackM.Top();
    const auto* const object = reinterpret_cast<const unsigned char*>(frame.pObject);
    unsigned char* p = outM.Begin();
    for (;;) {
        while (frame.candidates == 0) {
            if (frame.slot == 0) {
                outM.Commit(p);
                return false;
            }
            const uint32_t n = std::min(frame.slot, nCandidatesG);
            frame.slot -= n;
            frame.candidates = FindCandidates(frame, frame.slot, n);
        }
        const auto bit = 63 - static_cast<uint32_t>(__builtin_clzll(frame.candidates));
        frame.candidates ^= uint64_t{1} << bit;
        const uint32_t slot = frame.slot + bit;
        const FieldInfo& field = frame.vFieldInfo[slot];
        const bool isMulti = field.arity == SORN_ARITY_MULTI;
        const DataType type = field.Type();
        const uint32_t tag = wireformat::TagOf(slot, wireformat::WireTypeOf(type));
        const unsigned char* const member = object + field.storageOffset;
        const FieldStorage storage = StorageOf(type);
        if (!isMulti && storage == FieldStorage::PLAIN) {
            p = outM.Room(p, maxPlainG);
            p = varint::WriteBefore(tag, WritePlain(type, member, p));
        } else if (!isMulti && storage == FieldStorage::TEXT) {
            const RoxString& text = *reinterpret_cast<const RoxString*>(member);
            const uint32_t n = text.NByte();
            p = outM.Room(outM.Bytes(p, text.Utf8(), n), maxHeadG);
            p = varint::WriteBefore(tag, varint::WriteBefore(n, p));
        } else {
            outM.Commit(p);
            if (StartField(frame, field, isMulti, tag)) return true;
            p = outM.Begin();
        }
    }
}

/// Writes a field, or, when it holds objects or bodies, opens the last one; true when one has been opened.
bool ObjectEncoder::StartField(Frame& frame, const FieldInfo& field, bool isMulti, uint32_t tag) {
    const DataType type = field.Type();
    const FieldSource source(frame.pObject->MemberAt(field), isMulti);
    if (!FHoldsObjects(type) && type != SORN_DATA_TYPE_KNOWN_DICT_AS_LAZY) {
        WriteElements(field, source, tag);
        return false;
    }
    frame.nElements = source.Count(type);
    frame.pField = &field;
    frame.tag = tag;
    frame.isMulti = isMulti;
    return frame.nElements != 0 && OpenElement(frame);
}

/// Opens the last of the elements that are left and not null; false when there is none. `frame` may move.
bool ObjectEncoder::OpenElement(Frame& frame) {
    const FieldInfo& field = *frame.pField;
    const FieldSource source(frame.pObject->MemberAt(field), frame.isMulti);
    while (frame.nElements != 0) {
        const uint32_t i = --frame.nElements;
        if (field.Type() == SORN_DATA_TYPE_KNOWN_DICT_AS_LAZY) {
            if (OpenLazyBody(source.SharedAt<LazyDict>(i), frame.tag, frame.nLazyLevels + 1)) return true;
        } else if (const auto* const object = source.ReferenceAt<SornObject>(i)) {
            const Form form = field.Type() == SORN_DATA_TYPE_OBJECT ? SUBDICT : KNOWN_FIELD;
            Open(*object, form, frame.tag, nullptr, frame.nLazyLevels);
            return true;
        }
    }
    return false;
}

/// Opens the object that a body converts to; false when there is no body.
bool ObjectEncoder::OpenLazyBody(const ref<LazyDict>& body, uint32_t tag, uint32_t nLazyLevels) {
    if (body == nullptr) return false;
    ref<SornObject> object;
    if (nLazyLevels <= maxLazyLevelsG) {
        object = ObjectOfLazyBody(body);
    } else {
        RoxString error;  // the error's dictionary fits its struct
        DictionarySornObject(pMempoolM, tableM.vStructDef, tableM.nStructDef)
            .DictionaryToSornObject(NewTooDeepError(pMempoolM), 0, object, error);
    }
    if (object == nullptr) return false;
    object->UpRef();
    Open(*object, KNOWN_FIELD, tag, object.get(), nLazyLevels);
    return true;
}

/// Takes over a hold on `held`, which may be null.
void ObjectEncoder::Open(const SornObject& object, Form form, uint32_t headTag, RoxCore* held,
                         uint32_t nLazyLevels) {
    const StructInfo* const info = tableM.Find(object.structId);
    RoxAssert(info != nullptr, "the object is of a struct of the schema");
    stackM.Emplace(&object, info->vFieldInfo, static_cast<uint32_t>(info->nFields), uint64_t{0}, uint32_t{0},
                   static_cast<const FieldInfo*>(nullptr), uint32_t{0}, headTag, outM.Count(), held,
                   nLazyLevels, form, false);
}

/// Writes what stands before the object.
void ObjectEncoder::Close() {
    const Frame& frame = stackM.Top();
    if (frame.form != FIELDS) {
        unsigned char* p = outM.Room(outM.Begin(), 2 * maxHeadG);
        p = varint::WriteBefore(outM.Count(p) - frame.end, p);
        if (frame.form != SUBDICT) {
            p = varint::WriteBefore(wireformat::TagOf(frame.pObject->structId, wireformat::BYTES), p);
        }
        if (frame.form == KNOWN_FIELD) p = varint::WriteBefore(outM.Count(p) - frame.end, p);
        outM.Commit(WriteTag(frame.headTag, p));
    }
    RoxCore* const held = frame.pHeld;
    stackM.Pop();
    RoxCore::DownRef(held);
}

/// The values of a field that holds neither objects nor bodies, each with the tag.
void ObjectEncoder::WriteElements(const FieldInfo& field, const FieldSource& source, uint32_t tag) {
    const DataType type = field.Type();
    for (uint32_t i = source.Count(type); i-- > 0;) {
        switch (type) {
            case SORN_DATA_TYPE_STRING:
            case SORN_DATA_TYPE_STRING_ID:
                WriteText(source.TextAt(i), tag);
                break;
            case SORN_DATA_TYPE_BYTESTRING:
                WriteBytes(source.ReferenceAt<rox::ByteBuffer>(i), tag);
                break;
            case SORN_DATA_TYPE_ANY_DICT:
                WriteAnyDict(source.ReferenceAt<Dict>(i), tag);
                break;
            default:
                unsigned char* const p = outM.Room(outM.Begin(), maxPlainG);
                outM.Commit(WriteTag(tag, WritePlain(type, &source.PlainAt<unsigned char>(i), p)));
        }
    }
}

void ObjectEncoder::WriteText(const RoxString& text, uint32_t tag) {
    unsigned char* const p = outM.Room(outM.Bytes(outM.Begin(), text.Utf8(), text.NByte()), maxHeadG);
    outM.Commit(WriteTag(tag, varint::WriteBefore(text.NByte(), p)));
}

void ObjectEncoder::WriteBytes(const rox::ByteBuffer* bytes, uint32_t tag) {
    if (bytes == nullptr) return;
    unsigned char* p = outM.Begin();
    if (!bytes->FEmpty()) p = outM.Bytes(p, bytes->GetData(), bytes->GetLength());
    p = outM.Room(p, maxHeadG);
    outM.Commit(WriteTag(tag, varint::WriteBefore(bytes->GetLength(), p)));
}

void ObjectEncoder::WriteAnyDict(const Dict* dict, uint32_t tag) {
    if (dict == nullptr) return;
    const size_t end = outM.Count();
    AnyDictEncoder(pMempoolM, outM).Body(*dict->GetDictionary());
    unsigned char* p = outM.Room(outM.Begin(), maxHeadG);
    p = varint::WriteBefore(outM.Count(p) - end, p);
    outM.Commit(WriteTag(tag, p));
}

}  // namespace sorn
