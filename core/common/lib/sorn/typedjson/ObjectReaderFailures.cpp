// What is told of a bad text, and what is dropped with it.
#include "sorn/convert/ValueReader.h"
#include "sorn/typedjson/ObjectReader.h"

namespace sorn {

bool ObjectReader::FailFull() {
    return wordsM.Append(ValueReader::tooManyG);
}

/// The object on top is bad.
ObjectReader::Step ObjectReader::FailObject(const char* text) {
    wordsM.Replace(text);
    return stackM.Size() == 1 ? Step::FAILED : FailInnerObject();
}

/// The innermost array of the field under way has no right end.
ObjectReader::Step ObjectReader::FailArray() {
    if (stackM.Size() > 1) return FailInnerObject();
    wordsM.Replace("Array must end with ']'.");
    levelsM.Pop();
    wordsM.AppendArrayWords(levelsM, --stackM.Top().nLevels);
    return FailMember();
}

/// The value under way is bad.
ObjectReader::Step ObjectReader::FailValue() {
    if (stackM.Size() > 1) return FailInnerObject();
    const Frame& frame = stackM.Top();
    if (!frame.isBare) wordsM.AppendValueWords(levelsM, frame.nLevels);
    return FailMember();
}

/// The value of the field under way is bad, and all is said of it.
ObjectReader::Step ObjectReader::FailMember() {
    const Frame& frame = stackM.Top();
    if (frame.pInfo != nullptr) wordsM.AppendKeyWords(frame.pInfo->FieldName(*frame.pField));
    return Step::FAILED;
}

/// Something is wrong in an object inside the outermost one, and all that is told of it is where that stands.
ObjectReader::Step ObjectReader::FailInnerObject() {
    while (stackM.Size() > 1) {
        for (uint32_t i = stackM.Top().nLevels; i > 0; --i) levelsM.Pop();
        stackM.Pop();
    }
    wordsM.SetSilent(false);
    const Frame& frame = stackM.Top();
    if (frame.isMulti) {
        wordsM.Append(frame.pField->Type() == SORN_DATA_TYPE_OBJECT
                          ? " failed to Unmarshal TYPE_OBJECT in Multi"
                          : " failed to Unmarshal KNOWN_DICT in Multi");
    }
    return FailValue();
}

}  // namespace sorn
