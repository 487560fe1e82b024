#include "sorn/binary/ObjectEncoder.h"

#include "rox/RoxAssert.h"
#include "sorn/binary/AnyDictEncoder.h"
#include "sorn/binary/LazyLevels.h"
#include "sorn/binary/WireFormat.h"
#include "sorn/convert/DictionarySornObject.h"
#include "sorn/dict/Dict.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/model/ChannelNumber.h"
#include "sorn/model/CopyShort.h"
#include "sorn/model/Currency.h"

namespace sorn {

namespace {

static_assert(__BYTE_ORDER__ == __ORDER_LITTLE_ENDIAN__, "doubles are copied as they lie in memory");

/// A length and a tag.
constexpr size_t maxHeadG = varint::maxBytes64G + PlannedField::maxTagBytesG;
/// A text of so many bytes, the length of which is one byte, is written in one piece with what is around.
constexpr uint32_t maxShortG = 64;
/// A short text, a text of a scalar with its length, or a number, and a tag.
constexpr size_t maxPlainG = maxShortG + maxHeadG;
static_assert(ChannelNumber::maxTextBytesG <= maxShortG && Currency::maxTextBytesG <= maxShortG);
static_assert(maxShortG < 0x80);

const void* MemberOf(const SornObject& object, const PlannedField& field) {
    return reinterpret_cast<const unsigned char*>(&object) + field.storageOffset;
}

template <class T>
T Load(const void* member) {
    T value;
    std::memcpy(&value, member, sizeof value);
    return value;
}

template <class Scalar>
__attribute__((noinline)) unsigned char* WriteScalarText(const void* member, unsigned char* p) {
    char text[Scalar::maxTextBytesG];
    const unsigned n = static_cast<const Scalar*>(member)->FormatTo(text);
    p -= n;
    std::memcpy(p, text, n);
    return varint::WriteInRoom(n, p);
}

/// Writes a value without references so that it ends before p, where there is room for it.
__attribute__((always_inline)) inline unsigned char* WritePlain(DataType type, const void* member,
                                                                unsigned char* p) {
    switch (type) {
        case SORN_DATA_TYPE_BOOL:
            return varint::WriteInRoom(Load<uint8_t>(member), p);
        case SORN_DATA_TYPE_CHANNEL:
            return WriteScalarText<ChannelNumber>(member, p);
        case SORN_DATA_TYPE_CURRENCY:
            return WriteScalarText<Currency>(member, p);
        case SORN_DATA_TYPE_DATE:
        case SORN_DATA_TYPE_S32:
            return varint::WriteInRoom(varint::Zigzag(Load<int32_t>(member)), p);
        case SORN_DATA_TYPE_DATETIME:
        case SORN_DATA_TYPE_S64:
            return varint::WriteInRoom(varint::Zigzag(Load<int64_t>(member)), p);
        case SORN_DATA_TYPE_FLOAT:
            p -= sizeof(double);
            std::memcpy(p, member, sizeof(double));
            return p;
        case SORN_DATA_TYPE_LONG_ID:
        case SORN_DATA_TYPE_U64:
            return varint::WriteInRoom(Load<uint64_t>(member), p);
        default:  // ENUM, INT_ID, TIME, U32
            return varint::WriteInRoom(Load<uint32_t>(member), p);
    }
}

}  // namespace

ObjectEncoder::~ObjectEncoder() {
    for (; !stackM.FEmpty(); stackM.Pop()) RoxCore::DownRef(stackM.Top().pHeld);
}

void ObjectEncoder::Object(const SornObject& object, Form form) {
    Open(object, form, nullptr, nullptr, 0);
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
    if (OpenLazyBody(body, nullptr, 1)) Run();
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

/// Writes a value before p, where there is room for maxPlainG bytes, and leaves room for a tag.
__attribute__((always_inline)) inline unsigned char* ObjectEncoder::WriteText(const RoxString& text,
                                                                              unsigned char* p) {
    const uint32_t n = text.NByte();
    if (n > maxShortG) return varint::WriteInRoom(n, outM.Room(outM.Bytes(p, text.Utf8(), n), maxHeadG));
    p -= n;
    CopyShort(text.Utf8(), n, p);
    *--p = static_cast<unsigned char>(n);
    return p;
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
                p = WriteText(*reinterpret_cast<const RoxString*>(member), p);
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
            if (OpenLazyBody(source.SharedAt<LazyDict>(i), &field, frame.nLazyLevels + 1)) return true;
        } else if (const auto* const object = source.ReferenceAt<SornObject>(i)) {
            const Form form = field.Type() == SORN_DATA_TYPE_OBJECT ? SUBDICT : KNOWN_FIELD;
            Open(*object, form, &field, nullptr, frame.nLazyLevels);
            return true;
        }
    }
    return false;
}

/// Opens the object that a body converts to; false when there is no body.
bool ObjectEncoder::OpenLazyBody(const ref<LazyDict>& body, const PlannedField* headTag,
                                 uint32_t nLazyLevels) {
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
    Open(*object, KNOWN_FIELD, headTag, object.get(), nLazyLevels);
    return true;
}

/// Takes over a hold on `held`, which may be null.
inline void ObjectEncoder::Open(const SornObject& object, Form form, const PlannedField* headTag,
                                RoxCore* held, uint32_t nLazyLevels) {
    const StructPlan* const plan = plansM.Find(object.structId);
    RoxAssert(plan != nullptr, "the object is of a struct of the schema");
    stackM.Emplace(&object, plan, uint64_t{0}, plan->NGroups(), uint32_t{0},
                   static_cast<const PlannedField*>(nullptr), headTag, outM.Count(), held, nLazyLevels, form);
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

/// The values of a field that holds neither objects nor bodies, each with the tag.
void ObjectEncoder::WriteElements(const PlannedField& field, const FieldSource& source) {
    const DataType type = field.Type();
    unsigned char* p = outM.Begin();
    for (uint32_t i = source.Count(type); i-- > 0;) {
        p = outM.Room(p, maxPlainG);
        switch (type) {
            case SORN_DATA_TYPE_STRING:
            case SORN_DATA_TYPE_STRING_ID:
                p = WriteText(source.TextAt(i), p);
                break;
            case SORN_DATA_TYPE_BYTESTRING: {
                const auto* const bytes = source.ReferenceAt<rox::ByteBuffer>(i);
                if (bytes == nullptr) continue;
                p = WriteBytes(*bytes, p);
                break;
            }
            case SORN_DATA_TYPE_ANY_DICT: {
                const auto* const dict = source.ReferenceAt<Dict>(i);
                if (dict == nullptr) continue;
                p = WriteAnyDict(*dict, p);
                break;
            }
            default:
                p = WritePlain(type, &source.PlainAt<unsigned char>(i), p);
        }
        p = field.WriteTag(p);
    }
    outM.Commit(p);
}

// As WriteText.

unsigned char* ObjectEncoder::WriteBytes(const rox::ByteBuffer& bytes, unsigned char* p) {
    if (!bytes.FEmpty()) p = outM.Bytes(p, bytes.GetData(), bytes.GetLength());
    return varint::WriteInRoom(bytes.GetLength(), outM.Room(p, maxHeadG));
}

unsigned char* ObjectEncoder::WriteAnyDict(const Dict& dict, unsigned char* p) {
    const size_t end = outM.Count(p);
    outM.Commit(p);
    AnyDictEncoder(pMempoolM, outM).Body(*dict.GetDictionary());
    p = outM.Room(outM.Begin(), maxHeadG);
    return varint::WriteInRoom(outM.Count(p) - end, p);
}

}  // namespace sorn
