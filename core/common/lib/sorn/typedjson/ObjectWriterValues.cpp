// The one table of data types on the way from objects to text.

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

unsigned char* PutEnum(const FieldInfo& field, uint32_t value, unsigned char* out) {
    const EnumDef* const def = Schema::FindEnum(field.typeRef);
    const char* const name = def != nullptr ? def->NameOf(value) : nullptr;
    // Names are words of the schema, without anything to escape.
    if (name != nullptr) return PutQuoted(name, std::strlen(name), out);
    return PutQuoted(out, [value](unsigned char* p) {
        constexpr char words[] = "INVALID_VALUE:";
        return Bytes(scalartext::WriteUnsigned(value, Chars(CopyShort(words, sizeof words - 1, p))));
    });
}

}  // namespace

unsigned char* ObjectWriter::PutLongId(const FieldInfo& field, uint64_t id, unsigned char* out) const {
    // Prefixes are words of the schema, too.
    return PutQuoted(
        out, [&](unsigned char* p) { return p + schematext::WriteLongId(tableM, field, id, Chars(p)); });
}

unsigned char* ObjectWriter::PutStringId(const FieldInfo& field, const RoxString& id,
                                         unsigned char* out) const {
    return PutQuoted(out, [&](unsigned char* p) {
        const char* const prefix = schematext::IdPrefix(tableM, field);
        if (prefix == nullptr) return CopyShort("XXX", 3, p);
        const size_t nPrefix = std::min<size_t>(std::strlen(prefix), schematext::maxIdBytesG);
        const size_t nId = std::min<size_t>(id.NByte(), schematext::maxIdBytesG - nPrefix);
        return stringwriter::PutEscaped(id.Utf8(), nId, CopyShort(prefix, nPrefix, p));
    });
}

unsigned char* ObjectWriter::PutShort(const FieldInfo& field, const void* value, unsigned char* out) const {
    using namespace scalartext;
    switch (field.Type()) {
        case SORN_DATA_TYPE_BOOL:
            return As<unsigned char>(value) != 0 ? CopyShort("true", 4, out) : CopyShort("false", 5, out);
        case SORN_DATA_TYPE_CHANNEL:
            return PutScalar(As<ChannelNumber>(value), out);
        case SORN_DATA_TYPE_CURRENCY:
            return PutCurrency(As<Currency>(value), out);
        case SORN_DATA_TYPE_DATE:
            return PutScalar(As<Date>(value), out);
        case SORN_DATA_TYPE_DATETIME:
            return PutScalar(As<DateTime>(value), out);
        case SORN_DATA_TYPE_ENUM:
            return PutEnum(field, As<uint32_t>(value), out);
        case SORN_DATA_TYPE_FLOAT:
            return PutQuoted(out, [value](unsigned char* p) {
                return Bytes(scalarformat::WriteFloat(As<double>(value), Chars(p)));
            });
        case SORN_DATA_TYPE_INT_ID:
            return PutLongId(field, As<uint32_t>(value), out);
        case SORN_DATA_TYPE_LONG_ID:
            return PutLongId(field, As<uint64_t>(value), out);
        case SORN_DATA_TYPE_STRING_ID:
            return PutStringId(field, As<RoxString>(value), out);
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
