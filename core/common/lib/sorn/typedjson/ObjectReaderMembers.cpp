// Members of objects: their keys, and the ways to their values.
#include "sorn/json/ByteClass.h"
#include "sorn/typedjson/ObjectReader.h"
#include "sorn/typedjson/PlainText.h"
#include "sorn/typedjson/TextValue.h"

namespace sorn {

namespace {

constexpr const char* noColonG = "JSON field name must be followed by a colon.";

constexpr FieldKey unknownKeyG(nullptr);

}  // namespace

/// The key that stands at the cursor as programs write it, and where its value begins. Null for another key,
/// with nothing moved.
inline const FieldKey* ObjectReader::ReadPlainKey(Frame& frame, const unsigned char*& value) {
    const unsigned char* const p = cursorM.pCurrentM;
    const unsigned char* const end = cursorM.pEndM;
    const FieldIndex& index = *frame.pIndex;
    uint16_t& hint = hintsM.At(index.HintPlace(frame.slot));
    const FieldKey& hinted = index.KeyAt(hint);
    if (end - p > ptrdiff_t{FieldKey::maxBytesG} + plaintext::nBehindG && hinted.FAt(p)) {
        frame.slot = hint;
        value = plaintext::ValueOf(p + hinted.Bytes() - 2);
        return &hinted;
    }
    const unsigned char* const keyEnd = plaintext::FindKeyEnd(p, end);
    if (keyEnd == nullptr) return nullptr;
    value = plaintext::ValueOf(keyEnd);
    const uint32_t slot = index.FindSlot(NameKey::OfRoomy(plaintext::View(p + 1, keyEnd)));
    if (slot == FieldIndex::noneG) return &unknownKeyG;
    if (slot <= UINT16_MAX) hint = frame.slot = static_cast<uint16_t>(slot);
    return &index.KeyAt(slot);
}

/// Reads a member that stands at the cursor as programs write it. False, with nothing moved: another one.
inline __attribute__((always_inline)) bool ObjectReader::ReadPlainMember(Step& step) {
    Frame& frame = stackM.Top();
    if (frame.pIndex == nullptr) return false;
    const unsigned char* value;
    const FieldKey* const key = ReadPlainKey(frame, value);
    if (key == nullptr) return false;
    const FieldInfo* const field = key->Field();
    std::string_view text;
    if (field == nullptr) {
        const unsigned char* const behind = plaintext::FindText(value, cursorM.pEndM, text);
        if (behind == nullptr) return false;
        cursorM.pCurrentM = behind;
        step = Step::CLOSED;
        return true;
    }
    frame.pField = field;
    if (field->arity == SORN_ARITY_OPTIONAL) frame.pObject->SetPresent(*field);
    const unsigned char* const behind =
        key->FText() ? plaintext::FindText(value, cursorM.pEndM, text) : nullptr;
    if (behind == nullptr) {
        cursorM.pCurrentM = value;
        step = StartValue();
        return true;
    }
    cursorM.pCurrentM = behind;
    frame.isMulti = false;
    const FieldTarget target(frame.pObject->MemberAt(*field), false);
    step = ReadText(*field, text, true, target) ? Step::CLOSED : FailValue();
    return true;
}

/// Reads members of the object on top until it ends, or an object opens in it.
ObjectReader::Step ObjectReader::ReadMembers(bool fBehindValue) {
    InputPointerBytesource& cursor = cursorM;
    for (;; fBehindValue = true) {
        if (fBehindValue) {
            const unsigned char* const p = cursor.pCurrentM;
            if (p != cursor.pEndM && *p == ',') [[likely]] {
                cursor.pCurrentM = plaintext::BehindComma(p, cursor.pEndM);
            } else if (!cursor.FTake(',')) {
                break;
            }
        }
        Step step;
        if (!ReadPlainMember(step)) {
            // A comma may trail.
            if (!cursor.FSkipToByte() || !byteclass::FIs(*cursor.pCurrentM, byteclass::STARTS_KEY)) break;
            if (!textM.Read(cursor)) return FailObject("Failed to parse a fieldName key.");
            step = ReadMember(textM.View());
        }
        if (step != Step::CLOSED) return step;
    }
    if (!cursor.FTake('}')) return FailObject("JSON object does not end with '}'.");
    return CloseObject();
}

/// Reads a member behind its key.
ObjectReader::Step ObjectReader::ReadMember(std::string_view key) {
    Frame& frame = stackM.Top();
    const FieldInfo* const field = frame.pIndex != nullptr ? frame.pIndex->Find(NameKey(key))
                                                           : FieldIndex::FindByWalk(*frame.pInfo, key);
    if (field == nullptr) return SkipMember(key);
    if (!cursorM.FTake(':')) return FailObject(noColonG);
    frame.pField = field;
    if (field->arity == SORN_ARITY_OPTIONAL) frame.pObject->SetPresent(*field);
    return StartValue();
}

/// A key that names no field.
ObjectReader::Step ObjectReader::SkipMember(std::string_view key) {
    RoxString kept;
    if (cursorM.canRefillM && !wordsM.FSilent()) {
        kept = textM.Take(pMempoolM);
        key = kept.View();
    }
    if (!cursorM.FTake(':')) return FailObject(noColonG);
    if (!cursorM.FSkipTo('{') && !cursorM.FSkipTo('[')) {
        if (textM.Skip(cursorM)) return Step::CLOSED;
        wordsM.AppendValueWords(levelsM, 0);
    } else if (skipperM.SkipFieldValue()) {
        return Step::CLOSED;
    }
    if (stackM.Size() > 1) return FailInnerObject();
    wordsM.AppendKeyWords(textvalue::Terminated(key).Text());
    return Step::FAILED;
}

}  // namespace sorn
