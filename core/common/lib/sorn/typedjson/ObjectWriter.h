#pragma once

#include <cstdint>
#include <utility>

#include "rox/RoxWorkStack.h"
#include "rox/ref.h"
#include "sorn/convert/FieldAccess.h"
#include "sorn/convert/StructTable.h"
#include "sorn/dict/LazyBody.h"
#include "sorn/json/JsonOutput.h"
#include "sorn/json/StringWriter.h"
#include "sorn/model/FieldInfo.h"
#include "sorn/model/OrvoVersion.h"
#include "sorn/model/SornObject.h"
#include "sorn/typedjson/EnumTexts.h"
#include "sorn/typedjson/WriterPlan.h"
#include "sorn/typedjson/WriterPlans.h"

namespace sorn {

class Dictionary;

/// The writer of objects straight from the tables to compact text. The fields stand in slot order, and "type"
/// stands in front of the last slot whose name sorts below it, or behind all fields when there is none. Older
/// forms of fields are never written. Null references are left out, a single field's with its name, and so
/// are lazy bodies that cannot be read; a repeated field that is left without elements so is an empty list.
/// It keeps its own stack, so that nesting is bounded by memory alone. The objects must not change meanwhile.
///
/// Dictionaries, of any-dict fields and of lazy bodies, it cannot write: it stops before each one, and goes
/// on behind it when whoever runs it has written the dictionary. What stands in the dictionary may be written
/// by this same writer meanwhile, above what is open.
class ObjectWriter {
 public:
    /// `pool` takes the stack when it becomes large.
    ObjectWriter(RoxMempool* pool, StructTable table, JsonOutput& out)
        : plansM(table), outM(out), framesM(pool) {}

    /// Opens an object, whose struct must be in the table. It is the caller's.
    void BeginObject(const SornObject& object, OrvoVersion version) { Open(object, version, false); }
    /// The same with a reference that the writer keeps until the object is written.
    void BeginBody(const ref<SornObject>& object, OrvoVersion version);
    /// Opens one field of an object: its name, which is written as it is, and its value or values, as an
    /// object would have them. `isMulti` stands in for the field's arity, and whether the field is present is
    /// not asked. A separator goes before it unless `isFirst`, which becomes false. A repeated field without
    /// elements writes nothing; neither does a lazy body that cannot be read, nor a repeated field of a data
    /// type that does not exist, where a single one writes its name.
    void BeginField(const char* name, const FieldInfo& field, bool isMulti, const SornObject& object,
                    OrvoVersion version, bool& isFirst);
    /// Writes until no more than `depth` objects and lists are open. False when it stops before a dictionary.
    bool Run(size_t depth);
    /// Objects and lists that are open.
    size_t GetDepth() const { return framesM.Size(); }

    /// The dictionary before which Run has stopped.
    ref<Dictionary> TakeDictionary() { return std::move(dictionaryM); }

    /// Writes a separator unless `isFirst`, which becomes false, and the name as it is, with what goes
    /// between a name and its value.
    static void WriteName(const char* name, size_t nName, bool& isFirst, JsonOutput& out);

 private:
    using Step = WriterPlan::Step;

    /// An object, or the list of references of one of its repeated fields.
    struct Frame {
        const WriterPlan* pPlan;  // null for a list
        const SornObject* pObject;
        const FieldInfo* pField;  // that of a list
        uint32_t next;            // group, or element
        uint32_t end;             // of the groups, or of the elements
        uint32_t block;           // the step of the lowest bits of candidates
        uint32_t candidates;      // steps that are to be looked at
        uint32_t behindType;      // those behind "type", which comes first
        unsigned anchor;          // the step that has "type" in front
        OrvoVersion version;
        const WriterPlan::View* pView;  // null when each step is to be asked for its versions
        bool isFirst;
        bool isHeld;
        bool isTypeWritten;
    };

    void Open(const SornObject& object, OrvoVersion version, bool isHeld);
    void ContinueObject();
    void ContinueList();
    static void NextGroup(Frame& frame);
    /// Writes the candidates that are left. False as WriteMember is; the frame is ready to go on then.
    bool WriteCandidates(Frame& frame);
    void WriteType(Frame& frame);
    /// A field that has a value and is not written in one go. False as WriteMember is.
    bool WriteOther(const Step& step, Frame& frame);
    /// A field with its name, if there is anything to write. False as WriteMember is.
    bool WriteNamed(const char* name, const Step& step, const SornObject& object, OrvoVersion version,
                    bool& isFirst);
    /// What is written behind the key of a member that has a value. False when it has opened something, and
    /// before a dictionary.
    bool WriteMember(const Step& step, const SornObject& object, OrvoVersion version);
    void WriteList(const Step& step, const SornObject& object);
    /// Of a reference that is not null.
    bool WriteReference(DataType type, const FieldSource& source, unsigned i, OrvoVersion version);
    bool FPrepare(DataType type, const FieldSource& source, unsigned i);
    bool FPrepare(const Step& step, const SornObject& object);
    bool WriteLazy();

    // Values that hold no others; a value is what FieldSource gives for it (ObjectWriterValues.cpp).

    static constexpr size_t maxShortValueG = stringwriter::maxShortG * stringwriter::maxEscapedG + 2;
    static constexpr unsigned maxEntryG = WriterPlan::maxKeyG + maxShortValueG;
    static_assert(maxEntryG <= JsonOutput::maxRoomG);
    static_assert(EnumTexts::maxTextG + EnumTexts::nBlockG <= maxShortValueG);

    /// Whether the value is a string that PutShort cannot take.
    static bool FLong(DataType type, const void* value) {
        return type == SORN_DATA_TYPE_STRING &&
               static_cast<const RoxString*>(value)->NByte() > stringwriter::maxShortG;
    }
    /// Writes a value that is no reference to memory with room for maxShortValueG bytes; gives the end.
    unsigned char* PutShort(DataType type, const Step& step, const void* value, unsigned char* out) const;
    static unsigned char* PutEnum(const Step& step, uint32_t value, unsigned char* out);
    unsigned char* PutLongId(const Step& step, uint64_t id, unsigned char* out) const;
    unsigned char* PutStringId(const Step& step, const RoxString& id, unsigned char* out) const;
    void WriteValue(const Step& step, const void* value);
    void WriteBytes(const rox::ByteBuffer& value);

    WriterPlans plansM;
    JsonOutput& outM;
    RoxWorkStack<Frame, 16> framesM;
    LazyBodyContent bodyM;  // of the lazy body that is written next
    ref<Dictionary> dictionaryM;
};

}  // namespace sorn
