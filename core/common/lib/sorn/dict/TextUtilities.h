#pragma once

#include "rox/RoxString.h"
#include "rox/RoxStringArray.h"
#include "rox/ref.h"
#include "sorn/dict/RoxByteBuffer.h"

namespace sorn {

/// Reads groups of hexadecimal digits between white space, vertical tab and form feed included, up to a NUL
/// or the end: each gives the low byte of its number, as a strtol of 64 bits reads it in base 16, and 0 when
/// it is none. So a number out of range gives 0xFF, and 0x00 below zero. Nothing is an error. The reverse of
/// FormatBytes. The results are made in the pool.
RoxString ParseBytes(RoxMempool* pool, const RoxString& text);
ref<rox::ByteBuffer> ParseBytesToBytestring(RoxMempool* pool, const RoxString& text);

/// Each byte as two capital hexadecimal digits and a blank, the last one too. A null buffer counts as empty.
/// At most 1,431,655,765 bytes, RoxAssertFail beyond.
RoxString FormatBytes(RoxMempool* pool, const RoxString& bytes);
RoxString FormatBytesFromBytestring(RoxMempool* pool, const ref<rox::ByteBuffer>& bytes);

/// The text up to its first NUL with each byte that occurs in `chars` replaced. Bytes, not characters: those
/// of a character of several bytes stand for themselves.
RoxString ReplaceCharsWithString(RoxMempool* pool, const RoxString& text, const char* chars,
                                 const RoxString& replacement);

/// Adds the pieces of the text between delimiters, the last of them may be empty; a text without any
/// delimiter adds nothing. Behind a delimiter the search goes on as many characters (not bytes) later as the
/// delimiter has bytes, so one of several bytes to a character takes text behind it along. An empty delimiter
/// is found nowhere. Adding ends when the array is full.
void SplitString(RoxString text, const RoxString& delimiter, RoxStringArray& pieces);

}  // namespace sorn
