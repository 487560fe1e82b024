#include "convert/ExpectedRecord.h"

#include <cinttypes>
#include <cstring>
#include <ctime>
#include <map>
#include <vector>

#include "convert/RawText.h"
#include "rox/RoxGenericArray.h"
#include "rox/RoxGenericIntArray.h"
#include "rox/RoxStringArray.h"
#include "sorn/dict/Dict.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/lazy/LazyDict.h"
#include "sorn/model/Schema.h"

namespace sorntest {

using namespace sorn;

namespace {

std::string Quoted(const std::string& text) {
    std::string out = "\"";
    for (size_t i = 0; i < text.size(); ++i) {
        if (text[i] == '\n') {
            out += "\\n";
        } else if (text[i] == '\\' && i + 1 < text.size() && text[i + 1] == 'u') {
            out += '\\';
        } else {
            if (text[i] == '"' || text[i] == '\\') out += '\\';
            out += text[i];
        }
    }
    return out + "\"";
}

std::string Moment(const char* format, int64_t seconds) {
    time_t when = static_cast<time_t>(seconds);
    struct tm parts;
    gmtime_r(&when, &parts);
    char text[50];
    strftime(text, sizeof text, format, &parts);
    return text;
}

std::string Base64Of(const unsigned char* bytes, unsigned n) {
    static const char code[] = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";
    std::string bits;
    for (unsigned i = 0; i < n; ++i) {
        for (int bit = 7; bit >= 0; --bit) bits += (bytes[i] >> bit) & 1 ? '1' : '0';
    }
    while (bits.size() % 6 != 0) bits += '0';
    std::string text;
    for (size_t i = 0; i < bits.size(); i += 6) text += code[std::stoi(bits.substr(i, 6), nullptr, 2)];
    while (text.size() % 4 != 0) text += '=';
    return text;
}

std::string LongId(uint64_t id) {
    struct Row {
        unsigned code;
        const char* name;
    };
    static const Row rows[] = {{1, "rs"},     {2, "ts"},     {3, "bs"}, {5, "tms.ep"}, {6, "tms.sh"},
                               {7, "tms.mv"}, {8, "tms.sp"}, {9, "vp"}, {10, "dlna"},  {16384, "vod"}};
    if (id >> 48 == 0) return Format("%" PRIu64, id);
    const char* name = "xxx";
    for (const Row& row : rows) {
        if (row.code == id >> 48) name = row.name;
    }
    return Format("%s.%" PRIu64, name, id & 0xFFFFFFFFFFFF);
}

std::string Id(const FieldInfo& field, const std::string& id) {
    const StructInfo* info = Schema::FindStruct(field.typeRef);
    if (info == nullptr) return std::string(3, 'X');
    return ((info->idPrefix != nullptr ? info->idPrefix : "") + id).substr(0, 99);
}

std::string Float(double value) {
    std::string text = Format("%1.8g", value);
    if (text.find('.') == std::string::npos) text += ".0";
    return Quoted(text);  // always a point in it
}

std::string Number(const FieldInfo& field, const void* p) {
    int32_t s32 = 0;
    int64_t s64 = 0;
    if (field.dataType != 0) s32 = Read<int32_t>(p);
    switch (field.dataType) {
        case 0:
            return Read<unsigned char>(p) != 0 ? "true" : "false";
        case 4:
            return Quoted(Moment("%Y-%m-%d", int64_t{s32} * 86400));
        case 16:
            return Format("%" PRId32, s32);
        case 18:
            return Quoted(Moment("%H:%M:%S", s32 / 1000));
        case 19:
            return Format("%" PRIu32, static_cast<uint32_t>(s32));
        case 9:
            return Quoted(Id(field, Format("%" PRIu32, static_cast<uint32_t>(s32))));
        case 7: {
            const EnumDef* def = Schema::FindEnum(field.typeRef);
            uint32_t value = static_cast<uint32_t>(s32);
            const char* name = def != nullptr && value < def->count ? def->names[value] : nullptr;
            return Quoted(name != nullptr ? name : Format("INVALID_VALUE:%" PRIu32, value));
        }
        default:
            break;
    }
    s64 = Read<int64_t>(p);
    switch (field.dataType) {
        case 2: {
            int32_t sub = Read<int32_t>(static_cast<const char*>(p) + 4);
            if (sub == -2) return Quoted(s32 == -2 ? "invalid" : Format("%" PRId32, s32));
            return Quoted(Format("%" PRId32 "-%" PRId32, s32, sub));
        }
        case 3: {
            const char* code = static_cast<const char*>(p) + 4;
            return Quoted(code[0] == 0 ? "invalid" : Format("%s.%" PRId32, code, s32));
        }
        case 5:
            return Quoted(Moment("%Y-%m-%d %H:%M:%S", s64 / 1000));
        case 8:
            return Float(Read<double>(p));
        case 10:
            return Quoted(Id(field, LongId(static_cast<uint64_t>(s64))));
        case 15:
            return Quoted(Format("%" PRId64, s64));
        default:
            return Quoted(Format("%" PRIu64, static_cast<uint64_t>(s64)));
    }
}

using Entries = std::map<std::string, std::vector<std::string>>;  // of a name, its printed values

std::string Print(const Entries& entries) {
    std::string out = "{";
    for (const auto& [name, values] : entries) {
        for (const std::string& value : values) {
            if (out.size() > 1) out += ", ";
            out += Quoted(name) + ": " + value;
        }
    }
    return out + "}";
}

/// The typed text of an object without sub-objects, as a body writes it: fields in the order of slots, and
/// "type" in front of the last one that sorts below it.
std::string TypedJson(const SornObject& object);

std::string AnyDict(Dict& dict) {
    Entries entries;
    RoxStringArray names;
    dict.GetSortedNames(names);
    for (unsigned i = 0; i < names.GetCount(); ++i) {
        std::string printed;
        unsigned n = dict.CountValues(names.At(i));
        for (unsigned j = 0; j < n; ++j) {
            printed += (j == 0 ? "" : ", ") + Quoted(std::string(dict.GetString(names.At(i), j).View()));
        }
        entries[std::string(names.At(i).View())].push_back(n == 1 ? printed : "[" + printed + "]");
    }
    return Print(entries);
}

/// Empty for null.
std::string Reference(const FieldInfo& field, RoxCore* core, int version) {
    if (core == nullptr) return "";
    switch (field.dataType) {
        case 1: {
            const rox::ByteBuffer& bytes = static_cast<rox::ByteBuffer&>(*core);
            return Quoted(Base64Of(bytes.GetData(), bytes.GetLength()));
        }
        case 6:
            return AnyDict(static_cast<Dict&>(*core));
        case 13:
            return TypedJson(*static_cast<LazyDict&>(*core).GetStoredObject());
        default:
            return ExpectedJson(static_cast<SornObject&>(*core), version);
    }
}

std::vector<std::string> Values(const SornObject& object, const FieldInfo& field, int version) {
    const void* member = reinterpret_cast<const char*>(&object) + field.storageOffset;
    std::vector<std::string> values;
    auto text = [&](const RoxString& t) {
        std::string bare(t.View());
        values.push_back(Quoted(field.dataType == 11 ? Id(field, bare) : bare));
    };
    auto reference = [&](RoxCore* core) {
        std::string printed = Reference(field, core, version);
        if (!printed.empty()) values.push_back(printed);
    };
    bool isMulti = field.arity == 2;
    switch (field.dataType) {
        case 11:
        case 17:
            if (!isMulti) {
                text(*static_cast<const RoxString*>(member));
            } else {
                const RoxStringArray& array = *static_cast<const RoxStringArray*>(member);
                for (unsigned i = 0; i < array.GetCount(); ++i) text(array.At(i));
            }
            break;
        case 1:
        case 6:
        case 12:
        case 13:
        case 14:
            if (!isMulti) {
                reference(Read<RoxCore*>(member));
            } else {
                const RoxGenericArray& array = *static_cast<const RoxGenericArray*>(member);
                for (unsigned i = 0; i < array.GetCount(); ++i) reference(array.At(i));
            }
            break;
        default:
            if (!isMulti) {
                values.push_back(Number(field, member));
            } else {
                const RoxGenericIntArray& array = *static_cast<const RoxGenericIntArray*>(member);
                for (unsigned i = 0; i < array.GetCount(); ++i) values.push_back(Number(field, array.At(i)));
            }
    }
    return values;
}

const FieldInfo* Record(const StructInfo& info, int slot, int version) {
    const FieldInfo* record = &info.vFieldInfo[slot];
    if (record->arity == 3) return nullptr;
    if (version == 0) return record;
    for (int i = info.vFieldInfoHistory[slot].nVariants - 1; i >= 0; --i) {
        const FieldInfo& variant = info.vFieldInfoHistory[slot].vVariants[i];
        if (version >= variant.firstVersion && version <= variant.lastVersion) record = &variant;
    }
    return version < record->firstVersion || version > record->lastVersion ? nullptr : record;
}

bool FSet(const SornObject& object, const FieldInfo& field) {
    const char* start = reinterpret_cast<const char*>(&object);
    return field.arity != 0 || field.presenceOffset == 0 || start[field.presenceOffset] != 0;
}

std::string TypedJson(const SornObject& object) {
    const StructInfo& info = *Schema::FindStruct(object.structId);
    int anchor = info.nFields;
    for (int slot = 0; slot < info.nFields; ++slot) {
        const FieldInfo* field = Record(info, slot, 0);
        if (field != nullptr && strcmp(info.FieldName(*field), "type") < 0) anchor = slot;
    }
    std::string out;
    for (int slot = 0; slot <= info.nFields; ++slot) {
        if (slot == anchor) out += std::string(out.empty() ? "" : ", ") + "\"type\": " + Quoted(info.name);
        const FieldInfo* field = slot < info.nFields ? Record(info, slot, 0) : nullptr;
        if (field == nullptr || !FSet(object, *field)) continue;
        std::string printed;
        for (const std::string& value : Values(object, *field, 0))
            printed += (printed.empty() ? "" : ",") + value;
        if (printed.empty()) continue;
        if (field->arity == 2) printed = "[" + printed + "]";
        out += std::string(out.empty() ? "" : ", ") + Quoted(info.FieldName(*field)) + ": " + printed;
    }
    return "{" + out + "}";
}

}  // namespace

std::string ExpectedJson(const SornObject& object, int version) {
    const StructInfo& info = *Schema::FindStruct(object.structId);
    Entries entries;
    entries["type"] = {Quoted(info.name)};
    for (int slot = 0; slot < info.nFields; ++slot) {
        const FieldInfo* field = Record(info, slot, version);
        if (field == nullptr) continue;
        if (!FSet(object, *field)) continue;
        std::vector<std::string> values = Values(object, *field, version);
        if (values.empty()) continue;
        if (field->arity == 2 && field->dataType != 13) {
            std::string printed;
            for (const std::string& value : values) printed += (printed.empty() ? "" : ", ") + value;
            values = {"[" + printed + "]"};
        }
        std::vector<std::string>& all = entries[info.pFieldNames + field->nameOffset];
        all.insert(all.end(), values.begin(), values.end());
    }
    return Print(entries);
}

}  // namespace sorntest
