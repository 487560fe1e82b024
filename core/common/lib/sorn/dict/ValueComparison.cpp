#include "sorn/dict/ValueComparison.h"

#include "rox/RoxWorkStack.h"
#include "sorn/dict/ArrayValue.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/dict/DictionaryEntries.h"
#include "sorn/dict/StringValue.h"

namespace sorn {

namespace {

constexpr unsigned nInlineFramesG = 16;

/// Two arrays of equal count under comparison.
struct ArrayPair {
    const RoxGenericArray* a;
    const RoxGenericArray* b;
    unsigned i;
};

/// Two dictionaries with equally many names under comparison.
struct DictionaryPair {
    DictionaryEntries names;  // of a
    const Dictionary* b;
};

struct Frame {
    explicit Frame(const ArrayPair& pair) : fArrays(true), arrays(pair) {}
    explicit Frame(const DictionaryPair& pair) : fArrays(false), dictionaries(pair) {}

    bool fArrays;
    union {
        ArrayPair arrays;
        DictionaryPair dictionaries;
    };
};

class ValueComparer {
 public:
    explicit ValueComparer(RoxMempool* pool) : stackM(pool) {}

    bool FEqual(const DictValue* a, const DictValue* b) {
        if (!Enter(a, b)) return false;
        while (!stackM.FEmpty()) {
            if (!(stackM.Top().fArrays ? StepArrays() : StepDictionaries())) return false;
        }
        return true;
    }

 private:
    /// False when a and b differ at first sight; their contents are left to the steps.
    bool Enter(const DictValue* a, const DictValue* b) {
        if (a == nullptr || b == nullptr) return a == b;
        switch (a->GetTag()) {
            case dictvalue::STRING:
                return b->GetTag() == dictvalue::STRING &&
                       static_cast<const StringValue*>(a)->GetValue().FEqual(
                           static_cast<const StringValue*>(b)->GetValue());
            case dictvalue::ARRAY:
                return b->GetTag() == dictvalue::ARRAY &&
                       EnterArrays(static_cast<const ArrayValue*>(a)->GetElements(),
                                   static_cast<const ArrayValue*>(b)->GetElements());
            case dictvalue::DICTIONARY:
                return b->GetTag() == dictvalue::DICTIONARY &&
                       EnterDictionaries(*static_cast<const Dictionary*>(a),
                                         *static_cast<const Dictionary*>(b));
            default:
                return a->Equals(ref<DictValue>(const_cast<DictValue*>(b)));
        }
    }

    bool EnterArrays(const RoxGenericArray& a, const RoxGenericArray& b) {
        if (a.GetCount() != b.GetCount()) return false;
        if (!a.FEmpty()) stackM.Push(Frame(ArrayPair{&a, &b, 0}));
        return true;
    }

    bool EnterDictionaries(const Dictionary& a, const Dictionary& b) {
        const unsigned nNames = DictionaryEntries::Count(a);
        if (nNames != DictionaryEntries::Count(b)) return false;
        if (nNames != 0) stackM.Push(Frame(DictionaryPair{DictionaryEntries(a), &b}));
        return true;
    }

    bool StepArrays() {
        ArrayPair& pair = stackM.Top().arrays;
        const auto* const a = static_cast<const DictValue*>(pair.a->At(pair.i));
        const auto* const b = static_cast<const DictValue*>(pair.b->At(pair.i));
        if (++pair.i == pair.a->GetCount()) stackM.Pop();
        return Enter(a, b);
    }

    bool StepDictionaries() {
        DictionaryPair& pair = stackM.Top().dictionaries;
        const DictionaryEntries::Name a = pair.names.Current();
        DictionaryEntries::Name b;
        if (!DictionaryEntries::Find(*pair.b, a, b) || a.CountValues() != b.CountValues()) return false;
        pair.names.Next();
        if (!pair.names.FCurrent()) stackM.Pop();
        // Equal counts: either both have several values in a holder or neither has.
        if (a.GetSeveral() != nullptr) return EnterArrays(*a.GetSeveral(), *b.GetSeveral());
        return Enter(a.At(0), b.At(0));
    }

    RoxWorkStack<Frame, nInlineFramesG> stackM;
};

}  // namespace

bool FEqualValues(const DictValue* a, const DictValue* b) {
    return ValueComparer(a == nullptr ? nullptr : a->GetMempool()).FEqual(a, b);
}

}  // namespace sorn
