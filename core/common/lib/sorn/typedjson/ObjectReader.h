#pragma once

#include <cstdint>
#include <string_view>

#include "rox/RoxString.h"
#include "rox/RoxWorkStack.h"
#include "rox/ref.h"
#include "sorn/convert/FieldAccess.h"
#include "sorn/convert/ObjectBudget.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/model/FieldInfo.h"
#include "sorn/model/SornObject.h"
#include "sorn/model/StructInfo.h"
#include "sorn/typedjson/CursorText.h"
#include "sorn/typedjson/FieldIndex.h"
#include "sorn/typedjson/InputPointerBytesource.h"
#include "sorn/typedjson/KeyHints.h"
#include "sorn/typedjson/ObjectReaderLevels.h"
#include "sorn/typedjson/ObjectReaderObjects.h"
#include "sorn/typedjson/ObjectReaderWords.h"
#include "sorn/typedjson/ObjectSkipper.h"

namespace sorn {

/// The walk over a text that makes objects and stores their fields, with stacks of its own; the second pass
/// of a read. One reader makes one read. Objects take their structs from the list of the first pass; one
/// that joins the list only now is skipped, and so is one without a struct.
class ObjectReader {
 public:
    /// `error` is the caller's string, which gets the words of a failure. `nInput`: the bytes of the text, as
    /// far as they are known; they bound what may be spent on objects.
    ObjectReader(RoxMempool* pool, InputPointerBytesource& cursor, ObjectReaderObjects objects,
                 uint64_t nInput, RoxString& error);

    /// The object at the cursor, null for one that is skipped.
    bool ReadObject(const StructInfo* info, ref<SornObject>& out);

    // Values of a field of an object that is there; without a field they are skipped.

    bool ReadFieldValue(const FieldInfo* field, SornObject* object);
    bool ReadArray(const FieldInfo* field, SornObject* object);
    bool ReadElement(const FieldInfo* field, SornObject* object);
    /// One value, without words about where it stands.
    bool ReadOne(const FieldInfo* field, SornObject* object, bool isMulti);

 private:
    /// An object under way. Its references are held by the object around it, which it joins at once, or by
    /// the reader. The lowest frame may be an object of the caller's, without a struct: it stands for one
    /// value of one field.
    struct Frame {
        const StructInfo* pInfo;
        SornObject* pObject;
        const FieldInfo* pField;   ///< the field under way
        const FieldIndex* pIndex;  ///< of the struct, or null
        uint32_t nLevels;          ///< arrays that are open in its value
        bool isMulti;              ///< how the value under way is taken
        bool isBare;               ///< the caller wants no words about where the value stands
        uint16_t slot;             ///< of the field that came last, as far as hints go
    };
    enum class Step : uint8_t { OPENED, CLOSED, FAILED };

    bool Finish(bool isGood);
    void PushCaller(const FieldInfo* field, SornObject* object);
    bool Run(Step step);
    ref<SornObject> MakeObject(const StructInfo& info, const FieldIndex* index);
    void PushObject(const StructInfo& info, const FieldIndex* index, SornObject* object);
    Step ReadMembers(bool fBehindValue);
    Step ReadMember(std::string_view key);
    const FieldKey* ReadPlainKey(Frame& frame, const unsigned char*& value);
    bool ReadPlainMember(Step& step);
    Step SkipMember(std::string_view key);
    Step StartValue();
    Step StartArray(bool isBracketed);
    bool FNoElement(bool isBracketed);
    Step ReadElements(bool fBehindElement);
    Step ReadValue(bool isMulti);
    Step OpenValue(const StructInfo* info);
    Step SkipValue();
    Step CloseObject();
    bool ReadPlainValue(const FieldInfo& field, const FieldTarget& target);
    bool ReadAnyDict(const FieldTarget& target);
    bool ReadLazy(const FieldTarget& target);
    bool ReadText(const FieldInfo& field, std::string_view text, bool isRoomy, const FieldTarget& target);
    template <class Member, class Value>
    bool StoreNumber(bool (*convert)(std::string_view, Value&), std::string_view text,
                     const FieldTarget& target);
    template <class Scalar>
    bool StoreValid(std::string_view text, const FieldTarget& target);
    bool StoreEnum(const FieldInfo& field, const NameKey& name, const FieldTarget& target);
    bool StoreId(const FieldInfo& field, std::string_view text, const FieldTarget& target);
    bool StoreText(std::string_view text, const FieldTarget& target);
    bool StoreBytes(std::string_view text, const FieldTarget& target);
    RoxString Cut(std::string_view text);
    bool Stored(bool isStored) { return isStored || FailFull(); }
    bool FailFull();

    Step FailObject(const char* text);
    Step FailArray();
    Step FailValue();
    Step FailMember();
    Step FailInnerObject();
    bool FCaller() const { return stackM.Top().pInfo == nullptr; }
    FieldTarget Target(const Frame& frame) const {
        return FieldTarget(frame.pObject->MemberAt(*frame.pField), frame.isMulti);
    }

    RoxMempool* pMempoolM;
    InputPointerBytesource& cursorM;
    ObjectReaderObjects objectsM;
    ObjectBudget budgetM;
    uint64_t nInputM;
    ObjectReaderWords wordsM;
    CursorText textM;
    ObjectSkipper skipperM;
    RoxWorkStack<Frame, 16> stackM;
    ObjectReaderLevels levelsM;
    KeyHints& hintsM;
    ref<SornObject> outermostM;     ///< the outermost object that was made
    ref<rox::ByteBuffer> noBytesM;  ///< the value of all byte strings without bytes; made for the first
};

}  // namespace sorn
