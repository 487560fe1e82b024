#include "tools/DescribeJson.h"

#include "sorn/model/Schema.h"
#include "tools/SchemaNames.h"

// Schema names, id prefixes and enumeration names are plain ASCII without quotes or backslashes (the
// generator sees to it), so they are put between quotes as they stand.
namespace sorn::tools {

namespace {

std::string Quoted(const char* text) {
    return text == nullptr ? "null" : "\"" + std::string(text) + "\"";
}

/// Puts a comma before every item but the first.
class Separator {
 public:
    const char* Next() { return fFirstM ? (fFirstM = false, "") : ","; }

 private:
    bool fFirstM = true;
};

std::string NumberMember(const char* name, int64_t value) {
    return Quoted(name) + ":" + std::to_string(value);
}

/// The members of a field record, without the braces.
std::string FieldMembers(int slot, const StructInfo& info, const FieldInfo& field) {
    return NumberMember("slot", slot) + ",\"name\":" + Quoted(info.FieldName(field)) + "," +
           NumberMember("dataType", field.dataType) + "," + NumberMember("arity", field.arity) + "," +
           NumberMember("firstVersion", field.firstVersion) + "," +
           NumberMember("lastVersion", field.lastVersion) + "," + NumberMember("typeRef", field.typeRef);
}

std::string JsonOfField(int slot, const StructInfo& info) {
    std::string text = "{" + FieldMembers(slot, info, info.vFieldInfo[slot]) + ",\"variants\":[";
    const FieldInfoHistory& history = info.vFieldInfoHistory[slot];
    Separator comma;
    for (uint16_t i = 0; i < history.nVariants; ++i) {
        text += comma.Next();
        text += "{" + FieldMembers(slot, info, history.vVariants[i]) + ",\"variants\":[]}";
    }
    return text + "]}";
}

std::string JsonOfStruct(uint32_t id) {
    const StructInfo& info = *Schema::vStructDefG[id];
    std::string text = "{\"name\":" + Quoted(info.name) + "," + NumberMember("id", id) +
                       ",\"idPrefix\":" + Quoted(info.idPrefix) + "," +
                       NumberMember("nFields", info.nFields) + ",\"fields\":[";
    Separator comma;
    for (int slot = 0; slot < info.nFields; ++slot) {
        if (info.vFieldInfo[slot].FHole()) continue;
        text += comma.Next();
        text += JsonOfField(slot, info);
    }
    return text + "]}";
}

std::string JsonOfEnum(uint32_t id) {
    const EnumDef& values = *Schema::vEnumDefG[id];
    std::string text = "{" + NumberMember("id", id) + ",\"name\":" + Quoted(NameOfType(id)) + "," +
                       NumberMember("count", values.count) + ",\"names\":{";
    Separator comma;
    for (uint32_t value = 0; value < values.count; ++value) {
        if (values.names[value] == nullptr) continue;
        text += comma.Next();
        text += Quoted(std::to_string(value).c_str()) + ":" + Quoted(values.names[value]);
    }
    return text + "}}";
}

}  // namespace

std::string JsonOfType(uint32_t id) {
    return Schema::FindStruct(id) != nullptr ? JsonOfStruct(id) : JsonOfEnum(id);
}

std::string JsonOfSchema() {
    std::string text = "{" + NumberMember("firstSchemaVersion", Schema::firstSchemaVersionG) + "," +
                       NumberMember("lastSchemaVersion", Schema::lastSchemaVersionG) + "," +
                       NumberMember("defaultSchemaVersion", Schema::defaultSchemaVersionG) + "," +
                       NumberMember("nStructDef", Schema::nStructDefG) + "," +
                       NumberMember("nEnumDef", Schema::nEnumDefG) + ",\"structs\":[";
    Separator structComma;
    for (uint32_t id = 0; id < Schema::nStructDefG; ++id) {
        if (Schema::vStructDefG[id] != nullptr) text.append(structComma.Next()).append(JsonOfStruct(id));
    }
    text += "],\"enums\":[";
    Separator enumComma;
    for (uint32_t id = 0; id < Schema::nEnumDefG; ++id) {
        if (Schema::vEnumDefG[id] != nullptr) text.append(enumComma.Next()).append(JsonOfEnum(id));
    }
    text += "],\"structNameHashTable\":[";
    Separator entryComma;
    for (uint32_t i = 0; i < Schema::structNameHashTableSizeG; ++i) {
        const StructInfo* entry = Schema::structNameHashTableG[i];
        text.append(entryComma.Next()).append(Quoted(entry == nullptr ? nullptr : entry->name));
    }
    return text + "]}";
}

}  // namespace sorn::tools
