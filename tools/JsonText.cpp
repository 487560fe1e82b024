#include "tools/JsonText.h"

#include <algorithm>
#include <charconv>
#include <cstdint>
#include <cstdio>

namespace sorn::tools {

namespace {

constexpr char blanksG[] = " \t\r\n";
constexpr std::string_view escapedG = "\"\\/\b\f\n\r\t";
constexpr std::string_view lettersG = "\"\\/bfnrt";

/// A place in a text; every operation that finds something else than it looks for gives false.
class Cursor {
 public:
    explicit Cursor(std::string_view text) : restM(text) {}

    bool Take(char c) {
        SkipBlanks();
        if (restM.empty() || restM.front() != c) return false;
        restM.remove_prefix(1);
        return true;
    }
    bool FAtEnd() {
        SkipBlanks();
        return restM.empty();
    }
    /// A string with its quotes.
    bool TakeString(std::string_view& raw) {
        SkipBlanks();
        if (restM.empty() || restM.front() != '"') return false;
        size_t end = 1;
        while (end < restM.size() && restM[end] != '"') end += restM[end] == '\\' ? 2U : 1U;
        return TakeRaw(end + 1, raw);
    }
    /// Any value, without blanks around it.
    bool TakeValue(std::string_view& raw) {
        SkipBlanks();
        Cursor end(restM);
        size_t depth = 0;
        do {
            std::string_view text;
            if (end.Take('{') || end.Take('[')) {
                ++depth;
            } else if (end.Take('}') || end.Take(']')) {
                if (depth == 0) return false;
                --depth;
            } else if (depth != 0 && (end.Take(',') || end.Take(':'))) {
                continue;
            } else if (!end.TakeString(text) && !end.TakeWord()) {
                return false;
            }
        } while (depth != 0);
        return TakeRaw(restM.size() - end.restM.size(), raw);
    }

 private:
    void SkipBlanks() { restM.remove_prefix(std::min(restM.find_first_not_of(blanksG), restM.size())); }
    bool TakeWord() {
        const size_t end = std::min(restM.find_first_of(" \t\r\n,:[]{}\""), restM.size());
        restM.remove_prefix(end);
        return end != 0;
    }
    bool TakeRaw(size_t n, std::string_view& raw) {
        if (n > restM.size()) return false;
        raw = restM.substr(0, n);
        restM.remove_prefix(n);
        return true;
    }

    std::string_view restM;
};

/// Takes what stands between two brackets and commas; `item` takes one.
template <class TakeItem>
bool Split(std::string_view json, char open, char close, TakeItem item) {
    Cursor cursor(json);
    if (!cursor.Take(open)) return false;
    if (cursor.Take(close)) return cursor.FAtEnd();
    do {
        if (!item(cursor)) return false;
    } while (cursor.Take(','));
    return cursor.Take(close) && cursor.FAtEnd();
}

/// The number of four hexadecimal digits at the start.
bool ReadUnit(std::string_view digits, uint32_t& unit) {
    if (digits.size() < 4) return false;
    return std::from_chars(digits.data(), digits.data() + 4, unit, 16).ptr == digits.data() + 4;
}

/// Reads what stands behind a backslash-u, a pair of surrogates with the second backslash-u in it, into
/// UTF-8; gives how many bytes that took, 0 when it is bad.
size_t ReadUnicode(std::string_view json, std::string& text) {
    uint32_t c = 0;
    uint32_t low = 0;
    if (!ReadUnit(json, c) || (c >= 0xDC00 && c <= 0xDFFF)) return 0;
    const bool isPair = c >= 0xD800 && c <= 0xDBFF;
    if (isPair) {
        if (json.substr(4, 2) != "\\u" || !ReadUnit(json.substr(6), low)) return 0;
        if (low < 0xDC00 || low > 0xDFFF) return 0;
        c = 0x10000 + ((c - 0xD800) << 10) + (low - 0xDC00);
    }
    const unsigned nFollowing = c < 0x80 ? 0 : c < 0x800 ? 1 : c < 0x10000 ? 2 : 3;
    static constexpr unsigned char leadG[] = {0, 0xC0, 0xE0, 0xF0};
    text += static_cast<char>(leadG[nFollowing] | c >> (6 * nFollowing));
    for (unsigned i = nFollowing; i-- != 0;) text += static_cast<char>(0x80 | (c >> (6 * i) & 0x3F));
    return isPair ? 10 : 4;
}

}  // namespace

std::string Quoted(std::string_view text) {
    std::string json = "\"";
    for (char c : text) {
        if (const size_t at = escapedG.find(c); at != std::string_view::npos && c != '/') {
            json += '\\';
            json += lettersG[at];
        } else if (static_cast<unsigned char>(c) < 0x20) {
            char escape[8];
            std::snprintf(escape, sizeof escape, "\\u%04x", static_cast<unsigned>(c));
            json += escape;
        } else {
            json += c;
        }
    }
    return json + "\"";
}

bool Unquote(std::string_view json, std::string& text) {
    text.clear();
    if (json.empty() || json.front() != '"') return false;
    for (size_t i = 1; i < json.size(); ++i) {
        if (json[i] == '"') return true;
        if (json[i] != '\\') {
            text += json[i];
            continue;
        }
        if (++i == json.size()) return false;
        if (json[i] == 'u') {
            const size_t taken = ReadUnicode(json.substr(i + 1), text);
            if (taken == 0) return false;
            i += taken;
        } else {
            const size_t at = lettersG.find(json[i]);
            if (at == std::string_view::npos) return false;
            text += escapedG[at];
        }
    }
    return false;
}

bool SplitObject(std::string_view json, RawMembers& members) {
    return Split(json, '{', '}', [&members](Cursor& cursor) {
        std::string_view name;
        std::string_view value;
        std::string text;
        if (!cursor.TakeString(name) || !cursor.Take(':') || !cursor.TakeValue(value)) return false;
        if (!Unquote(name, text)) return false;
        members.emplace_back(text, value);
        return true;
    });
}

bool SplitArray(std::string_view json, std::vector<std::string_view>& elements) {
    return Split(json, '[', ']', [&elements](Cursor& cursor) {
        std::string_view value;
        if (!cursor.TakeValue(value)) return false;
        elements.push_back(value);
        return true;
    });
}

}  // namespace sorn::tools
