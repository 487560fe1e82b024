#include "sorn/model/StructInfoMap.h"

#include <cstdint>
#include <cstring>

#include "sorn/model/Schema.h"

namespace sorn {

const StructInfo* StructInfoMap::LookupStructByName(const char* name) {
    return LookupInTable(Schema::structNameHashTableG, Schema::structNameHashTableSizeG, name);
}

const StructInfo* StructInfoMap::LookupInTable(const StructInfo* const* table, uint32_t size,
                                               const char* name) {
    uint32_t hash = 0;
    for (const char* p = name; *p != '\0'; ++p) hash = hash * 31 + static_cast<unsigned char>(*p);
    for (uint32_t i = hash % size;; ++i) {
        if (i == size) i = 0;
        const StructInfo* const entry = table[i];
        if (entry == nullptr || std::strcmp(entry->name, name) == 0) return entry;
    }
}

}  // namespace sorn
