#include "schema/MetadataDump.h"

#include <sstream>

#include "sorn/model/Schema.h"

using sorn::EnumDef;
using sorn::FieldInfo;
using sorn::Schema;
using sorn::StructInfo;

namespace {

constexpr uint32_t orvoObjectTypeIdG = 1361;

// What the id names, by the enumeration of all types.
const char* TypeName(uint32_t id) {
    const char* name = Schema::FindEnum(orvoObjectTypeIdG)->NameOf(id);
    return name != nullptr ? name : "?";
}

void DumpField(std::ostream& out, const StructInfo& info, unsigned slot, const FieldInfo& field,
               const char* tail) {
    out << "  " << slot << ' ' << info.FieldName(field) << ' ' << DataTypeWord(field.dataType);
    if (field.typeRef != 0) out << ' ' << field.typeRef << ' ' << TypeName(field.typeRef);
    out << ' ' << ArityWord(field.arity) << ' ' << +field.firstVersion << '-' << +field.lastVersion;
    if (field.presenceOffset != 0) out << " presence";
    out << tail << '\n';
}

void DumpStruct(std::ostream& out, uint32_t id, const StructInfo& info) {
    out << "struct " << id << ' ' << info.name << ' ' << (info.idPrefix != nullptr ? info.idPrefix : "-")
        << " slots " << info.nFields << '\n';
    for (unsigned slot = 0; slot < static_cast<unsigned>(info.nFields); ++slot) {
        const FieldInfo& field = info.vFieldInfo[slot];
        if (field.FHole()) {
            out << "  " << slot << " hole\n";
            continue;
        }
        DumpField(out, info, slot, field, "");
        const sorn::FieldInfoHistory& history = info.vFieldInfoHistory[slot];
        for (unsigned i = 0; i < history.nVariants; ++i)
            DumpField(out, info, slot, history.vVariants[i], " older");
    }
}

void DumpEnum(std::ostream& out, uint32_t id, const EnumDef& def) {
    out << "enum " << id << ' ' << TypeName(id) << " count " << def.count << '\n';
    for (uint32_t value = 0; value < def.count; ++value) {
        if (def.names[value] != nullptr) out << "  " << value << ' ' << def.names[value] << '\n';
    }
}

}  // namespace

const char* DataTypeWord(unsigned dataType) {
    static const char* const vWords[] = {"bool",      "bytes", "channel", "currency", "date",   "datetime",
                                         "anydict",   "enum",  "float",   "intid",    "longid", "stringid",
                                         "knowndict", "lazy",  "object",  "s64",      "s32",    "string",
                                         "time",      "u32",   "u64",     "none"};
    return dataType < sizeof(vWords) / sizeof(vWords[0]) ? vWords[dataType] : "?";
}

const char* ArityWord(unsigned arity) {
    static const char* const vWords[] = {"optional", "required", "multi", "none"};
    return vWords[arity & 3];
}

std::string DumpMetadata() {
    std::ostringstream out;
    out << "versions " << Schema::firstSchemaVersionG << '-' << Schema::lastSchemaVersionG << " default "
        << Schema::defaultSchemaVersionG << '\n';
    out << "struct ids below " << Schema::nStructDefG << ", enum ids below " << Schema::nEnumDefG << '\n';
    for (uint32_t id = 0; id < Schema::nStructDefG; ++id) {
        if (Schema::vStructDefG[id] != nullptr) DumpStruct(out, id, *Schema::vStructDefG[id]);
    }
    for (uint32_t id = 0; id < Schema::nEnumDefG; ++id) {
        if (Schema::vEnumDefG[id] != nullptr) DumpEnum(out, id, *Schema::vEnumDefG[id]);
    }
    out << "struct names in " << Schema::structNameHashTableSizeG << " entries\n";
    for (uint32_t i = 0; i < Schema::structNameHashTableSizeG; ++i) {
        const StructInfo* info = Schema::structNameHashTableG[i];
        if (info != nullptr) out << "  " << i << ' ' << info->name << '\n';
    }
    return out.str();
}
