#include "sorn/model/Schema.h"

// In place of the library's: there both are the same number, so that a choice between them would not show. In
// a section of its own, where AddressSanitizer does not look for two definitions of one name.
[[gnu::section(".rodata.chosen")]] const int32_t sorn::Schema::defaultSchemaVersionG = 41;
