#include "sorn/typedjson/AnyDictReader.h"

#include <utility>

namespace sorn {

namespace {

constexpr const char* badFieldG = "bad field in AnyDictValue";
constexpr const char* badValueG = "bad value in AnyDictField";
constexpr const char* badEndG = "expected , or }";

}  // namespace

AnyDictReader::~AnyDictReader() {
    while (!stackM.FEmpty()) Pop();
}

bool AnyDictReader::ReadValue(bool& isMap, RoxString& text, ref<Dict>& dict) {
    isMap = cursorM.FSkipTo('{');
    if (!isMap) {
        if (!textM.Read(cursorM)) {
            pWordsM = "failed to read string in UnmarshalAnyDictValue";
            return false;
        }
        text = textM.Take(pMempoolM);
        return true;
    }
    ++cursorM.pCurrentM;
    if (dict == nullptr) dict = MakeDict(pMempoolM);
    Push(dict.get(), false);
    return Run(Step::KEY);
}

bool AnyDictReader::ReadField(Dict& dict) {
    Push(&dict, true);
    return Run(Step::KEY);
}

bool AnyDictReader::Run(Step step) {
    for (;;) {
        switch (step) {
            case Step::KEY:
                step = ReadKey();
                break;
            case Step::VALUE:
                step = ReadFieldValue();
                break;
            case Step::BEHIND_VALUE:
                step = EndValue();
                break;
            case Step::BEHIND_FIELD:
                step = EndField();
                break;
            case Step::DONE:
                return true;
            case Step::FAILED:
                return false;
        }
    }
}

AnyDictReader::Step AnyDictReader::ReadKey() {
    if (!textM.Read(cursorM)) return Fail("UnmarshalAnyDictField can't read fieldName");
    Frame& frame = stackM.Top();
    RoxString key = textM.Take(pMempoolM);
    frame.pKey = key.GetRepN();
    if (frame.pKey != nullptr) frame.pKey->UpRef();
    if (!cursorM.FTake(':')) return Fail("UnmarshalAnyDictField expected :");
    frame.isArray = cursorM.FTake('[');
    return Step::VALUE;
}

AnyDictReader::Step AnyDictReader::ReadFieldValue() {
    if (cursorM.FSkipTo('{')) return OpenMap();
    // Behind white space: a bare text that is empty leaves the cursor where it stands.
    const bool isQuoted = cursorM.FByte() && *cursorM.pCurrentM == '"';
    if (!textM.Read(cursorM)) return Fail(badValueG);
    const Frame& frame = stackM.Top();
    if (!frame.pDict->AddString(RoxString(frame.pKey), textM.Take(pMempoolM))) return Fail(badValueG);
    if (!frame.isArray) return Step::BEHIND_FIELD;
    const bool isMoved = isQuoted || !textM.View().empty();
    if (!isMoved && !cursorM.FSkipTo(',') && !cursorM.FSkipTo(']')) return Fail(badValueG);
    return Step::BEHIND_VALUE;
}

AnyDictReader::Step AnyDictReader::OpenMap() {
    ++cursorM.pCurrentM;
    ref<Dict> dict = MakeDict(pMempoolM);
    dict->UpRef();  // the stack's
    Push(dict.get(), false);
    return Step::KEY;
}

/// Behind an element of an array.
AnyDictReader::Step AnyDictReader::EndValue() {
    if (cursorM.FTake(',')) return Step::VALUE;
    if (cursorM.FTake(']')) return Step::BEHIND_FIELD;
    return Step::VALUE;  // no comma is needed
}

AnyDictReader::Step AnyDictReader::EndField() {
    if (stackM.Top().isField) {
        Pop();
        return Step::DONE;
    }
    if (cursorM.FTake(',')) {
        Frame& frame = stackM.Top();
        if (frame.pKey != nullptr) std::exchange(frame.pKey, nullptr)->DownRef();
        return Step::KEY;
    }
    if (cursorM.FTake('}')) return AddMap();
    if (stackM.Size() > 1) return Fail(badValueG);
    pWordsM = badEndG;
    return Step::FAILED;
}

/// The map on top is whole: it joins the one around it.
AnyDictReader::Step AnyDictReader::AddMap() {
    if (stackM.Size() == 1) {
        Pop();
        return Step::DONE;
    }
    const ref<Dict> dict(stackM.Top().pDict);
    Pop();
    const Frame& outer = stackM.Top();
    if (!outer.pDict->AddDict(RoxString(outer.pKey), dict)) return Fail(badValueG);
    return outer.isArray ? Step::BEHIND_VALUE : Step::BEHIND_FIELD;
}

/// Something is wrong in a field. `fieldWords` are those of the innermost operation, but each one around it
/// replaces what it finds.
AnyDictReader::Step AnyDictReader::Fail(const char* fieldWords) {
    if (!stackM[0].isField) {
        pWordsM = badFieldG;
    } else {
        pWordsM = stackM.Size() == 1 ? fieldWords : badValueG;
    }
    return Step::FAILED;
}

void AnyDictReader::Push(Dict* dict, bool isField) {
    stackM.Push({dict, nullptr, false, isField});
}

void AnyDictReader::Pop() {
    const Frame frame = stackM.Top();
    stackM.Pop();
    if (frame.pKey != nullptr) frame.pKey->DownRef();
    if (!stackM.FEmpty()) RoxCore::DownRef(frame.pDict);
}

}  // namespace sorn
