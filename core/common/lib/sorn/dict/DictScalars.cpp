// The text forms of scalars in strings.
#include <cstring>

#include "sorn/dict/Base64.h"
#include "sorn/dict/Dict.h"
#include "sorn/dict/ScalarFormat.h"
#include "sorn/model/ScalarText.h"

namespace sorn {

namespace {

/// The text that `write` puts into a buffer, as a string in the pool.
template <class Write>
RoxString Written(RoxMempool* pool, Write write) {
    char text[scalarformat::maxTextBytesG];
    const char* const end = write(text);
    return RoxString::FromUtf8Bytes(pool, static_cast<unsigned>(end - text), text);
}

}  // namespace

RoxString Dict::FormatBool(RoxMempool* pool, bool value) {
    return RoxString(pool, value ? "true" : "false");
}

bool Dict::ParseBool(RoxMempool*, const RoxString& text) {
    return text.FEqual("true");
}

RoxString Dict::FormatS32(RoxMempool* pool, int value) {
    return FormatS64(pool, value);
}

RoxString Dict::FormatS64(RoxMempool* pool, long long value) {
    return Written(pool, [value](char* out) { return scalartext::WriteDecimal(value, out); });
}

RoxString Dict::FormatU32(RoxMempool* pool, unsigned value) {
    return FormatU64(pool, value);
}

RoxString Dict::FormatU64(RoxMempool* pool, unsigned long long value) {
    return Written(pool, [value](char* out) { return scalartext::WriteUnsigned(value, out); });
}

RoxString Dict::FormatFloat(RoxMempool* pool, double value) {
    return Written(pool, [value](char* out) { return scalarformat::WriteFloat(value, out); });
}

double Dict::ParseFloat(RoxMempool*, const RoxString& text) {
    double value = 0;
    return scalarformat::ScanFloat(text.Utf8(), value) ? value : 0;
}

RoxString Dict::FormatBytestring(RoxMempool* pool, const ref<rox::ByteBuffer>& bytes) {
    return EncodeBase64(pool, bytes);
}

ref<rox::ByteBuffer> Dict::ParseBytestring(RoxMempool* pool, const RoxString& text) {
    return DecodeBase64(pool, text);
}

RoxString Dict::FormatLongId(RoxMempool* pool, unsigned long long value) {
    return Written(pool, [value](char* out) { return scalarformat::WriteLongId(value, out); });
}

unsigned long long Dict::ParseLongId(RoxMempool*, const char* text) {
    return scalarformat::ParseLongId(text, std::strlen(text));
}

int Dict::ParseS32(RoxMempool*, const RoxString& text) {
    return scalarformat::ParseS32(text.Utf8(), text.NByte());
}

long long Dict::ParseS64(RoxMempool*, const RoxString& text) {
    return scalarformat::ParseS64(text.Utf8(), text.NByte());
}

unsigned Dict::ParseU32(RoxMempool*, const char* text) {
    return scalarformat::ParseU32(text, std::strlen(text));
}

unsigned long long Dict::ParseU64(RoxMempool*, const char* text) {
    return scalarformat::ParseU64(text, std::strlen(text));
}

}  // namespace sorn
