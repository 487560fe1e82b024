#include "pairs/ScalarText.h"

#include <cinttypes>
#include <cstdlib>
#include <ctime>

#include "convert/RawText.h"
#include "sorn/model/Schema.h"

namespace sorntest {

using sorn::EnumDef;
using sorn::FieldInfo;
using sorn::Schema;
using sorn::StructInfo;

namespace {

const char base64Code[] = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";

struct Namespace {
    const char* name;
    uint64_t code;
};
const Namespace namespaces[] = {{"rs", 1},     {"ts", 2},     {"bs", 3}, {"tms.ep", 5}, {"tms.sh", 6},
                                {"tms.mv", 7}, {"tms.sp", 8}, {"vp", 9}, {"dlna", 10},  {"vod", 16384}};

std::string Moment(const char* format, int64_t seconds) {
    time_t when = static_cast<time_t>(seconds);
    struct tm parts;
    gmtime_r(&when, &parts);
    char text[64];
    strftime(text, sizeof text, format, &parts);
    return text;
}

std::string LongIdText(uint64_t id) {
    uint64_t code = id >> 48;
    if (code == 0) return Format("%" PRIu64, id);
    std::string name(3, 'x');
    for (const Namespace& each : namespaces) {
        if (each.code == code) name = each.name;
    }
    return name + Format(".%" PRIu64, id & 0xFFFFFFFFFFFF);
}

uint64_t DigitsToNumber(const std::string& text) {
    if (text.empty() || text.find_first_not_of("0123456789") != std::string::npos) return 0;
    uint64_t number = 0;
    for (char c : text) number = number * 10 + static_cast<uint64_t>(c - '0');
    return number;
}

uint64_t TextToLongId(const std::string& text) {
    size_t dot = text.rfind('.');
    if (dot == std::string::npos) return DigitsToNumber(text);
    for (const Namespace& each : namespaces) {
        if (text.substr(0, dot) == each.name) return DigitsToNumber(text.substr(dot + 1)) + (each.code << 48);
    }
    return 0;
}

std::string IdText(const FieldInfo& field, const std::string& id) {
    const StructInfo* info = Schema::FindStruct(field.typeRef);
    if (info == nullptr) return std::string(3, 'X');
    return ((info->idPrefix != nullptr ? info->idPrefix : "") + id).substr(0, 99);
}

std::string BytesOfBase64(const std::string& text) {
    std::string bytes;
    unsigned bits = 0;
    int nBits = 0;
    for (char c : text) {
        if (c == '=') break;
        bits = bits << 6 | static_cast<unsigned>(std::string(base64Code).find(c));
        nBits += 6;
        if (nBits >= 8) {
            nBits -= 8;
            bytes += static_cast<char>(bits >> nBits & 0xFF);
        }
    }
    return bytes;
}

int64_t Seconds(const std::string& text, const char* format, struct tm parts) {
    const char* end = strptime(text.c_str(), format, &parts);
    if (end == nullptr || *end != 0) return 0;
    return timegm(&parts);
}

bool ParseId(const FieldInfo& field, const std::string& text, Value& out, std::string& words) {
    const StructInfo* info = Schema::FindStruct(field.typeRef);
    const std::string prefix = info != nullptr && info->idPrefix != nullptr ? info->idPrefix : "";
    if (info == nullptr || text.compare(0, prefix.size(), prefix) != 0) {
        words = (info == nullptr ? "no struct for id" : "wrong prefix on id") + ("bad prefix: " + text);
        return false;
    }
    const std::string id = text.substr(prefix.size());
    if (field.dataType == 11) {
        out.text = id;
    } else if (field.dataType == 10) {
        out.number = static_cast<int64_t>(TextToLongId(id));
    } else {
        uint64_t number = DigitsToNumber(id);
        out.number = number <= UINT32_MAX ? static_cast<int64_t>(number) : 0;
    }
    return true;
}

bool ParseEnum(const FieldInfo& field, const std::string& text, Value& out, std::string& words) {
    const EnumDef& def = *Schema::FindEnum(field.typeRef);
    for (uint32_t i = 0; i < def.count; ++i) {
        if (def.names[i] == nullptr || text != def.names[i]) continue;
        out.number = i;
        return true;
    }
    words = "bad enum item name";
    return false;
}

bool ParseNumber(const FieldInfo& field, const std::string& text, Strictness strictness, Value& out) {
    bool isSigned = field.dataType == 15 || field.dataType == 16;
    bool isNarrow = field.dataType == 16 || field.dataType == 19;
    long long s = 0;
    unsigned long long u = 0;
    int n = isSigned ? sscanf(text.c_str(), "%lld", &s) : sscanf(text.c_str(), "%llu", &u);
    if (n != 1) return false;
    if (isNarrow && strictness == Strictness::dictionary) {
        if (isSigned ? s < INT32_MIN || s > INT32_MAX : u > UINT32_MAX) return false;
    }
    out.number = isSigned ? s : static_cast<int64_t>(u);
    if (isNarrow)
        out.number = isSigned ? int64_t{static_cast<int32_t>(s)} : int64_t{static_cast<uint32_t>(u)};
    return true;
}

bool ParseChannel(const std::string& text, Value& out) {
    int number = -2;
    int sub = -2;
    int end = 0;
    bool isDigit = !text.empty() && text[0] >= '0' && text[0] <= '9';
    if (isDigit && sscanf(text.c_str(), "%d%n", &number, &end) == 1 &&
        text[static_cast<size_t>(end)] == '-') {
        int more = 0;
        sscanf(text.c_str() + end + 1, "%d%n", &sub, &more);
        end += 1 + more;
    }
    bool isWhole = isDigit && static_cast<size_t>(end) == text.size();
    out.number = isWhole ? number : -2;
    out.sub = isWhole ? sub : -2;
    return isWhole;
}

bool ParseCurrency(const std::string& text, Value& out) {
    int end = 0;
    int amount = 0;
    bool isGood = text.size() > 4 && text[3] == '.' && text[4] >= '0' && text[4] <= '9' &&
                  sscanf(text.c_str() + 4, "%d%n", &amount, &end) == 1 &&
                  text.size() == 4u + static_cast<size_t>(end);
    out.text = isGood ? text.substr(0, 3) : "";
    out.number = isGood ? amount : 0;
    return isGood;
}

}  // namespace

std::string Base64Text(const std::string& bytes) {
    std::string text;
    for (size_t i = 0; i < bytes.size(); i += 3) {
        unsigned group = 0;
        size_t n = bytes.size() - i < 3 ? bytes.size() - i : 3;
        for (size_t j = 0; j < 3; ++j)
            group = group << 8 | (j < n ? static_cast<unsigned char>(bytes[i + j]) : 0u);
        for (size_t j = 0; j < 4; ++j) text += j <= n ? base64Code[group >> (18 - 6 * j) & 63] : '=';
    }
    return text;
}

std::string ScalarText(const FieldInfo& field, const Value& value) {
    uint64_t bits = static_cast<uint64_t>(value.number);
    switch (field.dataType) {
        case 0:
            return value.number != 0 ? "true" : "false";
        case 1:
            return Base64Text(value.text);
        case 2:
            if (value.sub != -2) return Format("%" PRId64 "-%" PRId64, value.number, value.sub);
            return value.number == -2 ? "invalid" : Format("%" PRId64, value.number);
        case 3:
            return value.text.empty() ? "invalid" : value.text + Format(".%" PRId64, value.number);
        case 4:
            return Moment("%Y-%m-%d", value.number * 86400);
        case 5:
            return Moment("%Y-%m-%d %H:%M:%S", value.number / 1000);
        case 7: {
            const EnumDef* def = Schema::FindEnum(field.typeRef);
            const char* name = def != nullptr && bits < def->count ? def->names[bits] : nullptr;
            return name != nullptr ? name : Format("INVALID_VALUE:%" PRIu64, bits);
        }
        case 8: {
            std::string text = Format("%1.8g", value.real);
            return text.find('.') == std::string::npos ? text + ".0" : text;
        }
        case 9:
        case 10:
            return IdText(field, LongIdText(bits));
        case 11:
            return IdText(field, value.text);
        case 17:
            return value.text;
        case 18:
            return Moment("%H:%M:%S", value.number / 1000);
        case 19:
        case 20:
            return Format("%" PRIu64, bits);
        default:
            return Format("%" PRId64, value.number);
    }
}

bool ParseScalar(const FieldInfo& field, const std::string& text, Strictness strictness, Value& out,
                 std::string& words) {
    struct tm epoch = {};
    epoch.tm_mday = 1;
    epoch.tm_year = 70;
    switch (field.dataType) {
        case 0:
            out.number = text == "true";
            return text == "true" || text == "false";
        case 1:
            out.text = BytesOfBase64(text);
            return true;
        case 2:
            return ParseChannel(text, out) || strictness == Strictness::dictionary;
        case 3:
            return ParseCurrency(text, out) || strictness == Strictness::dictionary;
        case 4:
            out.number = Seconds(text, "%Y-%m-%d", epoch) / 86400;
            return true;
        case 5:
            out.number = Seconds(text, "%Y-%m-%d %H:%M:%S", epoch) * 1000;
            return true;
        case 7:
            return ParseEnum(field, text, out, words);
        case 8:
            return sscanf(text.c_str(), "%lg", &out.real) == 1;
        case 9:
        case 10:
        case 11:
            return ParseId(field, text, out, words);
        case 17:
            out.text = text;
            return true;
        case 18:
            out.number = Seconds(text, "%H:%M:%S", epoch) * 1000;
            return true;
        default:
            return ParseNumber(field, text, strictness, out);
    }
}

}  // namespace sorntest
