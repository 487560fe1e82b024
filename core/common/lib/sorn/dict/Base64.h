#pragma once

#include "rox/RoxString.h"
#include "rox/ref.h"
#include "sorn/dict/RoxByteBuffer.h"

namespace sorn {

/// Base64 with padding over a set of 64 characters: no line breaks written, nothing foreign accepted.
/// Read-only once it is built, and so safe on any thread.
class Base64 {
 public:
    static constexpr const char* DEFAULT_CODE_SET =
        "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";
    static constexpr unsigned char DEFAULT_TERMINATOR = '=';
    static constexpr const char* YAHOO_CODE_SET =
        "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789._";
    static constexpr unsigned char YAHOO_TERMINATOR = '-';

    /// The code set is 64 characters, the terminator the padding. A character that stands there twice, or is
    /// the terminator, makes the set bad, and so does the end of the text; whoever brings a set of his own
    /// asks FCodeSetBad, the operations do not: they work with what the tables got until then.
    constexpr Base64(const char* codeSet, unsigned char terminator) : terminatorM(terminator) {
        for (unsigned char& value : reverseMapM) value = noCodeG;
        for (unsigned char i = 0; i < 64; ++i) {
            const auto c = static_cast<unsigned char>(codeSet[i]);
            codeSetM[i] = c;
            if (reverseMapM[c] != noCodeG || c == terminator) return;
            reverseMapM[c] = i;
            if (c == 0 && i < 63) return;  // there is no byte behind the text's end
        }
        isCodeSetBadM = false;
    }

    constexpr bool FCodeSetBad() const { return isCodeSetBadM; }

    /// `output` becomes a new buffer in the pool with the text of the bytes: at most 3,221,225,469 of them,
    /// RoxAssertFail beyond.
    void Encode(RoxMempool* pool, const ref<rox::ByteBuffer>& input, ref<rox::ByteBuffer>& output) const;
    /// `output` becomes a new buffer in the pool with the bytes of the text; untouched on false. Bits below
    /// the last byte of a padded text are dropped unseen, and what stands behind a terminator in third place
    /// is not looked at.
    bool Decode(RoxMempool* pool, const ref<rox::ByteBuffer>& input, ref<rox::ByteBuffer>& output) const;

    /// The same on plain memory. A text of n bytes has EncodedLength(n) characters, which Encode writes.
    static unsigned long long EncodedLength(unsigned n) { return (n + 2ull) / 3 * 4; }
    void Encode(const unsigned char* bytes, unsigned n, unsigned char* text) const;
    /// The bytes of n characters of text as a new buffer in the pool; null for bad text.
    ref<rox::ByteBuffer> Decode(RoxMempool* pool, const unsigned char* text, unsigned n) const;

 private:
    static constexpr unsigned char noCodeG = 255;

    void EncodeRest(const unsigned char* bytes, unsigned n, unsigned char* text) const;
    bool DecodeGroups(const unsigned char* text, unsigned nGroups, unsigned char* bytes) const;
    bool DecodeLastGroup(const unsigned char* text, unsigned char* bytes, unsigned& n) const;

    unsigned char codeSetM[64] = {};
    unsigned char reverseMapM[256] = {};
    bool isCodeSetBadM = true;
    unsigned char terminatorM;
};

/// The text of the bytes in the default set, in the pool, with the limit of Base64::Encode. A null buffer
/// counts as empty.
RoxString EncodeBase64(RoxMempool* pool, const ref<rox::ByteBuffer>& bytes);
/// The bytes of a text in the default set, in the pool: never null, empty for bad text.
ref<rox::ByteBuffer> DecodeBase64(RoxMempool* pool, const RoxString& text);

}  // namespace sorn
