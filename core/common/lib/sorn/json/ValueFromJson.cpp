// The FromJson and ReadFieldValue operations of the value classes.
#include "sorn/dict/ArrayValue.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/json/DictionaryParser.h"
#include "sorn/json/TextScan.h"

namespace sorn {

ref<Dictionary> Dictionary::FromJson(const unsigned char* data, unsigned length, RoxString& error,
                                     RoxMempool* pool) {
    error = RoxString();
    ref<Dictionary> dictionary(new (pool) Dictionary(pool));
    InputPointer cursor{data, data + length};
    cursor.pCurrentM = textscan::SkipWhitespace(cursor.pCurrentM, cursor.pEndM);
    if (cursor.FAtEnd() || *cursor.pCurrentM != '{') {
        error = "JSON must start with '{'.";
        return nullptr;
    }
    if (!dictionary->FromJson(cursor, error)) return nullptr;
    cursor.pCurrentM = textscan::SkipWhitespace(cursor.pCurrentM, cursor.pEndM);
    if (!cursor.FAtEnd()) {
        error = "Extra data after JSON.";
        return nullptr;
    }
    return dictionary;
}

ref<Dictionary> Dictionary::FromJson(const RoxString& text, RoxString& error, RoxMempool* pool) {
    // The words may replace the text when one string is both.
    const RoxString held = text;  // NOLINT(performance-unnecessary-copy-initialization)
    return FromJson(reinterpret_cast<const unsigned char*>(held.Utf8()), held.NByte(), error, pool);
}

ref<Dictionary> Dictionary::FromJsonBytestring(const ref<rox::ByteBuffer>& bytes, RoxString& error,
                                               RoxMempool* pool) {
    if (bytes == nullptr) return FromJson(nullptr, 0, error, pool);
    return FromJson(bytes->GetData(), bytes->GetLength(), error, pool);
}

bool Dictionary::FromJson(InputPointer& cursor, RoxString& error) {
    return DictionaryParser(GetMempool(), cursor, error).ReadObject(*this);
}

bool Dictionary::ReadFieldValue(InputPointer& cursor, const RoxString& key, RoxString& error) {
    return DictionaryParser(GetMempool(), cursor, error).ReadMemberValue(*this, key);
}

bool ArrayValue::FromJson(InputPointer& cursor, RoxString& error) {
    return DictionaryParser(GetMempool(), cursor, error).ReadArray(*this);
}

bool ArrayValue::ReadFieldValue(InputPointer& cursor, RoxString& error) {
    return DictionaryParser(GetMempool(), cursor, error).ReadElementValue(*this);
}

}  // namespace sorn
