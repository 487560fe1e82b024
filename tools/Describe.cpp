#include "tools/Describe.h"

#include <cstdio>
#include <string>

#include "sorn/model/Schema.h"
#include "tools/DescribeJson.h"
#include "tools/ExitCode.h"
#include "tools/Output.h"
#include "tools/SchemaNames.h"

namespace sorn::tools {

namespace {

void PrintField(int slot, const StructInfo& info, const FieldInfo& field, const char* remark) {
    std::string type = WordOfDataType(field.Type());
    if (field.typeRef != 0) type.append(" ").append(NameOfType(field.typeRef));
    std::printf("%6d  %-34s %-38s %-9s %u-%u%s\n", slot, info.FieldName(field), type.c_str(),
                WordOfArity(field.arity), field.firstVersion, field.lastVersion, remark);
}

void PrintStruct(uint32_t id) {
    const StructInfo& info = *Schema::vStructDefG[id];
    std::printf("%s: record %u, %d slots", info.name, id, info.nFields);
    if (info.idPrefix != nullptr) std::printf(", ids begin with \"%s\"", info.idPrefix);
    std::printf("\n%6s  %-34s %-38s %-9s %s\n", "slot", "field", "type", "arity", "versions");
    for (int slot = 0; slot < info.nFields; ++slot) {
        if (info.vFieldInfo[slot].FHole()) continue;
        PrintField(slot, info, info.vFieldInfo[slot], "");
        const FieldInfoHistory& history = info.vFieldInfoHistory[slot];
        for (uint16_t i = 0; i < history.nVariants; ++i)
            PrintField(slot, info, history.vVariants[i], "  older form");
    }
}

void PrintEnum(uint32_t id) {
    const EnumDef& values = *Schema::vEnumDefG[id];
    std::printf("%s: enumeration %u, values below %u\n", NameOfType(id), id, values.count);
    for (uint32_t value = 0; value < values.count; ++value) {
        if (values.names[value] != nullptr) std::printf("%6u  %s\n", value, values.names[value]);
    }
}

void PrintList() {
    for (uint32_t id = 0; id < Schema::nStructDefG || id < Schema::nEnumDefG; ++id) {
        if (Schema::FindStruct(id) != nullptr) std::printf("%6u  record       %s\n", id, NameOfType(id));
        if (Schema::FindEnum(id) != nullptr) std::printf("%6u  enumeration  %s\n", id, NameOfType(id));
    }
}

}  // namespace

int Describe(const DescribeOptions& options) {
    uint32_t id = 0;
    if (!options.nameOrId.empty()) {
        id = FindType(options.nameOrId.c_str());
        if (id == 0) {
            std::fprintf(stderr, "no record or enumeration \"%s\"\n", options.nameOrId.c_str());
            return WRONG_USAGE;
        }
    }
    if (options.json) {
        const std::string text = id == 0 ? JsonOfSchema() : JsonOfType(id);
        std::printf("%s\n", text.c_str());
    } else if (id == 0) {
        PrintList();
    } else if (Schema::FindStruct(id) != nullptr) {
        PrintStruct(id);
    } else {
        PrintEnum(id);
    }
    return FinishOutput(stdout) ? DONE : SOME_REFUSED;
}

}  // namespace sorn::tools
