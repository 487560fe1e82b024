#include "sorn/convert/SchemaText.h"

#include <algorithm>
#include <cstring>

#include "sorn/dict/ScalarFormat.h"
#include "sorn/model/InternedString.h"
#include "sorn/model/Schema.h"

namespace sorn::schematext {

namespace {

const char* PrefixOf(const StructInfo& info) {
    return info.idPrefix != nullptr ? info.idPrefix : "";
}

RoxString IdText(RoxMempool* pool, const FieldInfo& field, const char* id, size_t nId) {
    const StructInfo* info = Schema::FindStruct(field.typeRef);
    if (info == nullptr) return RoxString::FromUtf8Bytes(pool, 3, "XXX");
    char text[maxIdBytesG];
    const char* prefix = PrefixOf(*info);
    size_t nPrefix = std::min<size_t>(strlen(prefix), maxIdBytesG);
    memcpy(text, prefix, nPrefix);
    nId = std::min<size_t>(nId, maxIdBytesG - nPrefix);
    memcpy(text + nPrefix, id, nId);
    return RoxString::FromUtf8Bytes(pool, static_cast<unsigned>(nPrefix + nId), text);
}

}  // namespace

RoxString EnumName(RoxMempool* pool, const FieldInfo& field, uint32_t value) {
    const EnumDef* def = Schema::FindEnum(field.typeRef);
    const char* name = def != nullptr ? def->NameOf(value) : nullptr;
    if (name == nullptr) return RoxString::Format(pool, "INVALID_VALUE:%u", value);
    return *InternedString(nullptr, name);
}

bool EnumValue(const FieldInfo& field, const RoxString& name, uint32_t& value, ErrorWords& words) {
    const EnumDef* def = Schema::FindEnum(field.typeRef);
    const char* text = name.Utf8();
    if (def != nullptr && strlen(text) == name.NByte()) {
        for (uint32_t i = 0; i < def->count; ++i) {
            const char* candidate = def->names[i];
            if (candidate == nullptr || candidate[0] != text[0] || strcmp(candidate, text) != 0) continue;
            value = i;
            return true;
        }
    }
    words.Append("bad enum item name");
    return false;
}

RoxString LongIdText(RoxMempool* pool, const FieldInfo& field, uint64_t id) {
    char number[scalarformat::maxTextBytesG];
    const char* end = scalarformat::WriteLongId(id, number);
    return IdText(pool, field, number, static_cast<size_t>(end - number));
}

RoxString StringIdText(RoxMempool* pool, const FieldInfo& field, const RoxString& id) {
    return IdText(pool, field, id.Utf8(), id.NByte());
}

const char* BareId(const FieldInfo& field, const RoxString& text, ErrorWords& words) {
    const StructInfo* info = Schema::FindStruct(field.typeRef);
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

RoxString BareString(RoxMempool* pool, const RoxString& text, const char* bare) {
    const char* end = text.Utf8() + text.NByte();
    return RoxString::FromUtf8Bytes(pool, static_cast<unsigned>(end - bare), bare);
}

}  // namespace sorn::schematext
