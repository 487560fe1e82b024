#pragma once

#include "rox/RoxString.h"

class RoxMempool;

namespace sorn {

/// The one shared string of a name, out of the process's global string table. `text` must live as long as the
/// table: a name of a struct, a field or an enumeration value, or a literal. Entries do not
/// move, so the address holds until DestroyGlobalSornHashTable; a copy of the string shares its
/// representation, which lies on the general heap, and may outlive the table.
///
/// The first call makes the table, and the table keeps that caller's pool for what it needs later: that pool
/// must outlive the table, so call DestroyGlobalSornHashTable before it dies. Null stands for the general
/// heap. Any thread, any time.
const RoxString* InternedString(RoxMempool* pool, const char* text);

/// Empties and deletes the global string table; does nothing without one. Not while a conversion is going on.
/// The next InternedString makes a new table. At the end of the process it happens by itself.
void DestroyGlobalSornHashTable();

}  // namespace sorn
