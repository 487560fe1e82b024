#include <cstdlib>

#include "pairs/TextModel.h"

namespace sorntest {

namespace {

std::string Utf8Of(unsigned code) {
    std::string out;
    if (code < 0x80) return std::string(1, static_cast<char>(code));
    if (code < 0x800) {
        out += static_cast<char>(0xC0 | code >> 6);
    } else {
        out += static_cast<char>(0xE0 | code >> 12);
        out += static_cast<char>(0x80 | (code >> 6 & 63));
    }
    return out + static_cast<char>(0x80 | (code & 63));
}

/// Reads what the writers write, and no more.
class Parser {
 public:
    Parser(const std::string& text, Dialect dialect) : textM(text), dialectM(dialect) {}

    bool Dict(Tree& out, std::string& words);
    bool AtEnd() {
        SkipBlanks();
        return atM == textM.size();
    }

 private:
    char Next() {
        SkipBlanks();
        return atM < textM.size() ? textM[atM] : '\0';
    }
    void SkipBlanks() {
        while (atM < textM.size() && (textM[atM] == ' ' || textM[atM] == '\n')) ++atM;
    }
    bool String(std::string& out);
    bool Escape(std::string& out);
    bool ReadValue(Tree& out, std::string& words);
    bool Array(Tree& out, std::string& words);
    bool Scalar(Tree& out, std::string& words);

    const std::string& textM;
    Dialect dialectM;
    size_t atM = 0;
};

bool Parser::Escape(std::string& out) {
    const std::string named = "btnfr";
    char c = textM[atM++];
    size_t place = named.find(c);
    if (place != std::string::npos) {
        out += "\b\t\n\f\r"[place];
    } else if (c != 'u') {
        out += c;
    } else if (dialectM == Dialect::hand) {
        out += "\\u";
    } else if (dialectM == Dialect::stream) {
        const std::string digits = textM.substr(atM, 4);
        char* end = nullptr;
        unsigned long code = strtoul(digits.c_str(), &end, 16);
        if (digits.size() != 4 || *end != 0) return false;
        out += Utf8Of(static_cast<unsigned>(code));
        atM += 4;
    }
    return true;
}

bool Parser::String(std::string& out) {
    ++atM;
    out.clear();
    while (textM[atM] != '"') {
        char c = textM[atM++];
        bool isControl = static_cast<unsigned char>(c) < 0x20;
        if (isControl && dialectM == Dialect::stream) return false;
        if (c != '\\') {
            out += c;
        } else if (!Escape(out)) {
            return false;
        }
    }
    ++atM;
    return true;
}

bool Parser::Scalar(Tree& out, std::string& words) {
    if (Next() == '"') {
        out = Tree::Text("", true);
        if (String(out.text)) return true;
        words = someWords;
        return false;
    }
    size_t end = textM.find_first_of(" ,]}\n", atM);
    const std::string token = textM.substr(atM, end - atM);
    atM = end;
    out = token == "null" && dialectM != Dialect::typed ? Tree::Null() : Tree::Text(token, false);
    return true;
}

bool Parser::ReadValue(Tree& out, std::string& words) {
    switch (Next()) {
        case '{':
            return Dict(out, words);
        case '[':
            return Array(out, words);
        default:
            return Scalar(out, words);
    }
}

bool Parser::Array(Tree& out, std::string& words) {
    out = Tree::Array();
    ++atM;
    while (Next() != ']') {
        Tree item;
        if (!ReadValue(item, words)) {
            words += out.items.empty() ? " Failed to parse an array element."
                                       : " Failed to parse an array member.";
            return false;
        }
        out.items.push_back(item);
        if (Next() == ',') ++atM;
    }
    ++atM;
    return true;
}

bool Parser::Dict(Tree& out, std::string& words) {
    out = Tree::Dict();
    Next();
    size_t start = atM++;
    while (Next() == '"') {
        std::string key;
        if (!String(key)) {
            words = someWords;
            return false;
        }
        if (dialectM == Dialect::hand && out.Find(key) != nullptr) {
            words = "Duplicate key: " + key;
            return false;
        }
        Next();
        ++atM;  // the colon
        Tree value;
        if (!ReadValue(value, words)) {
            words += " Failed to parse value for key " + key;
            return false;
        }
        out.Add(key, value);
        if (Next() == ',') ++atM;
    }
    ++atM;
    out.raw = textM.substr(start, atM - start);
    return true;
}

}  // namespace

std::optional<Tree> ParseText(const std::string& text, Dialect dialect, std::string& words) {
    Parser parser(text, dialect);
    Tree tree;
    words.clear();
    if (!parser.Dict(tree, words)) {
        if (dialect != Dialect::hand) words = someWords;
        return std::nullopt;
    }
    return tree;
}

}  // namespace sorntest
