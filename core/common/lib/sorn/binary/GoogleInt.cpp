#include "sorn/binary/GoogleInt.h"

#include "sorn/binary/ProtoBufByteOutputStream.h"
#include "sorn/binary/Varint.h"

namespace sorn {

namespace varint {

const unsigned char* ReadLong32(const unsigned char* p, const unsigned char* end, uint32_t& value) {
    return p < end ? ReadLong<uint32_t, maxBytes32G>(p, end, value) : nullptr;
}

const unsigned char* ReadLong64(const unsigned char* p, const unsigned char* end, uint64_t& value) {
    return p < end ? ReadLong<uint64_t, maxBytes64G>(p, end, value) : nullptr;
}

}  // namespace varint

namespace {

template <class Unsigned>
void WriteNumber(Unsigned value, ProtoBufByteOutputStream& stream) {
    for (; value >= 0x80; value >>= 7) stream.WriteByte(static_cast<unsigned char>(value | 0x80));
    stream.WriteByte(static_cast<unsigned char>(value));
}

template <class Unsigned, class Out, class Convert>
bool ReadNumber(const unsigned char** cursor, const unsigned char* end, Out* out, Convert convert) {
    Unsigned value = 0;
    const unsigned char* const behind = varint::Read(*cursor, end, value);
    if (behind == nullptr) return false;
    *cursor = behind;
    *out = convert(value);
    return true;
}

}  // namespace

void GoogleInt::WriteGoogleU32(unsigned value, ProtoBufByteOutputStream& stream) {
    WriteNumber(value, stream);
}

void GoogleInt::WriteGoogleS32(int value, ProtoBufByteOutputStream& stream) {
    WriteNumber(varint::Zigzag(int32_t{value}), stream);
}

void GoogleInt::WriteGoogleU64(unsigned long long value, ProtoBufByteOutputStream& stream) {
    WriteNumber(value, stream);
}

void GoogleInt::WriteGoogleS64(long long value, ProtoBufByteOutputStream& stream) {
    WriteNumber(varint::Zigzag(int64_t{value}), stream);
}

bool GoogleInt::ReadGoogleU32(const unsigned char** cursor, const unsigned char* end, unsigned* out) {
    return ReadNumber<uint32_t>(cursor, end, out, [](uint32_t value) { return value; });
}

bool GoogleInt::ReadGoogleS32(const unsigned char** cursor, const unsigned char* end, int* out) {
    return ReadNumber<uint32_t>(cursor, end, out, [](uint32_t value) { return varint::Unzigzag(value); });
}

bool GoogleInt::ReadGoogleU64(const unsigned char** cursor, const unsigned char* end,
                              unsigned long long* out) {
    return ReadNumber<uint64_t>(cursor, end, out, [](uint64_t value) { return value; });
}

bool GoogleInt::ReadGoogleS64(const unsigned char** cursor, const unsigned char* end, long long* out) {
    return ReadNumber<uint64_t>(cursor, end, out, [](uint64_t value) { return varint::Unzigzag(value); });
}

}  // namespace sorn
