#include "typedjson/ReadModel.h"

#include <cstdio>
#include <cstring>
#include <map>
#include <vector>

#include "convert/RawText.h"
#include "kelbaselib/Bytesource.h"
#include "rox/RoxGenericArray.h"
#include "rox/RoxGenericIntArray.h"
#include "rox/RoxMempool.h"
#include "rox/RoxStringArray.h"
#include "sorn/convert/DictionarySornObject.h"
#include "sorn/dict/Dict.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/lazy/LazyDict.h"
#include "sorn/model/ChannelNumber.h"
#include "sorn/model/Currency.h"
#include "sorn/model/Date.h"
#include "sorn/model/DateTime.h"
#include "sorn/model/Schema.h"
#include "sorn/model/StructInfoMap.h"
#include "sorn/model/Time.h"

namespace sorntest {

using namespace sorn;

namespace {

using Values = std::vector<std::string>;

std::string LazyText(const LazyDict& body) {
    kelbaselib::Bytesource* source = body.GetStoredBytesource()->NewSource();
    std::string text;
    char piece[100];
    while (unsigned n = source->Read(piece, sizeof piece)) text.append(piece, n);
    source->Release();
    return text;
}

std::string ShowPlain(const FieldInfo& field, const void* p) {
    switch (field.dataType) {
        case 0:
            return Read<unsigned char>(p) == 1 ? "true" : Read<unsigned char>(p) == 0 ? "false" : "bad bool";
        case 2:
            return Format("%d/%d", Read<int>(p), Read<int>(static_cast<const char*>(p) + 4));
        case 3:
            return Format("%.4s/%d", static_cast<const char*>(p) + 4, Read<int>(p));
        case 8:
            return Format("%.17g", Read<double>(p));
        case 4:
        case 16:
        case 18:
            return Format("%d", Read<int>(p));
        case 7:
        case 9:
        case 19:
            return Format("%u", Read<unsigned>(p));
        case 5:
        case 15:
            return Format("%lld", Read<long long>(p));
        default:
            return Format("%llu", Read<unsigned long long>(p));
    }
}

std::string ShowReference(const FieldInfo& field, RoxCore* core) {
    if (core == nullptr) return "null";
    if (field.dataType == 6) return "dict " + std::string(static_cast<Dict*>(core)->ToString(false).Utf8());
    if (field.dataType == 13) return "lazy " + LazyText(static_cast<LazyDict&>(*core));
    if (field.dataType != 1) return ShowObject(static_cast<SornObject*>(core));
    std::string hex = "bytes ";
    const rox::ByteBuffer& bytes = static_cast<rox::ByteBuffer&>(*core);
    for (unsigned i = 0; i < bytes.GetLength(); ++i) hex += Format("%02x", bytes.GetData()[i]);
    return hex;
}

std::string ShowText(const RoxString& text) {
    return "'" + std::string(text.View());
}

template <class Array, class Show>
Values ShowArray(const void* member, Show show) {
    const Array& array = *static_cast<const Array*>(member);
    Values values;
    for (unsigned i = 0; i < array.GetCount(); ++i) values.push_back(show(array.At(i)));
    return values;
}

Values ShowValues(const SornObject& object, const FieldInfo& field) {
    const void* member = reinterpret_cast<const char*>(&object) + field.storageOffset;
    const bool isMulti = field.arity == 2;
    const auto reference = [&field](RoxCore* core) { return ShowReference(field, core); };
    const auto plain = [&field](const void* p) { return ShowPlain(field, p); };
    switch (field.dataType) {
        case 11:
        case 17:
            if (isMulti) return ShowArray<RoxStringArray>(member, ShowText);
            return {ShowText(*static_cast<const RoxString*>(member))};
        case 1:
        case 6:
        case 12:
        case 13:
        case 14:
            if (isMulti) return ShowArray<RoxGenericArray>(member, reference);
            return {reference(Read<RoxCore*>(member))};
        default:
            if (isMulti) return ShowArray<RoxGenericIntArray>(member, plain);
            return {plain(member)};
    }
}

std::string Shown(const StructInfo& info, const std::vector<Values>& values,
                  const std::vector<bool>& present) {
    std::string out = std::string(info.name) + "{";
    for (int slot = 0; slot < info.nFields; ++slot) {
        if (info.vFieldInfo[slot].arity == 3) continue;
        out += info.FieldName(info.vFieldInfo[slot]);
        if (present[static_cast<size_t>(slot)]) out += "!";
        for (const std::string& value : values[static_cast<size_t>(slot)]) out += "|" + value;
        out += ";";
    }
    return out + "}";
}

/// The values of an object, or of an empty one of a struct.
void Collect(const SornObject& object, std::vector<Values>& values, std::vector<bool>& present) {
    const StructInfo& info = *Schema::FindStruct(object.structId);
    for (int slot = 0; slot < info.nFields; ++slot) {
        const FieldInfo& field = info.vFieldInfo[slot];
        values.push_back(field.arity == 3 ? Values() : ShowValues(object, field));
        present.push_back(field.arity != 3 && field.presenceOffset != 0 &&
                          reinterpret_cast<const char*>(&object)[field.presenceOffset] == 1);
    }
}

/// A schema-less map: names with their values.
struct Map {
    std::map<std::string, Values> names;

    static std::string Quoted(const std::string& text) {
        std::string out = "\"";
        for (size_t i = 0; i < text.size(); ++i) {
            const char* const plain = "\b\f\n\r\t\"\\";
            const char* const found = text[i] != 0 ? strchr(plain, text[i]) : nullptr;
            if (found == nullptr || (text[i] == '\\' && text[i + 1] == 'u')) {
                out += static_cast<unsigned char>(text[i]) < 0x20 && text[i] != 3 && text[i] != 0x1A
                           ? Format("\\u00%02X", static_cast<unsigned>(text[i]))
                           : std::string(1, text[i]);
            } else {
                out += '\\';
                out += "bfnrt\"\\"[found - plain];
            }
        }
        return out + "\"";
    }
    std::string Text() const {
        std::string out = "{";
        for (const auto& [name, values] : names) {
            if (out.size() > 1) out += ", ";
            out += Quoted(name) + ": ";
            std::string list;
            for (const std::string& value : values) list += (list.empty() ? "" : ", ") + value;
            out += values.size() == 1 ? list : "[" + list + "]";
        }
        return out + "}";
    }
};

struct Model {
    const std::string& text;
    size_t p = 0;
    size_t index = 0;
    std::vector<const StructInfo*> list{};
    RoxMempool pool{"model"};

    struct Object {
        const StructInfo* info = nullptr;
        std::vector<Values> values{};
        std::vector<bool> present{};
        std::map<int, Map> maps{};
    };

    bool AtEnd() const { return p >= text.size(); }
    char Next() const { return text[p]; }
    bool Is(char c) const { return !AtEnd() && Next() == c; }
    void Skip() {
        while (!AtEnd() && (Next() == ' ' || Next() == '\t' || Next() == '\n' || Next() == '\r')) ++p;
    }
    static bool FAlnum(char c) {
        return (c >= '0' && c <= '9') || (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z');
    }

    bool String(std::string& out) {
        Skip();
        out.clear();
        if (!Is('"')) {
            while (!AtEnd() && (FAlnum(Next()) || Next() == '-' || Next() == '.' || Next() == '+'))
                out += text[p++];
            return true;
        }
        ++p;
        for (;;) {
            if (AtEnd() || Next() == 0) return false;
            char c = text[p++];
            if (c == '"') return true;
            if (c != '\\') {
                out += c;
                continue;
            }
            if (AtEnd() || Next() == 0) return false;
            c = text[p++];
            if (c == 'u') continue;
            const char* const from = "\"/\\bfnrt";
            const char* const found = strchr(from, c);
            if (found == nullptr) return false;
            out += "\"/\\\b\f\n\r\t"[found - from];
        }
    }

    bool Unmarshal(const StructInfo* info, std::string* out, std::string& err) {
        const size_t number = index++;
        const bool isFirst = number == list.size();
        if (isFirst) list.push_back(nullptr);
        Skip();
        if (!Is('{')) {
            err = "JSON object does not start with '{'.";
            return false;
        }
        ++p;
        Object object;
        if (info != nullptr && !isFirst) {
            object.info = info;
            Collect(*info->Factory(&pool), object.values, object.present);
        }
        for (;;) {
            Skip();
            if (AtEnd() || !(Next() == '"' || FAlnum(Next()))) break;
            std::string key;
            if (!String(key)) {
                err = "Failed to parse a fieldName key.";
                return false;
            }
            int slot = -1;
            for (int i = 0; object.info != nullptr && slot < 0 && i < info->nFields; ++i) {
                if (info->vFieldInfo[i].arity != 3 && key == info->FieldName(info->vFieldInfo[i])) slot = i;
            }
            Skip();
            if (!Is(':')) {
                err = "JSON field name must be followed by a colon.";
                return false;
            }
            ++p;
            if (slot >= 0 && info->vFieldInfo[slot].arity == 0 && info->vFieldInfo[slot].presenceOffset != 0)
                object.present[static_cast<size_t>(slot)] = true;
            if (isFirst && key == "type") {
                std::string name;
                if (!String(name)) {
                    err = "Can't parse type.";
                    return false;
                }
                list[number] = StructInfoMap::LookupStructByName(name.c_str());
            } else if (!FieldValue(slot, object, err)) {
                err += " Failed to parse value for key " + key;
                return false;
            }
            Skip();
            if (!Is(',')) break;
            ++p;
        }
        Skip();
        if (!Is('}')) {
            err = "JSON object does not end with '}'.";
            return false;
        }
        ++p;
        if (out == nullptr) return true;
        *out = "null";
        if (object.info == nullptr) return true;
        for (const auto& [slot, map] : object.maps)
            object.values[static_cast<size_t>(slot)] = {"dict " + map.Text()};
        *out = Shown(*object.info, object.values, object.present);
        return true;
    }

    bool FieldValue(int slot, Object& object, std::string& err) {
        Skip();
        if (Is('[') || (slot >= 0 && object.info->vFieldInfo[slot].arity == 2))
            return Array(slot, object, err);
        if (One(slot, object, false, err)) return true;
        err += " failed to UnmarshalOneSingleValue in ReadFieldValue";
        return false;
    }

    bool Array(int slot, Object& object, std::string& err) {
        Skip();
        const bool isBracketed = Is('[');
        if (isBracketed) ++p;
        Skip();
        const bool isList = slot < 0 || object.info->vFieldInfo[slot].arity == 2;
        if (Is(']') && (isList || !isBracketed)) {
            if (isBracketed) ++p;
            return true;
        }
        if (!Element(slot, object, err)) {
            err += " Failed to parse an array element.";
            return false;
        }
        if (!isBracketed) return true;
        Skip();
        while (Is(',')) {
            ++p;
            if (!Element(slot, object, err)) {
                err += " Failed to parse an array member.";
                return false;
            }
            Skip();
        }
        if (!Is(']')) {
            err = "Array must end with ']'.";
            return false;
        }
        ++p;
        return true;
    }

    bool Element(int slot, Object& object, std::string& err) {
        Skip();
        if (Is('[')) return Array(slot, object, err);
        if (One(slot, object, true, err)) return true;
        err += " failed to UnmarshalOneMultiValue in AVReadFieldValue";
        return false;
    }

    bool One(int slot, Object& object, bool isMulti, std::string& err) {
        std::string scratch;
        if (slot < 0) {
            Skip();
            return Is('{') ? Unmarshal(nullptr, nullptr, err) : String(scratch);
        }
        const FieldInfo& field = object.info->vFieldInfo[slot];
        if (isMulti != (field.arity == 2)) return false;
        std::string value;
        if (field.dataType == 6) return AnyDict(slot, object, isMulti);
        if (field.dataType == 12 || field.dataType == 14) {
            const StructInfo* info = field.dataType == 14  ? Schema::FindStruct(field.typeRef)
                                     : index < list.size() ? list[index]
                                                           : nullptr;
            if (!Unmarshal(info, &value, scratch)) {
                if (isMulti) {
                    err += field.dataType == 12 ? " failed to Unmarshal KNOWN_DICT in Multi"
                                                : " failed to Unmarshal TYPE_OBJECT in Multi";
                }
                return false;
            }
        } else if (field.dataType == 13) {
            const size_t begin = p;
            if (!Unmarshal(nullptr, nullptr, err)) {
                err += isMulti ? " Multi SORN_DATA_TYPE_KNOWN_DICT_AS_LAZY can't unmarshal"
                               : " Single SORN_DATA_TYPE_KNOWN_DICT_AS_LAZY can't Unmarshal";
                return false;
            }
            value = "lazy " + text.substr(begin, p - begin);
        } else if (!String(scratch) || !Scalar(field, scratch, value)) {
            return false;
        }
        Values& values = object.values[static_cast<size_t>(slot)];
        if (!isMulti) values.clear();
        values.push_back(value);
        return true;
    }

    bool Scalar(const FieldInfo& field, const std::string& from, std::string& value) {
        const RoxString rox(&pool, from.c_str());
        DictionarySornObject context(&pool, Schema::vStructDefG, Schema::nStructDefG);
        RoxString lost;
        int s32;
        unsigned u32;
        long long s64;
        unsigned long long u64;
        double number;
        RoxString id;
        switch (field.dataType) {
            case 0:
                value = from;
                return from == "true" || from == "false";
            case 1: {
                value = "bytes ";
                ref<rox::ByteBuffer> bytes = Dict::ParseBytestring(&pool, rox);
                for (unsigned i = 0; i < bytes->GetLength(); ++i)
                    value += Format("%02x", bytes->GetData()[i]);
                return true;
            }
            case 2: {
                const ChannelNumber channel = ChannelNumber::Parse(rox);
                value = Format("%d/%d", channel.number, channel.subNumber);
                return value != "-2/-2";
            }
            case 3: {
                const Currency currency = Currency::Parse(rox);
                value = Format("%.4s/%d", currency.code, currency.amount);
                return value != "/0";
            }
            case 4:
                value = Format("%d", Date::Parse(rox).days);
                return true;
            case 5:
                value = Format("%lld", static_cast<long long>(DateTime::Parse(rox).milliseconds));
                return true;
            case 18:
                value = Format("%d", Time::Parse(rox).milliseconds);
                return true;
            case 7: {
                const EnumDef* def = Schema::FindEnum(field.typeRef);
                for (uint32_t i = 0; def != nullptr && i < def->count; ++i) {
                    if (def->names[i] == nullptr || from != def->names[i]) continue;
                    value = Format("%u", i);
                    return true;
                }
                return false;
            }
            case 8:
                if (sscanf(from.c_str(), "%lg", &number) != 1) return false;
                value = Format("%.17g", number);
                return true;
            case 9:
                if (!context.StringToIntId(&pool, &field, rox, lost, u32)) return false;
                value = Format("%u", u32);
                return true;
            case 10:
                if (!context.StringToLongId(&pool, &field, rox, lost, u64)) return false;
                value = Format("%llu", u64);
                return true;
            case 11:
                if (!context.StringToStringId(&pool, &field, rox, lost, id)) return false;
                value = "'" + std::string(id.View());
                return true;
            case 15:
                if (sscanf(from.c_str(), "%lld", &s64) != 1) return false;
                value = Format("%lld", s64);
                return true;
            case 16:
                if (sscanf(from.c_str(), "%d", &s32) != 1) return false;
                value = Format("%d", s32);
                return true;
            case 19:
                if (sscanf(from.c_str(), "%u", &u32) != 1) return false;
                value = Format("%u", u32);
                return true;
            case 20:
                if (sscanf(from.c_str(), "%llu", &u64) != 1) return false;
                value = Format("%llu", u64);
                return true;
            default:
                value = "'" + from;
                return true;
        }
    }

    bool AnyDict(int slot, Object& object, bool isMulti) {
        ++index;
        Map fresh;
        Map& map = isMulti ? fresh : object.maps[slot];
        std::string scalar;
        bool isMap = false;
        if (!AnyValue(isMap, scalar, map) || !isMap) return false;
        if (isMulti) object.values[static_cast<size_t>(slot)].push_back("dict " + map.Text());
        return true;
    }

    bool AnyValue(bool& isMap, std::string& scalar, Map& map) {
        Skip();
        isMap = Is('{');
        if (!isMap) return String(scalar);
        do {
            ++p;
            if (!AnyField(map)) return false;
            Skip();
        } while (Is(','));
        if (!Is('}')) return false;
        ++p;
        return true;
    }

    bool AnyField(Map& map) {
        std::string key;
        if (!String(key)) return false;
        Skip();
        if (!Is(':')) return false;
        ++p;
        Skip();
        const bool isArray = Is('[');
        if (isArray) ++p;
        for (;;) {
            Skip();
            const size_t before = p;
            bool isMap = false;
            std::string scalar;
            Map local;
            if (!AnyValue(isMap, scalar, local)) return false;
            map.names[key].push_back(isMap ? local.Text() : Map::Quoted(scalar));
            if (!isArray) return true;
            const bool isMoved = p != before;
            Skip();
            if (Is(']')) {
                ++p;
                return true;
            }
            if (Is(',')) {
                ++p;
            } else if (!isMoved) {
                return false;
            }
        }
    }
};

}  // namespace

std::string ShowObject(const SornObject* object) {
    if (object == nullptr) return "null";
    std::vector<Values> values;
    std::vector<bool> present;
    Collect(*object, values, present);
    return Shown(*Schema::FindStruct(object->structId), values, present);
}

ReadOutcome ModelRead(const std::string& text, const std::string& wordsBefore) {
    Model model{text};
    ReadOutcome outcome{false, wordsBefore, "null"};
    if (!model.Unmarshal(nullptr, nullptr, outcome.words) || model.list[0] == nullptr) return outcome;
    model.p = model.index = 0;
    outcome.isRead = model.Unmarshal(model.list[0], &outcome.shown, outcome.words);
    if (!outcome.isRead) outcome.shown = "null";
    return outcome;
}

}  // namespace sorntest
