#include "sorn/dict/Base64.h"

#include <cstring>

#include "rox/RoxAssert.h"
#include "sorn/dict/NewText.h"

namespace sorn {

namespace {

constexpr Base64 defaultG(Base64::DEFAULT_CODE_SET, Base64::DEFAULT_TERMINATOR);
static_assert(!defaultG.FCodeSetBad());

uint32_t CheckedLength(unsigned n) {
    const unsigned long long length = Base64::EncodedLength(n);
    RoxAssert(length <= UINT32_MAX, "Base64: too many bytes");
    return static_cast<uint32_t>(length);
}

}  // namespace

void Base64::Encode(const unsigned char* bytes, unsigned n, unsigned char* text) const {
    for (; n >= 3; n -= 3, bytes += 3, text += 4) {
        const unsigned group = unsigned{bytes[0]} << 16 | unsigned{bytes[1]} << 8 | bytes[2];
        text[0] = codeSetM[group >> 18];
        text[1] = codeSetM[group >> 12 & 63];
        text[2] = codeSetM[group >> 6 & 63];
        text[3] = codeSetM[group & 63];
    }
    if (n != 0) EncodeRest(bytes, n, text);
}

/// The group of the last one or two bytes.
void Base64::EncodeRest(const unsigned char* bytes, unsigned n, unsigned char* text) const {
    const unsigned group = unsigned{bytes[0]} << 16 | (n == 2 ? unsigned{bytes[1]} << 8 : 0);
    text[0] = codeSetM[group >> 18];
    text[1] = codeSetM[group >> 12 & 63];
    text[2] = n == 2 ? codeSetM[group >> 6 & 63] : terminatorM;
    text[3] = terminatorM;
}

/// Groups of four code characters each; false at any other.
bool Base64::DecodeGroups(const unsigned char* text, unsigned nGroups, unsigned char* bytes) const {
    for (; nGroups != 0; --nGroups, text += 4, bytes += 3) {
        const unsigned a = reverseMapM[text[0]];
        const unsigned b = reverseMapM[text[1]];
        const unsigned c = reverseMapM[text[2]];
        const unsigned d = reverseMapM[text[3]];
        if ((a | b | c | d) > 63) return false;
        bytes[0] = static_cast<unsigned char>(a << 2 | b >> 4);
        bytes[1] = static_cast<unsigned char>(b << 4 | c >> 2);
        bytes[2] = static_cast<unsigned char>(c << 6 | d);
    }
    return true;
}

/// The one group that may have terminators; gives one to three bytes.
bool Base64::DecodeLastGroup(const unsigned char* text, unsigned char* bytes, unsigned& n) const {
    const unsigned a = reverseMapM[text[0]];
    const unsigned b = reverseMapM[text[1]];
    const unsigned c = reverseMapM[text[2]];
    const unsigned d = reverseMapM[text[3]];
    if (a == noCodeG || b == noCodeG) return false;
    bytes[0] = static_cast<unsigned char>(a << 2 | b >> 4);
    n = 1;
    if (c == noCodeG) return text[2] == terminatorM;  // whatever the fourth character is
    bytes[1] = static_cast<unsigned char>(b << 4 | c >> 2);
    n = 2;
    if (d == noCodeG) return text[3] == terminatorM;
    bytes[2] = static_cast<unsigned char>(c << 6 | d);
    n = 3;
    return true;
}

ref<rox::ByteBuffer> Base64::Decode(RoxMempool* pool, const unsigned char* text, unsigned n) const {
    if (n % 4 != 0) return nullptr;
    if (n == 0) return rox::ByteBuffer::NewOfLength(pool, 0);
    unsigned char last[3];
    unsigned nLast = 0;
    if (!DecodeLastGroup(text + n - 4, last, nLast)) return nullptr;
    const unsigned nGroups = n / 4 - 1;
    ref<rox::ByteBuffer> bytes = rox::ByteBuffer::NewOfLength(pool, nGroups * 3 + nLast);
    if (!DecodeGroups(text, nGroups, bytes->MutableData())) return nullptr;
    std::memcpy(bytes->MutableData() + nGroups * 3, last, nLast);
    return bytes;
}

void Base64::Encode(RoxMempool* pool, const ref<rox::ByteBuffer>& input, ref<rox::ByteBuffer>& output) const {
    const unsigned n = input == nullptr ? 0 : input->GetLength();
    ref<rox::ByteBuffer> text = rox::ByteBuffer::NewOfLength(pool, CheckedLength(n));
    if (n != 0) Encode(input->GetData(), n, text->MutableData());
    output = std::move(text);
}

bool Base64::Decode(RoxMempool* pool, const ref<rox::ByteBuffer>& input, ref<rox::ByteBuffer>& output) const {
    const unsigned n = input == nullptr ? 0 : input->GetLength();
    ref<rox::ByteBuffer> bytes = Decode(pool, n == 0 ? nullptr : input->GetData(), n);
    if (bytes == nullptr) return false;
    output = std::move(bytes);
    return true;
}

RoxString EncodeBase64(RoxMempool* pool, const ref<rox::ByteBuffer>& bytes) {
    const unsigned n = bytes == nullptr ? 0 : bytes->GetLength();
    return NewText(pool, CheckedLength(n), [&bytes, n](char* out) {
        defaultG.Encode(bytes->GetData(), n, reinterpret_cast<unsigned char*>(out));
    });
}

ref<rox::ByteBuffer> DecodeBase64(RoxMempool* pool, const RoxString& text) {
    ref<rox::ByteBuffer> bytes =
        defaultG.Decode(pool, reinterpret_cast<const unsigned char*>(text.Utf8()), text.NByte());
    return bytes == nullptr ? rox::ByteBuffer::NewOfLength(pool, 0) : bytes;
}

}  // namespace sorn
