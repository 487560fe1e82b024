#include "sorn/typedjson/ObjectReaderWords.h"

#include <cstring>

namespace sorn {

bool ObjectReaderWords::Append(const char* text, const char* more) {
    if (isSilentM || isFullM) return false;
    const size_t nByte = strlen(text) + strlen(more);
    if (nByte > maxBytesG - nByteM) {
        isFullM = true;
        wordsM.Append(restWordsG);
        return false;
    }
    nByteM += nByte;
    wordsM.Append(text);
    wordsM.Append(more);
    return false;
}

bool ObjectReaderWords::AppendValueWords(const ObjectReaderLevels& levels, size_t nLevels) {
    if (isSilentM) return false;
    if (nLevels == 0) return Append(" failed to UnmarshalOneSingleValue in ReadFieldValue");
    Append(" failed to UnmarshalOneMultiValue in AVReadFieldValue");
    AppendArrayWords(levels, nLevels);
    return false;
}

bool ObjectReaderWords::AppendArrayWords(const ObjectReaderLevels& levels, size_t nLevels) {
    for (size_t i = levels.Size(); nLevels-- > 0;) {
        switch (levels[--i]) {
            case ObjectReaderLevel::FIRST_ELEMENT:
            case ObjectReaderLevel::LONE_ELEMENT:
                Append(" Failed to parse an array element.");
                break;
            case ObjectReaderLevel::LATER_ELEMENT:
                Append(" Failed to parse an array member.");
                break;
            case ObjectReaderLevel::ELEMENT_ITSELF:
                break;
        }
    }
    return false;
}

bool ObjectReaderWords::AppendKeyWords(const char* key) {
    return Append(" Failed to parse value for key ", key);
}

}  // namespace sorn
