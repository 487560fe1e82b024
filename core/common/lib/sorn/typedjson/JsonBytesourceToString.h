#pragma once

#include <cstdint>

#include "rox/RoxString.h"
#include "rox/ref.h"
#include "sorn/model/FieldInfo.h"
#include "sorn/typedjson/InputPointerBytesource.h"

class RoxHashStringToStringNew;

namespace rox {
class ByteBuffer;
}

/// The readers of single values at a cursor. Each reads one text, behind white space, and takes it for a
/// value: false, with the target untouched, when it is none. Results are made in the pool.
namespace sorn {

/// One text. In quotes: up to the closing quote, with escapes decoded, but for backslash-u, of which both
/// bytes are dropped and the digits kept; false for a NUL, an unknown escape, and when the input ends first.
/// Without quotes: the longest run of ASCII letters, digits, '-', '.' and '+', which may be empty. The table
/// is not looked at.
bool JsonBytesourceToString(RoxMempool* pool, RoxHashStringToStringNew* table, InputPointerBytesource& cursor,
                            RoxString& out);
bool ReadString(RoxMempool* pool, InputPointerBytesource& cursor, RoxString& out);

bool ReadBool(RoxMempool* pool, InputPointerBytesource& cursor, bool& out);  ///< "true" or "false"
/// As textvalue::ToS32 and its relatives.
bool ReadS32(RoxMempool* pool, InputPointerBytesource& cursor, int& out);
bool ReadS64(RoxMempool* pool, InputPointerBytesource& cursor, long long& out);
bool ReadU32(RoxMempool* pool, InputPointerBytesource& cursor, unsigned& out);
bool ReadU64(RoxMempool* pool, InputPointerBytesource& cursor, unsigned long long& out);
/// A name of the field's enumeration.
bool ReadEnum(RoxMempool* pool, InputPointerBytesource& cursor, const FieldInfo* field, unsigned& out);
/// An id with the prefix of the field's struct, as DictionarySornObject reads it.
bool ReadIntId(RoxMempool* pool, InputPointerBytesource& cursor, const FieldInfo* field, unsigned& out);
bool ReadLongId(RoxMempool* pool, InputPointerBytesource& cursor, const FieldInfo* field,
                unsigned long long& out);
bool ReadStringId(RoxMempool* pool, InputPointerBytesource& cursor, const FieldInfo* field, RoxString& out);
/// Base64; a bad one gives an empty buffer, and true.
bool ReadBytestring(RoxMempool* pool, InputPointerBytesource& cursor, ref<rox::ByteBuffer>& out);

}  // namespace sorn
