#pragma once

#include <cstdint>

#include "rox/RoxString.h"
#include "sorn/convert/ErrorWords.h"
#include "sorn/convert/StructTable.h"
#include "sorn/model/FieldInfo.h"

/// The text forms that take their words from the schema: enumerations and ids.
namespace sorn::schematext {

/// Bytes of the longest text of an id, prefix included; longer ones are cut there.
constexpr unsigned maxIdBytesG = 99;

/// Whether a text has a NUL inside. Names of the schema have none, so such a text is not one of them,
/// whatever stands before the NUL.
bool FHasNul(const RoxString& text);

/// The name of a value of the field's enumeration, shared through the global string table, or
/// "INVALID_VALUE:%u" in the pool for a value without a name.
RoxString EnumName(RoxMempool* pool, const FieldInfo& field, uint32_t value);
/// The value of a name: the lowest one when several have it. False and words when none has.
bool EnumValue(const FieldInfo& field, const RoxString& name, uint32_t& value, ErrorWords& words);

/// The idPrefix of the field's struct and the id; "XXX" for a field without a struct.
RoxString LongIdText(RoxMempool* pool, StructTable table, const FieldInfo& field, uint64_t id);
RoxString StringIdText(RoxMempool* pool, StructTable table, const FieldInfo& field, const RoxString& id);

/// The prefix of the field's ids, which may be empty; null for a field without a struct.
const char* IdPrefix(StructTable table, const FieldInfo& field);
/// LongIdText without a string of its own: at most maxIdBytesG bytes into `out`, without a NUL; gives the
/// length.
unsigned WriteLongId(StructTable table, const FieldInfo& field, uint64_t id, char* out);

/// What follows the prefix of the field's struct in a text, as a pointer into the text. Null and words when
/// the field has no struct or the text does not begin with the prefix.
const char* BareId(StructTable table, const FieldInfo& field, const RoxString& text, ErrorWords& words);
/// What BareId gave for `text` as a number: 0 for bad digits, of which a NUL is one.
uint32_t BareInt(RoxMempool* pool, const RoxString& text, const char* bare);
uint64_t BareLong(RoxMempool* pool, const RoxString& text, const char* bare);
/// The same as a string of its own in the pool.
RoxString BareString(RoxMempool* pool, const RoxString& text, const char* bare);

}  // namespace sorn::schematext
