#include "pairs/TextModel.h"

#include <cctype>

#include "convert/RawText.h"
#include "pairs/BodyModel.h"
#include "pairs/ScalarText.h"

namespace sorntest {

using sorn::FieldInfo;
using sorn::StructInfo;

std::string Quoted(const std::string& text) {
    std::string out = "\"";
    for (size_t i = 0; i < text.size(); ++i) {
        unsigned char c = static_cast<unsigned char>(text[i]);
        const std::string named = "\b\t\n\f\r\"";
        size_t place = named.find(text[i]);
        bool isEscape = c == '\\' && i + 1 < text.size() && text[i + 1] == 'u';
        if (c != 0 && place != std::string::npos) {
            out += std::string("\\") + "btnfr\""[place];
        } else if (c < 0x20 && c != 0x03 && c != 0x1A) {
            out += Format("\\u%04X", c);
        } else {
            out += c == '\\' && !isEscape ? "\\\\" : std::string(1, text[i]);
        }
    }
    return out + "\"";
}

namespace {

bool FBare(const std::string& text) {
    for (char c : text) {
        bool isLetter = (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z');
        if (!isLetter && !(c >= '0' && c <= '9') && c != '-') return false;
    }
    return true;
}

class TreePrinter {
 public:
    TreePrinter(bool pretty, Destination destination) : prettyM(pretty), destinationM(destination) {}

    std::string Print(const Tree& tree, size_t level) {
        switch (tree.kind) {
            case Tree::isText:
                return !tree.quoted && FBare(tree.text) ? tree.text : Quoted(tree.text);
            case Tree::isNull:
                return "null";
            case Tree::isBody:
                return BodyText(*tree.body, prettyM, destinationM);
            case Tree::isArray:
                return PrintArray(tree, level);
            default:
                return PrintDict(tree, level);
        }
    }

 private:
    std::string Line(size_t level) const { return prettyM ? "\n" + std::string(4 * level, ' ') : ""; }

    std::string PrintArray(const Tree& tree, size_t level) {
        std::string out = prettyM ? "[\n" : "[";
        for (size_t i = 0; i < tree.items.size(); ++i) {
            if (prettyM) out += std::string(4 * (level + 1), ' ');
            out += Print(tree.items[i], level + 1);
            if (i + 1 < tree.items.size()) out += prettyM ? ", \n" : ", ";
        }
        return out + Line(level) + "]";
    }

    std::string PrintDict(const Tree& tree, size_t level) {
        std::string out = "{";
        bool isFirst = true;
        for (const auto& [name, values] : tree.Sorted()) {
            for (const Tree* value : values) {
                out +=
                    (isFirst ? "" : ", ") + Line(level + 1) + Quoted(name) + ": " + Print(*value, level + 1);
                isFirst = false;
            }
        }
        return out + Line(level) + "}";
    }

    bool prettyM;
    Destination destinationM;
};

bool FBareInTypedText(const FieldInfo& field) {
    return field.dataType == 0 || field.dataType == 16 || field.dataType == 19;
}

/// Empty for a null reference.
std::string TypedValue(const FieldInfo& field, const Value& value, int version) {
    if (FNullReference(field, value)) return "";
    switch (field.dataType) {
        case 6:
            return TreeText(*value.tree, false);
        case 12:
        case 14:
            return TypedText(*value.record, version);
        case 13:
            return BodyText(*value.body, false, Destination::buffer);
        default: {
            const std::string text = ScalarText(field, value);
            return FBareInTypedText(field) ? text : Quoted(text);
        }
    }
}

bool FHolds(const FieldInfo& field, int version) {
    if (field.arity == 3) return false;
    return version == 0 || (field.firstVersion <= version && version <= field.lastVersion);
}

/// The slot in front of which "type" stands; the number of slots when it stands behind all.
int AnchorOf(const StructInfo& info, int version) {
    int anchor = info.nFields;
    for (int slot = 0; slot < info.nFields; ++slot) {
        const FieldInfo& field = info.vFieldInfo[slot];
        if (FHolds(field, version) && std::string(info.pFieldNames + field.nameOffset) < "type")
            anchor = slot;
    }
    return anchor;
}

}  // namespace

std::string TreeText(const Tree& tree, bool pretty, Destination destination) {
    return TreePrinter(pretty, destination).Print(tree, 0);
}

std::string TypedText(const Record& record, int version) {
    const StructInfo& info = *record.info;
    const int anchor = AnchorOf(info, version);
    std::string out;
    auto entry = [&](const char* name, const std::string& text) {
        out += (out.empty() ? "\"" : ", \"") + std::string(name) + "\": " + text;
    };
    for (int slot = 0; slot <= info.nFields; ++slot) {
        if (slot == anchor) entry("type", Quoted(info.name));
        if (slot == info.nFields || !FHolds(info.vFieldInfo[slot], version)) continue;
        const FieldInfo& field = info.vFieldInfo[slot];
        const std::vector<Value>* values = record.Find({slot, currentForm});
        if (values == nullptr) continue;
        std::string list;
        for (const Value& value : *values) {
            const std::string text = TypedValue(field, value, version);
            if (!text.empty()) list += (list.empty() ? "" : ",") + text;
        }
        if (field.arity == 2) list = "[" + list + "]";
        if (!list.empty()) entry(info.pFieldNames + field.nameOffset, list);
    }
    return "{" + out + "}";
}

}  // namespace sorntest
