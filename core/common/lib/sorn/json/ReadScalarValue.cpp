#include "sorn/json/ReadScalarValue.h"

#include "sorn/json/ScalarReader.h"

namespace sorn {

bool ReadScalarValue(InputPointer& cursor, RoxMempool* pool, RoxString& error, ref<DictValue>* out) {
    cursor.pCurrentM = textscan::SkipWhitespace(cursor.pCurrentM, cursor.pEndM);
    const char* words = nullptr;
    DictValue* value = nullptr;
    const unsigned char* behind = ReadScalarAt(cursor.pCurrentM, cursor.pEndM, pool, value, words);
    if (behind == nullptr) {
        error = words;
        return false;
    }
    cursor.pCurrentM = behind;
    *out = value;
    return true;
}

}  // namespace sorn
