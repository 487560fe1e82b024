#include "sorn/typedjson/ObjectReader.h"

#include <utility>

#include "sorn/convert/ValueReader.h"
#include "sorn/json/ByteClass.h"
#include "sorn/model/Schema.h"
#include "sorn/typedjson/TextValue.h"

namespace sorn {

namespace {

constexpr const char* noColonG = "JSON field name must be followed by a colon.";

}  // namespace

ObjectReader::ObjectReader(RoxMempool* pool, InputPointerBytesource& cursor, ObjectReaderObjects objects,
                           uint64_t nInput, RoxString& error)
    : pMempoolM(pool),
      cursorM(cursor),
      objectsM(objects),
      budgetM(nInput),
      nInputM(nInput),
      wordsM(pool, error),
      textM(pool),
      skipperM(pool, cursor, objects, wordsM),
      stackM(pool),
      levelsM(pool) {}

bool ObjectReader::ReadObject(const StructInfo* info, ref<SornObject>& out) {
    if (info == nullptr || objectsM.FNextIsNew()) {
        if (!Finish(skipperM.SkipObject())) return false;
        out = nullptr;
        return true;
    }
    outermostM = MakeObject(*info);
    if (outermostM == nullptr) return Finish(false);
    PushObject(*info, outermostM.get());
    if (!Finish(Run(Step::OPENED))) return false;
    out = std::move(outermostM);
    return true;
}

bool ObjectReader::ReadFieldValue(const FieldInfo* field, SornObject* object) {
    if (field == nullptr) return Finish(skipperM.SkipFieldValue());
    PushCaller(field, object);
    return Finish(Run(StartValue()));
}

bool ObjectReader::ReadArray(const FieldInfo* field, SornObject* object) {
    if (field == nullptr) return Finish(skipperM.SkipArray());
    PushCaller(field, object);
    return Finish(Run(StartArray(cursorM.FSkipTo('['))));
}

bool ObjectReader::ReadElement(const FieldInfo* field, SornObject* object) {
    if (field == nullptr) return Finish(skipperM.SkipElement());
    PushCaller(field, object);
    levelsM.Push(ObjectReaderLevel::ELEMENT_ITSELF);
    stackM.Top().nLevels = 1;
    return Finish(Run(ReadElements(false)));
}

bool ObjectReader::ReadOne(const FieldInfo* field, SornObject* object, bool isMulti) {
    if (field == nullptr) return Finish(skipperM.SkipOne());
    PushCaller(field, object);
    stackM.Top().isBare = true;
    return Finish(Run(ReadValue(isMulti)));
}

bool ObjectReader::Finish(bool isGood) {
    if (!isGood) wordsM.Commit();
    return isGood;
}

void ObjectReader::PushCaller(const FieldInfo* field, SornObject* object) {
    stackM.Push({nullptr, object, field, nullptr, 0, false, false});
}

/// Goes on until the lowest frame is gone.
bool ObjectReader::Run(Step step) {
    while (step != Step::FAILED) {
        if (step == Step::CLOSED && stackM.FEmpty()) return true;
        if (stackM.Top().nLevels != 0) {
            step = ReadElements(step == Step::CLOSED);
            if (step != Step::CLOSED) continue;
        }
        if (step == Step::CLOSED && FCaller()) return true;
        step = ReadMembers(step == Step::CLOSED);
    }
    return false;
}

/// Makes the object that begins here, or null.
ref<SornObject> ObjectReader::MakeObject(const StructInfo& info) {
    uint32_t number;
    objectsM.Enter(number);
    if (!cursorM.FTake('{')) {
        wordsM.Replace("JSON object does not start with '{'.");
        return nullptr;
    }
    const uint64_t nInput = cursorM.TakenBytes();
    if (nInput > nInputM) {
        budgetM.AddInput(nInput - nInputM);
        nInputM = nInput;
    }
    ref<SornObject> object;
    if (budgetM.Take(info)) object = info.Factory(pMempoolM);
    if (object == nullptr) wordsM.Replace("Failed to create sorn object");
    return object;
}

void ObjectReader::PushObject(const StructInfo& info, SornObject* object) {
    wordsM.SetSilent(!stackM.FEmpty());
    stackM.Push({&info, object, nullptr, FieldIndex::Of(info), 0, false, false});
}

/// Reads members of the object on top until it ends, or an object opens in it.
ObjectReader::Step ObjectReader::ReadMembers(bool fBehindValue) {
    InputPointerBytesource& cursor = cursorM;
    Frame& frame = stackM.Top();
    for (;; fBehindValue = true) {
        if (fBehindValue && !cursor.FTake(',')) break;
        // A comma may trail.
        if (!cursor.FSkipToByte() || !byteclass::FIs(*cursor.pCurrentM, byteclass::STARTS_KEY)) break;
        if (!textM.Read(cursor)) return FailObject("Failed to parse a fieldName key.");
        const FieldInfo* const field = frame.pIndex != nullptr
                                           ? frame.pIndex->Find(textM.View())
                                           : FieldIndex::FindByWalk(*frame.pInfo, textM.View());
        Step step;
        if (field == nullptr) {
            step = SkipMember(textM.View());
        } else {
            if (!cursor.FTake(':')) return FailObject(noColonG);
            frame.pField = field;
            if (field->arity == SORN_ARITY_OPTIONAL) frame.pObject->SetPresent(*field);
            step = StartValue();
        }
        if (step != Step::CLOSED) return step;
    }
    if (!cursor.FTake('}')) return FailObject("JSON object does not end with '}'.");
    return CloseObject();
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

ObjectReader::Step ObjectReader::StartValue() {
    const bool isBracketed = cursorM.FSkipTo('[');
    if (isBracketed || stackM.Top().pField->arity == SORN_ARITY_MULTI) return StartArray(isBracketed);
    return ReadValue(false);
}

ObjectReader::Step ObjectReader::StartArray(bool isBracketed) {
    if (isBracketed) ++cursorM.pCurrentM;
    if (cursorM.FSkipTo(']')) {
        if (isBracketed) ++cursorM.pCurrentM;
        return Step::CLOSED;
    }
    levelsM.Push(isBracketed ? ObjectReaderLevel::FIRST_ELEMENT : ObjectReaderLevel::LONE_ELEMENT);
    ++stackM.Top().nLevels;
    return ReadElements(false);
}

/// Reads elements until all arrays of the field under way end, or an object opens in one.
ObjectReader::Step ObjectReader::ReadElements(bool fBehindElement) {
    Frame& frame = stackM.Top();
    while (frame.nLevels != 0) {
        if (fBehindElement) {
            const bool isArray = levelsM.Top() < ObjectReaderLevel::LONE_ELEMENT;
            if (isArray && cursorM.FTake(',')) {
                levelsM.Top() = ObjectReaderLevel::LATER_ELEMENT;
            } else if (!isArray || cursorM.FTake(']')) {
                levelsM.Pop();
                --frame.nLevels;
                continue;
            } else {
                return FailArray();
            }
        }
        if (cursorM.FSkipTo('[')) {
            ++cursorM.pCurrentM;
            fBehindElement = cursorM.FTake(']');
            if (fBehindElement) continue;
            levelsM.Push(ObjectReaderLevel::FIRST_ELEMENT);
            ++frame.nLevels;
            continue;
        }
        const Step step = ReadValue(true);
        if (step != Step::CLOSED) return step;
        fBehindElement = true;
    }
    return Step::CLOSED;
}

/// Reads one value of the field under way. The member of a repeated field is a container and that of another
/// one is none: a value that comes the other way is refused.
ObjectReader::Step ObjectReader::ReadValue(bool isMulti) {
    Frame& frame = stackM.Top();
    const FieldInfo& field = *frame.pField;
    frame.isMulti = isMulti;
    if (field.dataType >= SORN_DATA_TYPE_NONE) {
        wordsM.Replace(isMulti ? "Multi: unhandled data type" : "Single: unhandled data type");
        return FailValue();
    }
    if (isMulti != (field.arity == SORN_ARITY_MULTI)) return FailValue();
    switch (field.Type()) {
        case SORN_DATA_TYPE_KNOWN_DICT:
            return OpenValue(objectsM.NextStruct());
        case SORN_DATA_TYPE_OBJECT:
            return OpenValue(Schema::FindStruct(field.typeRef));
        default:
            return ReadPlainValue(field, Target(frame)) ? Step::CLOSED : FailValue();
    }
}

/// An object of the field under way.
ObjectReader::Step ObjectReader::OpenValue(const StructInfo* info) {
    if (info == nullptr || objectsM.FNextIsNew()) return SkipValue();
    const bool wasSilent = wordsM.FSilent();
    wordsM.SetSilent(true);
    ref<SornObject> made = MakeObject(*info);
    wordsM.SetSilent(wasSilent);
    if (made == nullptr) return FailInnerObject();
    SornObject* const object = made.get();
    if (FCaller()) {
        outermostM = std::move(made);
    } else if (!stackM.Top().isMulti) {
        const Frame& frame = stackM.Top();
        *static_cast<ref<SornObject>*>(frame.pObject->MemberAt(*frame.pField)) = std::move(made);
    } else if (!Stored(Target(stackM.Top()).StoreReference(made))) {
        return FailValue();
    }
    PushObject(*info, object);
    return Step::OPENED;
}

/// An object of the field under way that has no struct: the value is null.
ObjectReader::Step ObjectReader::SkipValue() {
    const bool wasSilent = wordsM.FSilent();
    wordsM.SetSilent(true);
    const bool isGood = skipperM.SkipObject();
    wordsM.SetSilent(wasSilent);
    if (!isGood) return FailInnerObject();
    if (Stored(Target(stackM.Top()).StoreReference(RefBase()))) return Step::CLOSED;
    return FailValue();
}

ObjectReader::Step ObjectReader::CloseObject() {
    stackM.Pop();
    if (stackM.Size() <= 1) wordsM.SetSilent(false);
    if (stackM.FEmpty() || !FCaller()) return Step::CLOSED;
    // The caller's object gets it only now that it is whole.
    if (Stored(Target(stackM.Top()).StoreReference(outermostM))) return Step::CLOSED;
    return FailValue();
}

bool ObjectReader::Stored(bool isStored) {
    return isStored || wordsM.Append(ValueReader::tooManyG);
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
