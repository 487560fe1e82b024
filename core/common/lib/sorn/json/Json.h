#pragma once

#include "rox/RoxString.h"
#include "sorn/json/InputPointer.h"

class RoxMempool;

namespace kelbaselib {
class Bytesink;
}

namespace sorn {

class ByteBuffer;

/// Texts in the JSON dialect of this library. It is not plain JSON: texts may stand without quotes, a
/// backslash-u sequence is never decoded and never escaped again, so that it survives a reading and a writing
/// unchanged, and bytes from 0x80 up pass through unchecked. No state: any thread.
class Json {
 public:
    /// Writes one text: with quotes, or, with `onlyIfNeeded`, with quotes only if it has a byte other than
    /// ASCII letters, digits and '-' (looking as far as its first NUL). All its bytes are written, NULs too,
    /// and escaped in both cases. The empty text with `onlyIfNeeded` writes nothing.
    static void StringToJson(const RoxString& text, bool onlyIfNeeded, ByteBuffer& out);
    static void StringToJson(const RoxString& text, bool onlyIfNeeded, kelbaselib::Bytesink& out);

    /// The byte that the byte behind a backslash stands for. False, with `out` left alone, for 'u' and for
    /// those that no escape has.
    static bool EscapedCharToChar(char escaped, char& out);

    /// Reads one text, behind white space, into a string in the pool. In quotes: up to the closing quote,
    /// escapes decoded but for backslash-u; when the input ends first, what was there is the text, and the
    /// cursor comes to stand one byte behind the end. Without quotes: the longest run of ASCII letters,
    /// digits, '-', '.' and '+', which may be empty. False, with `out` untouched, for an unknown escape, a
    /// NUL or a backslash at the end of the input.
    static bool JsonToString(RoxMempool* pool, InputPointer& cursor, RoxString& out);
};

}  // namespace sorn
