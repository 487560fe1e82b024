#include "sorn/json/Json.h"

#include "sorn/json/JsonOutput.h"
#include "sorn/json/QuotedText.h"
#include "sorn/json/StringWriter.h"

namespace sorn {

void Json::StringToJson(const RoxString& text, bool onlyIfNeeded, ByteBuffer& out) {
    JsonBufferOutput output(out);
    stringwriter::WriteText(text, !onlyIfNeeded, output);
}

void Json::StringToJson(const RoxString& text, bool onlyIfNeeded, kelbaselib::Bytesink& out) {
    JsonSinkOutput output(out);
    stringwriter::WriteText(text, !onlyIfNeeded, output);
}

bool Json::EscapedCharToChar(char escaped, char& out) {
    switch (escaped) {
        case '"':
        case '/':
        case '\\':
            out = escaped;
            return true;
        case 'b':
            out = '\b';
            return true;
        case 'f':
            out = '\f';
            return true;
        case 'n':
            out = '\n';
            return true;
        case 'r':
            out = '\r';
            return true;
        case 't':
            out = '\t';
            return true;
        default:
            return false;
    }
}

bool Json::JsonToString(RoxMempool* pool, InputPointer& cursor, RoxString& out) {
    const unsigned char* const end = cursor.pEndM;
    const unsigned char* p = textscan::SkipWhitespace(cursor.pCurrentM, end);
    cursor.pCurrentM = p;
    if (p < end && *p == '"') {
        QuotedText text;
        if (!text.Find(p + 1, end)) return false;
        out = text.Take(pool);
        cursor.pCurrentM = text.Behind();
        return true;
    }
    const unsigned char* const tokenEnd = textscan::FindTokenEnd(p, end);
    out = RoxString::FromUtf8Bytes(pool, static_cast<unsigned>(tokenEnd - p), p);
    cursor.pCurrentM = tokenEnd;
    return true;
}

}  // namespace sorn
