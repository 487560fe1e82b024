#include "tools/SchemaNames.h"

#include <charconv>
#include <cstring>

#include "sorn/model/Schema.h"

namespace sorn::tools {

namespace {

constexpr uint32_t typeEnumerationG = 1361;  // orvoObjectType: its rows name all structs and enumerations

bool FKnown(uint32_t id) {
    return Schema::FindStruct(id) != nullptr || Schema::FindEnum(id) != nullptr;
}

}  // namespace

const char* NameOfType(uint32_t id) {
    if (const StructInfo* info = Schema::FindStruct(id)) return info->name;
    return Schema::FindEnum(id) != nullptr ? Schema::vEnumDefG[typeEnumerationG]->NameOf(id) : nullptr;
}

uint32_t FindType(const char* nameOrId) {
    uint32_t id = 0;
    const char* const end = nameOrId + std::strlen(nameOrId);
    const auto [stop, failure] = std::from_chars(nameOrId, end, id);
    if (failure == std::errc() && stop == end) return FKnown(id) ? id : 0;
    const EnumDef& types = *Schema::vEnumDefG[typeEnumerationG];
    for (id = 0; id < types.count; ++id) {
        if (FKnown(id) && std::strcmp(NameOfType(id), nameOrId) == 0) return id;
    }
    return 0;
}

const char* WordOfDataType(DataType type) {
    static const char* const words[] = {"bool",      "bytes", "channel", "currency", "date",   "datetime",
                                        "anydict",   "enum",  "float",   "intid",    "longid", "stringid",
                                        "knowndict", "lazy",  "object",  "s64",      "s32",    "string",
                                        "time",      "u32",   "u64",     "none"};
    return words[type];
}

const char* WordOfArity(uint16_t arity) {
    static const char* const words[] = {"optional", "required", "multi", "none"};
    return words[arity];
}

}  // namespace sorn::tools
