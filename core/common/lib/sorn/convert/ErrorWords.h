#pragma once

#include <optional>

#include "rox/RoxString.h"
#include "sorn/dict/ByteBuffer.h"

namespace sorn {

/// The words of a failing conversion: gathered while it unwinds and put into the caller's string once, so
/// that they cost no more than their length, however many levels add theirs. Nothing is allocated before the
/// first word.
class ErrorWords {
 public:
    /// `target` is the caller's string: what it holds is kept in front until something replaces it.
    ErrorWords(RoxMempool* pool, RoxString& target) : pMempoolM(pool), targetM(target) {}

    /// Adds text behind what stands there. Both end at their first NUL, as they do in printf's "%s%s".
    void Append(const char* text);
    void Append(const RoxString& text) { Append(text.Utf8()); }
    /// Adds one byte, as printf's "%c" does. A NUL counts as a byte of the text, and goes when more text
    /// follows.
    void AppendRaw(unsigned char byte);
    /// Drops all that stands there, the caller's text included.
    void Replace(const char* text);

    /// Stores the words in the caller's string, in that string's pool. Without any words it is left alone.
    void Commit();

 private:
    void Begin(const char* text);

    RoxMempool* pMempoolM;
    RoxString& targetM;
    std::optional<ByteBuffer> bufferM;
    bool endsInNulM = false;
};

}  // namespace sorn
