#include "sorn/typedjson/TextValue.h"

#include <climits>
#include <cstring>

#include "sorn/dict/Base64.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/dict/ScalarFormat.h"
#include "sorn/model/Schema.h"
#include "sorn/typedjson/EnumNames.h"

namespace sorn::textvalue {

namespace {

constexpr Base64 base64G(Base64::DEFAULT_CODE_SET, Base64::DEFAULT_TERMINATOR);

/// A sign and a run of digits, clipped to 2^64 - 1.
struct Integer {
    bool isFound = false;
    bool isNegative = false;
    bool isClipped = false;
    uint64_t magnitude = 0;

    /// As strtol and its relatives give it for a type whose highest number is this.
    uint64_t Signed(uint64_t highest) const {
        if (isNegative) return magnitude > highest ? 0 - highest - 1 : 0 - magnitude;
        return magnitude > highest ? highest : magnitude;
    }
    uint64_t Unsigned(uint64_t highest) const {
        if (magnitude > highest || isClipped) return highest;
        return isNegative ? 0 - magnitude : magnitude;
    }
};

bool FDigit(char c) {
    return c >= '0' && c <= '9';
}

bool FSpace(char c) {
    return c == ' ' || (c >= '\t' && c <= '\r');
}

Integer ReadInteger(std::string_view text) {
    Integer result;
    const char* p = text.data();
    const char* const end = p + text.size();
    while (p != end && FSpace(*p)) ++p;
    if (p != end && (*p == '-' || *p == '+')) result.isNegative = *p++ == '-';
    result.isFound = p != end && FDigit(*p);
    const char* const safeEnd = end - p > 19 ? p + 19 : end;  // 19 digits fit
    for (; p != safeEnd && FDigit(*p); ++p) {
        result.magnitude = result.magnitude * 10 + static_cast<unsigned>(*p - '0');
    }
    for (; p != end && FDigit(*p) && !result.isClipped; ++p) {
        result.isClipped =
            __builtin_mul_overflow(result.magnitude, uint64_t{10}, &result.magnitude) ||
            __builtin_add_overflow(result.magnitude, static_cast<uint64_t>(*p - '0'), &result.magnitude);
    }
    if (result.isClipped) result.magnitude = UINT64_MAX;
    return result;
}

/// What stands behind the prefix of the field's struct.
bool BareId(const FieldInfo& field, std::string_view text, std::string_view& bare) {
    const StructInfo* const info = Schema::FindStruct(field.typeRef);
    if (info == nullptr) return false;
    size_t nPrefix = 0;  // by bytes, for it is short
    if (info->idPrefix != nullptr) {
        for (; info->idPrefix[nPrefix] != 0; ++nPrefix) {
            if (nPrefix == text.size() || text[nPrefix] != info->idPrefix[nPrefix]) return false;
        }
    }
    bare = text.substr(nPrefix);
    return true;
}

}  // namespace

Terminated::Terminated(std::string_view text) {
    if (text.size() < sizeof shortM) {
        if (!text.empty()) std::memcpy(shortM, text.data(), text.size());
        shortM[text.size()] = 0;
    } else {
        longM = RoxString::FromUtf8Bytes(nullptr, static_cast<unsigned>(text.size()), text.data());
    }
}

bool ToBool(std::string_view text, bool& out) {
    if (text != "true" && text != "false") return false;
    out = text.size() == 4;
    return true;
}

bool ToS32(std::string_view text, int& out) {
    const Integer integer = ReadInteger(text);
    if (integer.isFound) out = static_cast<int>(static_cast<uint32_t>(integer.Signed(LONG_MAX)));
    return integer.isFound;
}

bool ToS64(std::string_view text, long long& out) {
    const Integer integer = ReadInteger(text);
    if (integer.isFound) out = static_cast<long long>(integer.Signed(LLONG_MAX));
    return integer.isFound;
}

bool ToU32(std::string_view text, unsigned& out) {
    const Integer integer = ReadInteger(text);
    if (integer.isFound) out = static_cast<uint32_t>(integer.Unsigned(ULONG_MAX));
    return integer.isFound;
}

bool ToU64(std::string_view text, unsigned long long& out) {
    const Integer integer = ReadInteger(text);
    if (integer.isFound) out = integer.Unsigned(ULLONG_MAX);
    return integer.isFound;
}

bool ToFloat(std::string_view text, double& out) {
    return scalarformat::ScanFloat(Terminated(text).Text(), out);
}

bool ToEnum(const FieldInfo& field, const NameKey& text, uint32_t& out) {
    const EnumDef* const def = Schema::FindEnum(field.typeRef);
    return def != nullptr && EnumNames::Find(*def, text, out);
}

bool ToIntId(const FieldInfo& field, std::string_view text, unsigned& out) {
    std::string_view bare;
    if (!BareId(field, text, bare)) return false;
    out = scalarformat::ParseU32(bare.data(), bare.size());
    return true;
}

bool ToLongId(const FieldInfo& field, std::string_view text, unsigned long long& out) {
    std::string_view bare;
    if (!BareId(field, text, bare)) return false;
    out = scalarformat::ParseLongId(bare.data(), bare.size());
    return true;
}

bool ToStringId(const FieldInfo& field, std::string_view text, std::string_view& out) {
    return BareId(field, text, out);
}

ref<rox::ByteBuffer> ToBytes(RoxMempool* pool, std::string_view text) {
    if (text.empty()) return nullptr;
    return base64G.Decode(pool, reinterpret_cast<const unsigned char*>(text.data()),
                          static_cast<unsigned>(text.size()));
}

}  // namespace sorn::textvalue
