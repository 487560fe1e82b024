#include "sorn/typedjson/ObjectSkipper.h"

#include <cstring>

#include "sorn/json/ByteClass.h"
#include "sorn/typedjson/StructNames.h"
#include "sorn/typedjson/TextValue.h"

namespace sorn {

bool ObjectSkipper::SkipObject() {
    return Run(OpenObject());
}

bool ObjectSkipper::SkipFieldValue() {
    PushFrame(noObjectG);
    return RunValue();
}

bool ObjectSkipper::SkipArray() {
    PushFrame(noObjectG);
    if (cursorM.FSkipTo('[')) return Run(OpenArray());
    if (cursorM.FSkipTo(']')) {
        PopFrame();
        return true;
    }
    levelsM.Push(ObjectReaderLevel::LONE_ELEMENT);
    stackM.Top().nLevels = 1;
    return RunValue();
}

bool ObjectSkipper::SkipElement() {
    PushFrame(noObjectG);
    levelsM.Push(ObjectReaderLevel::ELEMENT_ITSELF);
    stackM.Top().nLevels = 1;
    return RunValue();
}

bool ObjectSkipper::SkipOne() {
    if (cursorM.FSkipTo('{')) return SkipObject();
    return textM.Skip(cursorM);
}

/// The value that the lowest frame stands for.
bool ObjectSkipper::RunValue() {
    if (cursorM.FSkipTo('{')) return Run(OpenObject());
    if (cursorM.FSkipTo('[')) return Run(OpenArray());
    if (!textM.Skip(cursorM)) return FailValue();
    return Run(Step::CLOSED);
}

/// Goes on until the lowest frame is gone.
bool ObjectSkipper::Run(Step step) {
    while (step != Step::FAILED) {
        if (step == Step::CLOSED && stackM.FEmpty()) return true;
        const Frame& frame = stackM.Top();
        const bool fBehindValue = step == Step::CLOSED;
        if (frame.nLevels != 0) {
            step = ReadElements(fBehindValue);
        } else if (frame.number == noObjectG) {
            PopFrame();
            return true;
        } else {
            step = ReadMembers(fBehindValue);
        }
    }
    return false;
}

void ObjectSkipper::PushFrame(uint32_t number) {
    stackM.Push({{nullptr}, number, 0});
    if (!cursorM.canRefillM) return;
    if (!keysM.has_value()) keysM.emplace(pMempoolM);
    stackM.Top().keyBegin = keysM->GetLength();
}

void ObjectSkipper::PopFrame() {
    if (cursorM.canRefillM) keysM->Truncate(stackM.Top().keyBegin);
    stackM.Pop();
}

ObjectSkipper::Step ObjectSkipper::OpenObject() {
    uint32_t number;
    if (!objectsM.Enter(number)) number = noNumberG;
    PushFrame(number);
    if (cursorM.FTake('{')) return Step::OPENED;
    FailObject("JSON object does not start with '{'.");
    return Step::FAILED;
}

ObjectSkipper::Step ObjectSkipper::OpenArray() {
    ++cursorM.pCurrentM;
    if (cursorM.FTake(']')) return Step::CLOSED;
    levelsM.Push(ObjectReaderLevel::FIRST_ELEMENT);
    ++stackM.Top().nLevels;
    return Step::OPENED;
}

/// Passes plain members of the object on top, up to the first that is anything else. True in front of an
/// object or array of such a member; else `fBehindValue` tells whether the cursor stands behind a value or
/// in front of a key.
inline bool ObjectSkipper::SkipPlainMembers(bool& fBehindValue) {
    const unsigned char* p = cursorM.pCurrentM;
    Frame& frame = stackM.Top();
    const bool isTypeWanted = frame.number != noNumberG;
    PlainMembers::Member member;
    plainM.Enter(cursorM);
    if (fBehindValue && plainM.FEnds(p)) return false;
    for (;;) {
        if (fBehindValue) {
            if (*p != ',') break;
            fBehindValue = false;
            if (!plainM.ReadBehindComma(p, member)) break;
        } else if (!plainM.Read(p, member)) {
            break;
        }
        const bool isType =
            isTypeWanted && member.key.size() == 4 && memcmp(member.key.data(), "type", 4) == 0;
        if (member.pBehind == nullptr) {
            if (isType) break;
            KeepKey(frame, p, member.key);
            cursorM.pCurrentM = member.pValue;
            return true;
        }
        if (isType) objectsM.Note(frame.number, StructNames::Find(NameKey::OfRoomy(member.text)));
        p = member.pBehind;
        fBehindValue = true;
    }
    cursorM.pCurrentM = p;
    return false;
}

/// The same for plain elements of the innermost array.
inline void ObjectSkipper::SkipPlainElements(bool& fBehindValue) {
    if (levelsM.Top() >= ObjectReaderLevel::LONE_ELEMENT) return;
    const unsigned char* p = cursorM.pCurrentM;
    const unsigned char* const end = cursorM.pEndM;
    std::string_view text;
    while (end - p > plaintext::nBehindG) {
        if (fBehindValue) {
            if (*p != ',') break;
            p = plaintext::BehindComma(p, end);
            fBehindValue = false;
            levelsM.Top() = ObjectReaderLevel::LATER_ELEMENT;
        } else {
            const unsigned char* const behind = plaintext::FindText(p, end, text);
            if (behind == nullptr) break;
            p = behind;
            fBehindValue = true;
        }
    }
    cursorM.pCurrentM = p;
}

/// Reads members of the object on top until it ends, or an object or array opens in it.
ObjectSkipper::Step ObjectSkipper::ReadMembers(bool fBehindValue) {
    InputPointerBytesource& cursor = cursorM;
    Frame& frame = stackM.Top();
    for (;; fBehindValue = true) {
        if (SkipPlainMembers(fBehindValue)) {
            return *cursor.pCurrentM == '{' ? OpenObject() : OpenArray();
        }
        if (fBehindValue && !cursor.FTake(',')) break;
        // A comma may trail.
        if (!cursor.FSkipToByte() || !byteclass::FIs(*cursor.pCurrentM, byteclass::STARTS_KEY)) break;
        bool isType = false;
        if (!ReadKeyAndColon(frame, isType)) return Step::FAILED;
        if (isType) {
            if (ReadType(frame.number)) continue;
            FailObject("Can't parse type.");
            return Step::FAILED;
        }
        if (cursor.FSkipToByte()) {
            if (*cursor.pCurrentM == '{') return OpenObject();
            if (*cursor.pCurrentM == '[') return OpenArray();
        }
        if (textM.Skip(cursor)) continue;
        FailValue();
        return Step::FAILED;
    }
    if (!cursor.FTake('}')) {
        FailObject("JSON object does not end with '}'.");
        return Step::FAILED;
    }
    PopFrame();
    return Step::CLOSED;
}

/// Reads elements of the innermost array of the frame on top until it ends, or an object or array opens in
/// it.
ObjectSkipper::Step ObjectSkipper::ReadElements(bool fBehindValue) {
    InputPointerBytesource& cursor = cursorM;
    for (;; fBehindValue = true) {
        SkipPlainElements(fBehindValue);
        if (fBehindValue) {
            if (levelsM.Top() >= ObjectReaderLevel::LONE_ELEMENT) break;
            if (!cursor.FTake(',')) {
                if (cursor.FTake(']')) break;
                FailArray("Array must end with ']'.");
                return Step::FAILED;
            }
            levelsM.Top() = ObjectReaderLevel::LATER_ELEMENT;
        }
        if (cursor.FSkipToByte()) {
            if (*cursor.pCurrentM == '{') return OpenObject();
            if (*cursor.pCurrentM == '[') return OpenArray();
        }
        if (textM.Skip(cursor)) continue;
        FailValue();
        return Step::FAILED;
    }
    levelsM.Pop();
    --stackM.Top().nLevels;
    return Step::CLOSED;
}

inline void ObjectSkipper::KeepKey(Frame& frame, const unsigned char* p, std::string_view key) {
    if (!cursorM.canRefillM) {
        frame.pKey = p;
    } else {
        keysM->Truncate(frame.keyBegin);
        keysM->AppendBytes(key.data(), static_cast<unsigned>(key.size()));
    }
}

inline bool ObjectSkipper::ReadKeyAndColon(Frame& frame, bool& isType) {
    const unsigned char* const p = cursorM.pCurrentM;
    if (!keyM.Read(cursorM)) return FailObject("Failed to parse a fieldName key.");
    KeepKey(frame, p, keyM.View());
    isType = frame.number != noNumberG && keyM.View() == "type";
    if (cursorM.FTake(':')) return true;
    return FailObject("JSON field name must be followed by a colon.");
}

bool ObjectSkipper::ReadType(uint32_t number) {
    if (!textM.Read(cursorM)) return false;
    objectsM.Note(number, StructNames::Find(NameKey(textM.View())));
    return true;
}

/// The object on top is bad.
bool ObjectSkipper::FailObject(const char* text) {
    wordsM.Replace(text);
    PopFrame();
    return FailValue();
}

/// The innermost array of the frame on top is bad.
bool ObjectSkipper::FailArray(const char* text) {
    wordsM.Replace(text);
    levelsM.Pop();
    Frame& frame = stackM.Top();
    wordsM.AppendArrayWords(levelsM, --frame.nLevels);
    return FailFrame();
}

/// The value under way in the frame on top is bad, and with it all the objects around it.
bool ObjectSkipper::FailValue() {
    if (wordsM.FSilent() || stackM.FEmpty()) return false;
    wordsM.AppendValueWords(levelsM, stackM.Top().nLevels);
    return FailFrame();
}

/// The same when all is said of the value.
bool ObjectSkipper::FailFrame() {
    if (wordsM.FSilent()) return false;
    for (;;) {
        const Frame& frame = stackM.Top();
        AppendKey(frame);
        for (uint32_t i = frame.nLevels; i > 0; --i) levelsM.Pop();
        PopFrame();
        if (stackM.FEmpty()) return false;
        wordsM.AppendValueWords(levelsM, stackM.Top().nLevels);
    }
}

void ObjectSkipper::AppendKey(const Frame& frame) {
    if (frame.number == noObjectG) return;
    if (cursorM.canRefillM) {
        const char* const key = reinterpret_cast<const char*>(keysM->GetData()) + frame.keyBegin;
        wordsM.AppendKeyWords(textvalue::Terminated({key, keysM->GetLength() - frame.keyBegin}).Text());
    } else {
        InputPointerBytesource again(frame.pKey, static_cast<unsigned>(cursorM.pEndM - frame.pKey));
        keyM.Read(again);
        wordsM.AppendKeyWords(textvalue::Terminated(keyM.View()).Text());
    }
}

}  // namespace sorn
