#include "sorn/convert/SchemaText.h"

#include <algorithm>
#include <cstring>

#include "sorn/convert/EnumNameIndex.h"
#include "sorn/dict/Dict.h"
#include "sorn/dict/ScalarFormat.h"
#include "sorn/model/CopyShort.h"
#include "sorn/model/InternedString.h"
#include "sorn/model/Schema.h"

namespace sorn::schematext {

namespace {

const char* PrefixOf(const StructInfo& info) {
    return info.idPrefix != nullptr ? info.idPrefix : "";
}

/// Writes prefix and id, cut at maxIdBytesG bytes; gives the length.
unsigned WriteId(const char* prefix, const char* id, size_t nId, char* out) {
    if (prefix == nullptr) {
        memcpy(out, "XXX", 3);
        return 3;
    }
    const size_t nPrefix = std::min<size_t>(strlen(prefix), maxIdBytesG);
    memcpy(out, prefix, nPrefix);
    nId = std::min<size_t>(nId, maxIdBytesG - nPrefix);
    memcpy(out + nPrefix, id, nId);
    return static_cast<unsigned>(nPrefix + nId);
}

}  // namespace

bool FHasNul(const RoxString& text) {
    return strlen(text.Utf8()) != text.NByte();
}

RoxString EnumName(RoxMempool* pool, const FieldInfo& field, uint32_t value) {
    const EnumDef* def = Schema::FindEnum(field.typeRef);
    const char* name = def != nullptr ? def->NameOf(value) : nullptr;
    if (name == nullptr) return RoxString::Format(pool, "INVALID_VALUE:%u", value);
    return *InternedString(nullptr, name);
}

bool EnumValue(const FieldInfo& field, const RoxString& name, uint32_t& value, ErrorWords& words) {
    const EnumDef* def = Schema::FindEnum(field.typeRef);
    if (def != nullptr && !FHasNul(name) && EnumNameIndex::Find(*def, name.Utf8(), name.NByte(), value))
        return true;
    words.Append("bad enum item name");
    return false;
}

const char* IdPrefix(StructTable table, const FieldInfo& field) {
    const StructInfo* info = table.Find(field.typeRef);
    return info != nullptr ? PrefixOf(*info) : nullptr;
}

unsigned WriteLongId(StructTable table, const FieldInfo& field, uint64_t id, char* out) {
    const char* prefix = IdPrefix(table, field);
    if (prefix != nullptr) {
        const size_t nPrefix = strlen(prefix);
        if (nPrefix + scalarformat::maxTextBytesG <= maxIdBytesG) {
            CopyShort(prefix, nPrefix, reinterpret_cast<unsigned char*>(out));
            return static_cast<unsigned>(scalarformat::WriteLongId(id, out + nPrefix) - out);
        }
    }
    char number[scalarformat::maxTextBytesG];
    const char* end = scalarformat::WriteLongId(id, number);
    return WriteId(prefix, number, static_cast<size_t>(end - number), out);
}

RoxString LongIdText(RoxMempool* pool, StructTable table, const FieldInfo& field, uint64_t id) {
    char text[maxIdBytesG];
    const unsigned n = WriteLongId(table, field, id, text);
    return RoxString::FromUtf8Bytes(pool, n, text);
}

RoxString StringIdText(RoxMempool* pool, StructTable table, const FieldInfo& field, const RoxString& id) {
    char text[maxIdBytesG];
    const unsigned n = WriteId(IdPrefix(table, field), id.Utf8(), id.NByte(), text);
    return RoxString::FromUtf8Bytes(pool, n, text);
}

const char* BareId(StructTable table, const FieldInfo& field, const RoxString& text, ErrorWords& words) {
    const StructInfo* info = table.Find(field.typeRef);
    if (info != nullptr) {
        const char* prefix = PrefixOf(*info);
        size_t nPrefix = strlen(prefix);
        if (text.NByte() >= nPrefix && memcmp(text.Utf8(), prefix, nPrefix) == 0)
            return text.Utf8() + nPrefix;
    }
    words.Append(info == nullptr ? "no struct for id" : "wrong prefix on id");
    words.Append("bad prefix: ");
    words.Append(text);
    return nullptr;
}

uint32_t BareInt(RoxMempool* pool, const RoxString& text, const char* bare) {
    return FHasNul(text) ? 0 : Dict::ParseU32(pool, bare);
}

uint64_t BareLong(RoxMempool* pool, const RoxString& text, const char* bare) {
    return FHasNul(text) ? 0 : Dict::ParseLongId(pool, bare);
}

RoxString BareString(RoxMempool* pool, const RoxString& text, const char* bare) {
    const char* end = text.Utf8() + text.NByte();
    return RoxString::FromUtf8Bytes(pool, static_cast<unsigned>(end - bare), bare);
}

}  // namespace sorn::schematext
