// The one table of data types on the way from objects to text, and the walk over fields that must be at one
// with it to be fast.

#include <algorithm>
#include <cstring>

#include "sorn/convert/FieldAccess.h"
#include "sorn/convert/SchemaText.h"
#include "sorn/dict/Base64.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/dict/ScalarFormat.h"
#include "sorn/json/StringWriter.h"
#include "sorn/model/ChannelNumber.h"
#include "sorn/model/CopyShort.h"
#include "sorn/model/Currency.h"
#include "sorn/model/Date.h"
#include "sorn/model/DateTime.h"
#include "sorn/model/ScalarText.h"
#include "sorn/model/Schema.h"
#include "sorn/model/Time.h"
#include "sorn/typedjson/ObjectWriter.h"

namespace sorn {

namespace {

constexpr Base64 base64G(Base64::DEFAULT_CODE_SET, Base64::DEFAULT_TERMINATOR);

template <class T>
const T& As(const void* value) {
    return *static_cast<const T*>(value);
}

char* Chars(unsigned char* p) {
    return reinterpret_cast<char*>(p);
}
unsigned char* Bytes(char* p) {
    return reinterpret_cast<unsigned char*>(p);
}

/// A text that needs no escape, in quotes.
unsigned char* PutQuoted(const char* text, size_t n, unsigned char* out) {
    *out++ = '"';
    out = CopyShort(text, n, out);
    *out++ = '"';
    return out;
}

/// The same of what `put` writes.
template <class Put>
unsigned char* PutQuoted(unsigned char* out, Put put) {
    *out++ = '"';
    out = put(out);
    *out++ = '"';
    return out;
}

template <class Scalar>
unsigned char* PutScalar(const Scalar& scalar, unsigned char* out) {
    return PutQuoted(out, [&scalar](unsigned char* p) { return p + scalar.FormatTo(Chars(p)); });
}

unsigned char* PutCurrency(const Currency& currency, unsigned char* out) {
    char text[Currency::maxTextBytesG];  // the code may be any three bytes
    const unsigned n = currency.FormatTo(text);
    return PutQuoted(out, [&text, n](unsigned char* p) { return stringwriter::PutEscaped(text, n, p); });
}

/// "true" or "false".
unsigned char* PutBool(bool value, unsigned char* out) {
    std::memcpy(out, value ? "true\0\0\0" : "false\0\0", 8);
    return out + (value ? 4 : 5);
}

}  // namespace

unsigned char* ObjectWriter::PutEnum(const Step& step, uint32_t value, unsigned char* out) {
    unsigned char* const end = step.pTexts != nullptr ? step.pTexts->Put(value, out) : nullptr;
    if (end != nullptr) [[likely]]
        return end;
    const EnumDef* const def = Schema::FindEnum(step.pField->typeRef);
    const char* const name = def != nullptr ? def->NameOf(value) : nullptr;
    // Names are words of the schema, without anything to escape.
    if (name != nullptr) return PutQuoted(name, std::strlen(name), out);
    return PutQuoted(out, [value](unsigned char* p) {
        constexpr char words[] = "INVALID_VALUE:";
        return Bytes(scalartext::WriteUnsigned(value, Chars(CopyShort(words, sizeof words - 1, p))));
    });
}

unsigned char* ObjectWriter::PutLongId(const Step& step, uint64_t id, unsigned char* out) const {
    if (step.pPrefix != nullptr) [[likely]] {
        std::memcpy(out, step.pPrefix, WriterPlan::nPrefixBlockG);
        out = Bytes(scalarformat::WriteLongId(id, Chars(out + step.nPrefix)));
        *out++ = '"';
        return out;
    }
    // Prefixes are words of the schema, too.
    return PutQuoted(out, [&](unsigned char* p) {
        return p + schematext::WriteLongId(plansM.GetTable(), *step.pField, id, Chars(p));
    });
}

unsigned char* ObjectWriter::PutStringId(const Step& step, const RoxString& id, unsigned char* out) const {
    return PutQuoted(out, [&](unsigned char* p) {
        const char* const prefix = schematext::IdPrefix(plansM.GetTable(), *step.pField);
        if (prefix == nullptr) return CopyShort("XXX", 3, p);
        const size_t nPrefix = std::min<size_t>(std::strlen(prefix), schematext::maxIdBytesG);
        const size_t nId = std::min<size_t>(id.NByte(), schematext::maxIdBytesG - nPrefix);
        return stringwriter::PutEscaped(id.Utf8(), nId, CopyShort(prefix, nPrefix, p));
    });
}

inline unsigned char* ObjectWriter::PutShort(DataType type, const Step& step, const void* value,
                                             unsigned char* out) const {
    using namespace scalartext;
    switch (type) {
        case SORN_DATA_TYPE_BOOL:
            return PutBool(As<unsigned char>(value) != 0, out);
        case SORN_DATA_TYPE_CHANNEL:
            return PutScalar(As<ChannelNumber>(value), out);
        case SORN_DATA_TYPE_CURRENCY:
            return PutCurrency(As<Currency>(value), out);
        case SORN_DATA_TYPE_DATE:
            return PutScalar(As<Date>(value), out);
        case SORN_DATA_TYPE_DATETIME:
            return PutScalar(As<DateTime>(value), out);
        case SORN_DATA_TYPE_ENUM:
            return PutEnum(step, As<uint32_t>(value), out);
        case SORN_DATA_TYPE_FLOAT:
            return PutQuoted(out, [value](unsigned char* p) {
                return Bytes(scalarformat::WriteFloat(As<double>(value), Chars(p)));
            });
        case SORN_DATA_TYPE_INT_ID:
            return PutLongId(step, As<uint32_t>(value), out);
        case SORN_DATA_TYPE_LONG_ID:
            return PutLongId(step, As<uint64_t>(value), out);
        case SORN_DATA_TYPE_STRING_ID:
            return PutStringId(step, As<RoxString>(value), out);
        // Numbers of 64 bits are quoted, those of 32 bits are not.
        case SORN_DATA_TYPE_S64:
            return PutQuoted(
                out, [value](unsigned char* p) { return Bytes(WriteDecimal(As<int64_t>(value), Chars(p))); });
        case SORN_DATA_TYPE_S32:
            return Bytes(WriteDecimal(As<int32_t>(value), Chars(out)));
        case SORN_DATA_TYPE_STRING:
            return PutQuoted(out, [value](unsigned char* p) {
                const RoxString& text = As<RoxString>(value);
                return stringwriter::PutEscaped(text.Utf8(), text.NByte(), p);
            });
        case SORN_DATA_TYPE_TIME:
            return PutScalar(As<Time>(value), out);
        case SORN_DATA_TYPE_U32:
            return Bytes(WriteUnsigned(As<uint32_t>(value), Chars(out)));
        case SORN_DATA_TYPE_U64:
            return PutQuoted(out, [value](unsigned char* p) {
                return Bytes(WriteUnsigned(As<uint64_t>(value), Chars(p)));
            });
        default:
            return out;
    }
}

bool ObjectWriter::WriteCandidates(Frame& frame) {
    const SornObject& object = *frame.pObject;
    const bool asksVersions = frame.pView == nullptr;
    const Step* const block = frame.pPlan->StepsFrom(frame.block);
    JsonOutput& output = outM;
    for (uint32_t candidates = frame.candidates; candidates != 0;) {
        const Step& step = block[static_cast<unsigned>(__builtin_ctz(candidates))];
        candidates &= candidates - 1;
        if (asksVersions && !step.pField->FHoldsIn(frame.version)) continue;
        const void* const member = step.MemberOf(object);
        if (step.FSimple() && !FLong(DataType{step.form}, member)) [[likely]] {
            unsigned char* const out = step.PutKey(frame.isFirst, output.Room(maxEntryG));
            frame.isFirst = false;
            output.Written(PutShort(DataType{step.form}, step, member, out));
        } else if (step.FHasValue(object)) {
            frame.candidates = candidates;  // before the frame moves
            if (!WriteOther(step, frame)) return false;
        }
    }
    frame.candidates = 0;
    return true;
}

void ObjectWriter::WriteValue(const Step& step, const void* value) {
    if (FLong(step.Type(), value)) [[unlikely]] {
        const RoxString& text = As<RoxString>(value);
        stringwriter::WriteQuoted(text.Utf8(), text.NByte(), outM);
    } else {
        outM.Written(PutShort(step.Type(), step, value, outM.Room(maxShortValueG)));
    }
}

void ObjectWriter::WriteBytes(const rox::ByteBuffer& value) {
    constexpr unsigned piece = JsonOutput::maxRoomG / 4 * 3;  // whole groups
    const unsigned char* bytes = value.GetData();
    outM.Byte('"');
    for (unsigned nLeft = value.GetLength(); nLeft > 0;) {
        const unsigned n = std::min(nLeft, piece);
        const auto nText = static_cast<unsigned>(Base64::EncodedLength(n));
        unsigned char* const text = outM.Room(nText);
        base64G.Encode(bytes, n, text);
        outM.Written(text + nText);
        bytes += n;
        nLeft -= n;
    }
    outM.Byte('"');
}

}  // namespace sorn
