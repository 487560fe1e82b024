#include "sorn/typedjson/ObjectReader.h"

#include <utility>

#include "sorn/model/Schema.h"

namespace sorn {

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
      levelsM(pool),
      hintsM(KeyHints::OfThread()) {}

bool ObjectReader::ReadObject(const StructInfo* info, ref<SornObject>& out) {
    if (info == nullptr || objectsM.FNextIsNew()) {
        if (!Finish(skipperM.SkipObject())) return false;
        out = nullptr;
        return true;
    }
    const FieldIndex* const index = FieldIndex::Of(*info);
    outermostM = MakeObject(*info, index);
    if (outermostM == nullptr) return Finish(false);
    PushObject(*info, index, outermostM.get());
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
    stackM.Push({nullptr, object, field, nullptr, 0, false, false, 0});
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
ref<SornObject> ObjectReader::MakeObject(const StructInfo& info, const FieldIndex* index) {
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
    const uint32_t nBytes = index != nullptr ? index->ObjectBytes() : ObjectBudget::SizeOf(info);
    if (budgetM.TakeBytes(nBytes)) object = info.Factory(pMempoolM);
    if (object == nullptr) wordsM.Replace("Failed to create sorn object");
    return object;
}

void ObjectReader::PushObject(const StructInfo& info, const FieldIndex* index, SornObject* object) {
    wordsM.SetSilent(!stackM.FEmpty());
    stackM.Emplace(&info, object, nullptr, index, 0u, false, false, uint16_t{0});
}

ObjectReader::Step ObjectReader::StartValue() {
    const bool isBracketed = cursorM.FSkipTo('[');
    if (isBracketed || stackM.Top().pField->arity == SORN_ARITY_MULTI) return StartArray(isBracketed);
    return ReadValue(false);
}

ObjectReader::Step ObjectReader::StartArray(bool isBracketed) {
    if (isBracketed) ++cursorM.pCurrentM;
    if (FNoElement(isBracketed)) {
        if (isBracketed) ++cursorM.pCurrentM;
        return Step::CLOSED;
    }
    levelsM.Push(isBracketed ? ObjectReaderLevel::FIRST_ELEMENT : ObjectReaderLevel::LONE_ELEMENT);
    ++stackM.Top().nLevels;
    return ReadElements(false);
}

/// Whether an array ends where its first element would stand. A field that is no list takes no array: there
/// the bracket stands for an element, which ReadValue refuses.
bool ObjectReader::FNoElement(bool isBracketed) {
    const bool isTaken = !isBracketed || stackM.Top().pField->arity == SORN_ARITY_MULTI;
    return cursorM.FSkipTo(']') && isTaken;
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
            fBehindElement = FNoElement(true);
            if (fBehindElement) {
                ++cursorM.pCurrentM;
                continue;
            }
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
    const FieldIndex* const index = FieldIndex::Of(*info);
    ref<SornObject> made = MakeObject(*info, index);
    wordsM.SetSilent(wasSilent);
    if (made == nullptr) return FailInnerObject();
    SornObject* const object = made.get();
    if (FCaller()) {
        outermostM = std::move(made);
    } else if (!stackM.Top().isMulti) {
        const Frame& frame = stackM.Top();
        *static_cast<ref<SornObject>*>(frame.pObject->MemberAt(*frame.pField)) = std::move(made);
    } else if (!Stored(Target(stackM.Top()).StoreReference(std::move(made)))) {
        return FailValue();
    }
    PushObject(*info, index, object);
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

}  // namespace sorn
